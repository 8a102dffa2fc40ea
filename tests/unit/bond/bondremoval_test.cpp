#include "bond/bondremoval.h"

#include <algorithm>

using harness::Err;
using harness::RecordingPlatform;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::BondDissolved;
using unit::BondErased;
using unit::BondRead;
using unit::BondRemoval;
using unit::Calls;
using unit::ExpectRecord;
using unit::FileOf;
using unit::kBond;
using unit::LongName;
using unit::ReadFile;
using unit::RecordBond;
using unit::Remove;
using unit::Sequence;
using unit::SwitchBond;
using unit::WriteFile;
using VORN::OVS::BondManager;

namespace {

constexpr char kFile[] = "bondmanager.cpp";

/** The edits of kBond's files without those that begin so. */
Calls DissolvedWithout(const std::vector<std::string>& left)
{
    Calls calls = BondDissolved(kBond);
    for (const std::string& begin : left) {
        EXPECT_EQ(
            std::erase_if(calls, [&](const std::string& call) { return call.starts_with(begin); }),
            1U)
            << begin;
    }
    return calls;
}

TEST_F(BondRemoval, StopsTheBondRestoresTheFilesAndStartsTheBridges)
{
    EXPECT_TRUE(Remove("ovs_bond0"));
    EXPECT_EQ(platform.Calls(), BondDissolved(kBond));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST_F(BondRemoval, RunsNoNetworkCommandAndDoesNotPauseWithoutTheFlag)
{
    EXPECT_TRUE(Remove("ovs_bond0", false));
    EXPECT_EQ(platform.Calls(),
              Sequence({BondRead(kBond), {"VORNNetBondIPConflict ovs_bond0"}, BondErased(kBond)}));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(BondRemovalOfFiles, UndoesWhatTheCreationDid)
{
    RecordingPlatform platform;
    platform.CarryOutFileEdits();
    const std::string first = "# mine\nDEVICE=ovs_eth0\nTYPE=OVS\nPRIMARY=eth0\nIPADDR=1.2.3.4\n";
    WriteFile(FileOf("ovs_eth0"), first);
    WriteFile(FileOf("ovs_eth1"), "DEVICE=ovs_eth1\nTYPE=OVS\n");
    WriteFile(FileOf("eth0"), "DEVICE=eth0\nBRIDGE=ovs_eth0\n");
    WriteFile(FileOf("eth1"), "DEVICE=eth1\nBRIDGE=ovs_eth1\n");
    unit::MakeLive(platform, {"ovs_eth0", "ovs_eth1"});
    std::vector<std::string> slaves{"eth0", "eth1"};
    EXPECT_TRUE(BondManager::Create(VORN_LINK_AGGR_OVS_BALANCE_TCP, "ovs_bond0", slaves, true));

    VORNLINKAGGROPT record{};
    EXPECT_TRUE(BondManager::Remove("ovs_bond0", &record, true));
    ExpectRecord(record, {"ovs_bond0", 8, {"eth0", "eth1"}});
    EXPECT_EQ(ReadFile(FileOf("ovs_eth0")), first);
    EXPECT_EQ(ReadFile(FileOf("ovs_eth1")), "DEVICE=ovs_eth1\nTYPE=OVS\n");
    EXPECT_EQ(ReadFile(FileOf("eth0")), "DEVICE=eth0\nBRIDGE=ovs_eth0\n");
    EXPECT_EQ(ReadFile(FileOf("eth1")), "DEVICE=eth1\nBRIDGE=ovs_eth1\n");
    EXPECT_EQ(ReadFile(FileOf("ovs_bond0")), std::nullopt);
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST_F(BondRemoval, TakesPositiveAnswersAsSuccess)
{
    platform.Answer("VORNNetLinkAggrOptSlsaveAdd", 1);
    platform.Answer("VLIBCExec /bin/cp", 1);
    platform.Answer("VLIBCFileSetKeys", 1);
    platform.Answer("VLIBCFileRemoveKey", 1);
    EXPECT_TRUE(Remove("ovs_bond0"));
    EXPECT_EQ(platform.Calls(), BondDissolved(kBond));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST_F(BondRemoval, MovesAConflictingInterfacesBridgeToDhcpBeforeAnythingElse)
{
    platform.Conflict("ovs_bond0", "eth1");
    EXPECT_TRUE(Remove("ovs_bond0"));
    Calls expected = BondDissolved(kBond);
    const auto asked =
        std::find(expected.begin(), expected.end(), "VORNNetBondIPConflict ovs_bond0");
    const std::string edit = "VLIBCFileSetKeyValue " + FileOf("ovs_eth1");
    const Calls edits{edit + " BOOTPROTO=dhcp", edit + " IPADDR=", edit + " NETMASK="};
    expected.insert(asked + 1, edits.begin(), edits.end());
    EXPECT_EQ(platform.Calls(), expected);
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST_F(BondRemoval, LeavesEmptyValuesInTheConflictingInterfacesFile)
{
    platform.CarryOutFileEdits();
    platform.Conflict("ovs_bond0", "eth5");
    WriteFile(FileOf("ovs_eth5"), "DEVICE=ovs_eth5\nIPADDR=1.2.3.4\nNETMASK=255.0.0.0\nX=1\n");
    EXPECT_TRUE(Remove("ovs_bond0"));
    EXPECT_EQ(ReadFile(FileOf("ovs_eth5")),
              "DEVICE=ovs_eth5\nIPADDR=\nNETMASK=\nX=1\nBOOTPROTO=dhcp\n");
}

TEST_F(BondRemoval, IgnoresEditsForAConflictThatFail)
{
    platform.Conflict("ovs_bond0", "eth1");
    platform.Answer("VLIBCFileSetKeyValue", -1);
    EXPECT_TRUE(Remove("ovs_bond0"));
    EXPECT_THAT(platform.Calls(),
                Contains("VLIBCFileSetKeyValue " + FileOf("ovs_eth1") + " NETMASK="));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST_F(BondRemoval, TakesNoAnswerBut1AsAConflict)
{
    platform.Conflict("ovs_bond0", "eth1");
    for (const int answer : {-1, 0, 2}) {
        platform.Forget();
        platform.Answer("VORNNetBondIPConflict", answer);
        EXPECT_TRUE(Remove("ovs_bond0")) << answer;
        EXPECT_EQ(platform.Calls(), BondDissolved(kBond)) << answer;
    }
}

TEST_F(BondRemoval, KeepsAConflictsNameUpToItsBuffer)
{
    const std::string name(31, 'c');
    for (const std::string& filled : {name, name + "d"}) {
        platform.Conflict("ovs_bond0", filled);
        EXPECT_TRUE(Remove("ovs_bond0"));
        EXPECT_THAT(platform.Calls(), Contains("VLIBCFileSetKeyValue " + FileOf("ovs_" + filled) +
                                               " BOOTPROTO=dhcp"));
    }
}

TEST_F(BondRemoval, GoesOnWhenTheNetworkScriptFails)
{
    for (const int answer : {-1, 1}) {
        platform.Forget();
        platform.Answer("VLIBCExecv /etc/rc.network", answer);
        EXPECT_TRUE(Remove("ovs_bond0"));
        EXPECT_EQ(platform.Calls(), BondDissolved(kBond));
        EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to stop the rc.network"),
                                                Err(kFile, "Failed to start the rc.network")));
    }
}

TEST_F(BondRemoval, PausesAWholeThreeSecondsWhateverSignalsCome)
{
    platform.AnswerNth("sleep 3", 1, 1);
    EXPECT_TRUE(Remove("ovs_bond0"));
    Calls expected = BondDissolved(kBond);
    expected.insert(std::find(expected.begin(), expected.end(), "sleep 3") + 1, "sleep 1");
    EXPECT_EQ(platform.Calls(), expected);
}

TEST_F(BondRemoval, GoesOnWhenTheBondsFileCannotBeCopied)
{
    platform.Answer("VLIBCExec /bin/cp", -1);
    EXPECT_TRUE(Remove("ovs_bond0"));
    EXPECT_EQ(platform.Calls(), DissolvedWithout({"VLIBCFileExist", "VLIBCFileSetKeys"}));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to copy the config " + FileOf("ovs_bond0") + " to " +
                                           FileOf("ovs_eth0")),
                            Err(kFile, "Faield to remove the ifcfg-ovs_bond0")));
}

TEST_F(BondRemoval, DeletesTheBondsFile)
{
    WriteFile(FileOf("ovs_bond0"), "DEVICE=ovs_bond0\n");
    EXPECT_TRUE(Remove("ovs_bond0"));
    EXPECT_EQ(ReadFile(FileOf("ovs_bond0")), std::nullopt);
}

TEST_F(BondRemoval, NamesTheBridgesFileWhenTheBondsCannotBeDeletedAndGoesOn)
{
    platform.Answer("VLIBCFileExist " + FileOf("ovs_bond0"), 1); // though there is none to delete
    EXPECT_TRUE(Remove("ovs_bond0"));
    EXPECT_EQ(platform.Calls(), DissolvedWithout({"VLIBCFileSetKeys"}));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to unlink " + FileOf("ovs_eth0") +
                                                           " for bridge interface"),
                                            Err(kFile, "Faield to remove the ifcfg-ovs_bond0")));
}

