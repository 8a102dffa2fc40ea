/**
 * Between libFuzzer and the program's one subject.
 */
#include "subject.h"

#include "sandbox/sandbox.h"

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <exception>

#include <syslog.h>

namespace {

/** Uncaught, so that libFuzzer keeps the text. */
[[noreturn]] void End(const char* what)
{
    std::fprintf(stderr, "%s\n", what);
    std::abort();
}

} // namespace

extern "C" int LLVMFuzzerInitialize(int* /*argc*/, char*** /*argv*/)
{
    try {
        harness::EnterSandbox();
    } catch (const std::exception& error) {
        End(error.what());
    }
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    static const fuzz::Feed feed = fuzz::Subjects().begin()->second;
    try {
        feed({reinterpret_cast<const char*>(data), size});
    } catch (const std::exception& error) {
        End(error.what());
    }
    return 0;
}
