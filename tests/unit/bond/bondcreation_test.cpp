#include <vornovs/vornovs.h>

#include "support/bondcalls.h"

#include <algorithm>

using harness::Err;
using harness::RecordingPlatform;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Not;
using testing::StartsWith;
using unit::BondAccepted;
using unit::BondBuilt;
using unit::BondWritten;
using unit::Calls;
using unit::FileOf;
using unit::LongName;
using unit::MakeLive;
using unit::ReadFile;
using unit::Sequence;
using unit::SwitchBond;
using unit::WriteFile;
using VORN::OVS::BondManager;

namespace {

constexpr char kFile[] = "bondmanager.cpp";
const harness::LogLine kWrongFormat =
    Err(kFile, "The parameter has wrong format when create the OVS bonding");

const SwitchBond kBond{"ovs_bond0", 6, {"eth0", "eth1"}};

bool Create(const SwitchBond& bond, bool restart = true)
{
    std::vector<std::string> slaves = bond.slaves;
    const bool result = BondManager::Create(static_cast<VORN_LINK_AGGR_MODE>(bond.mode), bond.name,
                                            slaves, restart);
    EXPECT_EQ(slaves, bond.slaves);
    return result;
}

/** Has the kernel know the bridge of every slave. */
void MakeBridgesLive(RecordingPlatform& platform, const SwitchBond& bond)
{
    for (const std::string& slave : bond.slaves) {
        MakeLive(platform, {"ovs_" + slave});
    }
}

class BondCreation : public testing::Test {
protected:
    BondCreation() { MakeBridgesLive(platform, kBond); }
    RecordingPlatform platform;
};

TEST_F(BondCreation, StopsTheSlavesWritesTheFilesAndStartsTheBond)
{
    EXPECT_TRUE(Create(kBond));
    EXPECT_EQ(platform.Calls(), BondBuilt(kBond));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST_F(BondCreation, WritesTheOptionsOfEachMode)
{
    for (const int mode : {6, 7, 8}) {
        platform.Forget();
        EXPECT_TRUE(Create({"ovs_bond0", mode, {"eth0", "eth1"}}));
        EXPECT_EQ(platform.Calls(), BondBuilt({"ovs_bond0", mode, {"eth0", "eth1"}}));
    }
}

TEST_F(BondCreation, TakesTheFirstSlaveAsTheCallerOrdersThem)
{
    const SwitchBond reversed{"ovs_bond0", 7, {"eth1", "eth0"}};
    EXPECT_TRUE(Create(reversed));
    EXPECT_EQ(platform.Calls(), BondBuilt(reversed));
    EXPECT_THAT(platform.Calls(),
                Contains("VLIBCExec /bin/cp -f " + FileOf("ovs_eth1") + " " + FileOf("ovs_bond0")));
}

TEST_F(BondCreation, RunsNoNetworkCommandAndDoesNotPauseWithoutTheFlag)
{
    EXPECT_TRUE(Create(kBond, false));
    EXPECT_EQ(platform.Calls(), Sequence({BondAccepted(kBond), BondWritten(kBond)}));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST_F(BondCreation, LeavesFilesThatTheNetworkScriptUnderstands)
{
    platform.CarryOutFileEdits();
    WriteFile(FileOf("ovs_eth0"),
              "# mine\nDEVICE=ovs_eth0\nTYPE=OVS\nPRIMARY=eth0\nIPADDR=1.2.3.4\n");
    WriteFile(FileOf("ovs_eth1"), "DEVICE=ovs_eth1\nTYPE=OVS\nPRIMARY=eth1\n");
    WriteFile(FileOf("eth0"), "DEVICE=eth0\nBRIDGE=ovs_eth0\n");
    WriteFile(FileOf("eth1"), "DEVICE=eth1\nBRIDGE=ovs_eth1\n");
    EXPECT_TRUE(Create(kBond));
    EXPECT_EQ(ReadFile(FileOf("ovs_bond0")),
              "# mine\nDEVICE=ovs_bond0\nTYPE=OVS\nPRIMARY=eth0\nIPADDR=1.2.3.4\n"
              "SLAVE_LIST=\"eth0 eth1 \"\nBOND_MODE=ovs-active-backup\n"
              "BONDING_OPTS=\"bond_mode=active-backup lacp=off\"\n");
    EXPECT_EQ(ReadFile(FileOf("ovs_eth0")),
              "# mine\nDEVICE=ovs_eth0\nTYPE=OVS\nPRIMARY=eth0\nIPADDR=1.2.3.4\nSLAVE=yes\n");
    EXPECT_EQ(ReadFile(FileOf("ovs_eth1")), "DEVICE=ovs_eth1\nTYPE=OVS\nPRIMARY=eth1\nSLAVE=yes\n");
    EXPECT_EQ(ReadFile(FileOf("eth0")),
              "DEVICE=eth0\nBRIDGE=ovs_eth0\nSLAVE=yes\nMASTER=ovs_bond0\n");
    EXPECT_EQ(ReadFile(FileOf("eth1")),
              "DEVICE=eth1\nBRIDGE=ovs_eth1\nSLAVE=yes\nMASTER=ovs_bond0\n");
}

TEST_F(BondCreation, FillsTheHashesInTheirOrderAndFreesThem)
{
    EXPECT_TRUE(Create({"ovs_bond0", 6, {"eth0", "eth1"}}, false));
    const auto& calls = platform.AllCalls();
    const auto copied = std::find_if(calls.begin(), calls.end(), [](const std::string& call) {
        return call.starts_with("VLIBCExec /bin/cp");
    });
    const Calls edits(copied + 1, copied + 16);
    EXPECT_THAT(edits,
                ElementsAre("VLIBCSzHashAlloc", "VLIBCSzHashSetValue DEVICE ovs_bond0",
                            "VLIBCSzHashSetValue SLAVE_LIST '\"eth0 eth1 \"'",
                            "VORNNetLinkAggrModeToString 6",
                            "VLIBCSzHashSetValue BOND_MODE ovs-active-backup",
                            StartsWith("VLIBCSzHashSetValue BONDING_OPTS"),
                            StartsWith("VLIBCFileSetKeys"), "VLIBCSzHashFree", "VLIBCSzHashAlloc",
                            "VLIBCSzHashAlloc", "VLIBCSzHashSetValue SLAVE yes",
                            "VLIBCSzHashSetValue SLAVE yes", "VLIBCSzHashSetValue MASTER ovs_bond0",
                            StartsWith("VLIBCFileSetKeys"), StartsWith("VLIBCFileSetKeys")));
}

TEST_F(BondCreation, RefusesEveryModeThatTheSwitchHasNot)
{
    for (const int mode : {-1, 0, 1, 2, 3, 4, 5, 9}) {
        platform.Forget();
        EXPECT_FALSE(Create({"ovs_bond0", mode, {"eth0", "eth1"}}));
        EXPECT_THAT(platform.Calls(), IsEmpty()) << mode;
        EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "OVS don't support this bonding mode " +
                                                               std::to_string(mode)),
                                                kWrongFormat))
            << mode;
    }
}

