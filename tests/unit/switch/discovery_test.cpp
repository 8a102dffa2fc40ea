// What GetInterface() and InitBondOpt() put into the model. The model is private: the interfaces
// show in the conversion's gateway copies, VLANs and bonds in the calls that remove them.
#include <vornovs/vornovs.h>

#include "support/support.h"

#include <array>
#include <type_traits>

using harness::Err;
using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::Calls;
using unit::LongName;
using VORN::OVS::OVSManager;

namespace {

constexpr char kFile[] = "ovsmanager.cpp";

/** Calls whose text begins with the words, without them. */
std::vector<std::string> Rest(const RecordingPlatform& platform, const std::string& words)
{
    std::vector<std::string> rest;
    for (const std::string& call : platform.Calls()) {
        if (call.starts_with(words + " ")) {
            rest.push_back(call.substr(words.size() + 1));
        }
    }
    return rest;
}

/** The interfaces that discovery found: each one's IPv4 gateway is copied, in the model's order. */
std::vector<std::string> Interfaces(RecordingPlatform& platform)
{
    OVSManager manager;
    platform.Answer("VLIBCFileExist", 0); // no interface lives: bonds are not built again
    (void)manager.CreateAll();
    return Rest(platform, "VLIBCExecl /usr/vorn/sbin/vornnetdtool --copy-gateway-info -4");
}

/** The model's VLANs by their record's name. */
std::vector<std::string> Vlans(RecordingPlatform& platform, const OVSManager& manager)
{
    platform.Forget();
    EXPECT_EQ(manager.RemoveLinuxVlan(), 0);
    return Rest(platform, "VLIBNetVlanRemove");
}

/** The model's bonds: name, mode and slaves. */
std::vector<std::string> Bonds(RecordingPlatform& platform, OVSManager& manager)
{
    platform.Forget();
    EXPECT_EQ(manager.CreateLinuxBond(), 0);
    return Rest(platform, "VORNNetLinkAggrSet");
}

TEST(OVSManager, IsMadeAndDestroyedWithoutTouchingTheSystem)
{
    const RecordingPlatform platform;
    static_assert(std::has_virtual_destructor_v<OVSManager>);
    {
        const OVSManager manager;
    }
    EXPECT_THAT(platform.Calls(), IsEmpty());
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(GetInterface, AsksAboutEachInterfaceInTheListsOrder)
{
    RecordingPlatform platform;
    platform.Interfaces({"eth1", "eth0"});
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBNetGetInterfaceInfo", "VLIBNetBridgeIfIsMaster eth1",
                            "VLIBNetVlanGet eth1", "VLIBNetBridgeIfIsMaster eth0",
                            "VLIBNetVlanGet eth0"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(GetInterface, FailsWhenThereIsNoInterface)
{
    RecordingPlatform platform;
    platform.Answer("VLIBNetGetInterfaceInfo", 0);
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), -1);
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBNetGetInterfaceInfo"));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "No interface.")));
}

TEST(GetInterface, FailsWhenThePlatformFails)
{
    RecordingPlatform platform;
    platform.Answer("VLIBNetGetInterfaceInfo", -1);
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), -1);
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Get interface info fail.")));
}

TEST(GetInterface, SkipsWirelessPointToPointTunnelAndSwitchInterfaces)
{
    RecordingPlatform platform;
    platform.Interfaces({"wlan0", "ppp0", "tun0", "ovs_eth0"});
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), 0);
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBNetGetInterfaceInfo"));

    platform.Forget();
    EXPECT_THAT(Interfaces(platform), IsEmpty());
}

TEST(GetInterface, SkipsNamesShorterThanAPrefixThatAgreeAsFarAsTheyGo)
{
    RecordingPlatform platform;
    platform.Interfaces({"ovs", "o", "wla", "pp", "t", "tu", ""});
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), 0);
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBNetGetInterfaceInfo"));
}

