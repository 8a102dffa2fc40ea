#include <vornovs/vornovs.h>

#include "switch/hostcalls.h"

using harness::Err;
using harness::Info;
using harness::RecordingPlatform;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::BondBuilt;
using unit::BondDissolved;
using unit::Calls;
using unit::EightLines;
using unit::EightTries;
using unit::FileOf;
using unit::LinuxBondRemoved;
using unit::LogLines;
using unit::MakeLive;
using unit::ReadBonds;
using unit::RecordBond;
using unit::Sequence;
using unit::SwitchBond;
using VORN::OVS::OVSManager;
namespace {

constexpr const char* kFile = unit::kManagerFile;

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
    EXPECT_EQ(platform.Calls(), Sequence({LinuxBondRemoved("bond0", "eth0 eth1", "eth0"),
                                          LinuxBondRemoved("bond1", "eth2", "eth2")}));
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
    const Calls all = LinuxBondRemoved("bond0", "eth0", "eth0");
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
    Calls expected = LinuxBondRemoved("bond0", "eth5 eth0", "eth5");
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
    Calls expected = LinuxBondRemoved("bond0", "eth0", "eth0");
    expected.insert(expected.end() - 1, "sleep 2");
    EXPECT_EQ(platform.Calls(), expected);
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

TEST(CreateOVSBond, HasNothingToDoWithoutBonds)
{
    const RecordingPlatform platform;
    EXPECT_EQ(OVSManager().CreateOVSBond(), 0);
    EXPECT_THAT(platform.Calls(), IsEmpty());
}

TEST(CreateOVSBond, BuildsTheBondsInTheOrderOfTheirNames)
{
    RecordingPlatform platform;
    platform.Bond("bond1", 2, {"eth3", "eth2"});
    platform.Bond("bond0", 1, {"eth0", "eth1"});
    MakeLive(platform, {"ovs_eth0", "ovs_eth1", "ovs_eth2", "ovs_eth3"});
    OVSManager manager;
    ReadBonds(platform, manager, {"bond1", "bond0"});
    EXPECT_EQ(manager.CreateOVSBond(), 0);
    EXPECT_EQ(platform.Calls(), Sequence({BondBuilt({"ovs_bond0", 7, {"eth0", "eth1"}}),
                                          BondBuilt({"ovs_bond1", 8, {"eth3", "eth2"}})}));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(CreateOVSBond, StopsAtTheFirstThatIsRefused)
{
    RecordingPlatform platform;
    platform.Bond("bond0", 1, {"eth0", "eth1"});
    platform.Bond("bond1", 1, {"eth2", "eth3"});
    OVSManager manager;
    ReadBonds(platform, manager, {"bond0", "bond1"});
    platform.Answer("VLIBCFileExist /sys/class/net/ovs_bond0/flags", 1);
    EXPECT_EQ(manager.CreateOVSBond(), -1);
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBCFileExist /sys/class/net/ovs_bond0/flags"));
    EXPECT_EQ(platform.Log().back(), Err(kFile, "Failed to create ovs bond"));
    EXPECT_EQ(platform.Log().size(), 3U);
}

TEST(CreateOVSBond, CutsALongNameTo15CharactersAfterThePrefix)
{
    RecordingPlatform platform;
    platform.Bond("bond01234567", 1, {"eth0", "eth1"});
    MakeLive(platform, {"ovs_eth0", "ovs_eth1"});
    OVSManager manager;
    ReadBonds(platform, manager, {"bond01234567"});
    EXPECT_EQ(manager.CreateOVSBond(), 0);
    EXPECT_EQ(platform.Calls(), BondBuilt({"ovs_bond0123456", 7, {"eth0", "eth1"}}));
}

TEST(RemoveOVSBond, HasNothingToDoWithoutBonds)
{
    const RecordingPlatform platform;
    EXPECT_EQ(OVSManager().RemoveOVSBond(), 0);
    EXPECT_THAT(platform.Calls(), IsEmpty());
}

TEST(RemoveOVSBond, TakesTheBondsApartInTheOrderOfTheirNames)
{
    RecordingPlatform platform;
    const SwitchBond first{"ovs_bond0", 6, {"eth0", "eth1"}};
    const SwitchBond second{"ovs_bond1", 7, {"eth3", "eth2"}};
    OVSManager manager;
    for (const SwitchBond& bond : {second, first}) {
        platform.Bond(bond.name, bond.mode, bond.slaves);
        RecordBond(platform, bond);
    }
    ReadBonds(platform, manager, {"ovs_bond1", "ovs_bond0"});
    EXPECT_EQ(manager.RemoveOVSBond(), 0);
    EXPECT_EQ(platform.Calls(), Sequence({BondDissolved(first), BondDissolved(second)}));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(RemoveOVSBond, StopsAtTheFirstThatCannotBeTakenApart)
{
    RecordingPlatform platform;
    OVSManager manager;
    platform.Bond("ovs_bond0", 6, {"eth0", "eth1"});
    platform.Bond("ovs_bond1", 6, {"eth2", "eth3"});
    ReadBonds(platform, manager, {"ovs_bond0", "ovs_bond1"});
    EXPECT_EQ(manager.RemoveOVSBond(), -1);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCFileGetKeyValue " + FileOf("ovs_bond0") + " SLAVE_LIST"));
    EXPECT_EQ(platform.Log().back(), Err(kFile, "Failed to remove OVS bonding"));
}

} // namespace
