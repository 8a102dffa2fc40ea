#include <vornovs/vornovs.h>

#include "support/support.h"

#include <algorithm>

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
using unit::LogLines;
using unit::Names;
using unit::Sequence;
using unit::WriteFile;
using VORN::OVS::OVSManager;

namespace {

constexpr char kFile[] = "ovsmanager.cpp";
constexpr char kBegin[] = "ExecHook net net/ovs_change 4 ACTION=delete";
constexpr char kDone[] = "ExecHook net net/ovs_change 5 ACTION=delete";
constexpr char kList[] = "VLIBCPopen /usr/bin/ovs-vsctl r list-br";

const Calls kStopped{"VLIBCExecl /etc/rc.network stop", "sleep 3"};
const Calls kNoTopology{"VLIBCFileCheckKeyValue /etc/vorninfo.conf support_net_topology yes"};
const Calls kTopology{"VLIBCFileCheckKeyValue /etc/vorninfo.conf support_net_topology yes",
                      "VLIBCFileCheckKeyValue /etc/vorninfo.conf net_topology bridge"};
const Calls kTopologyEdits{
    "VLIBCFileSetKeyValue /etc/sysconfig/network-scripts/ifcfg-br0 ONBOOT=yes",
    "VLIBCFileSetKeyValue /etc/sysconfig/network-scripts/ifcfg-eth0 BRIDGE=br0",
    "VLIBCFileSetKeyValue /etc/sysconfig/network-scripts/ifcfg-wlan0 BRIDGE=br0"};
const Calls kStarted{"VLIBCExecl /etc/rc.network start", "VLIBServiceIsRunning vornwifid",
                     "VLIBServiceRestart vornwifid"};

std::string GetTag(const std::string& bridge)
{
    return "VLIBCPopen /usr/bin/ovs-vsctl rB get port " + bridge + " tag";
}

/** Hook and list of the switch's bridges, none of which carries a bond. */
Calls Listed(const std::vector<std::string>& bridges)
{
    Calls calls{kBegin, "VLIBServiceIsRunning vornovs-db", "VLIBServiceIsRunning vornovs-vswitch",
                kList};
    for (const std::string& bridge : bridges) {
        calls.push_back(GetTag(bridge));
        calls.push_back("VLIBCPclose /usr/bin/ovs-vsctl get port " + bridge + " tag");
        calls.push_back("VLIBNetOVSIfIsMaster " + bridge);
    }
    calls.emplace_back("VLIBCPclose /usr/bin/ovs-vsctl list-br");
    return calls;
}

Calls TagCleared(const std::string& bridge)
{
    return {"VLIBCFileLock 2054 5",
            "VLIBCFileRemoveKey /etc/sysconfig/network-scripts/ifcfg-" + bridge + " OVS_VLAN_ID",
            "VLIBCFileUnlock 2048", "VLIBCExec /usr/bin/ovs-vsctl clear port " + bridge + " tag"};
}

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
    platform.Output(kList, "ovs_eth0\n");
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
    platform.Output(kList, "ovs_eth1\novs_eth0\n");
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
    EXPECT_THAT(platform.Calls(), ElementsAre(kBegin, "VLIBServiceIsRunning vornovs-db",
                                              "VLIBServiceIsRunning vornovs-vswitch", kList));
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
    platform.Output(kList, "br0\n");
    EXPECT_TRUE(OVSManager().DeleteAll());
    EXPECT_THAT(platform.Calls(),
                Contains("VLIBCExecl /usr/vorn/sbin/vornnetdtool --copy-gateway-info -4 br0 ''"));
}

