#include "support/allocations.h"

#include "recordingplatform/recordingplatform.h"

#include <cstdlib>
#include <new>

using harness::HarnessAllocations;

namespace {

/** Allocations until one fails; 0: none does. */
long g_countdown = 0;
bool g_allThatFollow = false;
bool g_failed = false;

void* Allocate(std::size_t size)
{
    if (g_countdown > 0 && !HarnessAllocations::Active()) {
        if (g_countdown == 1) {
            g_failed = true;
            g_countdown = g_allThatFollow ? 1 : 0;
            return nullptr;
        }
        --g_countdown;
    }
    return std::malloc(size == 0 ? 1 : size);
}

} // namespace

// Not inlined: the compiler would see memory from `new` go to `free` and warn of a mismatch.
[[gnu::noinline]] void* operator new(std::size_t size)
{
    void* const memory = Allocate(size);
    if (memory == nullptr) {
        throw std::bad_alloc();
    }
    return memory;
}

[[gnu::noinline]] void* operator new[](std::size_t size)
{
    return operator new(size);
}

[[gnu::noinline]] void* operator new(std::size_t size, const std::nothrow_t& /*tag*/) noexcept
{
    return Allocate(size);
}

[[gnu::noinline]] void operator delete(void* memory) noexcept
{
    std::free(memory);
}

[[gnu::noinline]] void operator delete(void* memory, std::size_t /*size*/) noexcept
{
    std::free(memory);
}

[[gnu::noinline]] void operator delete[](void* memory) noexcept
{
    std::free(memory);
}

[[gnu::noinline]] void operator delete[](void* memory, std::size_t /*size*/) noexcept
{
    std::free(memory);
}

namespace unit {

FailingAllocation::FailingAllocation(long nth, bool allThatFollow)
{
    g_failed = false;
    g_allThatFollow = allThatFollow;
    g_countdown = nth;
}

FailingAllocation::~FailingAllocation()
{
    g_countdown = 0;
}

bool FailingAllocation::HasFailed()
{
    return g_failed;
}

} // namespace unit
