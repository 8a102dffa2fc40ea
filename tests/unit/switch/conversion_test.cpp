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
using unit::BridgeMade;
using unit::Calls;
using unit::GatewaysCopied;
using unit::LogLines;
using unit::Sequence;
using VORN::OVS::OVSManager;

namespace {

constexpr char kFile[] = "ovsmanager.cpp";
constexpr char kBegin[] = "ExecHook net net/ovs_change 4 ACTION=create";
constexpr char kDone[] = "ExecHook net net/ovs_change 5 ACTION=create";

const Calls kStopped{"VLIBCExecl /etc/rc.network stop", "sleep 3"};
const Calls kNoTopology{"VLIBCFileCheckKeyValue /etc/vorninfo.conf support_net_topology yes"};
const Calls kTopology{"VLIBCFileCheckKeyValue /etc/vorninfo.conf support_net_topology yes",
                      "VLIBCFileCheckKeyValue /etc/vorninfo.conf net_topology bridge"};
const Calls kTopologyEdits{
    "VLIBCFileSetKeyValue /etc/sysconfig/network-scripts/ifcfg-br0 ONBOOT=no",
    "VLIBCFileRemoveKey /etc/sysconfig/network-scripts/ifcfg-eth0 BRIDGE",
    "VLIBCFileSetKeyValue /etc/sysconfig/network-scripts/ifcfg-wlan0 BRIDGE=ovs_eth0"};
const Calls kStarted{"VLIBCExecl /etc/rc.network start", "VLIBServiceIsRunning vornwifid",
                     "VLIBServiceRestart vornwifid"};

/** Hook and discovery of a host without VLANs and bonds. */
Calls Discovered(const std::vector<std::string>& interfaces)
{
    Calls calls{kBegin, "VLIBNetGetInterfaceInfo"};
    for (const std::string& name : interfaces) {
        calls.push_back("VLIBNetBridgeIfIsMaster " + name);
        calls.push_back("VLIBNetVlanGet " + name);
    }
    return calls;
}

/** A bond that is taken apart, its first slave up at once. */
Calls BondRemoved(const std::string& bond, const std::string& slaves, const std::string& first)
{
    const std::string tool = "VLIBCExec /usr/vorn/sbin/vornnetdtool --del-gateway-info ";
    return {tool + "-4 " + bond, tool + "-6 " + bond,
            "VORNNetLinkAggrSet " + bond + " mode=0 " + slaves, "sleep 3",
            "VORNNetGetEthInfo " + first};
}

Calls TagSet(const std::string& bridge, const std::string& tag)
{
    return {"VLIBCFileLock 2054 5",
            "VLIBCFileSetKeyValue /etc/sysconfig/network-scripts/ifcfg-" + bridge +
                " OVS_VLAN_ID=" + tag,
            "VLIBCFileUnlock 2048",
            "VLIBCExecl /usr/bin/ovs-vsctl set port " + bridge + " tag=" + tag};
}

const Calls kOnePort = Sequence({Discovered({"eth0"}),
                                 GatewaysCopied("eth0", "ovs_eth0"),
                                 kStopped,
                                 kNoTopology,
                                 BridgeMade("eth0"),
                                 kStarted,
                                 {"VORNNetGetEthInfo ovs_eth0", kDone}});

const LogLine kSpeed = Err(kFile, "[OVS] speed 1000");

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
    EXPECT_THAT(platform.Log(), ElementsAre(kSpeed));
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
    EXPECT_THAT(platform.Log(), ElementsAre(kSpeed));
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
    EXPECT_THAT(platform.Log(), ElementsAre(kSpeed));
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
                    kSpeed));
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
                                Err(kFile, "Failed to start the rc.network"), kSpeed))
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
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Filed to restart the vornwifid"), kSpeed));
}

TEST(CreateAll, TakesAPositiveAnswerOfTheRestartAsSuccess)
{
    RecordingPlatform platform;
    platform.Answer("VLIBServiceRestart", 1);
    EXPECT_TRUE(OVSManager().CreateAll());
    EXPECT_THAT(platform.Log(), ElementsAre(kSpeed));
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
                            Err(kFile, "Failed to create ovs for eth0"), kSpeed));
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