TEST_F(BondCreation, RefusesANameThatAnInterfaceHas)
{
    MakeLive(platform, {"ovs_bond0"});
    EXPECT_FALSE(Create(kBond));
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBCFileExist /sys/class/net/ovs_bond0/flags"));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "The master interface ovs_bond0 exist"), kWrongFormat));
}

TEST_F(BondCreation, RefusesFewerThanTwoSlaves)
{
    for (const std::vector<std::string>& slaves :
         {std::vector<std::string>{}, std::vector<std::string>{"eth0"}}) {
        platform.Forget();
        EXPECT_FALSE(Create({"ovs_bond0", 6, slaves}));
        EXPECT_THAT(platform.Calls(), ElementsAre("VLIBCFileExist /sys/class/net/ovs_bond0/flags"));
        EXPECT_THAT(platform.Log(),
                    ElementsAre(Err(kFile, "The number of bonding slave must bigger than 2"),
                                kWrongFormat));
    }
}

TEST_F(BondCreation, RefusesASlaveWithoutABridgeAfterTheGatewayWasCopied)
{
    platform.Answer("VLIBCFileExist /sys/class/net/ovs_eth1/flags", 0);
    EXPECT_FALSE(Create({"ovs_bond0", 6, {"eth0", "eth1", "eth2"}}));
    EXPECT_EQ(platform.Calls(), BondAccepted(kBond));
    EXPECT_THAT(
        platform.Log(),
        ElementsAre(Err(kFile, "The slave interface eth1 doesn't have the OVS version ovs_eth1"),
                    kWrongFormat));
}

