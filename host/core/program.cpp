#include "core/program.h"

#include "support/spawn.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <climits>
#include <cstdlib>
#include <cstring>

#include <dlfcn.h>
#include <fcntl.h>
#include <poll.h>
#include <sys/wait.h>

namespace vornhost {
namespace {

constexpr char kRunnerBesideLibrary[] = "/vornovs/vornrun";

std::array<char, PATH_MAX> g_runnerPath;

/** As the library is loaded: its path may be relative to a working directory that changes later. */
[[gnu::constructor]] void FindRunner()
{
    Dl_info library{};
    std::array<char, PATH_MAX> path{};
    if (::dladdr(g_runnerPath.data(), &library) == 0 ||
        ::realpath(library.dli_fname, path.data()) == nullptr) {
        return;
    }
    char* const slash = std::strrchr(path.data(), '/');
    const auto folder = static_cast<size_t>(slash - path.data());
    if (folder + sizeof kRunnerBesideLibrary <= path.size()) {
        std::memcpy(slash, kRunnerBesideLibrary, sizeof kRunnerBesideLibrary);
        g_runnerPath = path;
    }
}

Descriptor MoveAbove(const Descriptor& descriptor, int lowest)
{
    return Descriptor(::fcntl(descriptor.Get(), F_DUPFD_CLOEXEC, lowest));
}

/** The descriptors that vornrun gets, moved out of the way of the numbers that they get there. */
class HandedDescriptors {
public:
    explicit HandedDescriptors(size_t locks)
        : m_lowest(kFirstLockDescriptor + static_cast<int>(locks))
    {
        m_actions.Open(0, "/dev/null", O_RDONLY);
        m_actions.Open(1, "/dev/null", O_WRONLY);
        m_actions.Open(2, "/dev/null", O_WRONLY);
        // Neither does it keep the client's working directory from being unmounted.
        m_actions.ChangeFolder("/");
    }

    void Hand(const Descriptor& descriptor, int target)
    {
        m_next = std::max(m_next, target + 1);
        if (!descriptor) {
            m_actions.Close(target); // what the client has there is not for vornrun
            return;
        }
        m_moved.push_back(MoveAbove(descriptor, m_lowest));
        m_complete = m_complete && m_moved.back();
        m_actions.Duplicate(m_moved.back().Get(), target);
    }

    /** @return the steps, null when a descriptor could not be had. */
    const posix_spawn_file_actions_t* Finish()
    {
        m_actions.CloseFrom(m_next);
        return m_complete && m_actions.IsComplete() ? m_actions.Get() : nullptr;
    }

private:
    int m_lowest;
    int m_next = 3;
    bool m_complete = true;
    SpawnActions m_actions;
    std::vector<Descriptor> m_moved;
};

std::vector<std::string> RunnerArguments(const ProgramRequest& request)
{
    std::vector<std::string> arguments = {
        request.runner, kDeadlineOption + std::to_string(request.deadline.count()),
        kLocksOption + std::to_string(request.locks.size())};
    if (request.opened) {
        arguments.emplace_back(kOpenedOption);
    }
    if (request.detached) {
        arguments.emplace_back(kDetachedOption);
    }
    arguments.emplace_back(kEndOfOptions);
    arguments.insert(arguments.end(), request.argv.begin(), request.argv.end());
    return arguments;
}

/** @return 0, or the error for which vornrun did not start. */
int SpawnRunner(const ProgramRequest& request, const Descriptor& report, pid_t& runner)
{
    HandedDescriptors descriptors(request.locks.size());
    descriptors.Hand(report, kReportDescriptor);
    descriptors.Hand(request.output, kOutputDescriptor);
    descriptors.Hand(request.opened, kProgramDescriptor);
    for (size_t index = 0; index < request.locks.size(); ++index) {
        descriptors.Hand(request.locks[index], kFirstLockDescriptor + static_cast<int>(index));
    }
    const posix_spawn_file_actions_t* const actions = descriptors.Finish();
    if (actions == nullptr) {
        return EMFILE;
    }

    // All signals are blocked in it from its first moment: it lives as long as its program.
    const SpawnAttributes attributes(POSIX_SPAWN_SETSID, FullSignalSet());
    const std::vector<std::string> arguments = RunnerArguments(request);
    return ::posix_spawn(&runner, request.runner.c_str(), actions, attributes.Get(),
                         Pointers(arguments).data(), Pointers(request.environment).data());
}

/** Waits until something can be read or vornrun is gone. */
void WaitForReport(int report, const Descriptor& runner)
{
    // A process that the client forked meanwhile may keep the pipe's other end open, so the end of
    // vornrun itself is watched too. Without its descriptor it has been reaped, or is about to be.
    std::array<pollfd, 2> watched = {{{report, POLLIN, 0}, {runner.Get(), POLLIN, 0}}};
    while (::poll(watched.data(), watched.size(), -1) < 0 && errno == EINTR) {
    }
}

} // namespace

const char* RunnerPath()
{
    return g_runnerPath.data();
}

std::string CompanionPath(const std::string& name)
{
    const std::string runner = RunnerPath();
    return runner.substr(0, runner.rfind('/') + 1) + name;
}

std::vector<std::string> PlainEnvironment()
{
    return {"PATH=/usr/sbin:/usr/bin:/sbin:/bin", "LC_ALL=C"};
}

std::vector<std::string> LibraryEnvironment()
{
    std::vector<std::string> environment = PlainEnvironment();
    environment.emplace_back("OVS_CTL_TIMEOUT=10");
    // By it the network program knows that a start will follow a stop.
    environment.emplace_back("VORNOVS_HOLD=1");
    return environment;
}

RunnerReport RunningProgram::Wait()
{
    const Descriptor runner = OpenProcess(m_runner);
    RunnerReport report;
    ssize_t size = -1;
    do {
        WaitForReport(m_report.Get(), runner);
        size = ::read(m_report.Get(), &report, sizeof report);
    } while (size < 0 && errno == EINTR);
    if (size != sizeof report) {
        report = {}; // vornrun itself was killed
        report.startError = ECHILD;
    }
    m_report.Reset();

    // A client that ignores SIGCHLD or reaps every child has done this already.
    const pid_t child = std::exchange(m_runner, -1);
    while (::waitpid(child, nullptr, 0) < 0 && errno == EINTR) {
    }
    return report;
}

std::optional<RunningProgram> StartProgram(ProgramRequest request)
{
    if (request.argv.empty() || !request.argv[0].starts_with('/')) {
        errno = ENOENT;
        return std::nullopt;
    }
    std::array<int, 2> ends{};
    if (::pipe2(ends.data(), O_CLOEXEC | O_NONBLOCK) != 0) {
        return std::nullopt;
    }
    Descriptor report = AboveStandard(Descriptor(ends[0]));
    const Descriptor writeEnd(ends[1]);
    if (!report) {
        return std::nullopt;
    }

    pid_t runner = -1;
    const int failure = SpawnRunner(request, writeEnd, runner);
    if (failure != 0) {
        errno = failure;
        return std::nullopt;
    }
    return RunningProgram(runner, std::move(report));
}

RunnerReport RunProgram(ProgramRequest request)
{
    std::optional<RunningProgram> program = StartProgram(std::move(request));
    if (!program) {
        RunnerReport report;
        report.startError = errno;
        return report;
    }
    return program->Wait();
}

} // namespace vornhost
