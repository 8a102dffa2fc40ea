#include <vornovs/vornovs.h>

#include "support/bondcalls.h"

#include <filesystem>

using harness::Err;
using harness::Info;
using harness::RecordingPlatform;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::UnorderedElementsAre;
using unit::BondErased;
using unit::BondRead;
using unit::BridgeDissolved;
using unit::BridgeMade;
using unit::Calls;
using unit::FileOf;
using unit::kIgnoreList;
using unit::kInterfaceList;
using unit::LongName;
using unit::MakeUnopenable;
using unit::Names;
using unit::ReadFile;
using unit::Sequence;
using unit::SwitchBond;
using unit::WriteFile;
using VORN::OVS::AddInterface;
using VORN::OVS::RemoveInterface;

namespace {

constexpr char kFile[] = "libvornovs.cpp";

const Calls kIgnoreLoaded{"VLIBCFileCheckDir /usr/vorn/etc/vornovs",
                          "VLIBCFileExist /usr/vorn/etc/vornovs/ovs_ignore.conf"};
const Calls kSaved{"VLIBCFileCheckDir /usr/vorn/etc/vornovs"};

const SwitchBond kBond{"ovs_bond0", 6, {"eth0", "eth1"}};

/** Up to the stop of the bridge's network. */
Calls Stopped(const std::string& bridge)
{
    return Sequence(
        {kIgnoreLoaded,
         {"VLIBNetOVSIfIsMaster " + bridge, "VLIBCExecv /etc/rc.network stop " + bridge}});
}

const Calls kRemoved = Sequence({Stopped("ovs_eth0"),
                                 BridgeDissolved("eth0", true),
                                 kSaved,
                                 {"VLIBCExecv /etc/rc.network start eth0"}});

/** The bond's own part, without any network command. */
const Calls kBondTaken = Sequence({Stopped("ovs_bond0"),
                                   BondRead(kBond),
                                   {"VORNNetBondIPConflict ovs_bond0"},
                                   BondErased(kBond)});

const Calls kBondRemoved = Sequence({kBondTaken,
                                     BridgeDissolved("eth0", true),
                                     kSaved,
                                     BridgeDissolved("eth1", true),
                                     kSaved,
                                     {"VLIBCExecv /etc/rc.network start eth0 eth1"}});

class Removal : public testing::Test {
protected:
    Removal()
    {
        WriteFile(kInterfaceList, "eth0\neth1\n");
        unit::RecordBond(platform, kBond);
        platform.Answer("VLIBNetOVSIfIsMaster ovs_bond0", 2);
    }
    RecordingPlatform platform;
};

TEST_F(Removal, GivesABridgeBackToItsInterfaceAndStartsThat)
{
    EXPECT_EQ(RemoveInterface("ovs_eth0"), 0);
    EXPECT_EQ(platform.Calls(), kRemoved);
    EXPECT_THAT(platform.Log(), IsEmpty());
    EXPECT_EQ(ReadFile(kIgnoreList), "eth0\n");
    EXPECT_EQ(ReadFile(kInterfaceList), "eth1\n");
}

TEST_F(Removal, TakesABondApartAndStartsItsSlavesInSlotOrder)
{
    EXPECT_EQ(RemoveInterface("ovs_bond0"), 0);
    EXPECT_EQ(platform.Calls(), kBondRemoved);
    EXPECT_THAT(platform.Log(), IsEmpty());
    EXPECT_EQ(ReadFile(kIgnoreList), "eth0\neth1\n");
    EXPECT_EQ(ReadFile(kInterfaceList), std::nullopt);
}

TEST_F(Removal, KeepsTheSlotOrderOfSlavesThatSortOtherwise)
{
    unit::RecordBond(platform, {"ovs_bond0", 6, {"eth1", "eth0"}});
    EXPECT_EQ(RemoveInterface("ovs_bond0"), 0);
    EXPECT_EQ(platform.Calls().back(), "VLIBCExecv /etc/rc.network start eth1 eth0");
    EXPECT_EQ(ReadFile(kIgnoreList), "eth0\neth1\n");
}

TEST_F(Removal, RefusesWhatIsNoBridgeBeforeStoppingAnything)
{
    platform.Answer("VLIBNetOVSIfIsMaster eth7", -1);
    EXPECT_EQ(RemoveInterface("eth7"), -1);
    EXPECT_EQ(platform.Calls(), Sequence({kIgnoreLoaded, {"VLIBNetOVSIfIsMaster eth7"}}));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "The eth7 doesn't belong to OVS")));
}