TEST(DeleteAll, TurnsATagIntoAVlan)
{
    RecordingPlatform platform;
    PutOneBridgeOnTheSwitch(platform);
    platform.Output(GetTag("ovs_eth0"), "10\n");
    EXPECT_TRUE(OVSManager().DeleteAll());
    EXPECT_EQ(platform.Calls(), Sequence({Listed({"ovs_eth0"}),
                                          GatewaysCopied("ovs_eth0", "eth0"),
                                          TagCleared("ovs_eth0"),
                                          kStopped,
                                          BridgeDissolved("eth0", true),
                                          kNoTopology,
                                          kStarted,
                                          {"sleep 3", "VORNNetIFGetIPConfig eth0",
                                           "VLIBNetVlanCreate eth0 10 ip-of-eth0", kDone}}));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(DeleteAll, FailsBeforeTheNetworkIsTouchedWhenATagCannotBeRemoved)
{
    RecordingPlatform platform;
    PutOneBridgeOnTheSwitch(platform);
    platform.Output(GetTag("ovs_eth0"), "10\n");
    platform.Answer("VLIBCFileLock", -1);
    EXPECT_FALSE(OVSManager().DeleteAll());
    EXPECT_EQ(platform.Calls(),
              Sequence({Listed({"ovs_eth0"}),
                        GatewaysCopied("ovs_eth0", "eth0"),
                        {"VLIBCFileLock 2054 5", "VLIBCErrSetEx 1024 vlanmanager.cpp"}}));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to remove vlan of ovs_eth0"),
                                            Err(kFile, "Failed to remove ovs vlan")));
}

TEST(DeleteAll, FailsAfterTheNetworkIsBackWhenAVlanCannotBeMade)
{
    RecordingPlatform platform;
    PutOneBridgeOnTheSwitch(platform);
    platform.Output(GetTag("ovs_eth0"), "10\n");
    platform.Answer("VLIBNetVlanCreate", -1);
    EXPECT_FALSE(OVSManager().DeleteAll());
    EXPECT_EQ(platform.Calls(), Sequence({Listed({"ovs_eth0"}),
                                          GatewaysCopied("ovs_eth0", "eth0"),
                                          TagCleared("ovs_eth0"),
                                          kStopped,
                                          BridgeDissolved("eth0", true),
                                          kNoTopology,
                                          kStarted,
                                          {"sleep 3", "VORNNetIFGetIPConfig eth0",
                                           "VLIBNetVlanCreate eth0 10 ip-of-eth0"}}));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to create vlan tag 10 of eth0"),
                                            Err(kFile, "Failed to create the linux vlan")));
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
    platform.Output(kList, "ovs_eth0\novs_eth1\n");
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

TEST(DeleteAll, RebuildsABondThatAClientNamed)
{
    RecordingPlatform platform;
    OVSManager manager;
    platform.Bond("bond0", 6, {"eth0", "eth1"});
    EXPECT_EQ(manager.InitBondOpt("bond0", "802.3ad"), 0);
    platform.Forget();
    platform.AnswerNth("sleep 3", 2, 1); // the pause before the bonds, cut short by a signal
    EXPECT_TRUE(manager.DeleteAll());
    const Calls& calls = platform.Calls();
    const Calls tail(std::find(calls.begin(), calls.end(), "VLIBServiceRestart vornwifid") + 1,
                     calls.end());
    EXPECT_THAT(tail, ElementsAre("sleep 3", "sleep 1", "VORNNetLinkAggrSet bond0 mode=2 eth0 eth1",
                                  "VORNNetGetEthInfo bond0", kDone));
}

TEST(DeleteAll, GoesOnWhenABondCannotBeRebuilt)
{
    RecordingPlatform platform;
    OVSManager manager;
    platform.Bond("bond0", 6, {"eth0"});
    EXPECT_EQ(manager.InitBondOpt("bond0"), 0);
    platform.Forget();
    platform.Answer("VORNNetLinkAggrSet", -1);
    EXPECT_TRUE(manager.DeleteAll());
    EXPECT_EQ(platform.Calls().back(), kDone);
    EXPECT_EQ(platform.Log(), (LogLines{Err(kFile, "Failed to create linux bond"),
                                        Err(kFile, "Failed to create linux bond")}));
}

/** A manager whose model has the tags of these bridges, each the number in its name. */
void ReadTags(RecordingPlatform& platform, OVSManager& manager,
              const std::vector<std::string>& bridges)
{
    std::string list;
    for (const std::string& bridge : bridges) {
        list += bridge + "\n";
        platform.Output(GetTag(bridge), bridge.substr(bridge.find_first_of("0123456789")) + "\n");
    }
    platform.Output(kList, list);
    Names found;
    EXPECT_EQ(manager.GetSwitchList(found), 0);
    platform.Forget();
}

