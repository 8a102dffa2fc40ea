#include "bond/bondremoval.h"

using harness::BondRecord;
using harness::Err;
using harness::RecordingPlatform;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Not;
using testing::StartsWith;
using unit::BondDissolved;
using unit::BondRead;
using unit::BondRemoval;
using unit::Calls;
using unit::ExpectRecord;
using unit::FileOf;
using unit::kBond;
using unit::RecordBond;
using unit::Remove;
using unit::SwitchBond;
using VORN::OVS::BondManager;

namespace {

constexpr char kFile[] = "bondmanager.cpp";
const harness::LogLine kNotRead = Err(kFile, "Faild to get");
const harness::LogLine kWrongFormat =
    Err(kFile, "The parameter has wrong foramt when the OVSD bonding remove");

TEST_F(BondRemoval, FillsTheRecordFromTheFileAndZeroesTheRest)
{
    VORNLINKAGGROPT record{};
    std::memset(&record, 0xA5, sizeof(record));
    EXPECT_TRUE(BondManager::Remove("ovs_bond0", &record, true));
    ExpectRecord(record, kBond);
}

TEST_F(BondRemoval, FailsWithoutARecord)
{
    EXPECT_FALSE(BondManager::Remove("ovs_bond0", nullptr, true));
    EXPECT_THAT(platform.AllCalls(), IsEmpty());
    EXPECT_THAT(platform.Log(), ElementsAre(kNotRead, kWrongFormat));
}

TEST_F(BondRemoval, FailsWithoutAListAndLeavesAZeroedRecord)
{
    platform.Answer("VLIBCSzListAlloc", 0);
    VORNLINKAGGROPT record = BondRecord("before", 3, {"eth7"});
    EXPECT_FALSE(BondManager::Remove("ovs_bond0", &record, true));
    ExpectRecord(record, {"", 0, {}});
    EXPECT_THAT(platform.AllCalls(), ElementsAre("VLIBCSzListAlloc"));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to alloc memory."), kNotRead, kWrongFormat));
}

TEST(BondRemovalOfFiles, FailsForAFileWithoutASlaveListAndNamesAnotherKey)
{
    const RecordingPlatform platform;
    VORNLINKAGGROPT record{};
    EXPECT_FALSE(BondManager::Remove("ovs_bond0", &record, true));
    ExpectRecord(record, {"ovs_bond0", 0, {}});
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCFileGetKeyValue " + FileOf("ovs_bond0") + " SLAVE_LIST"));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to get key [BLOCK_CNT]"), kNotRead, kWrongFormat));
}

TEST_F(BondRemoval, FailsAtASlaveThatTheRecordDoesNotTake)
{
    platform.Answer("VORNNetLinkAggrOptSlsaveAdd eth1", -1);
    VORNLINKAGGROPT record{};
    EXPECT_FALSE(BondManager::Remove("ovs_bond0", &record, true));
    ExpectRecord(record, {"ovs_bond0", 0, {"eth0"}});
    const Calls read = BondRead(kBond);
    EXPECT_EQ(platform.Calls(), Calls(read.begin(), read.begin() + 3));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to add the slave eth1 into VORNLINKAGGROPT"),
                            kNotRead, kWrongFormat));
}

TEST_F(BondRemoval, FailsForAFileWithoutAMode)
{
    platform.Answer("VLIBCFileGetKeyValue " + FileOf("ovs_bond0") + " BOND_MODE", -1);
    VORNLINKAGGROPT record{};
    EXPECT_FALSE(BondManager::Remove("ovs_bond0", &record, true));
    ExpectRecord(record, {"ovs_bond0", 0, {"eth0", "eth1"}});
    const Calls read = BondRead(kBond);
    EXPECT_EQ(platform.Calls(), Calls(read.begin(), read.end() - 1));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to get key [BOND_MODE]"), kNotRead, kWrongFormat));
}

TEST_F(BondRemoval, RefusesAListOfOneSlave)
{
    const SwitchBond one{"ovs_bond0", 6, {"eth0"}};
    RecordBond(platform, one);
    VORNLINKAGGROPT record{};
    EXPECT_FALSE(BondManager::Remove("ovs_bond0", &record, true));
    ExpectRecord(record, one);
    EXPECT_EQ(platform.Calls(), BondRead(one));
    EXPECT_THAT(
        platform.Log(),
        ElementsAre(Err(kFile, "Failt to remove the bonding, since the number of slave is 1 for "
                               "master ovs_bond0"),
                    kWrongFormat));
}

