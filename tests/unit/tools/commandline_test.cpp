#include "commandtable.h"
#include "ctl.h"

#include <algorithm>
#include <array>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using unit::Ctl;
using unit::FakeHost;
using unit::Host;
using unit::Outcome;
using unit::PlayUser;
using unit::WrongUsage;

int Convert(FakeHost& host)
{
    host.clients->insert("lab");
    host.switchRuns = true;
    host.bridges = {"br-vms", "ovs_eth0", "ovs_eth1"};
    return 0;
}

int ConvertBack(FakeHost& host)
{
    host.clients->erase("lab");
    host.bridges = {"br-vms"};
    host.devices.clear();
    return 0;
}

using CommandLine = unit::OnAHost;

TEST_F(CommandLine, RegisterPassesBondModesOn)
{
    Host().act = Convert;

    EXPECT_EQ(Ctl({"register", "--bond-mode", "bond0=ovs-balance-tcp", "lab", "--bond-mode",
                   "bond1=ovs-balance-tcp"})
                  .exitStatus,
              0);
    EXPECT_THAT(Host().calls,
                ElementsAre("Register lab bond0=ovs-balance-tcp bond1=ovs-balance-tcp"));
}

TEST_F(CommandLine, ResetWantsToBeMeant)
{
    EXPECT_EQ(Ctl({"reset"}), WrongUsage("reset forgets every client: say --yes if that is meant"));
    EXPECT_THAT(Host().calls, ElementsAre());
}

// Every command with operands that it takes.
const std::vector<std::vector<std::string>> kForRoot{
    {"register", "lab"},
    {"unregister", "lab"},
    {"check"},
    {"repair"},
    {"status"},
    {"adopt"},
    {"release"},
    {"reset", "--yes"},
    {"interface", "list"},
    {"interface", "add", "eth0"},
    {"interface", "remove", "eth0"},
    {"port", "attach", "ovs_eth0", "tap0"},
    {"port", "detach", "ovs_eth0", "tap0"},
    {"bond", "create", "ovs_bond0", "ovs-balance-slb", "eth0", "eth1"},
    {"bond", "remove", "ovs_bond0"},
    {"bond", "get", "ovs_bond0"},
    {"bond", "mode", "ovs_bond0", "ovs-balance-slb"},
    {"vlan", "get", "tap0"},
    {"vlan", "set", "tap0", "10"},
    {"vlan", "clear", "tap0"},
    {"vlan", "create", "tap0", "10"},
    {"vlan", "remove", "tap0"},
    {"switch", "start"},
    {"switch", "stop"},
    {"network", "start"},
    {"network", "stop"},
    {"gateway", "copy", "eth0", "eth1"},
    {"gateway", "remove", "eth0"},
};
const std::vector<std::vector<std::string>> kForAnyone{
    {"show"}, {"bond", "free-name"}, {"bond", "modes"}};

std::string WordsOf(const std::vector<std::string>& commandLine)
{
    constexpr std::array kSingle{"register", "unregister", "status", "check",  "repair",
                                 "reset",    "show",       "adopt",  "release"};
    const bool single =
        std::find(kSingle.begin(), kSingle.end(), commandLine.front()) != kSingle.end();
    return single ? commandLine.front() : commandLine[0] + ' ' + commandLine[1];
}

TEST_F(CommandLine, IsForRootOnlyButForSomeCommands)
{
    PlayUser(1000);
    for (std::vector<std::string> words : kForRoot) {
        EXPECT_EQ(Ctl(words), unit::Failed(3, "only root may ask for this"))
            << testing::PrintToString(words);
        words.emplace_back("--json");
        EXPECT_EQ(Ctl(words), (Outcome{3,
                                       "{\n  \"command\": \"" + WordsOf(words) +
                                           "\",\n  \"exitStatus\": 3,\n  \"error\": \"only root "
                                           "may ask for this\"\n}\n",
                                       ""}));
    }
    EXPECT_THAT(Host().calls, ElementsAre());

    for (const std::vector<std::string>& words : kForAnyone) {
        EXPECT_NE(Ctl(words).exitStatus, 3) << testing::PrintToString(words);
    }
    EXPECT_EQ(Ctl({"--help"}).exitStatus, 0);
}

