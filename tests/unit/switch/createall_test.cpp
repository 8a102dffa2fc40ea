#include <vornovs/vornovs.h>

#include "switch/hostcalls.h"

#include <algorithm>

using harness::Err;
using harness::Info;
using harness::RecordingPlatform;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::BridgeMade;
using unit::Calls;
using unit::Discovered;
using unit::EightLines;
using unit::EightTries;
using unit::GatewaysCopied;
using unit::kNoTopology;
using unit::kStarted;
using unit::kStopped;
using unit::kTopology;
using unit::Sequence;
using unit::SpeedLine;
using VORN::OVS::OVSManager;
namespace {

constexpr const char* kFile = unit::kManagerFile;
constexpr char kBegin[] = "ExecHook net net/ovs_change 4 ACTION=create";
constexpr char kDone[] = "ExecHook net net/ovs_change 5 ACTION=create";

const Calls kTopologyEdits{
    "VLIBCFileSetKeyValue /etc/sysconfig/network-scripts/ifcfg-br0 ONBOOT=no",
    "VLIBCFileRemoveKey /etc/sysconfig/network-scripts/ifcfg-eth0 BRIDGE",
    "VLIBCFileSetKeyValue /etc/sysconfig/network-scripts/ifcfg-wlan0 BRIDGE=ovs_eth0"};

const Calls kOnePort = Sequence({Discovered({"eth0"}),
                                 GatewaysCopied("eth0", "ovs_eth0"),
                                 kStopped,
                                 kNoTopology,
                                 BridgeMade("eth0"),
                                 kStarted,
                                 {"VORNNetGetEthInfo ovs_eth0", kDone}});

/** The whole list of calls without one. */
Calls Without(Calls calls, const std::string& call)
{
    EXPECT_EQ(std::erase(calls, call), 1U) << call;
    return calls;
}

TEST(CreateAll, ConvertsAHostWithOnePort)
{
    const RecordingPlatform platform;
    EXPECT_TRUE(OVSManager().CreateAll());
    EXPECT_EQ(platform.Calls(), kOnePort);
    EXPECT_THAT(platform.Log(), ElementsAre(SpeedLine()));
    EXPECT_EQ(unit::ReadFile(unit::kInterfaceList), "eth0\n");
}

TEST(CreateAll, ConvertsThePortsInTheOrderOfTheirNamesAndAwaitsTheFirst)
{
    RecordingPlatform platform;
    platform.Interfaces({"eth2", "eth0", "eth1"});
    EXPECT_TRUE(OVSManager().CreateAll());
    EXPECT_EQ(platform.Calls(), Sequence({Discovered({"eth2", "eth0", "eth1"}),
                                          GatewaysCopied("eth0", "ovs_eth0"),
                                          GatewaysCopied("eth1", "ovs_eth1"),
                                          GatewaysCopied("eth2", "ovs_eth2"),
                                          kStopped,
                                          kNoTopology,
                                          BridgeMade("eth0"),
                                          BridgeMade("eth1"),
                                          BridgeMade("eth2"),
                                          kStarted,
                                          {"VORNNetGetEthInfo ovs_eth0", kDone}}));
    EXPECT_THAT(platform.Log(), ElementsAre(SpeedLine()));
}

TEST(CreateAll, StopsAfterADiscoveryThatFails)
{
    RecordingPlatform platform;
    platform.Answer("VLIBNetGetInterfaceInfo", 0);
    EXPECT_FALSE(OVSManager().CreateAll());
    EXPECT_THAT(platform.Calls(), ElementsAre(kBegin, "VLIBNetGetInterfaceInfo"));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "No interface."),
                                            Err(kFile, "Failed to get all interface")));
    EXPECT_THAT(platform.OpenHandles(), IsEmpty());
}

TEST(CreateAll, DoesNotMindAHookThatFails)
{
    RecordingPlatform platform;
    platform.Answer("ExecHook", -1);
    platform.Answer("SetEnv", -1);
    EXPECT_TRUE(OVSManager().CreateAll());
    EXPECT_EQ(platform.Calls(), kOnePort);
    EXPECT_THAT(platform.Log(), ElementsAre(SpeedLine()));
}

TEST(CreateAll, FailsWithoutMemoryForTheHook)
{
    RecordingPlatform platform;
    platform.Answer("BaseHook", 0);
    EXPECT_FALSE(OVSManager().CreateAll());
    EXPECT_THAT(platform.Calls(), IsEmpty());
}

TEST(CreateAll, DoesNotMindGatewaysThatCannotBeCopied)
{
    RecordingPlatform platform;
    const std::string ipv6 = GatewaysCopied("eth0", "ovs_eth0")[1];
    platform.Answer("VLIBCExecl /usr/vorn/sbin/vornnetdtool", 1);
    EXPECT_TRUE(OVSManager().CreateAll());
    EXPECT_EQ(platform.Calls(), Without(kOnePort, ipv6));
    EXPECT_THAT(
        platform.Log(),
        ElementsAre(Err("util.cpp", "Failed to copy the gateway info from eth0 to ovs_eth0"),
                    SpeedLine()));
}

