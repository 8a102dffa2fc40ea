#include <vornovs/vornovs.h>

#include "switch/hostcalls.h"

using harness::Err;
using harness::Info;
using harness::LogLine;
using harness::RecordingPlatform;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Not;
using unit::BridgeDissolved;
using unit::Calls;
using unit::GatewaysCopied;
using unit::kListBridges;
using unit::kNoTopology;
using unit::kStarted;
using unit::kStopped;
using unit::kTopology;
using unit::Listed;
using unit::LogLines;
using unit::Sequence;
using unit::WriteFile;
using VORN::OVS::OVSManager;
namespace {

constexpr const char* kFile = unit::kManagerFile;
constexpr char kBegin[] = "ExecHook net net/ovs_change 4 ACTION=delete";
constexpr char kDone[] = "ExecHook net net/ovs_change 5 ACTION=delete";

const Calls kTopologyEdits{
    "VLIBCFileSetKeyValue /etc/sysconfig/network-scripts/ifcfg-br0 ONBOOT=yes",
    "VLIBCFileSetKeyValue /etc/sysconfig/network-scripts/ifcfg-eth0 BRIDGE=br0",
    "VLIBCFileSetKeyValue /etc/sysconfig/network-scripts/ifcfg-wlan0 BRIDGE=br0"};
const Calls kOneBridge = Sequence({Listed({"ovs_eth0"}),
                                   GatewaysCopied("ovs_eth0", "eth0"),
                                   kStopped,
                                   BridgeDissolved("eth0", true),
                                   kNoTopology,
                                   kStarted,
                                   {kDone}});

const LogLine kNoTag = Info("vlanmanager.cpp", "ovs_eth0 without any vlan tag");

/** A host whose one interface is on the switch. */
void PutOneBridgeOnTheSwitch(RecordingPlatform& platform)
{
    WriteFile(unit::kInterfaceList, "eth0\n");
    platform.Output(kListBridges, "ovs_eth0\n");
}

TEST(DeleteAll, GivesAHostWithOneBridgeBack)
{
    RecordingPlatform platform;
    PutOneBridgeOnTheSwitch(platform);
    EXPECT_TRUE(OVSManager().DeleteAll());
    EXPECT_EQ(platform.Calls(), kOneBridge);
    EXPECT_THAT(platform.Log(), ElementsAre(kNoTag));
    EXPECT_THAT(unit::ListFolder(unit::kStateFolder), IsEmpty());
}

TEST(DeleteAll, StopsAndStartsTheNetworkWithoutAnyBridgeToo)
{
    const RecordingPlatform platform;
    EXPECT_TRUE(OVSManager().DeleteAll());
    EXPECT_EQ(platform.Calls(), Sequence({Listed({}), kStopped, kNoTopology, kStarted, {kDone}}));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(DeleteAll, ForgetsTheInterfacesThatTheModelHeld)
{
    RecordingPlatform platform;
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), 0);
    platform.Forget();
    EXPECT_TRUE(manager.DeleteAll());
    EXPECT_EQ(platform.Calls(), Sequence({Listed({}), kStopped, kNoTopology, kStarted, {kDone}}));
}

TEST(DeleteAll, WorksThroughTheBridgesInTheOrderOfTheirNames)
{
    RecordingPlatform platform;
    WriteFile(unit::kInterfaceList, "eth0\neth1\n");
    platform.Output(kListBridges, "ovs_eth1\novs_eth0\n");
    EXPECT_TRUE(OVSManager().DeleteAll());
    EXPECT_EQ(platform.Calls(), Sequence({Listed({"ovs_eth1", "ovs_eth0"}),
                                          GatewaysCopied("ovs_eth0", "eth0"),
                                          GatewaysCopied("ovs_eth1", "eth1"),
                                          kStopped,
                                          BridgeDissolved("eth0", true),
                                          BridgeDissolved("eth1", true),
                                          kNoTopology,
                                          kStarted,
                                          {kDone}}));
}

TEST(DeleteAll, FailsWhenTheBridgesCannotBeListed)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCPopen", 0);
    EXPECT_FALSE(OVSManager().DeleteAll());
    EXPECT_THAT(platform.Calls(),
                ElementsAre(kBegin, "VLIBServiceIsRunning vornovs-db",
                            "VLIBServiceIsRunning vornovs-vswitch", kListBridges));
    EXPECT_THAT(
        platform.Log(),
        ElementsAre(Err(kFile, "Failed to excute /usr/bin/ovs-vsctl list-br to get all ovs-brs"),
                    Err(kFile, "Fail to get all ovs switch list")));
}

TEST(DeleteAll, FailsWithoutMemoryForTheHook)
{
    RecordingPlatform platform;
    platform.Answer("BaseHook", 0);
    EXPECT_FALSE(OVSManager().DeleteAll());
    EXPECT_THAT(platform.Calls(), IsEmpty());
}

TEST(DeleteAll, DoesNotMindGatewaysThatCannotBeCopied)
{
    RecordingPlatform platform;
    PutOneBridgeOnTheSwitch(platform);
    platform.Answer("VLIBCExecl /usr/vorn/sbin/vornnetdtool", -1);
    EXPECT_TRUE(OVSManager().DeleteAll());
    EXPECT_THAT(platform.Log(),
                ElementsAre(kNoTag, Err("util.cpp",
                                        "Failed to copy the gateway info from ovs_eth0 to eth0")));
}