/** Tries of a wait that never succeeds. */
Calls EightTries(const std::string& name)
{
    Calls calls;
    for (int i = 0; i < 8; ++i) {
        calls.push_back("VORNNetGetEthInfo " + name);
        calls.emplace_back("sleep 1");
    }
    return calls;
}

LogLines EightLines(int priority, const std::string& name)
{
    LogLines lines;
    for (int i = 0; i < 8; ++i) {
        lines.push_back({priority, kFile, name + " not ready, retry(" + std::to_string(i) + ")"});
    }
    return lines;
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
                    ElementsAre(Info(kFile, "ovs_eth0 not ready, retry(0)"), kSpeed))
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
    EXPECT_THAT(platform.Log(), ElementsAre(kSpeed));
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
            kSpeed));
}

TEST(CreateAll, DoesNotLogATopologyEditThatAnswersLessThan0)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileCheckKeyValue", 1);
    platform.Answer("VLIBCFileSetKeyValue", -1);
    platform.Answer("VLIBCFileRemoveKey", -1);
    EXPECT_TRUE(OVSManager().CreateAll());
    EXPECT_THAT(platform.Log(), ElementsAre(kSpeed));
    for (const std::string& edit : kTopologyEdits) {
        EXPECT_THAT(platform.Calls(), Contains(edit));
    }
}

TEST(CreateAll, TurnsAVlanIntoATagOnItsParentsBridge)
{
    RecordingPlatform platform;
    platform.Interfaces({"eth0", "eth0.10"});
    platform.Vlan("eth0.10", "eth0", 10);
    EXPECT_TRUE(OVSManager().CreateAll());
    EXPECT_EQ(platform.Calls(), Sequence({Discovered({"eth0", "eth0.10"}),
                                          GatewaysCopied("eth0", "ovs_eth0"),
                                          {"VLIBNetVlanRemove eth0.10"},
                                          kStopped,
                                          kNoTopology,
                                          BridgeMade("eth0"),
                                          kStarted,
                                          {"VORNNetGetEthInfo ovs_eth0"},
                                          TagSet("ovs_eth0", "10"),
                                          {kDone}}));
    EXPECT_THAT(platform.Log(), ElementsAre(kSpeed));
}

TEST(CreateAll, GoesOnWhenAVlanCannotBeRemoved)
{
    RecordingPlatform platform;
    platform.Interfaces({"eth0.10", "eth0.20"});
    platform.Vlan("eth0.10", "eth0", 10);
    platform.Vlan("eth0.20", "eth0", 20);
    platform.Answer("VLIBNetVlanRemove", -1);
    EXPECT_TRUE(OVSManager().CreateAll());
    EXPECT_THAT(platform.Calls(), Not(Contains("VLIBNetVlanRemove eth0.20")));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to remove the vlan of eth0.10"),
                                            Err(kFile, "Failed to remove linux vlan"), kSpeed));
    EXPECT_EQ(platform.Calls().back(), kDone);
}

TEST(CreateAll, FailsWithoutTheSecondHookWhenATagCannotBeSet)
{
    RecordingPlatform platform;
    platform.Interfaces({"eth0.10"});
    platform.Vlan("eth0.10", "eth0", 10);
    platform.Answer("VLIBCFileLock", -1);
    EXPECT_FALSE(OVSManager().CreateAll());
    EXPECT_EQ(platform.Calls(), Sequence({Discovered({"eth0.10"}),
                                          GatewaysCopied("eth0", "ovs_eth0"),
                                          {"VLIBNetVlanRemove eth0.10"},
                                          kStopped,
                                          kNoTopology,
                                          BridgeMade("eth0"),
                                          kStarted,
                                          {"VORNNetGetEthInfo ovs_eth0", "VLIBCFileLock 2054 5",
                                           "VLIBCErrSetEx 1024 vlanmanager.cpp"}}));
    EXPECT_THAT(platform.Log(),
                ElementsAre(kSpeed, Err(kFile, "Failed to create the vlan tag 10 of ovs_eth0"),
                            Err(kFile, "Failed to create vlan for ovs-interface")));
}

TEST(CreateAll, SucceedsWhenTheSwitchRefusesATag)
{
    RecordingPlatform platform;
    platform.Interfaces({"eth0.10"});
    platform.Vlan("eth0.10", "eth0", 10);
    platform.Answer("VLIBCExecl /usr/bin/ovs-vsctl", 1);
    EXPECT_TRUE(OVSManager().CreateAll());
    EXPECT_EQ(platform.Calls().back(), kDone);
}

