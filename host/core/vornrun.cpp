/**
 * vornrun: runs one program for a client of the platform, see runner.h. It is started with all
 * signals blocked and in a session of its own, so that it lives as long as the program does and
 * keeps the client's locks that long. The program gets none of that.
 */
#include "core/runner.h"

#include "support/descriptor.h"
#include "support/spawn.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include <fcntl.h>
#include <linux/close_range.h>
#include <sys/mman.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <syslog.h>
#include <unistd.h>

namespace vornhost {
namespace {

constexpr int kUsageStatus = 64;
/** How long a system log that does not answer can hold us up. */
constexpr unsigned kLogSeconds = 5;
constexpr size_t kLoggedBytes = 8192;

struct Task {
    std::chrono::milliseconds deadline{0};
    unsigned locks = 0;
    bool opened = false;
    bool detached = false;
    std::vector<std::string> argv;
};

std::optional<unsigned> NumberAfter(std::string_view option, std::string_view argument)
{
    if (!argument.starts_with(option)) {
        return std::nullopt;
    }
    return static_cast<unsigned>(std::strtoul(argument.data() + option.size(), nullptr, 10));
}

std::optional<Task> ParseArguments(const std::vector<std::string>& arguments)
{
    Task task;
    for (size_t index = 1; index < arguments.size(); ++index) {
        const std::string& argument = arguments[index];
        if (const auto milliseconds = NumberAfter(kDeadlineOption, argument)) {
            task.deadline = std::chrono::milliseconds(*milliseconds);
        } else if (const auto locks = NumberAfter(kLocksOption, argument)) {
            task.locks = *locks;
        } else if (argument == kOpenedOption) {
            task.opened = true;
        } else if (argument == kDetachedOption) {
            task.detached = true;
        } else if (argument == kEndOfOptions && index + 1 < arguments.size()) {
            task.argv.assign(arguments.begin() + static_cast<ptrdiff_t>(index) + 1,
                             arguments.end());
            return task;
        } else {
            return std::nullopt;
        }
    }
    return std::nullopt;
}

bool IsScript(int program)
{
    std::array<char, 2> begin{};
    return ::pread(program, begin.data(), begin.size(), 0) == 2 && begin[0] == '#' &&
           begin[1] == '!';
}

/** @return 0, or the error for which the program did not start. */
int Start(const Task& task, const Descriptor& errors, pid_t& program)
{
    std::string path = task.argv[0];
    SpawnActions actions;
    if (::fcntl(kOutputDescriptor, F_GETFD) >= 0) {
        actions.Duplicate(kOutputDescriptor, 1);
    }
    if (errors) {
        actions.Duplicate(errors.Get(), 2);
    }
    if (task.opened) {
        path = "/proc/self/fd/" + std::to_string(kProgramDescriptor);
        if (IsScript(kProgramDescriptor)) {
            // The interpreter opens the script by this name, so the script keeps its descriptor.
            (void)::fcntl(kProgramDescriptor, F_SETFD, 0);
        }
    }
    if (!actions.IsComplete()) {
        return ENOMEM;
    }
    const SpawnAttributes attributes(POSIX_SPAWN_SETPGROUP, EmptySignalSet());
    return ::posix_spawn(&program, path.c_str(), actions.Get(), attributes.Get(),
                         Pointers(task.argv).data(), environ);
}

void Close(unsigned first, unsigned count)
{
    if (count > 0) {
        (void)::close_range(first, first + count - 1, 0);
    }
}

void Report(const RunnerReport& report)
{
    // A client that is gone does not read it any more.
    (void)!::write(kReportDescriptor, &report, sizeof report);
    Close(kReportDescriptor, 1);
}

std::string Describe(const RunnerReport& report)
{
    if (report.startError != 0) {
        return std::string("cannot be started: ") + std::strerror(report.startError);
    }
    if (report.timedOut != 0) {
        return "did not end in time and was ended";
    }
    if (WIFSIGNALED(report.status)) {
        return "was ended by signal " + std::to_string(WTERMSIG(report.status));
    }
    return "failed with exit status " + std::to_string(WEXITSTATUS(report.status));
}

std::string CommandLine(const std::vector<std::string>& argv)
{
    std::string line = argv[0];
    for (size_t index = 1; index < argv.size(); ++index) {
        line += " " + argv[index];
    }
    return line;
}

/** What the program wrote to its standard error. It may be still open in a daemon of its. */
std::string TakeErrors(const Descriptor& errors)
{
    // Nobody will read what a daemon writes from now on: it shall not fill the memory.
    (void)::fcntl(errors.Get(), F_ADD_SEALS, F_SEAL_GROW);
    std::string text(kLoggedBytes, '\0');
    const ssize_t size = ::pread(errors.Get(), text.data(), text.size(), 0);
    text.resize(size > 0 ? static_cast<size_t>(size) : 0);
    return text;
}

/** Tells the operator what the client only learns as a number. */
void Log(const Task& task, const RunnerReport& report, const std::string& errors)
{
    const bool failed = report.status != 0 || report.startError != 0;
    if (!failed && errors.empty()) {
        return;
    }
    const sigset_t none = EmptySignalSet();
    (void)::sigprocmask(SIG_SETMASK, &none, nullptr);
    ::alarm(kLogSeconds);

    ::openlog("vornrun", LOG_PID, LOG_DAEMON);
    const int priority = failed ? LOG_WARNING : LOG_INFO;
    for (size_t begin = 0; begin < errors.size();) {
        const size_t end = std::min(errors.find('\n', begin), errors.size());
        if (end > begin) {
            ::syslog(priority, "%s: %s", task.argv[0].c_str(),
                     errors.substr(begin, end - begin).c_str());
        }
        begin = end + 1;
    }
    if (failed) {
        ::syslog(priority, "%s: %s", CommandLine(task.argv).c_str(), Describe(report).c_str());
    }
}

/** Takes what the program writes to its standard error; out of the way of what we were handed. */
Descriptor MemoryFile(const Task& task)
{
    const Descriptor memory(::memfd_create("standard error", MFD_CLOEXEC | MFD_ALLOW_SEALING));
    const int lowest = kFirstLockDescriptor + static_cast<int>(task.locks);
    return Descriptor(::fcntl(memory.Get(), F_DUPFD_CLOEXEC, lowest));
}

/** Raises a limit of this process; beyond the hard one only with the privilege for that. */
void Raise(__rlimit_resource_t resource, rlim_t value)
{
    struct rlimit limit {};
    if (::getrlimit(resource, &limit) != 0) {
        return;
    }
    const struct rlimit raised = {std::max(limit.rlim_cur, value), std::max(limit.rlim_max, value)};
    if (::setrlimit(resource, &raised) != 0) {
        limit.rlim_cur = std::min(raised.rlim_cur, limit.rlim_max);
        (void)::setrlimit(resource, &limit);
    }
}

/**
 * What a client allows itself is not for what it starts: the network program writes files, and a
 * switch that is started for it stays and serves everybody.
 */
void LeaveClientsLimits()
{
    constexpr rlim_t kDescriptors = 1024;
    for (const auto resource : {RLIMIT_AS, RLIMIT_CPU, RLIMIT_DATA, RLIMIT_FSIZE}) {
        Raise(resource, RLIM_INFINITY);
    }
    Raise(RLIMIT_NOFILE, kDescriptors);
}

void Run(const Task& task)
{
    const Descriptor errors = MemoryFile(task);
    pid_t program = -1;
    RunnerReport report;
    report.startError = Start(task, errors, program);
    // A reader of the output finds its end when the program has closed it.
    Close(kOutputDescriptor, 2);

    if (report.startError == 0 && task.detached) {
        report.status = 0;
    } else if (report.startError == 0) {
        const ProgramEnd end = WaitForGroup(program, task.deadline);
        report.status = end.status;
        report.timedOut = end.timedOut ? 1 : 0;
    }

    Close(kFirstLockDescriptor, task.locks);
    const std::string text = TakeErrors(errors);
    Report(report);
    Log(task, report, text);
}

} // namespace
} // namespace vornhost

int main(int argc, char** argv)
{
    using namespace vornhost;
    const sigset_t all = FullSignalSet();
    (void)::sigprocmask(SIG_SETMASK, &all, nullptr);
    (void)::close_range(3, ~0U, CLOSE_RANGE_CLOEXEC);
    LeaveClientsLimits();
    ::umask(022); // a client's own mask must not decide who can read or write what programs make

    const std::optional<Task> task = ParseArguments({argv, argv + argc});
    if (!task) {
        return kUsageStatus;
    }
    Run(*task);
    return 0;
}
