#include <vornovs/vornovs.h>

#include "switch/hostcalls.h"

#include <algorithm>

using harness::Err;
using harness::RecordingPlatform;
using testing::Contains;
using testing::ElementsAre;
using testing::Not;
using unit::BondBuilt;
using unit::BridgeMade;
using unit::Calls;
using unit::Discovered;
using unit::GatewaysCopied;
using unit::kNoTopology;
using unit::kStarted;
using unit::kStopped;
using unit::LinuxBondRemoved;
using unit::MakeLive;
using unit::PortFound;
using unit::Sequence;
using unit::SpeedLine;
using unit::SwitchBond;
using unit::TagSet;
using VORN::OVS::OVSManager;
namespace {

constexpr const char* kFile = unit::kManagerFile;
constexpr char kDone[] = "ExecHook net net/ovs_change 5 ACTION=create";

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
    EXPECT_THAT(platform.Log(), ElementsAre(SpeedLine()));
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
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to remove the vlan of eth0.10"),
                            Err(kFile, "Failed to remove linux vlan"), SpeedLine()));
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
                ElementsAre(SpeedLine(), Err(kFile, "Failed to create the vlan tag 10 of ovs_eth0"),
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

const SwitchBond kBuilt{"ovs_bond0", 6, {"eth1", "eth0"}};

TEST(CreateAll, TakesABondApartConvertsItsSlavesAndBuildsItOnTheSwitch)
{
    RecordingPlatform platform;
    platform.Interfaces({"bond0"});
    platform.Bond("bond0", 4, {"eth1", "eth0"});
    MakeLive(platform, {"ovs_eth0", "ovs_eth1"});
    EXPECT_TRUE(OVSManager().CreateAll());
    EXPECT_EQ(platform.Calls(), Sequence({Discovered({"bond0"}),
                                          {"VORNNetLinkAggrGet bond0"},
                                          GatewaysCopied("bond0", "ovs_bond0"),
                                          LinuxBondRemoved("bond0", "eth1 eth0", "eth1"),
                                          kStopped,
                                          kNoTopology,
                                          BridgeMade("eth0"),
                                          BridgeMade("eth1"),
                                          kStarted,
                                          {"VORNNetGetEthInfo ovs_eth0", "sleep 3"},
                                          BondBuilt(kBuilt),
                                          {kDone}}));
    EXPECT_THAT(platform.Log(), ElementsAre(SpeedLine()));
}

TEST(CreateAll, RemovesAVlanOnABondBeforeTheBondAndTagsTheBondsBridge)
{
    RecordingPlatform platform;
    platform.Interfaces({"bond0", "bond0.5"});
    platform.Vlan("bond0.5", "bond0", 5);
    platform.Bond("bond0", 4, {"eth1", "eth0"});
    MakeLive(platform, {"ovs_eth0", "ovs_eth1"});
    EXPECT_TRUE(OVSManager().CreateAll());
    EXPECT_EQ(platform.Calls(), Sequence({Discovered({"bond0"}),
                                          {"VORNNetLinkAggrGet bond0"},
                                          PortFound("bond0.5"),
                                          GatewaysCopied("bond0", "ovs_bond0"),
                                          {"VLIBNetVlanRemove bond0.5"},
                                          LinuxBondRemoved("bond0", "eth1 eth0", "eth1"),
                                          kStopped,
                                          kNoTopology,
                                          BridgeMade("eth0"),
                                          BridgeMade("eth1"),
                                          kStarted,
                                          {"VORNNetGetEthInfo ovs_eth0", "sleep 3"},
                                          BondBuilt(kBuilt),
                                          TagSet("ovs_bond0", "5"),
                                          {kDone}}));
    EXPECT_THAT(platform.Log(), ElementsAre(SpeedLine()));
}

TEST(CreateAll, FailsBeforeTheTagsAndTheSecondHookWhenABondCannotBeBuilt)
{
    RecordingPlatform platform;
    platform.Interfaces({"bond0", "bond0.5"});
    platform.Vlan("bond0.5", "bond0", 5);
    platform.Bond("bond0", 4, {"eth1", "eth0"});
    EXPECT_FALSE(OVSManager().CreateAll());
    EXPECT_EQ(platform.Calls().back(), "VLIBCFileExist /sys/class/net/ovs_eth1/flags");
    EXPECT_THAT(platform.Log(),
                ElementsAre(SpeedLine(),
                            Err("bondmanager.cpp",
                                "The slave interface eth1 doesn't have the OVS version ovs_eth1"),
                            Err("bondmanager.cpp",
                                "The parameter has wrong format when create the OVS bonding"),
                            Err(kFile, "Failed to create ovs bond"),
                            Err(kFile, "Failed to create bond for ovs-interface")));
}

TEST(CreateAll, PausesAWholeThreeSecondsBeforeTheBondsWhateverSignalsCome)
{
    RecordingPlatform platform;
    platform.Interfaces({"bond0"});
    platform.Bond("bond0", 4, {"eth1", "eth0"});
    platform.AnswerNth("sleep 3", 3, 1); // after the Linux bond's and the stopped network's
    EXPECT_FALSE(OVSManager().CreateAll());
    const auto& calls = platform.Calls();
    const auto waited = std::find(calls.begin(), calls.end(), "VORNNetGetEthInfo ovs_eth0");
    EXPECT_EQ(Calls(waited + 1, waited + 4),
              (Calls{"sleep 3", "sleep 1", "VLIBCFileExist /sys/class/net/ovs_bond0/flags"}));
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

TEST(CreateAll, InsertsAll32Slaves)
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

} // namespace
