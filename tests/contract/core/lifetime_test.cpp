/**
 * Programs that hang, clients that die, daemons that are left behind.
 */
#include "scene.h"

#include "core/program.h"
#include "sandbox/systemlog.h"

#include <chrono>
#include <csignal>
#include <string>
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <sys/wait.h>
#include <vornplatform/core.h>

namespace {

using namespace std::chrono_literals;
using scene::Child;
using scene::Exists;
using scene::IsLockFree;
using scene::MakeScript;
using scene::ReadFile;
using scene::Within;
using scene::WriteFile;
using testing::ElementsAre;

/** A program that runs until there is a file /tmp/gate. */
constexpr char kUntilGate[] =
    "echo $$ > /tmp/pid; while [ ! -e /tmp/gate ]; do sleep 0.02; done; echo end > /tmp/ended";

pid_t IdIn(const char* file)
{
    return static_cast<pid_t>(std::strtol(ReadFile(file).c_str(), nullptr, 10));
}

/** @return whether the process still does something. */
bool IsAlive(pid_t process)
{
    const std::string stat = ReadFile("/proc/" + std::to_string(process) + "/stat");
    const size_t state = stat.rfind(") ");
    return process > 0 && state != std::string::npos && stat[state + 2] != 'Z';
}

int LockAndRun(const std::string& program)
{
    int handle = -1;
    if (VLIBCFileLockTimeByFile(scene::kLockPath, 1, 0, &handle) != 0) {
        return 1;
    }
    return VLIBCExec(program.c_str(), nullptr) == 0 ? 0 : 2;
}

class Lifetime : public testing::Test {
protected:
    void SetUp() override
    {
        for (const char* file : {"/tmp/pid", "/tmp/gate", "/tmp/ended"}) {
            (void)::unlink(file);
        }
    }
};

vornhost::RunnerReport RunFor(const std::string& program, std::chrono::milliseconds deadline)
{
    vornhost::ProgramRequest request;
    request.argv = {program};
    request.deadline = deadline;
    request.runner = VORNRUN_PATH;
    return vornhost::RunProgram(std::move(request));
}

TEST_F(Lifetime, OfAHungProgramEndsAtTheDeadline)
{
    harness::SystemLog log;
    const std::string program = MakeScript("/tmp/hung", kUntilGate);
    const vornhost::RunnerReport report = RunFor(program, 200ms);
    EXPECT_EQ(report.status, SIGTERM);
    EXPECT_NE(report.timedOut, 0);
    EXPECT_FALSE(IsAlive(IdIn("/tmp/pid")));
    EXPECT_THAT(log.Lines(), ElementsAre("4 /tmp/hung: did not end in time and was ended"));
}

TEST_F(Lifetime, OfAHungProgramsGroupEndsWithIt)
{
    const std::string program =
        MakeScript("/tmp/hung", "(trap '' TERM; sleep 60) & echo $! > /tmp/pid; wait");
    const vornhost::RunnerReport report = RunFor(program, 300ms);
    EXPECT_NE(report.status, 0);
    EXPECT_TRUE(Within(5s, [] { return !IsAlive(IdIn("/tmp/pid")); }));
}

TEST_F(Lifetime, OfAProgramThatDoesNotListenEndsTooAndIsAFailure)
{
    const std::string deaf = MakeScript("/tmp/deaf", "trap '' TERM; while :; do sleep 1; done");
    EXPECT_EQ(RunFor(deaf, 200ms).status, SIGKILL);
    const std::string polite = MakeScript("/tmp/polite", "trap 'exit 0' TERM; sleep 60 & wait");
    EXPECT_EQ(RunFor(polite, 200ms).status, SIGTERM) << "it did not do what it was run for";
}

TEST_F(Lifetime, OfAProgramInTimeIsNotTouched)
{
    const vornhost::RunnerReport report = RunFor("/bin/true", 10s);
    EXPECT_EQ(report.status, 0);
    EXPECT_EQ(report.timedOut, 0);
}

TEST_F(Lifetime, OfTheLockIsThatOfTheProgramWhenTheClientIsKilled)
{
    const std::string program = MakeScript("/tmp/program", kUntilGate);
    Child client([&] { return LockAndRun(program); });
    ASSERT_TRUE(Within(10s, [] { return IdIn("/tmp/pid") > 0; }));

    client.Kill();
    EXPECT_EQ(client.Wait(), SIGKILL);
    for (int attempt = 0; attempt < 10; ++attempt) {
        EXPECT_FALSE(IsLockFree()) << "while the program runs";
        std::this_thread::sleep_for(10ms);
    }

    WriteFile("/tmp/gate", "");
    EXPECT_TRUE(Within(10s, IsLockFree));
    EXPECT_EQ(ReadFile("/tmp/ended"), "end\n");
}

TEST_F(Lifetime, OfTheLockIsThatOfTheProgramWhenItsKeeperIsAskedToEndToo)
{
    const std::string program =
        MakeScript("/tmp/program", std::string("echo $PPID > /tmp/keeper; ") + kUntilGate);
    Child client([&] { return LockAndRun(program); });
    ASSERT_TRUE(Within(10s, [] { return IdIn("/tmp/pid") > 0; }));
    for (const int signal : {SIGTERM, SIGHUP, SIGINT}) {
        ::kill(IdIn("/tmp/keeper"), signal);
    }
    client.Kill();
    (void)client.Wait();
    EXPECT_FALSE(Within(100ms, IsLockFree));
    WriteFile("/tmp/gate", "");
    EXPECT_TRUE(Within(10s, IsLockFree));
}

TEST_F(Lifetime, OfTheProgramDoesNotEndWithTheClientsGroup)
{
    const std::string program = MakeScript("/tmp/program", kUntilGate);
    Child client([&] {
        ::setpgid(0, 0);
        return LockAndRun(program);
    });
    ASSERT_TRUE(Within(10s, [] { return IdIn("/tmp/pid") > 0; }));
    ::kill(-client.Id(), SIGTERM);
    EXPECT_EQ(client.Wait(), SIGTERM);
    EXPECT_TRUE(IsAlive(IdIn("/tmp/pid")));
    WriteFile("/tmp/gate", "");
    EXPECT_TRUE(Within(10s, [] { return Exists("/tmp/ended"); }));
    EXPECT_TRUE(Within(10s, IsLockFree));
}

TEST_F(Lifetime, OfTheLockIsNotThatOfADaemonThatTheProgramLeavesBehind)
{
    const std::string program =
        MakeScript("/tmp/program", "setsid sh -c 'echo $$ > /tmp/pid; exec sleep 60' &\n"
                                   "while [ ! -s /tmp/pid ]; do sleep 0.02; done");
    EXPECT_EQ(scene::ResultOf([&] { return LockAndRun(program); }), 0);
    EXPECT_TRUE(Within(2s, IsLockFree));
    ASSERT_TRUE(IsAlive(IdIn("/tmp/pid")));
    ::kill(IdIn("/tmp/pid"), SIGKILL);
}

TEST_F(Lifetime, OfADaemonThatIsLeftBehindIsItsOwnAndDoesNotHoldUpTheAnswer)
{
    const std::string program = MakeScript(
        "/tmp/program", "echo answer; (trap '' PIPE; while [ ! -e /tmp/gate ]; do sleep 0.02; "
                        "echo noise >&2; done; echo end > /tmp/ended) &");
    FILE* const stream = VLIBCPopen(program.c_str(), "r", nullptr);
    ASSERT_NE(stream, nullptr);
    char line[64] = "";
    EXPECT_STREQ(std::fgets(line, sizeof line, stream), "answer\n");
    EXPECT_EQ(VLIBCPclose(stream), 0);
    EXPECT_FALSE(Exists("/tmp/ended"));
    WriteFile("/tmp/gate", "");
    EXPECT_TRUE(Within(10s, [] { return Exists("/tmp/ended"); }));
}

TEST_F(Lifetime, OfALockThatIsReleasedEndsThoughAProgramStillRuns)
{
    const std::string program = MakeScript("/tmp/program", kUntilGate);
    int handle = -1;
    ASSERT_EQ(VLIBCFileLockTimeByFile(scene::kLockPath, 1, 0, &handle), 0);
    std::thread other([&] { EXPECT_EQ(VLIBCExec(program.c_str(), nullptr), 0); });
    EXPECT_TRUE(Within(10s, [] { return IdIn("/tmp/pid") > 0; }));
    EXPECT_EQ(VLIBCFileUnlockByFile(handle), 0);
    EXPECT_TRUE(IsLockFree());
    WriteFile("/tmp/gate", "");
    other.join();
}

TEST_F(Lifetime, OfTheLockEndsWithItsOwnerThoughAForkedChildLivesOn)
{
    Child owner([] {
        int handle = -1;
        if (VLIBCFileLockTimeByFile(scene::kLockPath, 1, 0, &handle) != 0) {
            return 1;
        }
        if (::fork() == 0) {
            while (!Exists("/tmp/gate")) {
                std::this_thread::sleep_for(10ms);
            }
            ::_exit(0);
        }
        WriteFile("/tmp/ended", "forked");
        std::this_thread::sleep_for(60s);
        return 0;
    });
    ASSERT_TRUE(Within(10s, [] { return Exists("/tmp/ended"); }));
    EXPECT_FALSE(IsLockFree());
    owner.Kill();
    EXPECT_EQ(owner.Wait(), SIGKILL);
    EXPECT_TRUE(Within(2s, IsLockFree));
    WriteFile("/tmp/gate", "");
}

} // namespace