// The switch bond itself is built once the library can: up to there a bond's slaves are converted.
TEST(CreateAll, TakesABondApartAndConvertsItsSlaves)
{
    RecordingPlatform platform;
    platform.Interfaces({"bond0"});
    platform.Bond("bond0", 4, {"eth1", "eth0"});
    EXPECT_TRUE(OVSManager().CreateAll());
    const Calls taken(
        platform.Calls().begin(),
        std::find(platform.Calls().begin(), platform.Calls().end(), "VORNNetGetEthInfo ovs_eth0") +
            1);
    EXPECT_EQ(taken, Sequence({{kBegin, "VLIBNetGetInterfaceInfo", "VLIBNetBridgeIfIsMaster bond0",
                                "VLIBNetVlanGet bond0", "VORNNetLinkAggrGet bond0"},
                               GatewaysCopied("bond0", "ovs_bond0"),
                               BondRemoved("bond0", "eth1 eth0", "eth1"),
                               kStopped,
                               kNoTopology,
                               BridgeMade("eth0"),
                               BridgeMade("eth1"),
                               kStarted,
                               {"VORNNetGetEthInfo ovs_eth0"}}));
}

TEST(CreateAll, RemovesAVlanOnABondBeforeTheBondAndTagsTheBondsBridge)
{
    RecordingPlatform platform;
    platform.Interfaces({"bond0", "bond0.5"});
    platform.Vlan("bond0.5", "bond0", 5);
    platform.Bond("bond0", 4, {"eth0", "eth1"});
    EXPECT_TRUE(OVSManager().CreateAll());
    const auto at = [&](const std::string& call) {
        return std::find(platform.Calls().begin(), platform.Calls().end(), call);
    };
    EXPECT_LT(at("VLIBNetVlanRemove bond0.5"), at("VORNNetLinkAggrSet bond0 mode=0 eth0 eth1"));
    const Calls tag = TagSet("ovs_bond0", "5");
    EXPECT_EQ(Calls(platform.Calls().end() - 5, platform.Calls().end() - 1), tag);
}

TEST(CreateAll, GoesOnWithTheBondItselfWhenItCannotBeTakenApart)
{
    RecordingPlatform platform;
    platform.Interfaces({"bond0"});
    platform.Bond("bond0", 4, {"eth0"});
    platform.Answer("VORNNetLinkAggrSet", -1);
    (void)OVSManager().CreateAll();
    for (const std::string& call : BridgeMade("bond0")) {
        EXPECT_THAT(platform.Calls(), Contains(call));
    }
    EXPECT_EQ(platform.Log()[0], Err(kFile, "Failed to remove bonding"));
    EXPECT_EQ(platform.Log()[1], Err(kFile, "Failed to remove linux bond"));
}

/** A manager that has read the bonds; what it did for that is forgotten. */
void ReadBonds(RecordingPlatform& platform, OVSManager& manager,
               const std::vector<std::string>& bonds)
{
    for (const std::string& bond : bonds) {
        EXPECT_EQ(manager.InitBondOpt(bond), 0);
    }
    platform.Forget();
}

TEST(RemoveLinuxBond, HasNothingToDoWithoutBonds)
{
    const RecordingPlatform platform;
    EXPECT_EQ(OVSManager().RemoveLinuxBond(), 0);
    EXPECT_THAT(platform.Calls(), IsEmpty());
}

