#include "core/arguments.h"
#include "core/guard.h"
#include "core/heldlocks.h"
#include "core/program.h"
#include "core/refusal.h"

#include <cstdarg>
#include <string>
#include <vector>

#include <vornplatform/core.h>

namespace {

using vornhost::CollectArguments;
using vornhost::Guarded;
using vornhost::ProgramRequest;
using vornhost::RunnerReport;

/** Runs a program for the client. @return 0, or -1 for whatever kept it from succeeding. */
int Run(std::vector<std::string> argv, bool wait = true)
{
    if (vornhost::IsRefused(argv)) {
        return -1;
    }
    ProgramRequest request;
    request.argv = std::move(argv);
    request.detached = !wait;
    if (wait) {
        request.locks = vornhost::DuplicateHeldLocks();
    }
    const RunnerReport report = vornhost::RunProgram(std::move(request));
    return report.startError == 0 && report.status == 0 ? 0 : -1;
}

} // namespace

int VLIBCExec(const char* path, ...)
{
    if (path == nullptr) {
        return -1;
    }
    va_list arguments;
    va_start(arguments, path);
    const int result = Guarded(-1, [&] { return Run(CollectArguments(path, arguments)); });
    va_end(arguments);
    return result;
}

int VLIBCExecl(const char* path, int options, ...)
{
    // Every script is run in the one way that there is here, whatever the word asks for.
    if (path == nullptr) {
        return -1;
    }
    va_list arguments;
    va_start(arguments, options);
    const int result = Guarded(-1, [&] { return Run(CollectArguments(path, arguments)); });
    va_end(arguments);
    return result;
}

int VLIBCExecv(const char* path, const char* const argv[], int wait)
{
    if (path == nullptr || argv == nullptr) {
        return -1;
    }
    return Guarded(-1, [&] {
        std::vector<std::string> strings = {path};
        // The vector's first element is the program again.
        for (size_t index = 1; argv[0] != nullptr && argv[index] != nullptr; ++index) {
            strings.emplace_back(argv[index]);
        }
        return Run(std::move(strings), wait == 1);
    });
}
