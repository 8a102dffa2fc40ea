#include <vornovs/vornovs.h>

#include "system/pause.h"

#include "support/support.h"

#include <ostream>

using harness::Err;
using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::Calls;
using unit::LongName;
using VORN::OVS::CopyGatewayInfo;
using VORN::OVS::IsDaemonAlive;
using VORN::OVS::IsInterfaceExist;
using VORN::OVS::NotSupportOVS;
using VORN::OVS::RemoveGateWayInfo;
using VORN::OVS::StartNetwork;
using VORN::OVS::StartOVSDaemon;
using VORN::OVS::StopNetwork;
using VORN::OVS::StopOVSBaemon;

namespace {

constexpr char kFile[] = "util.cpp";

std::vector<std::string> ManyNames(std::size_t count)
{
    std::vector<std::string> names;
    for (std::size_t i = 0; i < count; ++i) {
        names.push_back("eth" + std::to_string(i));
    }
    return names;
}

std::string Joined(const std::string& start, const std::vector<std::string>& names)
{
    std::string text = start;
    for (const std::string& name : names) {
        text += " " + name;
    }
    return text;
}

TEST(IsDaemonAlive, AsksDatabaseThenSwitch)
{
    const RecordingPlatform platform;
    EXPECT_TRUE(IsDaemonAlive());
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBServiceIsRunning vornovs-db",
                                              "VLIBServiceIsRunning vornovs-vswitch"));
}

TEST(IsDaemonAlive, DoesNotAskForTheSwitchWhenTheDatabaseDoesNotRun)
{
    RecordingPlatform platform;
    platform.Answer("VLIBServiceIsRunning vornovs-db", 0);
    EXPECT_FALSE(IsDaemonAlive());
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBServiceIsRunning vornovs-db"));
}

TEST(IsDaemonAlive, IsFalseWhenTheSwitchDoesNotRun)
{
    RecordingPlatform platform;
    platform.Answer("VLIBServiceIsRunning vornovs-vswitch", 0);
    EXPECT_FALSE(IsDaemonAlive());
}

TEST(IsDaemonAlive, TakesEveryAnswerBut0AsRunning)
{
    for (const int answer : {-1, 2}) {
        RecordingPlatform platform;
        platform.Answer("VLIBServiceIsRunning", answer);
        EXPECT_TRUE(IsDaemonAlive()) << answer;
    }
}

TEST(StartOVSDaemon, StartsTheDatabaseBeforeTheSwitch)
{
    const RecordingPlatform platform;
    EXPECT_TRUE(StartOVSDaemon());
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBServiceStart vornovs-db", "VLIBServiceStart vornovs-vswitch"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(StartOVSDaemon, StopsAtADatabaseThatDoesNotStart)
{
    RecordingPlatform platform;
    platform.Answer("VLIBServiceStart vornovs-db", -1);
    EXPECT_FALSE(StartOVSDaemon());
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBServiceStart vornovs-db"));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to call the ovs-db related upstart")));
}

TEST(StartOVSDaemon, LeavesTheDatabaseStartedWhenTheSwitchDoesNotStart)
{
    RecordingPlatform platform;
    platform.Answer("VLIBServiceStart vornovs-vswitch", -1);
    EXPECT_FALSE(StartOVSDaemon());
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBServiceStart vornovs-db", "VLIBServiceStart vornovs-vswitch"));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to call the ovs-db related upstart")));
}

TEST(StartOVSDaemon, TakesAPositiveAnswerAsSuccess)
{
    RecordingPlatform platform;
    platform.Answer("VLIBServiceStart", 1);
    EXPECT_TRUE(StartOVSDaemon());
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(StopOVSBaemon, StopsTheSwitchBeforeTheDatabase)
{
    const RecordingPlatform platform;
    EXPECT_TRUE(StopOVSBaemon());
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBServiceStop vornovs-vswitch", "VLIBServiceStop vornovs-db"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(StopOVSBaemon, StopsAtASwitchThatDoesNotStop)
{
    RecordingPlatform platform;
    platform.Answer("VLIBServiceStop vornovs-vswitch", -1);
    EXPECT_FALSE(StopOVSBaemon());
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBServiceStop vornovs-vswitch"));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to kill the process ovs-vswitchd")));
}

TEST(StopOVSBaemon, NamesADatabaseThatDoesNotStop)
{
    RecordingPlatform platform;
    platform.Answer("VLIBServiceStop vornovs-db", -1);
    EXPECT_FALSE(StopOVSBaemon());
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to kill the process ovsdb-server")));
}