TEST(GetInterface, KeepsNamesThatOnlyLookLikeAPrefix)
{
    RecordingPlatform platform;
    platform.Interfaces({"ovsx", "xtun0", "Wlan0", "tap0", "pp0"});
    EXPECT_THAT(Interfaces(platform), ElementsAre("Wlan0 ovs_Wlan0", "ovsx ovs_ovsx", "pp0 ovs_pp0",
                                                  "tap0 ovs_tap0", "xtun0 ovs_xtun0"));
}

TEST(GetInterface, SkipsALinuxBridgeOnEveryAnswerBut0)
{
    for (const int answer : {-1, 1, 2}) {
        RecordingPlatform platform;
        platform.Interfaces({"br0", "eth0"});
        platform.Answer("VLIBNetBridgeIfIsMaster br0", answer);
        OVSManager manager;
        EXPECT_EQ(manager.GetInterface(), 0) << answer;
        EXPECT_THAT(platform.Calls(),
                    ElementsAre("VLIBNetGetInterfaceInfo", "VLIBNetBridgeIfIsMaster br0",
                                "VLIBNetBridgeIfIsMaster eth0", "VLIBNetVlanGet eth0"))
            << answer;
    }
}

TEST(GetInterface, CountsAVlanThroughItsParent)
{
    RecordingPlatform platform;
    platform.Interfaces({"eth0", "eth0.10"});
    platform.Vlan("eth0.10", "eth0", 10);
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), 0);
    EXPECT_THAT(Vlans(platform, manager), ElementsAre("eth0.10"));

    platform.Forget();
    EXPECT_THAT(Interfaces(platform), ElementsAre("eth0 ovs_eth0"));
}

TEST(GetInterface, FindsAParentThatIsNotListedItself)
{
    RecordingPlatform platform;
    platform.Interfaces({"eth0.10", "eth0.20"});
    platform.Vlan("eth0.10", "eth0", 10);
    platform.Vlan("eth0.20", "eth0", 20);
    EXPECT_THAT(Interfaces(platform), ElementsAre("eth0 ovs_eth0"));
}

TEST(GetInterface, TakesNoAnswerBut1AsAVlan)
{
    for (const int answer : {-1, 0, 2}) {
        RecordingPlatform platform;
        platform.Interfaces({"eth0.10"});
        platform.Vlan("eth0.10", "eth0", 10);
        platform.Answer("VLIBNetVlanGet", answer);
        OVSManager manager;
        EXPECT_EQ(manager.GetInterface(), 0) << answer;
        EXPECT_THAT(Vlans(platform, manager), IsEmpty()) << answer;

        platform.Forget();
        EXPECT_THAT(Interfaces(platform), ElementsAre("eth0.10 ovs_eth0.10")) << answer;
    }
}

TEST(GetInterface, KeepsTheVlansOfAnEarlierCallButNotItsInterfaces)
{
    RecordingPlatform platform;
    platform.Interfaces({"eth0.10"});
    platform.Vlan("eth0.10", "eth0", 10);
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), 0);
    platform.Interfaces({"eth1.5"});
    platform.Vlan("eth1.5", "eth1", 5);
    EXPECT_EQ(manager.GetInterface(), 0);
    EXPECT_THAT(Vlans(platform, manager), ElementsAre("eth0.10", "eth1.5"));

    platform.Forget();
    EXPECT_TRUE(manager.CreateAll());
    EXPECT_THAT(Rest(platform, "VLIBCExecl /usr/vorn/sbin/vornnetdtool --copy-gateway-info -4"),
                ElementsAre("eth1 ovs_eth1"));
}

TEST(GetInterface, EmptiesTheInterfacesBeforeItFails)
{
    RecordingPlatform platform;
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), 0);
    platform.Bond("bond0", 1, {"eth5"});
    EXPECT_EQ(manager.InitBondOpt("bond0"), 0);
    platform.Answer("VLIBNetGetInterfaceInfo", -1);
    EXPECT_EQ(manager.GetInterface(), -1);

    platform.Forget();
    EXPECT_FALSE(manager.CreateAll());
    EXPECT_THAT(platform.Calls(), ElementsAre("ExecHook net net/ovs_change 4 ACTION=create",
                                              "VLIBNetGetInterfaceInfo"));
}