TEST(RemoveOVSVlan, HasNothingToDoWithoutVlans)
{
    const RecordingPlatform platform;
    EXPECT_EQ(OVSManager().RemoveOVSVlan(), 0);
    EXPECT_THAT(platform.Calls(), IsEmpty());
}

TEST(RemoveOVSVlan, ClearsTheTagsInTheOrderOfTheNamesAndStopsAtTheFirstFailure)
{
    RecordingPlatform platform;
    OVSManager manager;
    ReadTags(platform, manager, {"ovs_eth3", "ovs_eth2", "ovs_eth1"});
    EXPECT_EQ(manager.RemoveOVSVlan(), 0);
    EXPECT_EQ(platform.Calls(),
              Sequence({TagCleared("ovs_eth1"), TagCleared("ovs_eth2"), TagCleared("ovs_eth3")}));

    platform.Forget();
    platform.AnswerNth("VLIBCFileLock", 2, -1);
    EXPECT_EQ(manager.RemoveOVSVlan(), -1);
    EXPECT_EQ(platform.Calls(),
              Sequence({TagCleared("ovs_eth1"),
                        {"VLIBCFileLock 2054 5", "VLIBCErrSetEx 1024 vlanmanager.cpp"}}));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to remove vlan of ovs_eth2")));
}

TEST(CreateLinuxVlan, HasNothingToDoWithoutVlans)
{
    const RecordingPlatform platform;
    EXPECT_EQ(OVSManager().CreateLinuxVlan(), 0);
    EXPECT_THAT(platform.Calls(), IsEmpty());
}

