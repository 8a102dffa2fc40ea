#include "show/switchreader.h"

#include "fakelibrary.h"

#include <fstream>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sstream>

namespace {

using unit::Host;
using vornovsctl::AskSwitch;
using vornovsctl::Bridge;
using vornovsctl::Member;
using vornovsctl::ParseSwitch;
using vornovsctl::Port;
using vornovsctl::SwitchAnswer;

std::string RecordedReply()
{
    std::ifstream file(VORNOVS_TEST_DATA "/switchreply.json");
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
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

TEST(ParseSwitch, TakesEverythingFromARecordedReply)
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
    EXPECT_EQ(ParseSwitch(RecordedReply()), expected);
}

TEST(ParseSwitch, KnowsOfOneActiveMemberOnlyWhereTheOthersWait)
{
    std::string reply = RecordedReply();
    const std::string mode = "\"active-backup\"";
    reply.replace(reply.find(mode), mode.size(), "\"balance-slb\"");

    const auto bridges = ParseSwitch(reply);
    ASSERT_TRUE(bridges);
    EXPECT_EQ(bridges->at(2).ports.at(0).mode, "balance-slb");
    EXPECT_EQ(bridges->at(2).ports.at(0).active, "");
}

TEST(ParseSwitch, RefusesWhatIsNoReply)
{
    for (const char* const text :
         {"", "{", "[]", R"({"result":[]})", R"({"result":null,"error":"no"})",
          R"({"result":[{"rows":[]},{"rows":[]},{"error":"unknown column"}]})",
          R"({"result":[{"rows":[{"name":"b","ports":["uuid","1"]}]},{"rows":[]},{"rows":[]}]})",
          R"({"result":[{"rows":[{"name":7,"ports":["set",[]]}]},{"rows":[]},{"rows":[]}]})"}) {
        EXPECT_EQ(ParseSwitch(text), std::nullopt) << text;
    }
    EXPECT_EQ(ParseSwitch(R"({"result":[{"rows":[]},{"rows":[]},{"rows":[]}]})"),
              std::vector<Bridge>());
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
    EXPECT_EQ(answer.fault, "the answer of the switch's database cannot be understood");

    Host().answer = RecordedReply();
    answer = AskSwitch();
    EXPECT_EQ(answer.bridges, ParseSwitch(RecordedReply()));
    EXPECT_EQ(answer.fault, "");
}

} // namespace
