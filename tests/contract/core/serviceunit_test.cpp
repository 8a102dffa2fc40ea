#include "scene.h"
#include "systemd/fakesystemd.h"

#include <atomic>
#include <chrono>
#include <string>
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <sys/mount.h>
#include <unistd.h>
#include <vornplatform/core.h>

namespace {

using harness::FakeSystemd;
using scene::MakeScript;
using scene::ReadFile;
using scene::WriteFile;
using std::chrono::seconds;
using testing::ElementsAre;
using testing::IsEmpty;

constexpr char kService[] = "vornovs-db";
constexpr char kUnit[] = "vornovs-db.service";
constexpr char kScript[] = "/etc/init.d/vornovs-db";
constexpr char kVerbs[] = "/tmp/verbs";

class ServiceUnit : public testing::Test {
protected:
    void SetUp() override
    {
        MakeScript(kScript, "echo \"$@\" $VORNOVS_SCRIPT >> /tmp/verbs\nexit 0");
        WriteFile(kVerbs, "");
    }
};

TEST_F(ServiceUnit, StartsInsteadOfTheScriptWhereSystemdRuns)
{
    FakeSystemd systemd;
    systemd.AddUnit(kUnit);
    EXPECT_EQ(VLIBServiceStart(kService, 0), 0);
    EXPECT_THAT(systemd.Jobs(), ElementsAre("StartUnit vornovs-db.service"));
    EXPECT_EQ(ReadFile(kVerbs), "");
}

TEST_F(ServiceUnit, IsStoppedTogetherWithADaemonThatIsNotItsOwn)
{
    FakeSystemd systemd;
    systemd.AddUnit(kUnit);
    EXPECT_EQ(VLIBServiceStop(kService, 0), 0);
    EXPECT_THAT(systemd.Jobs(), ElementsAre("StopUnit vornovs-db.service"));
    EXPECT_EQ(ReadFile(kVerbs), "stop alone\n");
}

TEST_F(ServiceUnit, IsStoppedWithoutAScript)
{
    FakeSystemd systemd;
    systemd.AddUnit("vornwifid.service", "active");
    EXPECT_EQ(VLIBServiceStop("vornwifid", 0), 0);
    EXPECT_THAT(systemd.Jobs(), ElementsAre("StopUnit vornwifid.service"));
}

TEST_F(ServiceUnit, IsRestartedInOneJobWhenItIsActive)
{
    FakeSystemd systemd;
    systemd.AddUnit(kUnit, "active");
    EXPECT_EQ(VLIBServiceRestart(kService), 0);
    EXPECT_THAT(systemd.Jobs(), ElementsAre("RestartUnit vornovs-db.service"));
    EXPECT_EQ(ReadFile(kVerbs), "");
}

TEST_F(ServiceUnit, IsRestartedByStoppingADaemonThatIsNotItsOwn)
{
    FakeSystemd systemd;
    systemd.AddUnit(kUnit);
    EXPECT_EQ(VLIBServiceRestart(kService), 0);
    EXPECT_THAT(systemd.Jobs(),
                ElementsAre("StopUnit vornovs-db.service", "StartUnit vornovs-db.service"));
    EXPECT_EQ(ReadFile(kVerbs), "stop alone\n");
}

TEST_F(ServiceUnit, ThatFailsIsReported)
{
    FakeSystemd systemd([](const std::string&, const std::string&) { return "failed"; });
    systemd.AddUnit(kUnit, "active");
    EXPECT_LT(VLIBServiceStart(kService, 0), 0);
    EXPECT_LT(VLIBServiceStop(kService, 0), 0);
    EXPECT_LT(VLIBServiceRestart(kService), 0);
    EXPECT_EQ(ReadFile(kVerbs), "");
}

TEST_F(ServiceUnit, ThatIsNotThereLeavesTheWorkToTheScript)
{
    FakeSystemd systemd;
    EXPECT_EQ(VLIBServiceStart(kService, 0), 0);
    EXPECT_EQ(VLIBServiceStop(kService, 0), 0);
    EXPECT_EQ(VLIBServiceRestart(kService), 0);
    EXPECT_LT(VLIBServiceStart("vornwifid", 0), 0);
    EXPECT_THAT(systemd.Jobs(), IsEmpty());
    EXPECT_EQ(ReadFile(kVerbs), "start alone\nstop alone\nrestart alone\n");
}

TEST_F(ServiceUnit, KeepsTheLockUntilItIsStartedWhenTheClientIsKilled)
{
    std::atomic<bool> goOn = false;
    std::atomic<bool> begun = false;
    FakeSystemd systemd([&](const std::string&, const std::string&) {
        begun = true;
        while (!goOn) {
            std::this_thread::sleep_for(std::chrono::milliseconds(5));
        }
        return "done";
    });
    systemd.AddUnit(kUnit);
    scene::Child client([] {
        int handle = -1;
        (void)VLIBCFileLockTimeByFile(scene::kLockPath, 1, 5, &handle);
        return VLIBServiceStart(kService, 0);
    });
    ASSERT_TRUE(scene::Within(seconds(20), [&] { return begun.load(); }));
    client.Kill();
    EXPECT_FALSE(scene::IsLockFree());
    goOn = true;
    EXPECT_TRUE(scene::Within(seconds(20), [] { return scene::IsLockFree(); }));
}

TEST_F(ServiceUnit, WithoutAScriptRunsWhileItHasProcesses)
{
    ASSERT_EQ(::mount("none", "/sys/fs/cgroup", "tmpfs", 0, nullptr), 0) << errno;
    const std::string events = "/sys/fs/cgroup/system.slice/vornwifid.service/cgroup.events";
    scene::MakeFolder("/sys/fs/cgroup/system.slice/vornwifid.service");
    WriteFile(events, "populated 1\nfrozen 0\n");
    EXPECT_EQ(VLIBServiceIsRunning("vornwifid"), 0) << "where systemd does not run";

    FakeSystemd systemd;
    EXPECT_EQ(VLIBServiceIsRunning("vornwifid"), 1);
    WriteFile(events, "populated 0\nfrozen 0\n");
    EXPECT_EQ(VLIBServiceIsRunning("vornwifid"), 0);
    ::unlink(events.c_str());
    EXPECT_EQ(VLIBServiceIsRunning("vornwifid"), 0);
    EXPECT_THAT(systemd.Jobs(), IsEmpty());
    EXPECT_EQ(::umount2("/sys/fs/cgroup", MNT_DETACH), 0);
}

} // namespace