TEST(CreateLinuxVlan, MakesEachVlanWithItsParentsAddress)
{
    RecordingPlatform platform;
    OVSManager manager;
    ReadTags(platform, manager, {"ovs_eth2", "ovs_eth1"});
    EXPECT_EQ(manager.CreateLinuxVlan(), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VORNNetIFGetIPConfig eth1", "VLIBNetVlanCreate eth1 1 ip-of-eth1",
                            "VORNNetIFGetIPConfig eth2", "VLIBNetVlanCreate eth2 2 ip-of-eth2"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(CreateLinuxVlan, StopsAtAParentWhoseAddressCannotBeRead)
{
    RecordingPlatform platform;
    OVSManager manager;
    ReadTags(platform, manager, {"ovs_eth2", "ovs_eth1"});
    platform.Answer("VORNNetIFGetIPConfig", -1);
    EXPECT_EQ(manager.CreateLinuxVlan(), -1);
    EXPECT_THAT(platform.Calls(), ElementsAre("VORNNetIFGetIPConfig eth1"));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to get config of eth1")));
}

TEST(CreateLinuxVlan, StopsAtTheFirstThatCannotBeMade)
{
    RecordingPlatform platform;
    OVSManager manager;
    ReadTags(platform, manager, {"ovs_eth2", "ovs_eth1"});
    platform.Answer("VLIBNetVlanCreate", -1);
    EXPECT_EQ(manager.CreateLinuxVlan(), -1);
    EXPECT_EQ(platform.Calls().size(), 2U);
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to create vlan tag 1 of eth1")));
}

TEST(CreateLinuxVlan, TakesPositiveAnswersAsSuccess)
{
    RecordingPlatform platform;
    OVSManager manager;
    ReadTags(platform, manager, {"ovs_eth1"});
    platform.Answer("VORNNetIFGetIPConfig", 1);
    platform.Answer("VLIBNetVlanCreate", 1);
    EXPECT_EQ(manager.CreateLinuxVlan(), 0);
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(CreateLinuxVlan, TakesAParentWithoutThePrefixAsTheEmptyName)
{
    RecordingPlatform platform;
    OVSManager manager;
    ReadTags(platform, manager, {"br1"});
    EXPECT_EQ(manager.CreateLinuxVlan(), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VORNNetIFGetIPConfig ''", "VLIBNetVlanCreate '' 1 ip-of-"));
}

TEST(CreateLinuxBond, HasNothingToDoWithoutBonds)
{
    const RecordingPlatform platform;
    EXPECT_EQ(OVSManager().CreateLinuxBond(), 0);
    EXPECT_THAT(platform.Calls(), IsEmpty());
}

TEST(CreateLinuxBond, MakesTheBondsInTheOrderOfTheirNamesAndAwaitsEach)
{
    RecordingPlatform platform;
    OVSManager manager;
    platform.Bond("ovs_bond1", 8, {"eth2"});
    platform.Bond("ovs_bond0", 7, {"eth0", "eth1"});
    EXPECT_EQ(manager.InitBondOpt("ovs_bond1"), 0);
    EXPECT_EQ(manager.InitBondOpt("ovs_bond0"), 0);
    platform.Forget();
    platform.LinkSpeeds("bond0", {-1, 1000});
    EXPECT_EQ(manager.CreateLinuxBond(), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VORNNetLinkAggrSet bond0 mode=3 eth0 eth1", "VORNNetGetEthInfo bond0",
                            "sleep 1", "VORNNetGetEthInfo bond0",
                            "VORNNetLinkAggrSet bond1 mode=2 eth2", "VORNNetGetEthInfo bond1"));
    EXPECT_THAT(platform.Log(), ElementsAre(Info(kFile, "bond0 not ready, retry(0)")));
}

TEST(CreateLinuxBond, StopsAtTheFirstThatCannotBeMade)
{
    RecordingPlatform platform;
    OVSManager manager;
    platform.Bond("ovs_bond1", 8, {"eth2"});
    platform.Bond("ovs_bond0", 7, {"eth0"});
    EXPECT_EQ(manager.InitBondOpt("ovs_bond0"), 0);
    EXPECT_EQ(manager.InitBondOpt("ovs_bond1"), 0);
    platform.Forget();
    platform.Answer("VORNNetLinkAggrSet", -1);
    EXPECT_EQ(manager.CreateLinuxBond(), -1);
    EXPECT_THAT(platform.Calls(), ElementsAre("VORNNetLinkAggrSet bond0 mode=3 eth0"));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to create linux bond")));
}

TEST(CreateLinuxBond, TakesAPositiveAnswerAsSuccess)
{
    RecordingPlatform platform;
    OVSManager manager;
    platform.Bond("ovs_bond0", 7, {"eth0"});
    EXPECT_EQ(manager.InitBondOpt("ovs_bond0"), 0);
    platform.Answer("VORNNetLinkAggrSet", 1);
    EXPECT_EQ(manager.CreateLinuxBond(), 0);
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(CreateLinuxBond, Waits8SecondsForABondThatNeverBecomesReady)
{
    RecordingPlatform platform;
    OVSManager manager;
    platform.Bond("ovs_bond0", 7, {"eth0"});
    EXPECT_EQ(manager.InitBondOpt("ovs_bond0"), 0);
    platform.Forget();
    platform.Answer("VORNNetGetEthInfo", 1);
    EXPECT_EQ(manager.CreateLinuxBond(), 0);
    Calls expected{"VORNNetLinkAggrSet bond0 mode=3 eth0"};
    LogLines lines;
    for (int i = 0; i < 8; ++i) {
        expected.emplace_back("VORNNetGetEthInfo bond0");
        expected.emplace_back("sleep 1");
        lines.push_back(Info(kFile, "bond0 not ready, retry(" + std::to_string(i) + ")"));
    }
    EXPECT_EQ(platform.Calls(), expected);
    EXPECT_EQ(platform.Log(), lines);
}

TEST(CreateLinuxBond, LeavesANameWithoutThePrefix)
{
    for (const char* name : {"bond0", "ovs_", "ovsbond0", "x"}) {
        RecordingPlatform platform;
        OVSManager manager;
        platform.Bond(name, 7, {"eth0"});
        EXPECT_EQ(manager.InitBondOpt(name), 0);
        platform.Forget();
        EXPECT_EQ(manager.CreateLinuxBond(), 0);
        EXPECT_EQ(platform.Calls().front(),
                  std::string("VORNNetLinkAggrSet ") + name + " mode=3 eth0");
    }
}

} // namespace