TEST_F(Removal, StopsABridgeOfAnotherKindAndStartsNothing)
{
    for (const int kind : {0, 3}) {
        platform.Forget();
        platform.Answer("VLIBNetOVSIfIsMaster ovs_x", kind);
        EXPECT_EQ(RemoveInterface("ovs_x"), 0) << kind;
        EXPECT_EQ(platform.Calls(), Sequence({Stopped("ovs_x"), {"VLIBCExecv"}})) << kind;
        EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to start the rc.network")))
            << kind;
    }
}

TEST_F(Removal, DoesNotLogAPlatformThatIsContentWithNothing)
{
    platform.Answer("VLIBNetOVSIfIsMaster ovs_x", 0);
    platform.Answer("VLIBCExecv", 0);
    EXPECT_EQ(RemoveInterface("ovs_x"), 0);
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST_F(Removal, GoesOnWhenTheNetworkScriptFails)
{
    for (const int answer : {-1, 1}) {
        std::filesystem::remove(kIgnoreList);
        WriteFile(kInterfaceList, "eth0\neth1\n");
        platform.Forget();
        platform.Answer("VLIBCExecv /etc/rc.network", answer);
        EXPECT_EQ(RemoveInterface("ovs_eth0"), 0) << answer;
        EXPECT_EQ(platform.Calls(), kRemoved) << answer;
        EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to stop the rc.network"),
                                                Err(kFile, "Failed to start the rc.network")))
            << answer;
    }
}

TEST_F(Removal, FailsWithoutAStartWhenTheBridgeCannotBeDissolved)
{
    platform.Answer("VLIBCExec /bin/cp", -1);
    EXPECT_EQ(RemoveInterface("ovs_eth0"), -1);
    const Calls dissolved = BridgeDissolved("eth0", true);
    EXPECT_EQ(platform.Calls(),
              Sequence({Stopped("ovs_eth0"), Calls(dissolved.begin(), dissolved.begin() + 3)}));
    EXPECT_EQ(platform.Log().back(), Err(kFile, "Failed to remove the ovs interface ovs_eth0"));
    EXPECT_EQ(platform.Log().size(), 2U);
    EXPECT_EQ(ReadFile(kIgnoreList), std::nullopt);
}

TEST_F(Removal, FailsWithoutAStartForAnInterfaceThatIsIgnoredAlready)
{
    WriteFile(kIgnoreList, "eth0\n");
    EXPECT_EQ(RemoveInterface("ovs_eth0"), -1);
    EXPECT_EQ(platform.Calls(), Sequence({Stopped("ovs_eth0"), BridgeDissolved("eth0", true)}));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err("ifsconf.cpp", "The eth0 has exist"),
                            Err(kFile, "Failed to adde the ovs interface ovs_eth0 into ignore "
                                       "filke")));
}

TEST_F(Removal, FailsWithoutAStartWhenTheBondCannotBeTakenApart)
{
    unit::RecordBond(platform, {"ovs_bond0", 6, {"eth0"}});
    EXPECT_EQ(RemoveInterface("ovs_bond0"), -1);
    EXPECT_EQ(platform.Calls(),
              Sequence({Stopped("ovs_bond0"), BondRead({"ovs_bond0", 6, {"eth0"}})}));
    EXPECT_EQ(platform.Log().size(), 3U);
    EXPECT_EQ(platform.Log().back(), Err(kFile, "Failed to remove the ovs bond ovs_bond0"));
}

TEST_F(Removal, NamesTheBondWhenASlavesBridgeCannotBeDissolvedAndLeavesTheOtherSlaves)
{
    platform.AnswerNth("VLIBCExec /bin/cp", 2, -1); // the first copies the bond's file
    EXPECT_EQ(RemoveInterface("ovs_bond0"), -1);
    const Calls dissolved = BridgeDissolved("eth0", true);
    EXPECT_EQ(platform.Calls(),
              Sequence({kBondTaken, Calls(dissolved.begin(), dissolved.begin() + 3)}));
    EXPECT_EQ(platform.Log().back(), Err(kFile, "Failed to remove the ovs interface ovs_bond0"));
    EXPECT_EQ(ReadFile(kIgnoreList), std::nullopt);
}