TEST_F(BondRemoval, DeletesNothingUnlessTheFileExistsFor1)
{
    for (const int answer : {-1, 0, 2}) {
        WriteFile(FileOf("ovs_bond0"), "DEVICE=ovs_bond0\n");
        platform.Answer("VLIBCFileExist", answer);
        EXPECT_TRUE(Remove("ovs_bond0"));
        EXPECT_EQ(ReadFile(FileOf("ovs_bond0")), "DEVICE=ovs_bond0\n") << answer;
    }
}

struct HashRow {
    int nth;
    std::string message;
};

class HashOfTheBridge : public BondRemoval, public testing::WithParamInterface<HashRow> {};

INSTANTIATE_TEST_SUITE_P(Missing, HashOfTheBridge,
                         testing::Values(HashRow{1, "Failed to alloc the hash pshOVSUpdate"},
                                         HashRow{2, "Failed to alloc the hash pshOVSDel"}),
                         [](const auto& test) { return "Nth" + std::to_string(test.param.nth); });

TEST_P(HashOfTheBridge, EndsTheRestoringAndTheSlavesFollow)
{
    platform.AnswerNth("VLIBCSzHashAlloc", GetParam().nth, 0);
    EXPECT_TRUE(Remove("ovs_bond0"));
    EXPECT_EQ(platform.Calls(), DissolvedWithout({"VLIBCFileSetKeys"}));
    EXPECT_EQ(
        std::count(platform.AllCalls().begin(), platform.AllCalls().end(), "VLIBCSzHashAlloc"),
        GetParam().nth);
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, GetParam().message),
                                            Err(kFile, "Faield to remove the ifcfg-ovs_bond0")));
}

