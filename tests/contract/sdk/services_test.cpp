#include "tools.h"

#include <chrono>
#include <filesystem>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/mount.h>
#include <thread>
#include <unistd.h>

namespace {

using contract::Outcome;
using contract::ReadFile;
using contract::RunProgram;
using contract::WriteFile;
using testing::HasSubstr;
using testing::Not;

constexpr char kDatabase[] = "/etc/openvswitch/conf.db";
constexpr char kDbPidFile[] = "/var/run/openvswitch/ovsdb-server.pid";
constexpr char kSwitchPidFile[] = "/var/run/openvswitch/ovs-vswitchd.pid";
const Outcome kSilentSuccess{0, "", ""};

Outcome Db(const std::string& verb)
{
    return RunProgram({"/etc/init.d/vornovs-db", verb});
}

Outcome Switch(const std::string& verb)
{
    return RunProgram({"/etc/init.d/vornovs-vswitch", verb});
}

Outcome Vsctl(std::vector<std::string> words)
{
    words.insert(words.begin(), {"ovs-vsctl", "--timeout=10", "--no-wait"});
    return RunProgram(words);
}

pid_t Pid(const char* pidFile)
{
    return std::atoi(ReadFile(pidFile).c_str());
}

bool Runs(pid_t process)
{
    return process > 0 && kill(process, 0) == 0;
}

// An ended process can be seen until its parent has collected it.
bool IsGone(pid_t process)
{
    const auto limit = std::chrono::steady_clock::now() + std::chrono::seconds(10);
    while (Runs(process) && std::chrono::steady_clock::now() < limit) {
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    return !Runs(process);
}

void Kill(pid_t process)
{
    ASSERT_GT(process, 0);
    ASSERT_EQ(kill(process, SIGKILL), 0);
    ASSERT_TRUE(IsGone(process));
}

std::string StatusText(const char* service, const char* daemon, pid_t process)
{
    return std::string(service) + ": " + daemon + " runs (process " + std::to_string(process) +
           ")\n";
}

class Services : public testing::Test {
protected:
    // As if no switch had ever run here.
    ~Services() override
    {
        EXPECT_EQ(Switch("stop").exitCode, 0);
        EXPECT_EQ(Db("stop").exitCode, 0);
        contract::Delete("/run/openvswitch");
        for (const auto& entry : std::filesystem::directory_iterator("/etc/openvswitch")) {
            contract::Delete(entry.path());
        }
    }
};

TEST_F(Services, DatabaseIsMadeAndAnswersWhenStartReturns)
{
    EXPECT_EQ(Db("start"), kSilentSuccess);

    EXPECT_EQ(Vsctl({"add-br", "br0"}), kSilentSuccess);
    EXPECT_EQ(Vsctl({"list-br"}), (Outcome{0, "br0\n", ""}));
    EXPECT_EQ(Db("status"),
              (Outcome{0, StatusText("vornovs-db", "ovsdb-server", Pid(kDbPidFile)), ""}));
}

TEST_F(Services, StartOfOneThatRunsChangesNothing)
{
    ASSERT_EQ(Db("start"), kSilentSuccess);
    ASSERT_EQ(Switch("start").exitCode, 0);
    const pid_t database = Pid(kDbPidFile);
    const pid_t theSwitch = Pid(kSwitchPidFile);

    EXPECT_EQ(Db("start"), kSilentSuccess);
    EXPECT_EQ(Switch("start"), kSilentSuccess);

    EXPECT_EQ(Pid(kDbPidFile), database);
    EXPECT_EQ(Pid(kSwitchPidFile), theSwitch);
}

TEST_F(Services, StatusTellsOneThatNeverRanFromOneThatDied)
{
    EXPECT_EQ(Db("status"), (Outcome{3, "vornovs-db: ovsdb-server does not run\n", ""}));
    EXPECT_EQ(Switch("status"), (Outcome{3, "vornovs-vswitch: ovs-vswitchd does not run\n", ""}));

    ASSERT_EQ(Db("start"), kSilentSuccess);
    Kill(Pid(kDbPidFile));
    EXPECT_EQ(Db("status"), (Outcome{1,
                                     "vornovs-db: ovsdb-server is dead and has left "
                                     "/var/run/openvswitch/ovsdb-server.pid\n",
                                     ""}));

    ASSERT_EQ(Db("stop"), kSilentSuccess);
    EXPECT_EQ(Db("status").exitCode, 3);
}

TEST_F(Services, StartBringsBackOnesThatWereKilledWithWhatTheyKnew)
{
    ASSERT_EQ(Db("start"), kSilentSuccess);
    ASSERT_EQ(Switch("start").exitCode, 0);
    ASSERT_EQ(Vsctl({"add-br", "br0", "--", "set", "bridge", "br0", "datapath_type=netdev"}),
              kSilentSuccess);
    Kill(Pid(kSwitchPidFile));
    Kill(Pid(kDbPidFile));

    EXPECT_EQ(Db("start"), kSilentSuccess);
    EXPECT_EQ(Switch("start").exitCode, 0);

    EXPECT_EQ(Vsctl({"list-br"}), (Outcome{0, "br0\n", ""}));
    EXPECT_TRUE(Runs(Pid(kSwitchPidFile)));
}

TEST_F(Services, PidFileOfAnotherProcessIsNotTheDaemon)
{
    WriteFile("/run/openvswitch/ovsdb-server.pid", std::to_string(getpid()) + "\n");

    EXPECT_EQ(Db("status").exitCode, 1);
    EXPECT_EQ(Db("start"), kSilentSuccess);
    EXPECT_NE(Pid(kDbPidFile), getpid());
}

TEST_F(Services, StopEndsTheDaemonAndRemovesItsFiles)
{
    ASSERT_EQ(Db("start"), kSilentSuccess);
    ASSERT_EQ(Switch("start").exitCode, 0);
    const pid_t database = Pid(kDbPidFile);
    const pid_t theSwitch = Pid(kSwitchPidFile);

    EXPECT_EQ(Switch("stop"), kSilentSuccess);
    EXPECT_EQ(Db("stop"), kSilentSuccess);

    EXPECT_TRUE(IsGone(database));
    EXPECT_TRUE(IsGone(theSwitch));
    EXPECT_TRUE(std::filesystem::is_empty("/run/openvswitch"));
    EXPECT_EQ(Db("stop"), kSilentSuccess) << "a second time";
}

TEST_F(Services, StopEndsADaemonThatDoesNotListen)
{
    ASSERT_EQ(Db("start"), kSilentSuccess);
    const pid_t database = Pid(kDbPidFile);
    ASSERT_EQ(kill(database, SIGSTOP), 0);

    EXPECT_EQ(Db("stop").exitCode, 0);

    EXPECT_TRUE(IsGone(database));
}

TEST_F(Services, RestartMakesANewProcess)
{
    ASSERT_EQ(Db("start"), kSilentSuccess);
    const pid_t before = Pid(kDbPidFile);

    EXPECT_EQ(Db("restart"), kSilentSuccess);

    EXPECT_NE(Pid(kDbPidFile), before);
    EXPECT_TRUE(Runs(Pid(kDbPidFile)));
}

TEST_F(Services, SwitchCarriesOutWhatTheDatabaseSaysWhenStartReturns)
{
    ASSERT_EQ(Db("start"), kSilentSuccess);
    ASSERT_EQ(Vsctl({"add-br", "br0", "--", "set", "bridge", "br0", "datapath_type=netdev"}),
              kSilentSuccess);

    EXPECT_EQ(Switch("start").exitCode, 0);

    EXPECT_EQ(RunProgram({"ip", "link", "show", "br0"}).exitCode, 0);
    EXPECT_EQ(Switch("status"),
              (Outcome{0, StatusText("vornovs-vswitch", "ovs-vswitchd", Pid(kSwitchPidFile)), ""}));
}

TEST_F(Services, SwitchIsNotStartedWithoutTheDatabase)
{
    EXPECT_EQ(Switch("start"),
              (Outcome{1, "",
                       "vornovs-vswitch: the database does not answer; start vornovs-db first\n"}));
    EXPECT_EQ(ReadFile(kSwitchPidFile), "(none)");
}

TEST_F(Services, SwitchWaitsForTheMachinesTenthSecond)
{
    ASSERT_EQ(Db("start"), kSilentSuccess);
    WriteFile("/run/uptime", "9.99 1.00\n");
    ASSERT_EQ(mount("/run/uptime", "/proc/uptime", nullptr, MS_BIND, nullptr), 0);

    std::atomic<int> exitCode = -1;
    std::jthread start([&] { exitCode = Switch("start").exitCode; });
    std::this_thread::sleep_for(std::chrono::milliseconds(500));
    EXPECT_EQ(ReadFile(kSwitchPidFile), "(none)");

    WriteFile("/run/uptime", "10.00 1.00\n");
    start.join();
    EXPECT_EQ(exitCode, 0);
    EXPECT_TRUE(Runs(Pid(kSwitchPidFile)));
    EXPECT_EQ(umount("/proc/uptime"), 0);
}

TEST_F(Services, DatabaseThatIsEmptyOrUnreadableIsMadeAnew)
{
    WriteFile(kDatabase, "");
    EXPECT_EQ(Db("start"), kSilentSuccess);
    ASSERT_EQ(Db("stop"), kSilentSuccess);

    WriteFile(kDatabase, "garbage");
    const Outcome outcome = Db("start");
    EXPECT_EQ(outcome.exitCode, 0);
    EXPECT_THAT(outcome.errors, HasSubstr("it is now /etc/openvswitch/conf.db.unreadable"));
    EXPECT_EQ(ReadFile("/etc/openvswitch/conf.db.unreadable"), "garbage");
    EXPECT_EQ(Vsctl({"list-br"}), kSilentSuccess);
}

TEST_F(Services, DatabaseOfAnotherVersionIsConvertedAndKeepsItsBridges)
{
    ASSERT_EQ(Db("start"), kSilentSuccess);
    ASSERT_EQ(Vsctl({"add-br", "br0"}), kSilentSuccess);
    ASSERT_EQ(Db("stop"), kSilentSuccess);
    std::string schema = ReadFile("/usr/share/openvswitch/vswitch.ovsschema");
    const std::size_t version = schema.find("\"version\": \"");
    ASSERT_NE(version, std::string::npos);
    schema.replace(version, 14, "\"version\": \"7.");
    WriteFile("/run/old.ovsschema", schema);
    ASSERT_EQ(RunProgram({"ovsdb-tool", "convert", kDatabase, "/run/old.ovsschema"}).exitCode, 0);

    EXPECT_EQ(Db("start"), kSilentSuccess);

    EXPECT_EQ(Vsctl({"list-br"}), (Outcome{0, "br0\n", ""}));
    ASSERT_EQ(Db("stop"), kSilentSuccess);
    EXPECT_EQ(RunProgram({"ovsdb-tool", "needs-conversion", kDatabase,
                          "/usr/share/openvswitch/vswitch.ovsschema"}),
              (Outcome{0, "no\n", ""}));
}

TEST_F(Services, DatabaseThatSomebodyElseRunsIsLeftAlone)
{
    std::filesystem::create_directories("/run/openvswitch");
    ASSERT_EQ(
        RunProgram({"ovsdb-tool", "create", kDatabase, "/usr/share/openvswitch/vswitch.ovsschema"})
            .exitCode,
        0);
    ASSERT_EQ(RunProgram({"ovsdb-server", kDatabase, "--remote=punix:/var/run/openvswitch/db.sock",
                          "--pidfile=/run/other.pid", "--unixctl=/run/other.ctl", "--detach"})
                  .exitCode,
              0);

    EXPECT_EQ(Db("start"), kSilentSuccess);

    EXPECT_EQ(ReadFile(kDbPidFile), "(none)");
    EXPECT_TRUE(Runs(Pid("/run/other.pid")));
    Kill(Pid("/run/other.pid"));
}

TEST_F(Services, DaemonsKeepNothingOfTheirCaller)
{
    const Outcome started = RunProgram(
        {"bash", "-c",
         "exec 3>/run/three 7>/run/seven 100>/run/hundred\n"
         "setsid -w sh -c '/etc/init.d/vornovs-db start && /etc/init.d/vornovs-vswitch start; "
         "kill -9 0'"});
    EXPECT_NE(started.exitCode, 0) << "the caller's group was killed";

    for (const char* const pidFile : {kDbPidFile, kSwitchPidFile}) {
        const pid_t process = Pid(pidFile);
        ASSERT_TRUE(Runs(process)) << pidFile;
        for (const pid_t each : {process, getpgid(process)}) {
            const std::string open =
                RunProgram({"ls", "-l", "/proc/" + std::to_string(each) + "/fd"}).output;
            EXPECT_THAT(open, HasSubstr("0 -> /dev/null"));
            EXPECT_THAT(open, Not(HasSubstr("/run/three")));
            EXPECT_THAT(open, Not(HasSubstr("/run/seven")));
            EXPECT_THAT(open, Not(HasSubstr("/run/hundred")));
            EXPECT_THAT(open, Not(HasSubstr("/run/vornovs/")));
        }
        EXPECT_NE(getsid(process), getsid(0));
    }
}

TEST_F(Services, ScriptsRunUnderASmallShell)
{
    const std::string shell = VORNOVS_OPENVSWITCH_TREE "/bin/busybox";
    for (const char* const script : {"/etc/init.d/vornovs-db", "/etc/init.d/vornovs-vswitch"}) {
        EXPECT_EQ(RunProgram({shell, "sh", script, "start"}).exitCode, 0) << script;
        EXPECT_EQ(RunProgram({shell, "sh", script, "status"}).exitCode, 0) << script;
        EXPECT_EQ(RunProgram({shell, "sh", script, "restart"}).exitCode, 0) << script;
    }
}

TEST_F(Services, RefuseOtherVerbs)
{
    const std::string verbs = " start|stop|restart|force-reload|status\n";
    EXPECT_EQ(Db(""), (Outcome{2, "", "Usage: /etc/init.d/vornovs-db" + verbs}));
    EXPECT_EQ(Switch("reload"), (Outcome{2, "", "Usage: /etc/init.d/vornovs-vswitch" + verbs}));
}

} // namespace