TEST_F(Removal, NamesTheBondWhenASlaveIsIgnoredAlreadyAndLeavesTheOtherSlaves)
{
    WriteFile(kIgnoreList, "eth0\n");
    EXPECT_EQ(RemoveInterface("ovs_bond0"), -1);
    EXPECT_EQ(platform.Calls(), Sequence({kBondTaken, BridgeDissolved("eth0", true)}));
    EXPECT_EQ(platform.Log().back(),
              Err(kFile, "Failed to adde the ovs interface ovs_bond0 into ignore filke"));
    EXPECT_EQ(ReadFile(kIgnoreList), "eth0\n");
}

TEST_F(Removal, ListsABridgeWithoutThePrefixAsTheEmptyName)
{
    EXPECT_EQ(RemoveInterface("br7"), 0);
    EXPECT_EQ(ReadFile(kIgnoreList), "\n");
    EXPECT_EQ(platform.Calls().back(), "VLIBCExecv /etc/rc.network start ''");
}

TEST_F(Removal, CutsTheInterfacesNameToItsBuffer)
{
    const std::string plain = LongName().substr(0, 1023);
    EXPECT_EQ(RemoveInterface("ovs_" + LongName()), 0);
    EXPECT_EQ(ReadFile(kIgnoreList), plain + "\n");
    EXPECT_EQ(platform.Calls().back(), "VLIBCExecv /etc/rc.network start " + plain);
}

TEST_F(Removal, TakesNoLock)
{
    EXPECT_EQ(RemoveInterface("ovs_eth0"), 0);
    EXPECT_EQ(AddInterface("eth0"), 0);
    Names names;
    EXPECT_EQ(VORN::OVS::ListInterface(names), 0);
    EXPECT_THAT(platform.Calls(), Not(Contains(testing::StartsWith("VLIBCFileLock"))));
}

Calls Added(const std::string& name)
{
    return Sequence({kIgnoreLoaded,
                     {"VLIBCExecl /etc/rc.network stop " + name},
                     BridgeMade(name),
                     kSaved,
                     {"VLIBCExecl /etc/rc.network start ovs_" + name}});
}

TEST(Addition, PutsAnInterfaceBackOnTheSwitch)
{
    const RecordingPlatform platform;
    WriteFile(kIgnoreList, "eth0\neth1\n");
    EXPECT_EQ(AddInterface("eth0"), 0);
    EXPECT_EQ(platform.Calls(), Added("eth0"));
    EXPECT_THAT(platform.Log(), IsEmpty());
    EXPECT_EQ(ReadFile(kIgnoreList), "eth1\n");
    EXPECT_EQ(ReadFile(kInterfaceList), "eth0\n");
}

TEST(Addition, GoesOnWhenTheNetworkScriptFailsAndSpeaksOfStoppingTwice)
{
    for (const int answer : {-1, 1}) {
        std::filesystem::remove(kInterfaceList);
        WriteFile(kIgnoreList, "eth0\n");
        RecordingPlatform platform;
        platform.Answer("VLIBCExecl /etc/rc.network", answer);
        EXPECT_EQ(AddInterface("eth0"), 0) << answer;
        EXPECT_EQ(platform.Calls(), Added("eth0")) << answer;
        EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to stop the rc.network"),
                                                Err(kFile, "Failed to stop the rc.network")))
            << answer;
    }
}

TEST(Addition, FailsWithoutAStartWhenTheBridgesFileCannotBeWritten)
{
    RecordingPlatform platform;
    WriteFile(kIgnoreList, "eth0\n");
    platform.Answer("VLIBCExec /bin/cp", -1);
    EXPECT_EQ(AddInterface("eth0"), -1);
    const Calls made = BridgeMade("eth0");
    EXPECT_EQ(platform.Calls(), Sequence({kIgnoreLoaded,
                                          {"VLIBCExecl /etc/rc.network stop eth0"},
                                          Calls(made.begin(), made.begin() + 3)}));
    EXPECT_EQ(platform.Log().back(), Err(kFile, "Failed to remove the ovs interface eth0"));
    EXPECT_EQ(ReadFile(kIgnoreList), "eth0\n");
}

