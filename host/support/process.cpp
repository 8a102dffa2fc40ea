#include "process.h"

#include "descriptor.h"
#include "spawn.h"

#include <array>
#include <cerrno>
#include <cstring>

#include <sys/mman.h>

namespace vornhost {
namespace {

/**
 * A file in memory. Unlike a pipe it never makes the program or us wait, and a daemon that the
 * program leaves behind does not hold up our reading.
 */
Descriptor MemoryFile()
{
    return AboveStandard(Descriptor(::memfd_create("standard stream", MFD_CLOEXEC)));
}

bool Fill(int file, const std::string& text)
{
    for (size_t written = 0; written < text.size();) {
        const ssize_t size = ::pwrite(file, text.data() + written, text.size() - written,
                                      static_cast<off_t>(written));
        if (size < 0 && errno != EINTR) {
            return false;
        }
        written += size > 0 ? static_cast<size_t>(size) : 0;
    }
    return true;
}

std::string Contents(int file)
{
    std::string text;
    std::array<char, 16384> buffer{};
    for (;;) {
        const ssize_t size =
            ::pread(file, buffer.data(), buffer.size(), static_cast<off_t>(text.size()));
        if (size > 0) {
            text.append(buffer.data(), static_cast<size_t>(size));
        } else if (size == 0 || errno != EINTR) {
            return text;
        }
    }
}

/** An ignored SIGCHLD would make the kernel throw the status of our children away. */
void KeepStatusOfChildren()
{
    struct sigaction action {};
    if (::sigaction(SIGCHLD, nullptr, &action) == 0 &&
        (action.sa_handler == SIG_IGN || (action.sa_flags & SA_NOCLDWAIT) != 0)) {
        (void)::signal(SIGCHLD, SIG_DFL);
    }
}

ProcessResult NotStarted(int reason)
{
    ProcessResult result;
    result.errors = std::strerror(reason);
    return result;
}

} // namespace

ProcessResult RunProcess(const std::vector<std::string>& argv, const ProcessOptions& options)
{
    if (argv.empty() || !argv[0].starts_with('/')) {
        return NotStarted(ENOENT);
    }
    const Descriptor input = MemoryFile();
    const Descriptor output = MemoryFile();
    const Descriptor errors = MemoryFile();
    if (!input || !output || !errors || !Fill(input.Get(), options.input)) {
        return NotStarted(errno);
    }

    SpawnActions actions;
    actions.Duplicate(input.Get(), 0);
    if (options.capture) {
        actions.Duplicate(output.Get(), 1);
        actions.Duplicate(errors.Get(), 2);
    }
    actions.CloseFrom(3);
    const SpawnAttributes attributes(POSIX_SPAWN_SETPGROUP, EmptySignalSet());
    const std::vector<std::string> environment =
        options.environment.empty()
            ? std::vector<std::string>{"PATH=/usr/sbin:/usr/bin:/sbin:/bin", "LC_ALL=C"}
            : options.environment;

    KeepStatusOfChildren();
    pid_t child = -1;
    const int failure =
        !actions.IsComplete()
            ? ENOMEM
            : ::posix_spawn(&child, argv[0].c_str(), actions.Get(), attributes.Get(),
                            Pointers(argv).data(), Pointers(environment).data());
    if (failure != 0) {
        return NotStarted(failure);
    }

    const ProgramEnd end = WaitForGroup(child, options.deadline);
    return {end.status, end.timedOut, Contents(output.Get()), Contents(errors.Get())};
}

} // namespace vornhost
