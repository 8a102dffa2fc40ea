#include <vornovs/vornovs.h>

#include "support/support.h"

#include <ostream>

using harness::Err;
using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::LongName;
using VORN::OVS::OVSManager;

namespace {

constexpr char kFile[] = "ovsmanager.cpp";

/** Both operations differ in the verb and the text alone. */
struct PortCall {
    std::string name;
    bool (OVSManager::*run)(const std::string&, const std::string&) const;
    std::string verb;
    std::string word;

    friend void PrintTo(const PortCall& call, std::ostream* out) { *out << call.name; }
};

class ManagerPort : public testing::TestWithParam<PortCall> {
protected:
    static bool Run(const std::string& bridge, const std::string& port)
    {
        const OVSManager manager;
        return (manager.*GetParam().run)(bridge, port);
    }

    static std::string Command(const std::string& bridge, const std::string& port)
    {
        return "VLIBCExec /usr/bin/ovs-vsctl " + GetParam().verb + " " + bridge + " " + port;
    }
};

INSTANTIATE_TEST_SUITE_P(
    Both, ManagerPort,
    testing::Values(PortCall{"AttachPort", &OVSManager::AttachPort, "add-port", "attach"},
                    PortCall{"DetachPort", &OVSManager::DetachPort, "del-port", "detach"}),
    [](const auto& test) { return test.param.name; });

TEST_P(ManagerPort, RunsTheToolWhenTheServicesRun)
{
    const RecordingPlatform platform;
    EXPECT_TRUE(Run("ovs_eth0", "tap0"));
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBServiceIsRunning vornovs-db",
                            "VLIBServiceIsRunning vornovs-vswitch", Command("ovs_eth0", "tap0")));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST_P(ManagerPort, StartsTheServicesFirst)
{
    RecordingPlatform platform;
    platform.Answer("VLIBServiceIsRunning vornovs-vswitch", 0);
    EXPECT_TRUE(Run("ovs_eth0", "tap0"));
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBServiceIsRunning vornovs-db",
                            "VLIBServiceIsRunning vornovs-vswitch", "VLIBServiceStart vornovs-db",
                            "VLIBServiceStart vornovs-vswitch", Command("ovs_eth0", "tap0")));
}

TEST_P(ManagerPort, IsDoneWithoutTheToolWhenTheServicesCannotBeStarted)
{
    RecordingPlatform platform;
    platform.Answer("VLIBServiceIsRunning", 0);
    platform.Answer("VLIBServiceStart vornovs-vswitch", -1);
    EXPECT_TRUE(Run("ovs_eth0", "tap0"));
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBServiceIsRunning vornovs-db", "VLIBServiceStart vornovs-db",
                            "VLIBServiceStart vornovs-vswitch"));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err("util.cpp", "Failed to call the ovs-db related upstart"),
                            Err(kFile, "Fail to start OVS Daemon")));
}

TEST_P(ManagerPort, FailsOnEveryAnswerBut0)
{
    for (const int answer : {-1, 1}) {
        RecordingPlatform platform;
        platform.Answer("VLIBCExec", answer);
        EXPECT_FALSE(Run("ovs_eth0", "tap0")) << answer;
        EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Fail to " + GetParam().word +
                                                               " the tap0 into ovs_eth0")))
            << answer;
    }
}

TEST_P(ManagerPort, StandsNamesOf5000Characters)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCExec", 1);
    EXPECT_FALSE(Run(LongName(), LongName()));
    EXPECT_EQ(platform.Calls().back(), Command(LongName(), LongName()));
}

} // namespace
