/**
 * How a plan goes on when the kernel refuses a part of it.
 */
#include "host.h"
#include "rcnetwork/apply.h"

#include <gmock/gmock.h>

namespace contract {
namespace {

using testing::ElementsAre;
using testing::Field;
using testing::StartsWith;
using vornhost::Remark;
using vornhost::Stage;
using vornhost::StageKind;

class ApplyTest : public Host {
protected:
    bool Apply(const std::vector<std::string>& lines)
    {
        return vornhost::ApplyStage(Stage{StageKind::kBatch, "devices", lines}, m_remarks);
    }

    static auto Says(const std::string& line)
    {
        return Field(&Remark::text, StartsWith("devices: ip failed at \"" + line + "\": "));
    }

    std::vector<Remark> m_remarks;
};

TEST_F(ApplyTest, PassesOverEachPropertyThatTheKernelRefuses)
{
    EXPECT_TRUE(Apply({"link set dev eth0 up", "link set dev eth0 mtu 4000000",
                       "addr add 192.0.2.5/24 dev eth0", "link set dev eth1 type bond miimon 100",
                       "addr add 192.0.2.6/24 dev eth1", "link set dev eth1 mtu 4000000"}));

    EXPECT_EQ(Network(), "eth0 192.0.2.5/24\neth1 192.0.2.6/24\n");
    EXPECT_THAT(m_remarks, ElementsAre(Says("link set dev eth0 mtu 4000000"),
                                       Says("link set dev eth1 type bond miimon 100"),
                                       Says("link set dev eth1 mtu 4000000")));
}

TEST_F(ApplyTest, TakesNothingAwayAfterAnythingElseThatFailed)
{
    EXPECT_TRUE(Apply({"addr add 192.0.2.5/24 dev eth0"}));
    EXPECT_FALSE(Apply({"addr add 192.0.2.5/24 dev nothing", "addr del 192.0.2.5/24 dev eth0",
                        "addr add 192.0.2.6/24 dev eth1", "link set dev eth1 type bond mode 1"}));

    EXPECT_EQ(Network(), "eth0 192.0.2.5/24\neth1 192.0.2.6/24\n");
    EXPECT_THAT(m_remarks, ElementsAre(Says("addr add 192.0.2.5/24 dev nothing")));
    EXPECT_FALSE(Apply({"link set dev eth1 type bond mode 1"}));
}

TEST_F(ApplyTest, DoesTheRestOfWhatFailsEachTimeAndTakesNothingAway)
{
    vornhost::Plan plan;
    plan.stages = {
        {StageKind::kBatch, "devices", {"link add dev eth0 type bridge", "link set dev eth0 up"}},
        {StageKind::kClients, "end clients", {"end eth7"}},
        {StageKind::kSettings, "settings", {"eth1 ipv4.conf.forwarding 1"}},
        {StageKind::kBatch,
         "move",
         {"link set dev eth1 up", "addr add 192.0.2.6/24 dev eth1",
          "addr add 192.0.2.5/24 dev eth0", "link set dev eth1 down", "link del dev eth1"}},
        {StageKind::kSwitch, "remove bridges", {"--if-exists del-br ovs_eth1"}},
        {StageKind::kBatch, "tidy", {"addr add 192.0.2.7/24 dev eth1"}}};

    EXPECT_FALSE(vornhost::ApplyPlan(plan, m_remarks));
    EXPECT_EQ(Network(), "");
    EXPECT_FALSE(vornhost::ApplyWhatCanBe(plan, m_remarks));
    EXPECT_EQ(Network(), "eth0 192.0.2.5/24\neth1 192.0.2.6/24\n");
    EXPECT_EQ(ReadFile("/proc/sys/net/ipv4/conf/eth1/forwarding"), "1\n");
    EXPECT_THAT(m_remarks, ElementsAre(Says("link add dev eth0 type bridge"),
                                       Says("link add dev eth0 type bridge")));

    plan.stages = {{StageKind::kSwitch, "make bridges", {"no-such-command"}},
                   {StageKind::kBatch, "move", {"addr add 192.0.2.8/24 dev eth1"}}};
    EXPECT_FALSE(vornhost::ApplyWhatCanBe(plan, m_remarks));
    EXPECT_EQ(Network(), "eth0 192.0.2.5/24\neth1 192.0.2.6/24\n");
}

} // namespace
} // namespace contract
