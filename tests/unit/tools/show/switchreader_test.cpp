#include "show/switchreader.h"

#include "fakelibrary.h"

#include <fstream>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sstream>

namespace {

using unit::Host;
using vornhost::ParseSwitchReply;
using vornovsctl::AskSwitch;
using vornovsctl::Bridge;
using vornovsctl::DrawnBridges;
using vornovsctl::Member;
using vornovsctl::Port;
using vornovsctl::SwitchAnswer;

std::string RecordedReply()
{
    std::ifstream file(VORNOVS_TEST_DATA "/switchreply.json");
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

std::vector<Bridge> DrawnFrom(const std::string& reply)
{
    const auto bridges = ParseSwitchReply(reply);
    EXPECT_TRUE(bridges.has_value());
    return DrawnBridges(bridges.value_or(std::vector<vornhost::SwitchBridge>()));
}

Member MakeMember(const std::string& name, const std::string& number, bool link, bool negotiated)
{
    return {name, "52:54:00:00:00:" + number, link, negotiated, ""};
}

Port MakePort(const std::string& name, const Member& member)
{
    Port port;
    port.name = name;
    port.members = {member};
    return port;
}

TEST(DrawnBridges, TakesEverythingFromARecordedReply)
{
    Port lacp;
    lacp.name = "bond0";
    lacp.bond = true;
    lacp.wire = true;
    lacp.mode = "balance-tcp";
    lacp.lacp = "active";
    lacp.members = {MakeMember("eth1", "02", true, true), MakeMember("eth2", "03", false, false)};
    Port backup = lacp;
    backup.name = "bond1";
    backup.mode = "active-backup";
    backup.lacp = "off";
    backup.active = "eth5";
    backup.members = {MakeMember("eth4", "04", true, false), MakeMember("eth5", "05", true, false)};

    Port wire = MakePort("eth0", MakeMember("eth0", "01", true, false));
    wire.wire = true;
    Port tagged = MakePort("tap0", {"tap0", "", {}, false, ""});
    tagged.tag = 20;
    Port trunk = MakePort("tap10", {"tap10", "", {}, false, ""});
    trunk.trunks = {30, 40};
    const Port broken = MakePort(
        "tap2", {"tap2", "", {}, false, "could not open network device tap2 (No such device)"});

    const std::vector<Bridge> expected{
        {"br-empty", {}, {}},
        {"ovs_bond0", {}, {lacp}},
        {"ovs_bond1", {}, {backup}},
        {"ovs_eth0", 10, {wire, tagged, broken, trunk}},
    };
    EXPECT_EQ(DrawnFrom(RecordedReply()), expected);
}

TEST(DrawnBridges, KnowsOfOneActiveMemberOnlyWhereTheOthersWait)
{
    std::string reply = RecordedReply();
    const std::string mode = "\"active-backup\"";
    reply.replace(reply.find(mode), mode.size(), "\"balance-slb\"");

    const auto bridges = DrawnFrom(reply);
    ASSERT_EQ(bridges.size(), 4U);
    EXPECT_EQ(bridges[2].ports.at(0).mode, "balance-slb");
    EXPECT_EQ(bridges[2].ports.at(0).active, "");
}

TEST(AskSwitch, TellsWhyThereIsNoAnswer)
{
    Host() = unit::FakeHost();
    SwitchAnswer answer = AskSwitch();
    EXPECT_EQ(answer.bridges, std::nullopt);
    EXPECT_EQ(answer.fault, "the switch's database does not answer");

    Host().answer = "{}";
    answer = AskSwitch();
    EXPECT_EQ(answer.bridges, std::nullopt);
    EXPECT_EQ(answer.fault, "the switch's database does not answer");

    Host().answer = RecordedReply();
    answer = AskSwitch();
    EXPECT_EQ(answer.bridges, DrawnFrom(RecordedReply()));
    EXPECT_EQ(answer.fault, "");
}

} // namespace