TEST(DeleteAll, TakesABridgeWithoutThePrefixAsTheEmptyName)
{
    RecordingPlatform platform;
    platform.Output(kListBridges, "br0\n");
    EXPECT_TRUE(OVSManager().DeleteAll());
    EXPECT_THAT(platform.Calls(),
                Contains("VLIBCExecl /usr/vorn/sbin/vornnetdtool --copy-gateway-info -4 br0 ''"));
}

TEST(DeleteAll, GoesOnWhenTheNetworkScriptFails)
{
    for (const int answer : {-1, 1}) {
        RecordingPlatform platform;
        PutOneBridgeOnTheSwitch(platform);
        platform.Answer("VLIBCExecl /etc/rc.network", answer);
        EXPECT_TRUE(OVSManager().DeleteAll()) << answer;
        EXPECT_EQ(platform.Calls(), kOneBridge) << answer;
        EXPECT_THAT(platform.Log(), ElementsAre(kNoTag, Err(kFile, "Failed to stop the rc.network"),
                                                Err(kFile, "Failed to start the rc.network")))
            << answer;
    }
}

TEST(DeleteAll, GoesOnWithTheOtherBridgesWhenOneCannotBeDissolved)
{
    RecordingPlatform platform;
    WriteFile(unit::kInterfaceList, "eth0\neth1\n");
    platform.Output(kListBridges, "ovs_eth0\novs_eth1\n");
    platform.AnswerNth("VLIBCFileSetKeys", 1, -1);
    EXPECT_TRUE(OVSManager().DeleteAll());
    EXPECT_EQ(platform.Calls(), Sequence({Listed({"ovs_eth0", "ovs_eth1"}),
                                          GatewaysCopied("ovs_eth0", "eth0"),
                                          GatewaysCopied("ovs_eth1", "eth1"),
                                          kStopped,
                                          BridgeDissolved("eth0", false),
                                          BridgeDissolved("eth1", true),
                                          kNoTopology,
                                          kStarted,
                                          {kDone}}));
    EXPECT_THAT(LogLines(platform.Log().begin() + 2, platform.Log().end()),
                ElementsAre(Err(kFile, "Failed to set the key-value to "
                                       "/etc/sysconfig/network-scripts/ifcfg-eth0"),
                            Err(kFile, "Failed to delete ovs for ovs_eth0")));
}

TEST(DeleteAll, RestoresTheBridgeTopologyBeforeTheNetworkStarts)
{
    RecordingPlatform platform;
    PutOneBridgeOnTheSwitch(platform);
    platform.Answer("VLIBCFileCheckKeyValue", 1);
    EXPECT_TRUE(OVSManager().DeleteAll());
    EXPECT_EQ(platform.Calls(), Sequence({Listed({"ovs_eth0"}),
                                          GatewaysCopied("ovs_eth0", "eth0"),
                                          kStopped,
                                          BridgeDissolved("eth0", true),
                                          kTopology,
                                          kTopologyEdits,
                                          kStarted,
                                          {kDone}}));
    EXPECT_THAT(platform.Log(), ElementsAre(kNoTag));
}

TEST(DeleteAll, IsInBridgeTopologyOnlyWhenBothAnswersAre1)
{
    for (const int answer : {-1, 0, 2}) {
        RecordingPlatform platform;
        platform.Answer("VLIBCFileCheckKeyValue", 1);
        platform.Answer("VLIBCFileCheckKeyValue /etc/vorninfo.conf net_topology", answer);
        EXPECT_TRUE(OVSManager().DeleteAll()) << answer;
        EXPECT_EQ(platform.Calls(), Sequence({Listed({}), kStopped, kTopology, kStarted, {kDone}}))
            << answer;
    }
}

TEST(DeleteAll, LogsATopologyEditThatAnswersMoreThan0)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileCheckKeyValue", 1);
    platform.Answer("VLIBCFileSetKeyValue", 1);
    EXPECT_TRUE(OVSManager().DeleteAll());
    const std::string prefix = unit::kIfcfg;
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to set key ONBOOT in " + prefix + "br0"),
                            Err(kFile, "Failed to set key BRIDGE in " + prefix + "eth0"),
                            Err(kFile, "Failed to set key BRIDGE in " + prefix + "wlan0")));
}

TEST(DeleteAll, DoesNotLogATopologyEditThatAnswersLessThan0)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileCheckKeyValue", 1);
    platform.Answer("VLIBCFileSetKeyValue", -1);
    EXPECT_TRUE(OVSManager().DeleteAll());
    EXPECT_THAT(platform.Log(), IsEmpty());
    EXPECT_EQ(platform.Calls(),
              Sequence({Listed({}), kStopped, kTopology, kTopologyEdits, kStarted, {kDone}}));
}

TEST(DeleteAll, LeavesAWirelessServiceAloneOnEveryAnswerBut1)
{
    for (const int answer : {-1, 0, 2}) {
        RecordingPlatform platform;
        platform.Answer("VLIBServiceIsRunning vornwifid", answer);
        EXPECT_TRUE(OVSManager().DeleteAll()) << answer;
        EXPECT_THAT(platform.Calls(), Not(Contains("VLIBServiceRestart vornwifid"))) << answer;
    }
}

TEST(DeleteAll, GoesOnWhenTheWirelessServiceDoesNotRestart)
{
    RecordingPlatform platform;
    platform.Answer("VLIBServiceRestart", -1);
    EXPECT_TRUE(OVSManager().DeleteAll());
    EXPECT_EQ(platform.Calls().back(), kDone);
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Filed to restart the vornwifid")));
}

} // namespace