TEST_F(CommandLine, EveryCommandAnswersInJson)
{
    for (const auto& commands : {kForRoot, kForAnyone}) {
        for (std::vector<std::string> words : commands) {
            words.emplace_back("--json");
            const Outcome outcome = Ctl(words);
            EXPECT_EQ(outcome.errors, "") << testing::PrintToString(words);
            const auto object = nlohmann::json::parse(outcome.output);
            EXPECT_EQ(object.at("command"), WordsOf(words));
            EXPECT_EQ(object.at("exitStatus"), outcome.exitStatus);
            EXPECT_EQ(object.at("error").is_null(), outcome.exitStatus == 0)
                << testing::PrintToString(words);
        }
    }
}

TEST_F(CommandLine, EveryCommandIsKnownToTheseTests)
{
    std::set<std::string> tested;
    for (const auto& commands : {kForRoot, kForAnyone}) {
        for (const std::vector<std::string>& words : commands) {
            tested.insert(WordsOf(words));
        }
    }
    std::set<std::string> known;
    for (const vornovsctl::CommandRow& row : vornovsctl::Commands()) {
        known.insert(row.Words());
    }
    EXPECT_EQ(known, tested);
}

TEST_F(CommandLine, TellsInJsonWhatIsWrongWithIt)
{
    EXPECT_EQ(Ctl({"vlan", "set", "tap0", "5000", "--json"}), (Outcome{2, R"({
  "command": null,
  "exitStatus": 2,
  "error": "the VLAN id '5000' is no number from 1 to 4094"
}
)",
                                                                       ""}));
    EXPECT_EQ(Ctl({"register", "--", "--json"}), WrongUsage("the client's name begins with '-'"));
    EXPECT_EQ(Ctl({"show", "--json", "--format", "dot"}).output, R"({
  "command": null,
  "exitStatus": 2,
  "error": "--json and --format dot are two things"
}
)");
}

TEST_F(CommandLine, RefusesNamesThatCanBeNone)
{
    struct Row {
        std::string name;
        std::string message;
    };
    const Row rows[] = {
        {"", "the client's name is empty"},
        {"-lab", "the client's name begins with '-'"},
        {"a/b", "the client's name holds a slash"},
        {"a\nb", "the client's name holds a line break or another control character"},
        {"a\tb", "the client's name holds a line break or another control character"},
        {"a\x7f", "the client's name holds a line break or another control character"},
        {std::string(256, 'a'), "the client's name is longer than 255 characters"},
    };
    for (const Row& row : rows) {
        EXPECT_EQ(Ctl({"register", "--", row.name}), WrongUsage(row.message));
        EXPECT_EQ(Ctl({"unregister", "--", row.name}), WrongUsage(row.message));
    }
    EXPECT_THAT(Host().calls, ElementsAre());
}

TEST_F(CommandLine, TakesAnyOtherName)
{
    Host().act = Convert;
    for (const std::string& name : {std::string("a b"), std::string("caf\xc3\xa9"),
                                    std::string(255, 'a'), std::string("a-b=c")}) {
        Host().calls.clear();
        (void)Ctl({"register", name});
        EXPECT_THAT(Host().calls, ElementsAre("Register " + name));
    }
}