TEST_F(BondRemoval, TakesAnEmptyListAsOneSlaveWithoutAName)
{
    platform.Value(FileOf("ovs_bond0"), "SLAVE_LIST", "");
    EXPECT_FALSE(Remove("ovs_bond0"));
    EXPECT_THAT(platform.Calls(), Contains("VORNNetLinkAggrOptSlsaveAdd ''"));
    EXPECT_EQ(platform.Log().front(),
              Err(kFile, "Failt to remove the bonding, since the number of slave is 1 for "
                         "master ovs_bond0"));
}

struct ListRow {
    std::string name;
    std::string value;
    std::vector<std::string> slaves;

    friend void PrintTo(const ListRow& row, std::ostream* out) { *out << row.name; }
};

class SlaveList : public BondRemoval, public testing::WithParamInterface<ListRow> {};

INSTANTIATE_TEST_SUITE_P(
    Rows, SlaveList,
    testing::Values(ListRow{"AsTheCreationWritesIt", "eth0 eth1 ", {"eth0", "eth1"}},
                    ListRow{"WithoutTheTrailingBlank", "eth0 eth1", {"eth0", "eth1"}},
                    ListRow{"WithWhiteSpaceAround", " \t eth0 eth1 \t ", {"eth0", "eth1"}},
                    ListRow{"WithTwoBlanksBetween", "eth0  eth1", {"eth0", "", "eth1"}},
                    ListRow{"WithATabBetween", "eth0\teth1 eth2", {"eth0\teth1", "eth2"}}),
    [](const auto& test) { return test.param.name; });

TEST_P(SlaveList, IsTrimmedAndSplitAtSingleBlanks)
{
    platform.Value(FileOf("ovs_bond0"), "SLAVE_LIST", GetParam().value);
    VORNLINKAGGROPT record{};
    EXPECT_TRUE(BondManager::Remove("ovs_bond0", &record, false));
    ExpectRecord(record, {"ovs_bond0", 6, GetParam().slaves});
}

TEST_F(BondRemoval, TakesTheModeAsItStandsAndUnchecked)
{
    platform.Value(FileOf("ovs_bond0"), "BOND_MODE", " ovs-balance-tcp");
    VORNLINKAGGROPT record{};
    EXPECT_TRUE(BondManager::Remove("ovs_bond0", &record, false));
    EXPECT_EQ(record.mode, VORN_LINK_AGGR_NONE);
    EXPECT_THAT(platform.Calls(), Contains("VORNNetLinkAggrStringToMode ' ovs-balance-tcp'"));
}

TEST_F(BondRemoval, TakesAllOf32SlavesAndNoMore)
{
    SwitchBond bond{"ovs_bond0", 6, {}};
    for (int i = 0; i < 33; ++i) {
        bond.slaves.push_back("eth" + std::to_string(i));
    }
    RecordBond(platform, bond);
    bond.slaves.pop_back();
    VORNLINKAGGROPT record{};
    EXPECT_TRUE(BondManager::Remove("ovs_bond0", &record, true));
    ExpectRecord(record, bond);
    EXPECT_THAT(platform.Calls(),
                Not(Contains(StartsWith("VLIBCFileRemoveKey " + FileOf("eth32")))));
    EXPECT_EQ(platform.Calls().back(), BondDissolved(bond).back());
}

TEST_F(BondRemoval, SplitsTheTrimmedTextAndFreesTheList)
{
    EXPECT_TRUE(Remove("ovs_bond0", false));
    const Calls begin(platform.AllCalls().begin(), platform.AllCalls().begin() + 9);
    EXPECT_THAT(begin,
                ElementsAre("VLIBCSzListAlloc", StartsWith("VLIBCFileGetKeyValue"),
                            "VLIBCStrTrimSpace 'eth0 eth1 '", "VLIBCStrSep 'eth0 eth1'",
                            "VORNNetLinkAggrOptSlsaveAdd eth0", "VORNNetLinkAggrOptSlsaveAdd eth1",
                            StartsWith("VLIBCFileGetKeyValue"),
                            StartsWith("VORNNetLinkAggrStringToMode"), "VLIBCSzListFree"));
}

} // namespace