TEST(RemoveLinuxBond, TakesTheBondsApartInTheOrderOfTheirNames)
{
    RecordingPlatform platform;
    platform.Bond("bond1", 1, {"eth2"});
    platform.Bond("bond0", 1, {"eth0", "eth1"});
    OVSManager manager;
    ReadBonds(platform, manager, {"bond1", "bond0"});
    EXPECT_EQ(manager.RemoveLinuxBond(), 0);
    EXPECT_EQ(platform.Calls(), Sequence({BondRemoved("bond0", "eth0 eth1", "eth0"),
                                          BondRemoved("bond1", "eth2", "eth2")}));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(RemoveLinuxBond, PutsTheModeBackIntoTheModel)
{
    RecordingPlatform platform;
    platform.Bond("bond0", 1, {"eth0"});
    OVSManager manager;
    ReadBonds(platform, manager, {"bond0"});
    EXPECT_EQ(manager.RemoveLinuxBond(), 0);
    platform.Forget();
    EXPECT_EQ(manager.CreateLinuxBond(), 0);
    EXPECT_EQ(platform.Calls().front(), "VORNNetLinkAggrSet bond0 mode=7 eth0");
}

TEST(RemoveLinuxBond, StopsAtABondThatCannotBeTakenApartAndKeepsItsMode0)
{
    RecordingPlatform platform;
    platform.Bond("bond0", 1, {"eth0"});
    platform.Bond("bond1", 1, {"eth1"});
    OVSManager manager;
    ReadBonds(platform, manager, {"bond0", "bond1"});
    platform.AnswerNth("VORNNetLinkAggrSet", 1, -1);
    EXPECT_EQ(manager.RemoveLinuxBond(), -1);
    const Calls all = BondRemoved("bond0", "eth0", "eth0");
    EXPECT_EQ(platform.Calls(), Calls(all.begin(), all.begin() + 3));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to remove bonding")));

    platform.Forget();
    EXPECT_EQ(manager.CreateLinuxBond(), 0);
    EXPECT_EQ(platform.Calls()[0], "VORNNetLinkAggrSet bond0 mode=0 eth0");
    EXPECT_EQ(platform.Calls()[2], "VORNNetLinkAggrSet bond1 mode=7 eth1");
}

TEST(RemoveLinuxBond, TakesAPositiveAnswerAsSuccess)
{
    RecordingPlatform platform;
    platform.Bond("bond0", 1, {"eth0"});
    OVSManager manager;
    ReadBonds(platform, manager, {"bond0"});
    platform.Answer("VORNNetLinkAggrSet", 1);
    EXPECT_EQ(manager.RemoveLinuxBond(), 0);
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(RemoveLinuxBond, DoesNotMindAGatewayThatCannotBeRemoved)
{
    RecordingPlatform platform;
    platform.Bond("bond0", 1, {"eth0"});
    OVSManager manager;
    ReadBonds(platform, manager, {"bond0"});
    platform.Answer("VLIBCExec /usr/vorn/sbin/vornnetdtool", -1);
    EXPECT_EQ(manager.RemoveLinuxBond(), 0);
    EXPECT_THAT(platform.Calls(), Contains("VORNNetLinkAggrSet bond0 mode=0 eth0"));
}

TEST(RemoveLinuxBond, LogsEachTryForTheFirstSlaveAsAnErrorAndGoesOn)
{
    RecordingPlatform platform;
    platform.Bond("bond0", 1, {"eth5", "eth0"});
    OVSManager manager;
    ReadBonds(platform, manager, {"bond0"});
    platform.LinkSpeeds("eth5", {-1});
    EXPECT_EQ(manager.RemoveLinuxBond(), 0);
    Calls expected = BondRemoved("bond0", "eth5 eth0", "eth5");
    expected.pop_back();
    EXPECT_EQ(platform.Calls(), Sequence({expected, EightTries("eth5")}));
    EXPECT_EQ(platform.Log(), EightLines(3, "eth5"));
}

TEST(RemoveLinuxBond, PausesAWholeThreeSecondsWhateverSignalsCome)
{
    RecordingPlatform platform;
    platform.Bond("bond0", 1, {"eth0"});
    OVSManager manager;
    ReadBonds(platform, manager, {"bond0"});
    platform.Answer("sleep 3", 2);
    EXPECT_EQ(manager.RemoveLinuxBond(), 0);
    Calls expected = BondRemoved("bond0", "eth0", "eth0");
    expected.insert(expected.end() - 1, "sleep 2");
    EXPECT_EQ(platform.Calls(), expected);
}

TEST(CreateAll, BelievesNoSlaveCountBeyondTheRecord)
{
    for (const int count : {-1, 33, 1000000}) {
        RecordingPlatform platform;
        platform.Interfaces({"bond0"});
        VORNLINKAGGROPT record = harness::BondRecord("bond0", 1, {"eth0"});
        record.nSlave = count;
        platform.Bond("bond0", record);
        (void)OVSManager().CreateAll();
        // 31 slots hold the empty name, which goes before "eth0".
        const Calls first = count < 0 ? Calls{} : BridgeMade("eth0");
        for (const std::string& call : first) {
            EXPECT_THAT(platform.Calls(), Contains(call)) << count;
        }
        EXPECT_THAT(platform.Calls(), Not(Contains(BridgeMade("bond0")[2]))) << count;
    }
}

TEST(RemoveLinuxBond, InsertsAll32Slaves)
{
    RecordingPlatform platform;
    platform.Interfaces({"bond0"});
    std::vector<std::string> slaves;
    Calls bridges;
    for (int i = 10; i < 42; ++i) {
        slaves.push_back("eth" + std::to_string(i));
        bridges = Sequence({bridges, BridgeMade(slaves.back())});
    }
    platform.Bond("bond0", 1, slaves);
    (void)OVSManager().CreateAll();
    const auto begin = std::find(platform.Calls().begin(), platform.Calls().end(), bridges[0]);
    EXPECT_EQ(Calls(begin, begin + static_cast<std::ptrdiff_t>(bridges.size())), bridges);
}

TEST(RemoveLinuxVlan, RemovesTheVlansInTheOrderOfTheirNames)
{
    RecordingPlatform platform;
    platform.Interfaces({"eth1.5", "eth0.10"});
    platform.Vlan("eth1.5", "eth1", 5);
    platform.Vlan("eth0.10", "eth0", 10);
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), 0);
    platform.Forget();
    EXPECT_EQ(manager.RemoveLinuxVlan(), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBNetVlanRemove eth0.10", "VLIBNetVlanRemove eth1.5"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(RemoveLinuxVlan, StopsAtTheFirstThatCannotBeRemoved)
{
    RecordingPlatform platform;
    platform.Interfaces({"eth1.5", "eth0.10"});
    platform.Vlan("eth1.5", "eth1", 5);
    platform.Vlan("eth0.10", "eth0", 10);
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), 0);
    platform.Forget();
    platform.Answer("VLIBNetVlanRemove", -1);
    EXPECT_EQ(manager.RemoveLinuxVlan(), -1);
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBNetVlanRemove eth0.10"));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to remove the vlan of eth0.10")));
}

