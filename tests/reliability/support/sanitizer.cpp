// What these programs ask of the address sanitizer when nobody says otherwise.
#include "support/sanitizer.h"

#ifdef VORNOVS_ADDRESS_SANITIZER
// They are forked thousands of times and allocate all the time, and pay for each page they touch
// and each caller that is noted: what was freed is kept out of use for some ten thousand
// allocations.
extern "C" __attribute__((visibility("default"))) const char* __asan_default_options()
{
    return "quarantine_size_mb=2:thread_local_quarantine_size_kb=256:malloc_context_size=8";
}
#endif
