/**
 * What a client does with its signals and descriptors is no matter of the program, and the other
 * way round.
 */
#include "reapers/reapers.h"
#include "scene.h"

#include <array>
#include <atomic>
#include <csignal>
#include <cstdlib>
#include <functional>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/time.h>
#include <sys/wait.h>
#include <unistd.h>
#include <vornplatform/core.h>

namespace {

using scene::MakeScript;

std::string OutputOf(const char* program, const char* argument = nullptr,
                     const char* second = nullptr)
{
    FILE* const stream = VLIBCPopen(program, "r", argument, second, nullptr);
    std::string output;
    for (int letter = 0; stream != nullptr && (letter = std::fgetc(stream)) != EOF;) {
        output += static_cast<char>(letter);
    }
    return VLIBCPclose(stream) == 0 ? output : "failed";
}

int StatusOf(const char* program, const char* mode)
{
    FILE* const stream = VLIBCPopen(program, mode, nullptr);
    return stream == nullptr ? -1 : VLIBCPclose(stream);
}

/** How a client treats the end of its children. */
struct Treatment {
    const char* name;
    std::function<void()> begin;
};

void SetHandler(void (*handler)(int), int flags)
{
    struct sigaction action {};
    action.sa_handler = handler;
    action.sa_flags = flags;
    ASSERT_EQ(::sigaction(SIGCHLD, &action, nullptr), 0);
}

class ClientThat : public testing::TestWithParam<Treatment> {};

TEST_P(ClientThat, GetsTheRightStatus)
{
    const std::string good = MakeScript("/tmp/good", "exit 0");
    const std::string bad = MakeScript("/tmp/bad", "exit 3");
    const int wrong = scene::ResultOf([&] {
        GetParam().begin();
        int failures = 0;
        for (int round = 0; round < 10; ++round) {
            failures += VLIBCExec(good.c_str(), nullptr) == 0 ? 0 : 1;
            failures += VLIBCExec(bad.c_str(), nullptr) < 0 ? 0 : 1;
            failures += StatusOf(good.c_str(), "rB") == 0 ? 0 : 1;
            failures += StatusOf(bad.c_str(), "rB") == 3 << 8 ? 0 : 1;
            failures += StatusOf(bad.c_str(), "r") == 3 << 8 ? 0 : 1;
        }
        return failures;
    });
    EXPECT_EQ(wrong, 0);
}

INSTANTIATE_TEST_SUITE_P(
    Signals, ClientThat,
    testing::Values(Treatment{"LeavesSigchldAlone", [] { SetHandler(SIG_DFL, 0); }},
                    Treatment{"IgnoresSigchld", [] { SetHandler(SIG_IGN, 0); }},
                    Treatment{"WantsNoZombies", [] { SetHandler(SIG_DFL, SA_NOCLDWAIT); }},
                    Treatment{"ReapsInAHandler", [] { SetHandler(harness::ReapAll, 0); }},
                    Treatment{"ReapsInAThread", harness::ReapForEver}),
    [](const auto& row) { return row.param.name; });

TEST(Client, GetsTheRightStatusWhileSignalsInterruptIt)
{
    const std::string bad = MakeScript("/tmp/bad", "sleep 0.05; exit 3");
    const int wrong = scene::ResultOf([&] {
        struct sigaction action {};
        action.sa_handler = [](int) {};
        ::sigaction(SIGALRM, &action, nullptr);
        const itimerval often = {{0, 1000}, {0, 1000}};
        ::setitimer(ITIMER_REAL, &often, nullptr);
        int failures = 0;
        for (int round = 0; round < 10; ++round) {
            failures += VLIBCExec("/bin/true", nullptr) == 0 ? 0 : 1;
            failures += VLIBCExec(bad.c_str(), nullptr) < 0 ? 0 : 1;
            failures += StatusOf(bad.c_str(), "rB") == 3 << 8 ? 0 : 1;
        }
        return failures;
    });
    EXPECT_EQ(wrong, 0);
}

TEST(Client, CanHaveItsStandardDescriptorsClosed)
{
    const std::string bad = MakeScript("/tmp/bad", "echo text >&2; exit 3");
    const int wrong = scene::ResultOf([&] {
        for (int descriptor = 0; descriptor < 3; ++descriptor) {
            ::close(descriptor);
        }
        int handle = -1;
        const bool locked = VLIBCFileLockTimeByFile(scene::kLockPath, 1, 0, &handle) == 0;
        int failures = locked ? 0 : 100;
        failures += VLIBCExec("/bin/true", nullptr) == 0 ? 0 : 1;
        failures += VLIBCExec(bad.c_str(), nullptr) < 0 ? 0 : 1;
        failures += StatusOf(bad.c_str(), "rB") == 3 << 8 ? 0 : 1;
        failures += OutputOf("/bin/echo", "here") == "here\n" ? 0 : 1;
        failures += ::fcntl(0, F_GETFD) == -1 || ::fcntl(2, F_GETFD) == -1 ? 0 : 1;
        return failures;
    });
    EXPECT_EQ(wrong, 0);
}

TEST(Program, GetsAFixedEnvironment)
{
    ASSERT_EQ(::setenv("PATH", "/tmp/evil", 1), 0);
    ASSERT_EQ(::setenv("LD_PRELOAD", "/tmp/evil.so", 1), 0);
    ASSERT_EQ(::setenv("IFS", "/", 1), 0);
    ASSERT_EQ(::setenv("LC_ALL", "de_DE.UTF-8", 1), 0);
    ASSERT_EQ(::setenv("OVS_RUNDIR", "/tmp/evil", 1), 0);
    EXPECT_EQ(OutputOf("/usr/bin/env"), "PATH=/usr/sbin:/usr/bin:/sbin:/bin\n"
                                        "LC_ALL=C\n"
                                        "OVS_CTL_TIMEOUT=10\n"
                                        "VORNOVS_HOLD=1\n");
    ::unsetenv("LD_PRELOAD");
}

/** @return a signal set of /proc/self/status as the program sees its own. */
unsigned long SignalSet(const std::string& status, const std::string& name)
{
    const size_t begin = status.find(name + ":\t");
    return begin == std::string::npos
               ? ~0UL
               : std::strtoul(status.c_str() + begin + name.size() + 2, nullptr, 16);
}

TEST(Program, GetsDefaultSignalsAndAnEmptyMask)
{
    // The C library keeps two signals to itself.
    constexpr unsigned long kInternal = 0x180000000;
    const int differences = scene::ResultOf([] {
        sigset_t all;
        ::sigfillset(&all);
        ::sigprocmask(SIG_SETMASK, &all, nullptr);
        for (const int signal : {SIGTERM, SIGINT, SIGPIPE, SIGHUP, SIGCHLD, SIGUSR1}) {
            (void)::signal(signal, SIG_IGN);
        }
        const std::string status = OutputOf("/bin/cat", "/proc/self/status");
        return (SignalSet(status, "SigBlk") == 0 ? 0 : 1) +
               ((SignalSet(status, "SigIgn") & ~kInternal) == 0 ? 0 : 2);
    });
    EXPECT_EQ(differences, 0);
}

TEST(Program, GetsNoDescriptorButTheStandardOnes)
{
    int handle = -1;
    ASSERT_EQ(VLIBCFileLockTimeByFile(scene::kLockPath, 1, 0, &handle), 0);
    const int stray = ::open("/etc/passwd", O_RDONLY); // without O_CLOEXEC, as careless clients do
    for (const int number : {4, 5, 20}) {
        if (::fcntl(number, F_GETFD) < 0) {
            ::dup2(stray, number);
        }
    }
    // The fourth is the listing's own.
    EXPECT_EQ(OutputOf("/bin/ls", "/proc/self/fd"), "0\n1\n2\n3\n");
    EXPECT_EQ(OutputOf("/usr/bin/readlink", "/proc/self/fd/0"), "/dev/null\n");
    ::close(stray);
    EXPECT_EQ(VLIBCFileUnlockByFile(handle), 0);
}

TEST(Program, WritesNothingIntoTheClientsDescriptors)
{
    const std::string script = MakeScript("/tmp/program", "echo out; echo err >&2");
    EXPECT_EQ(scene::ResultOf([&] {
                  // Inherited by careless programs: at the numbers of the runner's own, too.
                  const int file = ::open("/tmp/ours", O_RDWR | O_CREAT | O_TRUNC, 0600); // NOLINT
                  for (int number = 0; number < 16; ++number) {
                      (void)::dup2(file, number);
                  }
                  return VLIBCExec(script.c_str(), nullptr) == 0 ? 0 : 1;
              }),
              0);
    EXPECT_EQ(scene::ReadFile("/tmp/ours"), "");
}

TEST(Program, IsIndependentOfTheClientsMaskAndFolder)
{
    const mode_t mask = ::umask(0);
    const std::string script = MakeScript("/tmp/where", "umask; pwd");
    EXPECT_EQ(OutputOf(script.c_str()), "0022\n/\n");
    ::umask(mask);
}

TEST(Program, DoesNotGetTheSignalsOfTheClientsTerminal)
{
    const std::string script = MakeScript("/tmp/session", "ps -o sid=,pgid= -p $$");
    const std::string ids = OutputOf(script.c_str());
    const long session = std::strtol(ids.c_str(), nullptr, 10);
    EXPECT_GT(session, 0) << ids;
    EXPECT_NE(session, ::getsid(0));
}

} // namespace
