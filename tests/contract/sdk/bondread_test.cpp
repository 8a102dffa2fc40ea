#include "trip.h"

#include "support/bondoptions.h"
#include "tools.h"

#include <cstring>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sandbox/systemlog.h>
#include <sys/mount.h>
#include <vornplatform/netsdk.h>

namespace {

using testing::ElementsAre;

class LinkAggrGet : public testing::Test {
protected:
    LinkAggrGet()
    {
        EXPECT_EQ(mount("devices", vornhost::kInterfaceFolder, "tmpfs", 0, nullptr), 0);
        contract::StartWith({});
    }
    ~LinkAggrGet() override { EXPECT_EQ(umount(vornhost::kInterfaceFolder), 0); }

    /** Refused, and nothing is written. */
    static void ExpectNone(const char* name)
    {
        VORNLINKAGGROPT opt;
        std::memset(&opt, 'x', sizeof opt);
        const VORNLINKAGGROPT before = opt;
        EXPECT_EQ(VORNNetLinkAggrGet(name, &opt), -1);
        EXPECT_EQ(std::memcmp(&opt, &before, sizeof opt), 0);
    }
};

TEST_F(LinkAggrGet, ReadsEachModeOfTheKernelThatHasANumber)
{
    const std::pair<const char*, int> rows[] = {{"balance-rr 0", 1},
                                                {"802.3ad 4", 2},
                                                {"balance-xor 2", 3},
                                                {"active-backup 1", 4},
                                                {"balance-alb 6", 5}};
    for (const auto& [shown, mode] : rows) {
        contract::ShowBond("bond0", {{"mode", shown}, {"slaves", "eth1 eth0"}});
        VORNLINKAGGROPT opt;
        std::memset(&opt, 'x', sizeof opt);

        EXPECT_EQ(VORNNetLinkAggrGet("bond0", &opt), 0) << shown;

        const VORNLINKAGGROPT wanted = contract::BondRecord("bond0", mode, {"eth1", "eth0"});
        EXPECT_EQ(std::memcmp(&opt, &wanted, sizeof opt), 0) << shown;
    }
}

TEST_F(LinkAggrGet, SaysThatAModeHasNothingLikeItOnTheSwitch)
{
    for (const std::string mode : {"broadcast", "balance-tlb"}) {
        contract::ShowBond("bond0", {{"mode", mode + " 3"}, {"slaves", "eth0 eth1"}});
        harness::SystemLog log;

        ExpectNone("bond0");

        EXPECT_THAT(log.Lines(),
                    ElementsAre("4 vornnetsdk: bond bond0 is not taken apart: there is nothing "
                                "like " +
                                    mode + " on the switch",
                                "6 vornnetsdk: there is no bond bond0 to be read"));
    }
}

TEST_F(LinkAggrGet, RefusesABondWithMoreSlavesThanARecordHolds)
{
    std::string slaves;
    for (int number = 0; number < 32; ++number) {
        slaves += "eth" + std::to_string(number) + ' ';
    }
    contract::ShowBond("bond0", {{"mode", "802.3ad 4"}, {"slaves", slaves}});
    VORNLINKAGGROPT opt{};
    EXPECT_EQ(VORNNetLinkAggrGet("bond0", &opt), 0);
    EXPECT_EQ(opt.nSlave, 32);

    contract::ShowBond("bond0", {{"slaves", slaves + "eth32"}});
    ExpectNone("bond0");
}

TEST_F(LinkAggrGet, RefusesWhatIsNoBond)
{
    contract::ShowBond("bond0", {{"mode", "802.3ad 4"}, {"slaves", "eth0"}});

    ExpectNone("eth0");
    ExpectNone("");
    ExpectNone("../net/bond0");
    ExpectNone("a-name-that-is-too-long");
    ExpectNone(nullptr);
    EXPECT_EQ(VORNNetLinkAggrGet("bond0", nullptr), -1);
}

} // namespace
