/**
 * The border between our C++ and the C functions of the platform.
 */
#ifndef VORNHOST_CORE_GUARD_H
#define VORNHOST_CORE_GUARD_H

#include <exception>

namespace vornhost {

/**
 * Runs the body of a platform function. An exception, such as the one for memory running out,
 * becomes the function's failure result. The one by which a thread is cancelled is not among them.
 */
template <typename Result, typename Body>
Result Guarded(Result failure, const Body& body)
{
    try {
        return body();
    } catch (const std::exception&) {
        return failure;
    }
}

} // namespace vornhost

#endif