TEST(GetInterface, LoadsABondWithTheConvertedMode)
{
    RecordingPlatform platform;
    platform.Interfaces({"bond0"});
    platform.Bond("bond0", 4, {"eth0", "eth1"});
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBNetGetInterfaceInfo", "VLIBNetBridgeIfIsMaster bond0",
                            "VLIBNetVlanGet bond0", "VORNNetLinkAggrGet bond0"));
    EXPECT_THAT(Bonds(platform, manager), ElementsAre("bond0 mode=6 eth0 eth1"));
}

TEST(GetInterface, CountsTheBondItselfAsAnInterface)
{
    RecordingPlatform platform;
    platform.Interfaces({"bond0"});
    EXPECT_THAT(Interfaces(platform), ElementsAre("bond0 ovs_bond0"));
    EXPECT_EQ(platform.Log().front(), Err(kFile, "Failed to get the status of link aggr"));
}

TEST(GetInterface, TakesAShortNameThatAgreesWithBondAsABond)
{
    RecordingPlatform platform;
    platform.Interfaces({"bon", "b", "bonding", "bone"});
    platform.Bond("bon", 1, {"eth0"});
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), 0);
    EXPECT_THAT(Rest(platform, "VORNNetLinkAggrGet"), ElementsAre("bon", "b", "bonding"));
    EXPECT_THAT(Bonds(platform, manager), ElementsAre("bon mode=7 eth0"));
}

TEST(GetInterface, FindsABondThroughItsVlan)
{
    RecordingPlatform platform;
    platform.Interfaces({"bond0.5"});
    platform.Vlan("bond0.5", "bond0", 5);
    platform.Bond("bond0", 1, {"eth0", "eth1"});
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), 0);
    EXPECT_THAT(Rest(platform, "VORNNetLinkAggrGet"), ElementsAre("bond0"));
    EXPECT_THAT(Vlans(platform, manager), ElementsAre("bond0.5"));
    EXPECT_THAT(Bonds(platform, manager), ElementsAre("bond0 mode=7 eth0 eth1"));

    platform.Forget();
    EXPECT_EQ(Interfaces(platform).front(), "bond0 ovs_bond0");
}

TEST(GetInterface, AsksOnceForABondAndItsVlans)
{
    RecordingPlatform platform;
    platform.Interfaces({"bond0", "bond0.5", "bond0.6"});
    platform.Vlan("bond0.5", "bond0", 5);
    platform.Vlan("bond0.6", "bond0", 6);
    platform.Bond("bond0", 1, {"eth0"});
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), 0);
    EXPECT_THAT(Rest(platform, "VORNNetLinkAggrGet"), ElementsAre("bond0"));
}

TEST(GetInterface, KeepsAModeForcedBefore)
{
    RecordingPlatform platform;
    platform.Interfaces({"bond0"});
    platform.Bond("bond0", 4, {"eth0"});
    OVSManager manager;
    EXPECT_EQ(manager.InitBondOpt("bond0", "ovs-balance-tcp"), 0);
    EXPECT_EQ(manager.GetInterface(), 0);
    EXPECT_THAT(Rest(platform, "VORNNetLinkAggrGet"), ElementsAre("bond0"));
    EXPECT_THAT(Bonds(platform, manager), ElementsAre("bond0 mode=8 eth0"));
}

TEST(GetInterface, Takes32Interfaces)
{
    RecordingPlatform platform;
    std::vector<std::string> names;
    for (int i = 10; i < 42; ++i) {
        names.push_back("eth" + std::to_string(i));
    }
    platform.Interfaces(names);
    EXPECT_EQ(Interfaces(platform).size(), 32U);
}