TEST_F(BondCreation, DoesNotMindAGatewayThatCannotBeCopied)
{
    platform.Answer("VLIBCExecl /usr/vorn/sbin/vornnetdtool", 1);
    EXPECT_TRUE(Create(kBond));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err("util.cpp", "Failed to copy the gateway info from eth0 to "
                                            "ovs_bond0")));
    EXPECT_EQ(platform.Calls().back(), BondBuilt(kBond).back());
}

TEST_F(BondCreation, GoesOnWhenTheNetworkScriptFails)
{
    for (const int answer : {-1, 1}) {
        platform.Forget();
        platform.Answer("VLIBCExecv /etc/rc.network", answer);
        EXPECT_TRUE(Create(kBond));
        EXPECT_EQ(platform.Calls(), BondBuilt(kBond));
        EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to stop the rc.network"),
                                                Err(kFile, "Failed to start the rc.network")));
    }
}

TEST_F(BondCreation, GoesOnWithTheSlavesWhenTheBridgesFileCannotBeCopied)
{
    platform.Answer("VLIBCExec /bin/cp", -1);
    EXPECT_TRUE(Create(kBond));
    Calls expected = BondBuilt(kBond);
    EXPECT_EQ(std::erase_if(expected,
                            [](const std::string& call) {
                                return call.starts_with("VORNNetLinkAggrModeToString") ||
                                       call.find("SLAVE_LIST") != std::string::npos;
                            }),
              2U);
    EXPECT_EQ(platform.Calls(), expected);
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to copy the config " + FileOf("ovs_eth0") + " to " +
                                           FileOf("ovs_bond0")),
                            Err(kFile, "Failed to Create the ifcfg config for ovs_bond0")));
}

TEST_F(BondCreation, TakesAPositiveAnswerOfTheCopyAndTheEditsAsSuccess)
{
    platform.Answer("VLIBCExec /bin/cp", 1);
    platform.Answer("VLIBCFileSetKeys", 1);
    EXPECT_TRUE(Create(kBond));
    EXPECT_EQ(platform.Calls(), BondBuilt(kBond));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST_F(BondCreation, GoesOnWithoutAHashForTheBond)
{
    platform.AnswerNth("VLIBCSzHashAlloc", 1, 0);
    EXPECT_TRUE(Create(kBond));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to alloc the hash buffer"),
                            Err(kFile, "Failed to Create the ifcfg config for ovs_bond0")));
    EXPECT_EQ(platform.Calls().back(), BondBuilt(kBond).back());
}

TEST_F(BondCreation, GoesOnWhenTheBondsFileCannotBeEdited)
{
    platform.AnswerNth("VLIBCFileSetKeys", 1, -1);
    EXPECT_TRUE(Create(kBond));
    EXPECT_EQ(platform.Calls(), BondBuilt(kBond));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to set the key-value to " + FileOf("ovs_bond0")),
                            Err(kFile, "Failed to Create the ifcfg config for ovs_bond0")));
}

/** The edits of the two slaves' files, without those at the given places. */
Calls SlaveEditsWithout(const std::vector<std::size_t>& left)
{
    const Calls written = BondWritten(kBond);
    Calls edits;
    for (std::size_t at = 3; at < written.size(); ++at) {
        if (std::find(left.begin(), left.end(), at - 3) == left.end()) {
            edits.push_back(written[at]);
        }
    }
    return edits;
}

/** What was edited after the bond's own file. */
Calls SlaveEdits(const RecordingPlatform& platform)
{
    Calls edits;
    for (const std::string& call : platform.Calls()) {
        if (call.starts_with("VLIBCFileSetKeys") && call.find("SLAVE_LIST") == std::string::npos) {
            edits.push_back(call);
        }
    }
    return edits;
}

class HashOfASlave : public BondCreation, public testing::WithParamInterface<int> {};

INSTANTIATE_TEST_SUITE_P(Missing, HashOfASlave, testing::Values(2, 3),
                         [](const auto& test) { return "Nth" + std::to_string(test.param); });

TEST_P(HashOfASlave, IsAskedForBeforeEitherIsTestedAndTheNextSlaveFollows)
{
    platform.AnswerNth("VLIBCSzHashAlloc", GetParam(), 0);
    EXPECT_TRUE(Create(kBond));
    EXPECT_EQ(SlaveEdits(platform), SlaveEditsWithout({0, 1}));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to alloc the hash buffer")));
    EXPECT_EQ(
        std::count(platform.AllCalls().begin(), platform.AllCalls().end(), "VLIBCSzHashAlloc"), 5);
}