TEST(RemoveLinuxVlan, TakesAPositiveAnswerAsSuccess)
{
    RecordingPlatform platform;
    platform.Interfaces({"eth0.10"});
    platform.Vlan("eth0.10", "eth0", 10);
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), 0);
    platform.Answer("VLIBNetVlanRemove", 1);
    EXPECT_EQ(manager.RemoveLinuxVlan(), 0);
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(CreateOVSVlan, HasNothingToDoWithoutVlans)
{
    const RecordingPlatform platform;
    EXPECT_EQ(OVSManager().CreateOVSVlan(), 0);
    EXPECT_THAT(platform.Calls(), IsEmpty());
}

TEST(CreateOVSVlan, SetsTheTagsInTheOrderOfTheVlansNamesAndStopsAtTheFirstFailure)
{
    RecordingPlatform platform;
    platform.Interfaces({"eth2.7", "eth1.5", "eth0.10"});
    platform.Vlan("eth2.7", "eth2", 7);
    platform.Vlan("eth1.5", "eth1", 5);
    platform.Vlan("eth0.10", "eth0", 10);
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), 0);
    platform.Forget();
    EXPECT_EQ(manager.CreateOVSVlan(), 0);
    EXPECT_EQ(platform.Calls(), Sequence({TagSet("ovs_eth0", "10"), TagSet("ovs_eth1", "5"),
                                          TagSet("ovs_eth2", "7")}));

    platform.Forget();
    platform.AnswerNth("VLIBCFileLock", 2, -1);
    EXPECT_EQ(manager.CreateOVSVlan(), -1);
    EXPECT_EQ(platform.Calls(),
              Sequence({TagSet("ovs_eth0", "10"),
                        {"VLIBCFileLock 2054 5", "VLIBCErrSetEx 1024 vlanmanager.cpp"}}));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to create the vlan tag 5 of ovs_eth1")));
}

TEST(CreateOVSVlan, WritesTheIdInDecimalWhateverItIs)
{
    RecordingPlatform platform;
    platform.Interfaces({"eth0.1"});
    platform.Vlan("eth0.1", "eth0", -1);
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), 0);
    platform.Forget();
    EXPECT_EQ(manager.CreateOVSVlan(), 0);
    EXPECT_EQ(platform.Calls(), TagSet("ovs_eth0", "-1"));
}

} // namespace
