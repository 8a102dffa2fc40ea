#include <cstring>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <set>
#include <vornplatform/netsdk.h>

namespace {

struct ModeRow {
    int mode;
    const char* name;
};

constexpr ModeRow kModes[] = {
    {1, "balance-rr"},  {2, "802.3ad"},           {3, "balance-xor"},     {4, "active-backup"},
    {5, "balance-alb"}, {6, "ovs-active-backup"}, {7, "ovs-balance-slb"}, {8, "ovs-balance-tcp"}};

TEST(LinkAggrModes, HaveNamesOfTheirOwnThatParseBack)
{
    std::set<std::string> names;
    for (const ModeRow& row : kModes) {
        const auto mode = static_cast<VORN_LINK_AGGR_MODE>(row.mode);
        EXPECT_STREQ(VORNNetLinkAggrModeToString(mode), row.name);
        EXPECT_EQ(VORNNetLinkAggrStringToMode(row.name), mode);
        names.insert(row.name);
    }
    EXPECT_EQ(names.size(), 8u);
}

TEST(LinkAggrModes, AnswerNoModeForAnUnknownName)
{
    for (const char* const name : {"", "balance-slb", "Active-Backup", "active-backup ", "4"}) {
        EXPECT_EQ(VORNNetLinkAggrStringToMode(name), VORN_LINK_AGGR_NONE) << name;
    }
    EXPECT_EQ(VORNNetLinkAggrStringToMode(nullptr), VORN_LINK_AGGR_NONE);
}

TEST(LinkAggrModes, HaveATextForAnUnknownModeThatIsNoModesName)
{
    for (const int number : {0, -1, 9, 1000}) {
        const char* const text =
            VORNNetLinkAggrModeToString(static_cast<VORN_LINK_AGGR_MODE>(number));
        ASSERT_NE(text, nullptr) << number;
        EXPECT_EQ(VORNNetLinkAggrStringToMode(text), VORN_LINK_AGGR_NONE) << number;
    }
}

TEST(LinkAggrOptSlsaveAdd, AppendsUpTo32Slaves)
{
    VORNLINKAGGROPT opt{};
    VORNLINKAGGROPT wanted{};
    for (int index = 0; index < 32; ++index) {
        const std::string name = "eth" + std::to_string(index);
        EXPECT_EQ(VORNNetLinkAggrOptSlsaveAdd(&opt, name.c_str()), 0);
        name.copy(wanted.rgszSlave[index], name.size());
    }
    wanted.nSlave = 32;
    EXPECT_EQ(std::memcmp(&opt, &wanted, sizeof(opt)), 0);

    EXPECT_LT(VORNNetLinkAggrOptSlsaveAdd(&opt, "eth32"), 0);
    EXPECT_EQ(std::memcmp(&opt, &wanted, sizeof(opt)), 0);
}

TEST(LinkAggrOptSlsaveAdd, OverwritesWhatAnUnusedSlotHolds)
{
    VORNLINKAGGROPT opt;
    std::memset(&opt, 'x', sizeof(opt));
    opt.nSlave = 0;

    EXPECT_EQ(VORNNetLinkAggrOptSlsaveAdd(&opt, "eth0"), 0);

    EXPECT_STREQ(opt.rgszSlave[0], "eth0");
    EXPECT_EQ(opt.nSlave, 1);
}

TEST(LinkAggrOptSlsaveAdd, TakesNamesOfUpTo15Bytes)
{
    VORNLINKAGGROPT opt{};
    EXPECT_EQ(VORNNetLinkAggrOptSlsaveAdd(&opt, "fifteen-letters"), 0);
    EXPECT_STREQ(opt.rgszSlave[0], "fifteen-letters");

    const VORNLINKAGGROPT before = opt;
    EXPECT_LT(VORNNetLinkAggrOptSlsaveAdd(&opt, "sixteen-letters!"), 0);
    EXPECT_LT(VORNNetLinkAggrOptSlsaveAdd(&opt, std::string(5000, 'a').c_str()), 0);
    EXPECT_LT(VORNNetLinkAggrOptSlsaveAdd(&opt, ""), 0);
    EXPECT_EQ(std::memcmp(&opt, &before, sizeof(opt)), 0);
}

TEST(LinkAggrOptSlsaveAdd, RefusesARecordWithAnImpossibleCount)
{
    VORNLINKAGGROPT opt{};
    opt.nSlave = -1;
    EXPECT_LT(VORNNetLinkAggrOptSlsaveAdd(&opt, "eth0"), 0);
    opt.nSlave = 33;
    EXPECT_LT(VORNNetLinkAggrOptSlsaveAdd(&opt, "eth0"), 0);
    EXPECT_LT(VORNNetLinkAggrOptSlsaveAdd(nullptr, "eth0"), 0);
    EXPECT_LT(VORNNetLinkAggrOptSlsaveAdd(&opt, nullptr), 0);
}

} // namespace
