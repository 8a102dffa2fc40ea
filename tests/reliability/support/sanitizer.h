/**
 * Whether the address sanitizer is in the program; each compiler says so in its own way.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_SANITIZER_H
#define VORNOVS_TESTS_RELIABILITY_SANITIZER_H

#ifdef __SANITIZE_ADDRESS__
#define VORNOVS_ADDRESS_SANITIZER
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
#define VORNOVS_ADDRESS_SANITIZER
#endif
#endif

namespace reliability {

#ifdef VORNOVS_ADDRESS_SANITIZER
constexpr bool kAddressSanitizer = true;
#else
constexpr bool kAddressSanitizer = false;
#endif

} // namespace reliability

#endif