TEST(CreateAll, GoesOnWhenTheNetworkScriptFails)
{
    for (const int answer : {-1, 1}) {
        unit::WriteFile(unit::kInterfaceList, "");
        RecordingPlatform platform;
        platform.Answer("VLIBCExecl /etc/rc.network", answer);
        EXPECT_TRUE(OVSManager().CreateAll()) << answer;
        EXPECT_EQ(platform.Calls(), kOnePort) << answer;
        EXPECT_THAT(platform.Log(),
                    ElementsAre(Err(kFile, "Failed to stop the rc.network"),
                                Err(kFile, "Failed to start the rc.network"), SpeedLine()))
            << answer;
    }
}

TEST(CreateAll, PausesAWholeThreeSecondsWhateverSignalsCome)
{
    RecordingPlatform platform;
    platform.AnswerNth("sleep 3", 1, 1);
    EXPECT_TRUE(OVSManager().CreateAll());
    Calls expected = kOnePort;
    const auto pause = std::find(expected.begin(), expected.end(), "sleep 3");
    expected.insert(pause + 1, "sleep 1");
    EXPECT_EQ(platform.Calls(), expected);
}

TEST(CreateAll, LeavesAWirelessServiceAloneOnEveryAnswerBut1)
{
    for (const int answer : {-1, 0, 2}) {
        unit::WriteFile(unit::kInterfaceList, "");
        RecordingPlatform platform;
        platform.Answer("VLIBServiceIsRunning vornwifid", answer);
        EXPECT_TRUE(OVSManager().CreateAll()) << answer;
        EXPECT_EQ(platform.Calls(), Without(kOnePort, "VLIBServiceRestart vornwifid")) << answer;
    }
}

TEST(CreateAll, GoesOnWhenTheWirelessServiceDoesNotRestart)
{
    RecordingPlatform platform;
    platform.Answer("VLIBServiceRestart", -1);
    EXPECT_TRUE(OVSManager().CreateAll());
    EXPECT_EQ(platform.Calls(), kOnePort);
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Filed to restart the vornwifid"), SpeedLine()));
}

TEST(CreateAll, TakesAPositiveAnswerOfTheRestartAsSuccess)
{
    RecordingPlatform platform;
    platform.Answer("VLIBServiceRestart", 1);
    EXPECT_TRUE(OVSManager().CreateAll());
    EXPECT_THAT(platform.Log(), ElementsAre(SpeedLine()));
}

TEST(CreateAll, GoesOnWithTheOtherPortsWhenOneHasNoFile)
{
    RecordingPlatform platform;
    platform.Interfaces({"eth0", "eth1"});
    platform.AnswerNth("VLIBCExec /bin/cp", 1, -1);
    EXPECT_TRUE(OVSManager().CreateAll());
    const std::string prefix = unit::kIfcfg;
    const Calls cutShort{"VLIBCFileCheckDir /usr/vorn/etc/vornovs",
                         "VLIBCFileExist /usr/vorn/etc/vornovs/ovs_interface.conf",
                         "VLIBCExec /bin/cp -f " + prefix + "eth0 " + prefix + "ovs_eth0"};
    EXPECT_EQ(platform.Calls(), Sequence({Discovered({"eth0", "eth1"}),
                                          GatewaysCopied("eth0", "ovs_eth0"),
                                          GatewaysCopied("eth1", "ovs_eth1"),
                                          kStopped,
                                          kNoTopology,
                                          cutShort,
                                          BridgeMade("eth1"),
                                          kStarted,
                                          {"VORNNetGetEthInfo ovs_eth0", kDone}}));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to copy the config " + prefix + "eth0 to " + prefix +
                                           "ovs_eth0"),
                            Err(kFile, "Failed to handle the ifcfg for non-br interface eth0"),
                            Err(kFile, "Failed to create ovs for eth0"), SpeedLine()));
    EXPECT_EQ(unit::ReadFile(unit::kInterfaceList), "eth1\n");
}