TEST_F(BondCreation, DoesNotTouchASlavesFileWhenItsBridgesCannotBeMarked)
{
    platform.Answer("VLIBCFileSetKeys " + FileOf("ovs_eth0"), -1);
    EXPECT_TRUE(Create(kBond));
    EXPECT_EQ(SlaveEdits(platform), SlaveEditsWithout({1}));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to set the key-value to " + FileOf("ovs_eth0"))));
}

TEST_F(BondCreation, GoesOnWhenASlavesFileCannotBeMarked)
{
    platform.Answer("VLIBCFileSetKeys " + FileOf("eth0"), -1);
    EXPECT_TRUE(Create(kBond));
    EXPECT_EQ(SlaveEdits(platform), SlaveEditsWithout({}));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to set the key-value to " + FileOf("eth0"))));
}

TEST_F(BondCreation, PausesAWholeThreeSecondsWhateverSignalsCome)
{
    platform.AnswerNth("sleep 3", 1, 2);
    EXPECT_TRUE(Create(kBond));
    Calls expected = BondBuilt(kBond);
    expected.insert(std::find(expected.begin(), expected.end(), "sleep 3") + 1, "sleep 2");
    EXPECT_EQ(platform.Calls(), expected);
}

/** A bond of so many slaves, all of which have bridges. */
SwitchBond WithSlaves(RecordingPlatform& platform, int count)
{
    SwitchBond bond{"ovs_bond0", 6, {}};
    for (int i = 0; i < count; ++i) {
        bond.slaves.push_back("eth" + std::to_string(i));
    }
    MakeBridgesLive(platform, bond);
    return bond;
}

TEST_F(BondCreation, StopsUpTo62SlavesWithTheirBridges)
{
    const SwitchBond bond = WithSlaves(platform, 62);
    EXPECT_TRUE(Create(bond));
    EXPECT_EQ(platform.Calls(), BondBuilt(bond));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST_F(BondCreation, CannotStop63SlavesAndGoesOn)
{
    const SwitchBond bond = WithSlaves(platform, 63);
    EXPECT_TRUE(Create(bond));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err("util.cpp", "Fatal Error: The size of interface 126 bigger than "
                                            "the limtation"),
                            Err(kFile, "Failed to stop the rc.network")));
    EXPECT_THAT(platform.Calls(), Not(Contains(StartsWith("VLIBCExecv /etc/rc.network stop"))));
    EXPECT_EQ(platform.Calls().back(), "VLIBCExecv /etc/rc.network start ovs_bond0");
}

TEST_F(BondCreation, CutsPathsAndBridgeNamesToTheirBuffers)
{
    platform.Answer("VLIBCFileExist", 1);
    const std::string master(5000, 'm');
    platform.Answer("VLIBCFileExist " + ("/sys/class/net/" + master).substr(0, 1023), 0);
    EXPECT_TRUE(Create({master, 6, {LongName(), "eth1"}}, false));
    const auto path = [](const std::string& name) { return FileOf(name).substr(0, 4095); };
    const std::string bridge = ("ovs_" + LongName()).substr(0, 1023);
    EXPECT_THAT(platform.Calls(),
                Contains("VLIBCExec /bin/cp -f " + path("ovs_" + LongName()) + " " + path(master)));
    EXPECT_EQ(SlaveEdits(platform),
              (Calls{"VLIBCFileSetKeys " + path(bridge) + " SLAVE=yes",
                     "VLIBCFileSetKeys " + path(LongName()) + " SLAVE=yes MASTER=" + master,
                     "VLIBCFileSetKeys " + FileOf("ovs_eth1") + " SLAVE=yes",
                     "VLIBCFileSetKeys " + FileOf("eth1") + " SLAVE=yes MASTER=" + master}));
}

TEST_F(BondCreation, NamesALongSlaveWholeAndItsBridgeCut)
{
    EXPECT_FALSE(Create({"ovs_bond0", 6, {LongName(), "eth1"}}));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "The slave interface " + LongName() +
                                                           " doesn't have the OVS version " +
                                                           ("ovs_" + LongName()).substr(0, 1023)),
                                            kWrongFormat));
}

} // namespace
