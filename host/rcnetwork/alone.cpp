#include "alone.h"

#include "inputs.h"
#include "report.h"

#include "support/servicemanager.h"
#include "support/spawn.h"

#include <cerrno>
#include <csignal>

#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

namespace vornhost {
namespace {

constexpr char kOwnProgram[] = "/proc/self/exe";
constexpr unsigned kLowestOtherDescriptor = 3;
/** Nothing of it waits for others: when it takes longer, something is wrong with systemd. */
constexpr std::chrono::seconds kUnitDeadline{10};

/** Leaves nothing of the caller's: no descriptors, no folder, no signal settings. */
void Detach()
{
    if (chdir("/") != 0) {
        _exit(1);
    }
    const int null = open("/dev/null", O_RDWR | O_CLOEXEC);
    for (const int descriptor : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO}) {
        (void)dup2(null, descriptor);
    }
    (void)close_range(kLowestOtherDescriptor, ~0U, 0);
    for (int signal = 1; signal < NSIG; ++signal) {
        (void)std::signal(signal, SIG_DFL);
    }
    sigset_t none;
    (void)sigemptyset(&none);
    (void)sigprocmask(SIG_SETMASK, &none, nullptr);
}

bool StartAsNobodysChild(const std::vector<std::string>& arguments)
{
    std::vector<std::string> command{"rc.network"};
    command.insert(command.end(), arguments.begin(), arguments.end());
    const std::vector<std::string> settings = ToolEnvironment();
    const std::vector<char*> words = Pointers(command);
    const std::vector<char*> environment = Pointers(settings);

    const pid_t child = fork();
    if (child == 0) {
        // Before the other one exists, so that nothing meant for its caller's group can reach it.
        (void)setsid();
        const pid_t other = fork();
        if (other == 0) {
            Detach();
            (void)execve(kOwnProgram, words.data(), environment.data());
            _exit(1);
        }
        _exit(other < 0 ? 1 : 0);
    }
    int status = -1;
    while (child > 0 && waitpid(child, &status, 0) < 0 && errno == EINTR) {
    }
    return child > 0 && status == 0;
}

} // namespace

bool StartAlone(const std::string& unit, const std::vector<std::string>& arguments)
{
    if (SystemdRuns()) {
        std::string error;
        if (StartUnit(unit, kUnitDeadline, &error)) {
            return true;
        }
        Say({Severity::kWarning, "systemd does not run it apart from its caller: " + error});
    }
    return StartAsNobodysChild(arguments);
}

} // namespace vornhost