TEST_F(BondRemoval, GoesOnWhenTheBridgesFileCannotBeEdited)
{
    platform.Answer("VLIBCFileSetKeys", -1);
    EXPECT_TRUE(Remove("ovs_bond0"));
    EXPECT_EQ(platform.Calls(), BondDissolved(kBond));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to set the key-value to " + FileOf("ovs_eth0")),
                            Err(kFile, "Faield to remove the ifcfg-ovs_bond0")));
}

TEST_F(BondRemoval, StopsUnmarkingASlaveAtTheFirstKeyThatStaysAndGoesOnWithTheNext)
{
    const std::vector<std::string> removals{FileOf("ovs_eth0") + " SLAVE",
                                            FileOf("eth0") + " MASTER", FileOf("eth0") + " SLAVE"};
    for (std::size_t failing = 0; failing < removals.size(); ++failing) {
        platform.Forget();
        platform.AnswerNth("VLIBCFileRemoveKey " + removals[failing], 1, -1);
        EXPECT_TRUE(Remove("ovs_bond0"));
        std::vector<std::string> left;
        for (std::size_t at = failing + 1; at < removals.size(); ++at) {
            left.push_back("VLIBCFileRemoveKey " + removals[at]);
        }
        EXPECT_EQ(platform.Calls(), DissolvedWithout(left)) << failing;
        EXPECT_THAT(platform.Log(),
                    ElementsAre(Err(kFile, "Remove the OVS slave key fails"),
                                Err(kFile, "Failed to remove the slave ifcfg of eth0")))
            << failing;
    }
}

TEST_F(BondRemoval, CutsTheBridgesThatItStartsTo19Characters)
{
    const SwitchBond fits{"ovs_bond0", 6, {std::string(15, 'a'), "eth1"}};
    RecordBond(platform, fits);
    EXPECT_TRUE(Remove("ovs_bond0"));
    EXPECT_EQ(platform.Calls(), BondDissolved(fits));

    platform.FillNamesWhole();
    const std::string whole(16, 'b');
    RecordBond(platform, {"ovs_bond0", 6, {whole, "eth1"}});
    EXPECT_TRUE(Remove("ovs_bond0"));
    EXPECT_EQ(platform.Calls().back(),
              "VLIBCExecv /etc/rc.network start ovs_" + whole.substr(1) + " ovs_eth1");
    EXPECT_THAT(platform.Calls(),
                Contains("VLIBCFileRemoveKey " + FileOf("ovs_" + whole) + " SLAVE"));
}

TEST_F(BondRemoval, CutsTheBondsNameInTheRecordAndItsPathToTheirBuffers)
{
    RecordingPlatform& fresh = platform;
    const std::string path = FileOf(LongName()).substr(0, 4095);
    fresh.Value(path, "SLAVE_LIST", "eth0 eth1 ");
    fresh.Value(path, "BOND_MODE", "ovs-balance-slb");
    VORNLINKAGGROPT record{};
    EXPECT_TRUE(BondManager::Remove(LongName(), &record, true));
    ExpectRecord(record, {LongName().substr(0, 15), 7, {"eth0", "eth1"}});
    EXPECT_THAT(fresh.Calls(), Contains("VLIBCExec /bin/cp -f " + path + " " + FileOf("ovs_eth0")));
    EXPECT_THAT(fresh.Calls(), Contains("VLIBCExecv /etc/rc.network stop eth0 eth1 " + LongName()));
}

} // namespace
