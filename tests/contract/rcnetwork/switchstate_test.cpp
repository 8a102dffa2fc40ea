#include "rcnetwork/switchstate.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace vornhost {
namespace {

using testing::Optional;

constexpr char kTables[] =
    R"({"data":[[["uuid","b1"],"ovs_eth0",["set",[["uuid","p1"],["uuid","p2"]]],["map",[["vornovs-network","rc.network"]]],["map",[["hwaddr","02:00:00:00:00:01"]]],""],[["uuid","b2"],"br-int",["uuid","p3"],["map",[]],["map",[]],"netdev"]],"headings":["_uuid","name","ports","external_ids","other_config","datapath_type"]}
{"data":[[["uuid","p1"],"ovs_eth0",["uuid","i1"],["map",[]],10],[["uuid","p2"],"eth0",["uuid","i2"],["map",[["vornovs-network","rc.network"]]],["set",[]]],[["uuid","p3"],"br-int",["uuid","i3"],["map",[["vornovs-network","other"]]],["set",[]]]],"headings":["_uuid","name","interfaces","external_ids","tag"]}
{"data":[[["uuid","i1"],"ovs_eth0",65534,["set",[]],9000],[["uuid","i2"],"eth0",1,["set",[]],["set",[]]],[["uuid","i3"],"br-int",-1,"could not open network device br-int",["set",[]]]],"headings":["_uuid","name","ofport","error","mtu_request"]}
)";

TEST(ParseSwitchTables, ReadsBridgesWithTheirPortsAndMarks)
{
    const auto state = ParseSwitchTables(kTables);

    ASSERT_TRUE(state.has_value());
    EXPECT_TRUE(state->running);
    ASSERT_EQ(state->bridges.size(), 2U);
    const SwitchBridge& bridge = state->bridges.at("ovs_eth0");
    EXPECT_TRUE(bridge.ours);
    EXPECT_EQ(bridge.hwaddr, "02:00:00:00:00:01");
    EXPECT_EQ(bridge.datapathType, "");
    ASSERT_EQ(bridge.ports.size(), 2U);
    EXPECT_EQ(bridge.ports[0].name, "eth0");
    EXPECT_TRUE(bridge.ports[0].ours);
    EXPECT_TRUE(bridge.ports[0].working);
    EXPECT_EQ(bridge.ports[0].tag, std::nullopt);
    EXPECT_EQ(bridge.ports[1].name, "ovs_eth0");
    EXPECT_FALSE(bridge.ports[1].ours);
    EXPECT_THAT(bridge.ports[1].tag, Optional(10U));
    EXPECT_THAT(bridge.ports[1].mtuRequest, Optional(9000U));
}

TEST(ParseSwitchTables, TakesABridgeWithAnotherMarkOrAFailedPortForWhatItIs)
{
    const auto state = ParseSwitchTables(kTables);

    ASSERT_TRUE(state.has_value());
    const SwitchBridge& bridge = state->bridges.at("br-int");
    EXPECT_FALSE(bridge.ours);
    EXPECT_EQ(bridge.datapathType, "netdev");
    ASSERT_EQ(bridge.ports.size(), 1U);
    EXPECT_FALSE(bridge.ports[0].ours);
    EXPECT_FALSE(bridge.ports[0].working);
}

TEST(ParseSwitchTables, RefusesATextThatIsNotAllThreeTables)
{
    const std::string text = kTables;

    EXPECT_FALSE(ParseSwitchTables("").has_value());
    EXPECT_FALSE(ParseSwitchTables("no such table").has_value());
    EXPECT_FALSE(ParseSwitchTables(text.substr(0, text.size() / 2)).has_value());
    EXPECT_FALSE(ParseSwitchTables(text.substr(text.find('\n') + 1)).has_value());
}

} // namespace
} // namespace vornhost