TEST(StopOVSBaemon, TakesAPositiveAnswerAsSuccess)
{
    RecordingPlatform platform;
    platform.Answer("VLIBServiceStop", 1);
    EXPECT_TRUE(StopOVSBaemon());
    EXPECT_THAT(platform.Log(), IsEmpty());
}

/** Both functions differ in the verb alone. */
struct NetworkCall {
    std::string verb;
    bool (*run)(const std::vector<std::string>&);

    friend void PrintTo(const NetworkCall& call, std::ostream* out) { *out << call.verb; }
};

class Network : public testing::TestWithParam<NetworkCall> {};

INSTANTIATE_TEST_SUITE_P(Both, Network,
                         testing::Values(NetworkCall{"start", StartNetwork},
                                         NetworkCall{"stop", StopNetwork}),
                         [](const auto& test) { return test.param.verb; });

TEST_P(Network, RunsTheScriptWithoutInterfaceForNoNames)
{
    const RecordingPlatform platform;
    EXPECT_TRUE(GetParam().run({}));
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBCExecv /etc/rc.network " + GetParam().verb));
}

TEST_P(Network, PassesTheNamesInTheirOrder)
{
    const RecordingPlatform platform;
    EXPECT_TRUE(GetParam().run({"eth1", "eth0", "eth1"}));
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCExecv /etc/rc.network " + GetParam().verb + " eth1 eth0 eth1"));
}

TEST_P(Network, Passes124Names)
{
    const RecordingPlatform platform;
    const std::vector<std::string> names = ManyNames(124);
    EXPECT_TRUE(GetParam().run(names));
    EXPECT_THAT(platform.Calls(),
                ElementsAre(Joined("VLIBCExecv /etc/rc.network " + GetParam().verb, names)));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST_P(Network, Refuses125NamesAndRunsNothing)
{
    const RecordingPlatform platform;
    EXPECT_FALSE(GetParam().run(ManyNames(125)));
    EXPECT_THAT(platform.Calls(), IsEmpty());
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(
                    kFile, "Fatal Error: The size of interface 125 bigger than the limtation")));
}

TEST_P(Network, FailsSilentlyOnEveryAnswerBut0)
{
    for (const int answer : {-1, 1, 256}) {
        RecordingPlatform platform;
        platform.Answer("VLIBCExecv", answer);
        EXPECT_FALSE(GetParam().run({"eth0"})) << answer;
        EXPECT_THAT(platform.Log(), IsEmpty()) << answer;
    }
}

TEST_P(Network, StandsNamesOf5000Characters)
{
    const RecordingPlatform platform;
    EXPECT_TRUE(GetParam().run({LongName()}));
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCExecv /etc/rc.network " + GetParam().verb + " " + LongName()));
}

TEST(IsInterfaceExist, AsksForTheInterfacesFlags)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileExist", 1);
    EXPECT_TRUE(IsInterfaceExist("eth0"));
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBCFileExist /sys/class/net/eth0/flags"));
}

TEST(IsInterfaceExist, TakesEveryAnswerBut0AsThere)
{
    for (const int answer : {-1, 2}) {
        RecordingPlatform platform;
        platform.Answer("VLIBCFileExist", answer);
        EXPECT_TRUE(IsInterfaceExist("eth0")) << answer;
    }
    RecordingPlatform platform;
    platform.Answer("VLIBCFileExist", 0);
    EXPECT_FALSE(IsInterfaceExist("eth0"));
}

TEST(IsInterfaceExist, CutsThePathToItsBuffer)
{
    const RecordingPlatform platform;
    EXPECT_FALSE(IsInterfaceExist(LongName()));
    const std::string path = "/sys/class/net/" + LongName();
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBCFileExist " + path.substr(0, 1023)));
}

