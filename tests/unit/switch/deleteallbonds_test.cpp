#include <vornovs/vornovs.h>

#include "switch/hostcalls.h"

using harness::Err;
using harness::Info;
using harness::RecordingPlatform;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::BondDissolved;
using unit::BridgeDissolved;
using unit::Calls;
using unit::FileOf;
using unit::GatewaysCopied;
using unit::GetTag;
using unit::kListBridges;
using unit::kNoTopology;
using unit::kStarted;
using unit::kStopped;
using unit::Listed;
using unit::RecordBond;
using unit::Sequence;
using unit::SwitchBond;
using unit::TagCleared;
using unit::WriteFile;
using VORN::OVS::OVSManager;

namespace {

constexpr const char* kFile = unit::kManagerFile;
constexpr char kDone[] = "ExecHook net net/ovs_change 5 ACTION=delete";

/** A host whose one interface is on the switch. */
void PutOneBridgeOnTheSwitch(RecordingPlatform& platform)
{
    WriteFile(unit::kInterfaceList, "eth0\n");
    platform.Output(kListBridges, "ovs_eth0\n");
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

const SwitchBond kBond{"ovs_bond0", 6, {"eth0", "eth1"}};

/** A host whose two interfaces are a bond on the switch. */
class BondOnTheSwitch : public testing::Test {
protected:
    BondOnTheSwitch()
    {
        WriteFile(unit::kInterfaceList, "eth0\neth1\n");
        platform.Output(kListBridges, "ovs_bond0\n");
        platform.Answer("VLIBNetOVSIfIsMaster ovs_bond0", 2);
        platform.Bond("ovs_bond0", 6, kBond.slaves);
        RecordBond(platform, kBond);
    }

    /** Up to the bond's removal. */
    static Calls Found()
    {
        Calls calls = Listed({"ovs_bond0"});
        calls.insert(calls.end() - 1, "VORNNetLinkAggrGet ovs_bond0");
        return Sequence({calls, GatewaysCopied("ovs_bond0", "bond0")});
    }

    /** From the network's stop to its start. */
    static Calls Dissolved()
    {
        return Sequence({kStopped, BridgeDissolved("eth0", true), BridgeDissolved("eth1", true),
                         kNoTopology, kStarted});
    }

    const harness::LogLine noTag = Info("vlanmanager.cpp", "ovs_bond0 without any vlan tag");
    RecordingPlatform platform;
};

TEST_F(BondOnTheSwitch, IsTakenApartAndBecomesALinuxBondAgain)
{
    EXPECT_TRUE(OVSManager().DeleteAll());
    EXPECT_EQ(platform.Calls(), Sequence({Found(),
                                          BondDissolved(kBond),
                                          Dissolved(),
                                          {"sleep 3", "VORNNetLinkAggrSet bond0 mode=4 eth0 eth1",
                                           "VORNNetGetEthInfo bond0", kDone}}));
    EXPECT_THAT(platform.Log(), ElementsAre(noTag));
    EXPECT_THAT(unit::ListFolder(unit::kStateFolder), IsEmpty());
}

TEST_F(BondOnTheSwitch, LosesItsTagBeforeItGoesAndIsALinuxBondBeforeItsVlanIsMade)
{
    platform.Output(GetTag("ovs_bond0"), "5\n");
    platform.AnswerNth("sleep 3", 3, 1); // the pause before the bonds, cut short by a signal
    EXPECT_TRUE(OVSManager().DeleteAll());
    EXPECT_EQ(platform.Calls(),
              Sequence({Found(),
                        TagCleared("ovs_bond0"),
                        BondDissolved(kBond),
                        Dissolved(),
                        {"sleep 3", "sleep 1", "VORNNetLinkAggrSet bond0 mode=4 eth0 eth1",
                         "VORNNetGetEthInfo bond0", "sleep 3", "VORNNetIFGetIPConfig bond0",
                         "VLIBNetVlanCreate bond0 5 ip-of-bond0", kDone}}));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST_F(BondOnTheSwitch, ComesBackInTheModeThatAClientNamed)
{
    OVSManager manager;
    EXPECT_EQ(manager.InitBondOpt("ovs_bond0", "802.3ad"), 0);
    EXPECT_TRUE(manager.DeleteAll());
    EXPECT_THAT(platform.Calls(), Contains("VORNNetLinkAggrSet bond0 mode=2 eth0 eth1"));
}

TEST_F(BondOnTheSwitch, StaysAndTheNetworkRunsWhenItCannotBeTakenApart)
{
    platform.Answer("VLIBCFileGetKeyValue", -1);
    EXPECT_FALSE(OVSManager().DeleteAll());
    EXPECT_EQ(platform.Calls(),
              Sequence({Found(), {"VLIBCFileGetKeyValue " + FileOf("ovs_bond0") + " SLAVE_LIST"}}));
    EXPECT_THAT(platform.Log(),
                ElementsAre(noTag, Err("bondmanager.cpp", "Failed to get key [BLOCK_CNT]"),
                            Err("bondmanager.cpp", "Faild to get"),
                            Err("bondmanager.cpp",
                                "The parameter has wrong foramt when the OVSD bonding remove"),
                            Err(kFile, "Failed to remove OVS bonding"),
                            Err(kFile, "Failed to create bond for ovs-interface")));
}

TEST_F(BondOnTheSwitch, LeavesItsSlavesOnTheirOwnWhenTheLinuxBondCannotBeMade)
{
    platform.Answer("VORNNetLinkAggrSet", -1);
    EXPECT_TRUE(OVSManager().DeleteAll());
    EXPECT_EQ(platform.Calls(),
              Sequence({Found(),
                        BondDissolved(kBond),
                        Dissolved(),
                        {"sleep 3", "VORNNetLinkAggrSet bond0 mode=4 eth0 eth1", kDone}}));
    EXPECT_THAT(platform.Log(), ElementsAre(noTag, Err(kFile, "Failed to create linux bond"),
                                            Err(kFile, "Failed to create linux bond")));
}

} // namespace
