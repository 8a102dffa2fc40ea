#include "support/switchdatabase.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using vornhost::FindUplink;
using vornhost::ParseSwitchReply;
using vornhost::SwitchBridge;
using vornhost::SwitchPort;

constexpr char kReply[] = R"({"id":0,"error":null,"result":[
    {"rows":[{"name":"ovs_eth1","ports":["uuid","p3"]},
             {"name":"ovs_eth0","ports":["set",[["uuid","p2"],["uuid","p1"]]]},
             {"name":"empty","ports":["set",[]]}]},
    {"rows":[{"_uuid":["uuid","p1"],"name":"eth0","interfaces":["uuid","i1"],
              "bond_mode":["set",[]],
              "external_ids":["map",[["a","b"],["vornovs-network","rc.network"]]]},
             {"_uuid":["uuid","p2"],"name":"ovs_eth0","interfaces":["uuid","i2"],
              "bond_mode":["set",[]],"external_ids":["map",[]]},
             {"_uuid":["uuid","p3"],"name":"bond0","interfaces":["set",[["uuid","i4"],["uuid","i3"]]],
              "bond_mode":"balance-tcp","external_ids":["map",[["vornovs-network","other"]]]}]},
    {"rows":[{"_uuid":["uuid","i1"],"name":"eth0"},{"_uuid":["uuid","i2"],"name":"ovs_eth0"},
             {"_uuid":["uuid","i3"],"name":"eth1"},{"_uuid":["uuid","i4"],"name":"eth2"}]}]})";

const SwitchPort kOwn{"ovs_eth0", {"ovs_eth0"}, false, true};
const SwitchPort kClients{"tap0", {"tap0"}, false, false};
const SwitchPort kMarked{"eth9", {"eth9"}, false, true};
const SwitchPort kPrimary{"eth0", {"eth0"}, false, false};

TEST(ParseSwitchReply, GivesBridgesWithTheirPortsSorted)
{
    const auto bridges = ParseSwitchReply(kReply);

    ASSERT_TRUE(bridges.has_value());
    EXPECT_EQ(*bridges,
              (std::vector<SwitchBridge>{
                  {"empty", {}},
                  {"ovs_eth0",
                   {{"eth0", {"eth0"}, false, true}, {"ovs_eth0", {"ovs_eth0"}, false, false}}},
                  {"ovs_eth1", {{"bond0", {"eth1", "eth2"}, true, false}}}}));
}

TEST(ParseSwitchReply, GivesNothingForAnythingElse)
{
    for (const char* const reply :
         {"", "{}", "[]", "garbage", R"({"result":null,"error":"x"})",
          R"({"result":[{"error":"no table"},{"rows":[]},{"rows":[]}]})",
          R"({"result":[{"rows":[{"name":"b","ports":["uuid","gone"]}]},{"rows":[]},{"rows":[]}]})",
          R"({"result":[{"rows":[{"name":1,"ports":["set",[]]}]},{"rows":[]},{"rows":[]}]})"}) {
        EXPECT_FALSE(ParseSwitchReply(reply).has_value()) << reply;
    }
}

TEST(FindUplink, PrefersThePortOfThePrimary)
{
    const SwitchBridge bridge{"ovs_eth0", {kOwn, kMarked, kPrimary, kClients}};

    const SwitchPort* const uplink = FindUplink(bridge, "eth0");

    ASSERT_NE(uplink, nullptr);
    EXPECT_EQ(*uplink, kPrimary);
}

TEST(FindUplink, TakesTheMarkedPortWithoutAPrimary)
{
    const SwitchBridge bridge{"ovs_eth0", {kOwn, kClients, kMarked}};

    const SwitchPort* const uplink = FindUplink(bridge, "");

    ASSERT_NE(uplink, nullptr);
    EXPECT_EQ(*uplink, kMarked);
}

TEST(FindUplink, FindsNoneAmongTheBridgesOwnPortAndThoseOfClients)
{
    EXPECT_EQ(FindUplink({"ovs_eth0", {kOwn, kClients}}, "eth0"), nullptr);
    EXPECT_EQ(FindUplink({"ovs_eth0", {kOwn, kClients}}, "ovs_eth0"), nullptr);
    EXPECT_EQ(FindUplink({"ovs_eth0", {}}, ""), nullptr);
}

} // namespace
