#include "support/switchdatabase.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using vornhost::FindUplink;
using vornhost::ParseSwitchReply;
using vornhost::SwitchBridge;
using vornhost::SwitchPort;
using vornhost::SwitchValues;

constexpr char kReply[] = R"({"id":0,"error":null,"result":[
    {"rows":[{"name":"ovs_bond0","ports":["uuid","p3"],"datapath_type":"netdev",
              "external_ids":["map",[["vornovs-network","other"]]],"other_config":["map",[]]},
             {"name":"ovs_eth0","ports":["set",[["uuid","p2"],["uuid","p1"]]],"datapath_type":"",
              "external_ids":["map",[["vornovs-network","rc.network"]]],
              "other_config":["map",[["hwaddr","02:00:00:00:00:01"]]]},
             {"name":"empty","ports":["set",[]],"datapath_type":"",
              "external_ids":["map",[]],"other_config":["map",[]]}]},
    {"rows":[{"_uuid":["uuid","p1"],"name":"eth0","interfaces":["uuid","i1"],
              "bond_mode":["set",[]],"tag":["set",[]],"other_config":["map",[]],"trunks":7,
              "external_ids":["map",[["a","b"],["vornovs-network","rc.network"]]]},
             {"_uuid":["uuid","p2"],"name":"ovs_eth0","interfaces":["uuid","i2"],"tag":10,
              "bond_mode":["set",[]],"external_ids":["map",[]],"other_config":["map",[]],
              "trunks":["set",[]]},
             {"_uuid":["uuid","p3"],"name":"bond0","interfaces":["set",[["uuid","i4"],["uuid","i3"]]],
              "bond_mode":"balance-tcp","lacp":"active","bond_updelay":100,"trunks":["set",[8,9]],"tag":["set",[]],
              "other_config":["map",[["lacp-time","fast"]]],
              "external_ids":["map",[["vornovs-network","other"]]]}]},
    {"rows":[{"_uuid":["uuid","i1"],"name":"eth0","ofport":1,"error":["set",[]],
              "mtu_request":["set",[]],"lacp_current":["set",[]],
              "mac_in_use":"02:00:00:00:00:01","link_state":"up"},
             {"_uuid":["uuid","i2"],"name":"ovs_eth0","ofport":65534,"error":["set",[]],
              "mtu_request":9000,"lacp_current":["set",[]]},
             {"_uuid":["uuid","i3"],"name":"eth1","ofport":2,"error":["set",[]],
              "mtu_request":["set",[]],"lacp_current":true},
             {"_uuid":["uuid","i4"],"name":"eth2","ofport":-1,"error":"no such device",
              "mtu_request":["set",[]],"lacp_current":false}]}]})";

const SwitchValues::value_type kMark{"vornovs-network", "rc.network"};

const SwitchPort kOwn{"ovs_eth0", {"ovs_eth0"}, false, true};
const SwitchPort kClients{"tap0", {"tap0"}, false, false};
const SwitchPort kMarked{"eth9", {"eth9"}, false, true};
const SwitchPort kPrimary{"eth0", {"eth0"}, false, false};

TEST(ParseSwitchReply, GivesBridgesWithTheirPortsSorted)
{
    const SwitchPort single{"eth0",
                            {"eth0"},
                            false,
                            true,
                            std::nullopt,
                            {"eth0"},
                            std::nullopt,
                            false,
                            {{"trunks", "7"}},
                            {},
                            {{"a", "b"}, kMark},
                            {7},
                            {{"eth0", "02:00:00:00:00:01", true}}};
    const SwitchPort own{"ovs_eth0", {"ovs_eth0"},    false, false, 10U, {"ovs_eth0"},  9000U,
                         false,      {{"tag", "10"}}, {},    {},    {},  {{"ovs_eth0"}}};
    const SwitchPort bond{
        "bond0",
        {"eth1", "eth2"},
        true,
        false,
        std::nullopt,
        {"eth1"},
        std::nullopt,
        true,
        {{"bond_mode", "balance-tcp"}, {"bond_updelay", "100"}, {"lacp", "active"}},
        {{"lacp-time", "fast"}},
        {{"vornovs-network", "other"}},
        {8, 9},
        {{"eth1", "", std::nullopt, true}, {"eth2", "", std::nullopt, false, "no such device"}}};

    const auto bridges = ParseSwitchReply(kReply);

    ASSERT_TRUE(bridges.has_value());
    EXPECT_EQ(*bridges, (std::vector<SwitchBridge>{
                            {"empty", {}},
                            {"ovs_bond0", {bond}, false, "", "netdev"},
                            {"ovs_eth0", {single, own}, true, "02:00:00:00:00:01", ""}}));
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

TEST(FindUplink, LeavesOutWhatWasPutBesideTheUplink)
{
    SwitchPort further = kMarked;
    further.externalIds = {{vornhost::kFurtherPortKey, "eth0"}};

    EXPECT_EQ(FindUplink({"ovs_eth0", {kOwn, further}}, ""), nullptr);
}

TEST(FindUplink, FindsNoneAmongTheBridgesOwnPortAndThoseOfClients)
{
    EXPECT_EQ(FindUplink({"ovs_eth0", {kOwn, kClients}}, "eth0"), nullptr);
    EXPECT_EQ(FindUplink({"ovs_eth0", {kOwn, kClients}}, "ovs_eth0"), nullptr);
    EXPECT_EQ(FindUplink({"ovs_eth0", {}}, ""), nullptr);
}

} // namespace