TEST(GetInterface, ReadsNoMoreRecordsThanItGaveRoomFor)
{
    RecordingPlatform platform;
    platform.Interfaces(std::vector<std::string>(32, "eth0"));
    platform.Answer("VLIBNetGetInterfaceInfo", 33);
    EXPECT_THAT(Interfaces(platform), ElementsAre("eth0 ovs_eth0"));
}

TEST(InitBondOpt, Answers0AndLeavesTheModelWhenTheBondCannotBeRead)
{
    RecordingPlatform platform;
    OVSManager manager;
    EXPECT_EQ(manager.InitBondOpt("bond0"), 0);
    EXPECT_THAT(platform.Calls(), ElementsAre("VORNNetLinkAggrGet bond0"));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to get the status of link aggr")));
    EXPECT_THAT(Bonds(platform, manager), IsEmpty());
}

TEST(InitBondOpt, TakesAPositiveAnswerAsSuccess)
{
    RecordingPlatform platform;
    platform.Bond("bond0", 2, {"eth0"});
    platform.Answer("VORNNetLinkAggrGet", 1);
    OVSManager manager;
    EXPECT_EQ(manager.InitBondOpt("bond0"), 0);
    EXPECT_THAT(platform.Log(), IsEmpty());
    EXPECT_THAT(Bonds(platform, manager), ElementsAre("bond0 mode=8 eth0"));
}

TEST(InitBondOpt, OverwritesAnEarlierRecord)
{
    RecordingPlatform platform;
    platform.Bond("bond0", 1, {"eth0"});
    OVSManager manager;
    EXPECT_EQ(manager.InitBondOpt("bond0"), 0);
    platform.Bond("bond0", 2, {"eth1", "eth2"});
    EXPECT_EQ(manager.InitBondOpt("bond0"), 0);
    EXPECT_THAT(Bonds(platform, manager), ElementsAre("bond0 mode=8 eth1 eth2"));
}

TEST(InitBondOpt, KeepsAnEarlierRecordWhenTheBondCannotBeReadAnyMore)
{
    RecordingPlatform platform;
    platform.Bond("bond0", 1, {"eth0"});
    OVSManager manager;
    EXPECT_EQ(manager.InitBondOpt("bond0"), 0);
    platform.Answer("VORNNetLinkAggrGet", -1);
    EXPECT_EQ(manager.InitBondOpt("bond0"), 0);
    EXPECT_THAT(Bonds(platform, manager), ElementsAre("bond0 mode=7 eth0"));
}

TEST(InitBondOptWithMode, ForcesTheMode)
{
    RecordingPlatform platform;
    platform.Bond("bond0", 1, {"eth0"});
    OVSManager manager;
    EXPECT_EQ(manager.InitBondOpt("bond0", "ovs-balance-tcp"), 0);
    EXPECT_THAT(platform.Calls(), ElementsAre("VORNNetLinkAggrGet bond0",
                                              "VORNNetLinkAggrStringToMode ovs-balance-tcp"));
    EXPECT_THAT(Bonds(platform, manager), ElementsAre("bond0 mode=8 eth0"));
}

TEST(InitBondOptWithMode, MakesAnEmptyRecordWithTheModeWhenTheBondCannotBeRead)
{
    RecordingPlatform platform;
    OVSManager manager;
    EXPECT_EQ(manager.InitBondOpt("bond0", "ovs-balance-slb"), 0);
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to get the status of link aggr")));
    EXPECT_THAT(Bonds(platform, manager), ElementsAre("'' mode=7"));
}

TEST(InitBondOpt, StandsNamesOf5000Characters)
{
    RecordingPlatform platform;
    OVSManager manager;
    EXPECT_EQ(manager.InitBondOpt(LongName()), 0);
    EXPECT_EQ(manager.InitBondOpt(LongName(), LongName()), 0);
    EXPECT_THAT(Bonds(platform, manager), ElementsAre("'' mode=0"));
}

} // namespace