TEST(CreateAll, AwaitsNoBridgeWhenThereIsNothingToConvert)
{
    RecordingPlatform platform;
    platform.Interfaces({"wlan0"});
    EXPECT_TRUE(OVSManager().CreateAll());
    EXPECT_EQ(
        platform.Calls(),
        Sequence({{kBegin, "VLIBNetGetInterfaceInfo"}, kStopped, kNoTopology, kStarted, {kDone}}));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(CreateAll, Waits8SecondsForABridgeThatNeverReportsASpeed)
{
    RecordingPlatform platform;
    platform.LinkSpeeds("ovs_eth0", {-1});
    EXPECT_TRUE(OVSManager().CreateAll());
    Calls expected(kOnePort.begin(), kOnePort.end() - 2);
    EXPECT_EQ(platform.Calls(), Sequence({expected, EightTries("ovs_eth0"), {kDone}}));
    EXPECT_EQ(platform.Log(), EightLines(6, "ovs_eth0"));
}

TEST(CreateAll, StopsWaitingWithTheFirstSpeedThatIsNotMinus1)
{
    for (const int speed : {0, -2, 10000}) {
        unit::WriteFile(unit::kInterfaceList, "");
        RecordingPlatform platform;
        platform.LinkSpeeds("ovs_eth0", {-1, -1, speed, -1});
        EXPECT_TRUE(OVSManager().CreateAll()) << speed;
        Calls expected(kOnePort.begin(), kOnePort.end() - 2);
        EXPECT_EQ(platform.Calls(),
                  Sequence({expected,
                            {"VORNNetGetEthInfo ovs_eth0", "sleep 1", "VORNNetGetEthInfo ovs_eth0",
                             "sleep 1", "VORNNetGetEthInfo ovs_eth0", kDone}}))
            << speed;
        EXPECT_THAT(platform.Log(), ElementsAre(Info(kFile, "ovs_eth0 not ready, retry(0)"),
                                                Info(kFile, "ovs_eth0 not ready, retry(1)"),
                                                Err(kFile, "[OVS] speed " + std::to_string(speed))))
            << speed;
    }
}

TEST(CreateAll, TakesNoAnswerBut0AsASpeed)
{
    for (const int answer : {-1, 1}) {
        unit::WriteFile(unit::kInterfaceList, "");
        RecordingPlatform platform;
        platform.AnswerNth("VORNNetGetEthInfo", 1, answer);
        EXPECT_TRUE(OVSManager().CreateAll()) << answer;
        EXPECT_THAT(platform.Log(),
                    ElementsAre(Info(kFile, "ovs_eth0 not ready, retry(0)"), SpeedLine()))
            << answer;
    }
}

TEST(CreateAll, PointsTheWirelessSideAtTheBridgeInBridgeTopology)
{
    RecordingPlatform platform;
    platform.Interfaces({"eth1"});
    platform.Answer("VLIBCFileCheckKeyValue", 1);
    EXPECT_TRUE(OVSManager().CreateAll());
    EXPECT_EQ(platform.Calls(), Sequence({Discovered({"eth1"}),
                                          GatewaysCopied("eth1", "ovs_eth1"),
                                          kStopped,
                                          kTopology,
                                          kTopologyEdits,
                                          BridgeMade("eth0"),
                                          BridgeMade("eth1"),
                                          kStarted,
                                          {"VORNNetGetEthInfo ovs_eth0", kDone}}));
    EXPECT_THAT(platform.Log(), ElementsAre(SpeedLine()));
}

TEST(CreateAll, IsInBridgeTopologyOnlyWhenBothAnswersAre1)
{
    for (const int answer : {-1, 0, 2}) {
        unit::WriteFile(unit::kInterfaceList, "");
        RecordingPlatform platform;
        platform.Answer("VLIBCFileCheckKeyValue", 1);
        platform.Answer("VLIBCFileCheckKeyValue /etc/vorninfo.conf net_topology", answer);
        EXPECT_TRUE(OVSManager().CreateAll()) << answer;
        EXPECT_EQ(platform.Calls(), Sequence({Discovered({"eth0"}),
                                              GatewaysCopied("eth0", "ovs_eth0"),
                                              kStopped,
                                              kTopology,
                                              BridgeMade("eth0"),
                                              kStarted,
                                              {"VORNNetGetEthInfo ovs_eth0", kDone}}))
            << answer;

        unit::WriteFile(unit::kInterfaceList, "");
        platform.Forget();
        platform.Answer("VLIBCFileCheckKeyValue /etc/vorninfo.conf support_net_topology", answer);
        EXPECT_TRUE(OVSManager().CreateAll()) << answer;
        EXPECT_EQ(platform.Calls(), kOnePort) << answer;
    }
}

TEST(CreateAll, LogsATopologyEditThatAnswersMoreThan0)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileCheckKeyValue", 1);
    platform.Answer("VLIBCFileSetKeyValue", 1);
    platform.Answer("VLIBCFileRemoveKey", 1);
    EXPECT_TRUE(OVSManager().CreateAll());
    EXPECT_THAT(
        platform.Log(),
        ElementsAre(
            Err(kFile, "Failed to set key ONBOOT in /etc/sysconfig/network-scripts/ifcfg-br0"),
            Err(kFile, "Failed to remove key BRIDGE in /etc/sysconfig/network-scripts/ifcfg-eth0"),
            Err(kFile, "Failed to set key BRIDGE in /etc/sysconfig/network-scripts/ifcfg-wlan0"),
            SpeedLine()));
}

TEST(CreateAll, DoesNotLogATopologyEditThatAnswersLessThan0)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileCheckKeyValue", 1);
    platform.Answer("VLIBCFileSetKeyValue", -1);
    platform.Answer("VLIBCFileRemoveKey", -1);
    EXPECT_TRUE(OVSManager().CreateAll());
    EXPECT_THAT(platform.Log(), ElementsAre(SpeedLine()));
    for (const std::string& edit : kTopologyEdits) {
        EXPECT_THAT(platform.Calls(), Contains(edit));
    }
}

} // namespace