TEST(Addition, FailsWithoutAStartForAnInterfaceThatIsNotIgnored)
{
    const RecordingPlatform platform;
    EXPECT_EQ(AddInterface("eth0"), -1);
    EXPECT_EQ(
        platform.Calls(),
        Sequence({kIgnoreLoaded, {"VLIBCExecl /etc/rc.network stop eth0"}, BridgeMade("eth0")}));
    EXPECT_THAT(
        platform.Log(),
        ElementsAre(Err("ifsconf.cpp", "The eth0 has not been used before"),
                    Err(kFile, "Failed to remove the ovs interface eth0 from ignore filke")));
}

TEST(Addition, CutsTheBridgeThatItStartsToItsBuffer)
{
    const RecordingPlatform platform;
    WriteFile(kIgnoreList, LongName() + "\n");
    EXPECT_EQ(AddInterface(LongName()), 0);
    EXPECT_EQ(platform.Calls().back(),
              "VLIBCExecl /etc/rc.network start " + ("ovs_" + LongName()).substr(0, 1023));
}

TEST(Addition, IsTheWayBackOfARemoval)
{
    RecordingPlatform platform;
    platform.CarryOutFileEdits();
    const std::string plain = "DEVICE=eth0\nIPADDR=1.2.3.4\nBRIDGE=ovs_eth0\n";
    const std::string bridge = "DEVICE=ovs_eth0\nIPADDR=1.2.3.4\nTYPE=OVS\nPRIMARY=eth0\n";
    WriteFile(FileOf("eth0"), plain);
    WriteFile(FileOf("ovs_eth0"), bridge);
    WriteFile(kInterfaceList, "eth0\n");
    EXPECT_EQ(RemoveInterface("ovs_eth0"), 0);
    EXPECT_EQ(ReadFile(FileOf("eth0")), "DEVICE=eth0\nIPADDR=1.2.3.4\n");
    EXPECT_EQ(ReadFile(FileOf("ovs_eth0")), std::nullopt);
    EXPECT_EQ(AddInterface("eth0"), 0);
    EXPECT_EQ(ReadFile(FileOf("eth0")), plain);
    EXPECT_EQ(ReadFile(FileOf("ovs_eth0")), bridge);
    EXPECT_THAT(unit::ListFolder(unit::kStateFolder), ElementsAre("ovs_interface.conf"));
}

constexpr char kList[] = "VLIBCPopen /usr/bin/ovs-vsctl r list-br";

TEST(ListInterface, GivesTheBridgesWhenAClientIsRegistered)
{
    RecordingPlatform platform;
    WriteFile(unit::kRegistry, "a\n");
    platform.Output(kList, "ovs_eth1\novs_eth0\n");
    Names names{"before"};
    EXPECT_EQ(VORN::OVS::ListInterface(names), 0);
    EXPECT_THAT(names, UnorderedElementsAre("ovs_eth0", "ovs_eth1"));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Info("vlanmanager.cpp", "ovs_eth1 without any vlan tag"),
                            Info("vlanmanager.cpp", "ovs_eth0 without any vlan tag")));
}

TEST(ListInterface, LeavesTheSetWithoutAClient)
{
    const RecordingPlatform platform;
    Names names{"before"};
    EXPECT_EQ(VORN::OVS::ListInterface(names), 0);
    EXPECT_THAT(names, ElementsAre("before"));
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBCFileCheckDir /usr/vorn/etc/vornovs",
                                              "VLIBCFileExist /usr/vorn/etc/vornovs/ovs_reg.conf"));
}

TEST(ListInterface, FailsForARegistryThatCannotBeRead)
{
    const RecordingPlatform platform;
    MakeUnopenable(unit::kRegistry);
    Names names{"before"};
    EXPECT_EQ(VORN::OVS::ListInterface(names), -1);
    EXPECT_THAT(names, ElementsAre("before"));
    EXPECT_EQ(platform.Log().back(), Err(kFile, "Failed to load the ovs config"));
}

TEST(ListInterface, FailsWhenTheSwitchCannotBeAsked)
{
    RecordingPlatform platform;
    WriteFile(unit::kRegistry, "a\n");
    platform.Answer("VLIBCPopen", 0);
    Names names;
    EXPECT_EQ(VORN::OVS::ListInterface(names), -1);
    EXPECT_EQ(platform.Log().size(), 2U);
    EXPECT_EQ(platform.Log().back(), Err(kFile, "Failed to get all ovs interface"));
}

} // namespace