TEST_F(CommandLine, RefusesBondModesThatCanBeNone)
{
    struct Row {
        std::string verb;
        std::string text;
        std::string message;
    };
    const Row rows[] = {
        {"register", "bond0", "--bond-mode wants BOND=MODE"},
        {"register", "=ovs-balance-tcp", "the bond's name is empty"},
        {"register", "sixteen-letters!=ovs-balance-tcp",
         "the bond's name is longer than 15 characters"},
        {"register", "b/d=ovs-balance-tcp", "the bond's name holds a slash"},
        {"register", "b d=ovs-balance-tcp", "the bond's name holds a blank or a colon"},
        {"register", "bond0=", "'' is no bond mode of the switch"},
        {"register", "bond0=fastest", "'fastest' is no bond mode of the switch"},
        {"register", "bond0=active-backup", "'active-backup' is no bond mode of the switch"},
        {"unregister", "bond0=ovs-balance-tcp", "'ovs-balance-tcp' is no bond mode of Linux"},
    };
    for (const Row& row : rows) {
        EXPECT_EQ(Ctl({row.verb, "lab", "--bond-mode", row.text}), WrongUsage(row.message));
    }
    EXPECT_EQ(Ctl({"register", "lab", "--bond-mode", "b=ovs-balance-tcp", "--bond-mode",
                   "b=ovs-balance-tcp"}),
              WrongUsage("bond 'b' has two modes"));
    EXPECT_THAT(Host().calls, ElementsAre());
}

TEST_F(CommandLine, UnregisterPassesLinuxBondModesOn)
{
    PutOnTheSwitch({"lab"});
    Host().act = ConvertBack;

    EXPECT_EQ(Ctl({"unregister", "lab", "--bond-mode", "bond0=active-backup"}).exitStatus, 0);
    EXPECT_THAT(Host().calls, ElementsAre("UnRegister lab bond0=active-backup"));
}

TEST_F(CommandLine, RefusesAWrongCommandLine)
{
    for (const std::vector<std::string>& words :
         std::vector<std::vector<std::string>>{{},
                                               {"bogus"},
                                               {"register"},
                                               {"register", "a", "b"},
                                               {"status", "a"},
                                               {"status", "--bogus"},
                                               {"status", "reset"},
                                               {"bond"},
                                               {"bond", "bogus"},
                                               {"bond", "get"},
                                               {"bond", "get", "a", "b"},
                                               {"vlan", "set", "a"},
                                               {"vlan", "set", "a", "1", "2"},
                                               {"port", "attach", "a"},
                                               {"interface", "list", "a"},
                                               {"show", "--format", "svg"},
                                               {"show", "--format"},
                                               {"switch", "stop", "a"},
                                               {"status", "--yes"},
                                               {"bond", "modes", "--bond-mode", "a=b"},
                                               {"register", "a", "--bond-mode"}}) {
        const Outcome outcome = Ctl(words);
        EXPECT_EQ(outcome.exitStatus, 2) << testing::PrintToString(words);
        EXPECT_EQ(outcome.output, "");
        EXPECT_THAT(outcome.errors, HasSubstr("\nTry 'vornovsctl --help'.\n"));
    }
    EXPECT_THAT(Host().calls, ElementsAre());
}

TEST_F(CommandLine, TeachesItsUse)
{
    const Outcome help = Ctl({"--help"});
    EXPECT_EQ(help.exitStatus, 0);
    for (const char* const text : {"register", "unregister", "status", "reset", "Exit status:"}) {
        EXPECT_THAT(help.output, HasSubstr(text));
    }
    for (const vornovsctl::CommandRow& row : vornovsctl::Commands()) {
        std::vector<std::string> words{row.name, "--help"};
        if (*row.group != '\0') {
            words.insert(words.begin(), row.group);
        }
        const Outcome more = Ctl(words);
        EXPECT_EQ(more.exitStatus, 0) << row.Words();
        EXPECT_THAT(more.output, HasSubstr("Example")) << row.Words();
        EXPECT_THAT(more.output, HasSubstr("\n  vornovsctl " + row.Words())) << row.Words();
        EXPECT_THAT(more.output, HasSubstr("Usage: vornovsctl " + row.Words())) << row.Words();
    }
    EXPECT_THAT(Ctl({"bond", "create", "--help"}).output,
                HasSubstr("Usage: vornovsctl bond create [OPTIONS] BOND MODE SLAVE...\n"));
    EXPECT_THAT(Ctl({"network", "stop", "--help"}).output,
                HasSubstr("Usage: vornovsctl network stop [OPTIONS] [INTERFACE...]\n"));
    EXPECT_EQ(Ctl({"--version"}), (Outcome{0, "vornovsctl 1.0.0\n", ""}));
}

} // namespace