TEST(CopyGatewayInfo, CopiesIPv4ThenIPv6)
{
    const RecordingPlatform platform;
    EXPECT_EQ(CopyGatewayInfo("eth0", "ovs_eth0"), 0);
    EXPECT_THAT(
        platform.Calls(),
        ElementsAre("VLIBCExecl /usr/vorn/sbin/vornnetdtool --copy-gateway-info -4 eth0 ovs_eth0",
                    "VLIBCExecl /usr/vorn/sbin/vornnetdtool --copy-gateway-info -6 eth0 ovs_eth0"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(CopyGatewayInfo, DoesNotTryIPv6WhenIPv4Fails)
{
    for (const int answer : {-1, 1}) {
        RecordingPlatform platform;
        platform.Answer("VLIBCExecl /usr/vorn/sbin/vornnetdtool --copy-gateway-info -4", answer);
        EXPECT_EQ(CopyGatewayInfo("eth0", "ovs_eth0"), -1) << answer;
        EXPECT_EQ(platform.Calls().size(), 1U) << answer;
        EXPECT_THAT(
            platform.Log(),
            ElementsAre(Err(kFile, "Failed to copy the gateway info from eth0 to ovs_eth0")))
            << answer;
    }
}

TEST(CopyGatewayInfo, FailsWhenIPv6Fails)
{
    for (const int answer : {-1, 1}) {
        RecordingPlatform platform;
        platform.Answer("VLIBCExecl /usr/vorn/sbin/vornnetdtool --copy-gateway-info -6", answer);
        EXPECT_EQ(CopyGatewayInfo("eth0", "ovs_eth0"), -1) << answer;
        EXPECT_THAT(
            platform.Log(),
            ElementsAre(Err(kFile, "Failed to copy the gateway info from eth0 to ovs_eth0")))
            << answer;
    }
}

TEST(CopyGatewayInfo, RefusesANullName)
{
    const RecordingPlatform platform;
    EXPECT_EQ(CopyGatewayInfo(nullptr, "ovs_eth0"), -1);
    EXPECT_EQ(CopyGatewayInfo("eth0", nullptr), -1);
    EXPECT_THAT(platform.Calls(), IsEmpty());
}

TEST(RemoveGateWayInfo, RemovesIPv4ThenIPv6)
{
    const RecordingPlatform platform;
    EXPECT_EQ(RemoveGateWayInfo("bond0"), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCExec /usr/vorn/sbin/vornnetdtool --del-gateway-info -4 bond0",
                            "VLIBCExec /usr/vorn/sbin/vornnetdtool --del-gateway-info -6 bond0"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(RemoveGateWayInfo, DoesNotTryIPv6WhenIPv4Fails)
{
    for (const int answer : {-1, 1}) {
        RecordingPlatform platform;
        platform.Answer("VLIBCExec /usr/vorn/sbin/vornnetdtool --del-gateway-info -4", answer);
        EXPECT_EQ(RemoveGateWayInfo("bond0"), -1) << answer;
        EXPECT_EQ(platform.Calls().size(), 1U) << answer;
        EXPECT_THAT(
            platform.Log(),
            ElementsAre(Err(kFile, "Failed to use the vornnetdtool to delete gateway info")))
            << answer;
    }
}

TEST(RemoveGateWayInfo, FailsWhenIPv6Fails)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCExec /usr/vorn/sbin/vornnetdtool --del-gateway-info -6", 1);
    EXPECT_EQ(RemoveGateWayInfo("bond0"), -1);
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to use the vornnetdtool to delete gateway info")));
}

TEST(RemoveGateWayInfo, RefusesANullName)
{
    const RecordingPlatform platform;
    EXPECT_EQ(RemoveGateWayInfo(nullptr), -1);
    EXPECT_THAT(platform.Calls(), IsEmpty());
}

TEST(GatewayInfo, StandsNamesOf5000Characters)
{
    const RecordingPlatform platform;
    EXPECT_EQ(CopyGatewayInfo(LongName().c_str(), LongName().c_str()), 0);
    EXPECT_EQ(RemoveGateWayInfo(LongName().c_str()), 0);
    EXPECT_EQ(platform.Calls().size(), 4U);
}

TEST(NotSupportOVS, Is0OnEveryHost)
{
    const RecordingPlatform platform;
    EXPECT_EQ(NotSupportOVS(), 0);
    EXPECT_THAT(platform.Calls(), IsEmpty());
}

TEST(Pause, IsNotShortenedBySignals)
{
    RecordingPlatform platform;
    platform.AnswerNth("sleep 3", 1, 2);
    platform.AnswerNth("sleep 2", 1, 1);
    VORN::OVS::Pause(3);
    EXPECT_THAT(platform.Calls(), ElementsAre("sleep 3", "sleep 2", "sleep 1"));
}

TEST(Pause, OfNoLengthSleepsNotAtAll)
{
    const RecordingPlatform platform;
    VORN::OVS::Pause(0);
    EXPECT_THAT(platform.Calls(), IsEmpty());
}

} // namespace
