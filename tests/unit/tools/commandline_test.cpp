#include "ctl.h"

#include <csignal>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

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

TEST_F(CommandLine, IsForRootOnly)
{
    PlayUser(1000);
    for (const char* const verb : {"status", "register", "unregister", "reset"}) {
        std::vector<std::string> words{verb};
        if (words[0] == "reset") {
            words.emplace_back("--yes");
        } else if (words[0] != "status") {
            words.emplace_back("lab");
        }
        EXPECT_EQ(Ctl(words), (Outcome{3, "", "vornovsctl: only root may ask for this\n"})) << verb;
    }
    EXPECT_THAT(Host().calls, ElementsAre());
    EXPECT_EQ(Ctl({"--help"}).exitStatus, 0);
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
    for (const char* const verb : {"register", "unregister", "status", "reset"}) {
        const Outcome more = Ctl({verb, "--help"});
        EXPECT_EQ(more.exitStatus, 0) << verb;
        EXPECT_THAT(more.output, HasSubstr("Example")) << verb;
    }
    EXPECT_EQ(Ctl({"--version"}), (Outcome{0, "vornovsctl 1.0.0\n", ""}));
}

} // namespace
