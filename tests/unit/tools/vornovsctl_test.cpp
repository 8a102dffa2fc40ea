#include "fakelibrary.h"
#include "run.h"

#include <csignal>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sstream>

namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using unit::FakeHost;
using unit::Host;

struct Outcome {
    int exitStatus;
    std::string output;
    std::string errors;

    bool operator==(const Outcome&) const = default;
};

void PrintTo(const Outcome& outcome, std::ostream* stream)
{
    *stream << "exit status " << outcome.exitStatus << "\noutput:\n"
            << outcome.output << "errors:\n"
            << outcome.errors;
}

Outcome Ctl(std::vector<std::string> words)
{
    words.insert(words.begin(), "vornovsctl");
    std::vector<const char*> argv;
    argv.reserve(words.size());
    for (const std::string& word : words) {
        argv.push_back(word.c_str());
    }
    std::ostringstream output;
    std::ostringstream errors;
    const int status = vornovsctl::Run(static_cast<int>(argv.size()), argv.data(), output, errors);
    return {status, output.str(), errors.str()};
}

Outcome WrongUsage(const std::string& message)
{
    return {2, "", "vornovsctl: " + message + "\nTry 'vornovsctl --help'.\n"};
}

constexpr char kFirstClient[] = "Registering 'lab': it is the first client, so the host's wired "
                                "interfaces go on to the switch.\n";
constexpr char kLastClient[] = "Withdrawing 'lab': it is the last client, so the host's interfaces "
                               "leave the switch.\n";
constexpr char kNotRegistered[] =
    "vornovsctl: 'lab' is not registered: the conversion failed, another program held the "
    "configuration lock,\nor the registrations cannot be read or written. The system log tells "
    "which.\n";
constexpr char kStillRegistered[] =
    "vornovsctl: 'lab' is still registered, as far as can be told. Another program may hold the "
    "configuration lock,\nor the registrations cannot be read or written: see the system log, then "
    "try again.\n";

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

class Vornovsctl : public testing::Test {
protected:
    Vornovsctl() { Host() = FakeHost(); }

    static void PutOnTheSwitch(std::set<std::string> clients)
    {
        Host().clients = std::move(clients);
        Host().switchRuns = true;
        Host().bridges = {"ovs_eth0", "ovs_eth1"};
        Host().devices = {"ovs_eth0", "ovs_eth1"};
    }
};

TEST_F(Vornovsctl, RegisterOfTheFirstClientTellsWhatIsOnTheSwitch)
{
    Host().act = Convert;

    EXPECT_EQ(
        Ctl({"register", "lab"}),
        (Outcome{0, std::string(kFirstClient) + "'lab' is registered. On the switch: eth0, eth1.\n",
                 ""}));
    EXPECT_THAT(Host().calls, ElementsAre("Register lab"));
}

TEST_F(Vornovsctl, RegisterOfAFurtherClientIsSilentAboutTheConversion)
{
    PutOnTheSwitch({"vms"});
    Host().act = Convert;

    EXPECT_EQ(Ctl({"register", "lab"}),
              (Outcome{0, "'lab' is registered. On the switch: eth0, eth1.\n", ""}));
}

TEST_F(Vornovsctl, RegisterPassesBondModesOn)
{
    Host().act = Convert;

    EXPECT_EQ(Ctl({"register", "--bond-mode", "bond0=ovs-balance-tcp", "lab", "--bond-mode",
                   "bond1=ovs-balance-tcp"})
                  .exitStatus,
              0);
    EXPECT_THAT(Host().calls,
                ElementsAre("Register lab bond0=ovs-balance-tcp bond1=ovs-balance-tcp"));
}

TEST_F(Vornovsctl, RegisterOfAClientThatIsRegisteredChangesNothing)
{
    PutOnTheSwitch({"lab"});
    Host().act = [](FakeHost&) { return 1; };

    EXPECT_EQ(Ctl({"register", "lab"}),
              (Outcome{5, "", "vornovsctl: 'lab' was registered already; nothing was changed.\n"}));
}

TEST_F(Vornovsctl, RegisterFailsOnAHostThatCannotRunTheSwitch)
{
    Host().act = [](FakeHost&) { return 5; };

    EXPECT_EQ(Ctl({"register", "lab"}),
              (Outcome{1, kFirstClient,
                       "vornovsctl: this host cannot run Open vSwitch (reason 5); nothing was "
                       "changed.\n"}));
}

TEST_F(Vornovsctl, RegisterFailsWhenTheLibrarySaysSuccessAndNobodyIsRegistered)
{
    const std::string errors =
        std::string(kNotRegistered) + "No interface was moved for it: try again.\n";
    for (const int result : {0, -1}) {
        Host().act = [=](FakeHost&) { return result; };
        EXPECT_EQ(Ctl({"register", "lab"}), (Outcome{1, kFirstClient, errors})) << result;
    }

    PutOnTheSwitch({"vms"});
    EXPECT_EQ(Ctl({"register", "lab"}), (Outcome{1, "", errors}));
}

TEST_F(Vornovsctl, RegisterTellsWhatAFailedConversionLeftOnTheSwitch)
{
    Host().act = [](FakeHost& host) {
        Convert(host);
        host.clients->clear();
        return 0;
    };

    EXPECT_EQ(Ctl({"register", "lab"}),
              (Outcome{4, kFirstClient,
                       std::string(kNotRegistered) +
                           "On the switch all the same: eth0, eth1.\nRun '/etc/rc.network start' "
                           "to bring the network up as its files have it now. Then register "
                           "again;\nto go back instead, register and unregister again.\n"}));
}

TEST_F(Vornovsctl, RegisterTellsWhenNothingIsOnTheSwitch)
{
    const std::string advice =
        ".\nSee the system log for the reason, run '/etc/rc.network start', and look at "
        "'vornovsctl status' again.\nTo go back: 'vornovsctl unregister lab'.\n";
    Host().act = [](FakeHost& host) {
        Convert(host);
        host.bridges = {"br-vms", "ovs_"};
        return 0;
    };
    EXPECT_EQ(
        Ctl({"register", "lab"}),
        (Outcome{4, kFirstClient,
                 "vornovsctl: 'lab' is registered, but no interface is on the switch" + advice}));

    Host() = FakeHost();
    Host().act = [](FakeHost& host) {
        host.clients->insert("lab");
        return 0;
    };
    EXPECT_EQ(Ctl({"register", "lab"}),
              (Outcome{4, kFirstClient,
                       "vornovsctl: 'lab' is registered, but the switch does not run" + advice}));
}

TEST_F(Vornovsctl, UnregisterOfTheLastClientTellsThatTheHostIsBack)
{
    PutOnTheSwitch({"lab"});
    Host().act = ConvertBack;

    EXPECT_EQ(Ctl({"unregister", "lab"}),
              (Outcome{0,
                       std::string(kLastClient) + "'lab' is withdrawn; it was the last client. No "
                                                  "interface is on the switch.\n",
                       ""}));
    EXPECT_THAT(Host().calls, ElementsAre("UnRegister lab"));
}

TEST_F(Vornovsctl, UnregisterOfAnotherThanTheLastClientTellsWhoIsLeft)
{
    PutOnTheSwitch({"lab", "vms", "apps"});
    Host().act = [](FakeHost& host) {
        host.clients->erase("lab");
        return 0;
    };

    EXPECT_EQ(Ctl({"unregister", "lab"}),
              (Outcome{0,
                       "'lab' is withdrawn. Still registered: apps, vms; the interfaces stay on "
                       "the switch.\n",
                       ""}));
}

TEST_F(Vornovsctl, UnregisterOfAnUnknownClientChangesNothing)
{
    PutOnTheSwitch({"vms"});
    Host().act = [](FakeHost&) { return 1; };

    EXPECT_EQ(Ctl({"unregister", "lab"}),
              (Outcome{5, "", "vornovsctl: 'lab' was not registered; nothing was changed.\n"}));
}

TEST_F(Vornovsctl, UnregisterFailsWhileTheClientIsStillRegistered)
{
    for (const int result : {0, -1}) {
        PutOnTheSwitch({"lab", "vms"});
        Host().act = [=](FakeHost&) { return result; };
        EXPECT_EQ(Ctl({"unregister", "lab"}), (Outcome{1, "", kStillRegistered})) << result;
    }

    Host().clients.reset();
    EXPECT_EQ(Ctl({"unregister", "lab"}), (Outcome{1, "", kStillRegistered}));
}

TEST_F(Vornovsctl, UnregisterTellsWhatAFailedConversionBackLeftOnTheSwitch)
{
    const std::string advice =
        ".\nRun '/etc/rc.network start' to bring the network up as its files have it. Then, to go "
        "back once more,\n'vornovsctl register lab' and 'vornovsctl unregister lab'. The system "
        "log tells what failed.\n";
    const std::string errors =
        "vornovsctl: 'lab' is withdrawn and was the last client, but on the switch are still: ";

    PutOnTheSwitch({"lab"});
    Host().act = [](FakeHost& host) {
        ConvertBack(host);
        host.bridges = {"ovs_eth1"};
        return 0;
    };
    EXPECT_EQ(Ctl({"unregister", "lab"}), (Outcome{4, kLastClient, errors + "eth1" + advice}));

    // The switch has ended meanwhile: the devices tell.
    PutOnTheSwitch({"lab"});
    Host().act = [](FakeHost& host) {
        ConvertBack(host);
        host.switchRuns = false;
        host.devices = {"ovs_eth0"};
        return 0;
    };
    EXPECT_EQ(Ctl({"unregister", "lab"}), (Outcome{4, kLastClient, errors + "eth0" + advice}));
}

TEST_F(Vornovsctl, ConversionsCannotBeInterruptedAndStatusCan)
{
    Host().act = Convert;
    (void)Ctl({"register", "lab"});
    EXPECT_FALSE(Host().interruptible);

    Host().interruptible = true;
    (void)Ctl({"unregister", "lab"});
    EXPECT_FALSE(Host().interruptible);

    struct sigaction now {};
    ASSERT_EQ(sigaction(SIGINT, nullptr, &now), 0);
    EXPECT_EQ(now.sa_handler, SIG_DFL) << "and afterwards everything is as before";
}

TEST_F(Vornovsctl, StatusOfAHostThatNeverHadAClientStartsNothing)
{
    EXPECT_EQ(Ctl({"status"}), (Outcome{0,
                                        "Clients:     none\n"
                                        "Switch:      not running\n"
                                        "Interfaces:  not known while the switch does not run\n",
                                        ""}));
    EXPECT_EQ(Ctl({"status", "--json"}), (Outcome{0, R"({
  "clients": [],
  "switchRunning": false,
  "interfaces": null,
  "consistent": true
}
)",
                                                  ""}));
    EXPECT_THAT(Host().calls, ElementsAre());
}

TEST_F(Vornovsctl, StatusOfAHostOnTheSwitchTellsClientsAndInterfaces)
{
    PutOnTheSwitch({"vms", "lab"});

    EXPECT_EQ(Ctl({"status"}), (Outcome{0,
                                        "Clients:     lab, vms\n"
                                        "Switch:      running\n"
                                        "Interfaces:  eth0 (ovs_eth0), eth1 (ovs_eth1)\n",
                                        ""}));
    EXPECT_EQ(Ctl({"status", "--json"}), (Outcome{0, R"({
  "clients": [
    "lab",
    "vms"
  ],
  "switchRunning": true,
  "interfaces": [
    {
      "name": "eth0",
      "bridge": "ovs_eth0"
    },
    {
      "name": "eth1",
      "bridge": "ovs_eth1"
    }
  ],
  "consistent": true
}
)",
                                                  ""}));
}

TEST_F(Vornovsctl, StatusTellsWhenInterfacesHaveNoClient)
{
    PutOnTheSwitch({});

    EXPECT_EQ(Ctl({"status"}),
              (Outcome{4,
                       "Clients:     none\n"
                       "Switch:      running\n"
                       "Interfaces:  eth0 (ovs_eth0), eth1 (ovs_eth1)\n"
                       "No client is registered, but interfaces are on the switch: run\n"
                       "'/etc/rc.network start', then register a client and unregister it again.\n",
                       ""}));
}

TEST_F(Vornovsctl, StatusTellsWhenClientsHaveNoInterface)
{
    const std::string remark =
        "Clients are registered, but no interface is known to be on the switch: run\n"
        "'/etc/rc.network start'.\n";
    PutOnTheSwitch({"lab"});
    Host().bridges = {"br-vms"};
    EXPECT_EQ(Ctl({"status"}), (Outcome{4,
                                        "Clients:     lab\n"
                                        "Switch:      running\n"
                                        "Interfaces:  none\n" +
                                            remark,
                                        ""}));

    Host().bridges.reset();
    EXPECT_EQ(Ctl({"status"}), (Outcome{4,
                                        "Clients:     lab\n"
                                        "Switch:      running\n"
                                        "Interfaces:  cannot be read\n" +
                                            remark,
                                        ""}));

    Host().switchRuns = false;
    EXPECT_EQ(Ctl({"status"}).exitStatus, 4);
}

TEST_F(Vornovsctl, StatusFailsWhenTheRegistrationsCannotBeRead)
{
    Host().clients.reset();

    EXPECT_EQ(Ctl({"status"}), (Outcome{1,
                                        "Clients:     cannot be read\n"
                                        "Switch:      not running\n"
                                        "Interfaces:  not known while the switch does not run\n",
                                        ""}));
    EXPECT_EQ(Ctl({"status", "--json"}).output, R"({
  "clients": null,
  "switchRunning": false,
  "interfaces": null,
  "consistent": false
}
)");
}

TEST_F(Vornovsctl, StatusPrintsJsonWhateverBytesAreInAName)
{
    PutOnTheSwitch({"\xff\"x"});

    EXPECT_THAT(Ctl({"status", "--json"}).output, HasSubstr("\"\xef\xbf\xbd\\\"x\""));
}

TEST_F(Vornovsctl, ResetForgetsTheClientsAndTellsWhatStays)
{
    PutOnTheSwitch({"lab"});
    Host().act = [](FakeHost& host) {
        host.clients->clear();
        return 0;
    };

    EXPECT_EQ(Ctl({"reset", "--yes"}),
              (Outcome{0, "Every client is forgotten.\nStill on the switch: eth0, eth1.\n", ""}));
    EXPECT_THAT(Host().calls, ElementsAre("OVSSetDefault"));
}

TEST_F(Vornovsctl, ResetFailsWhenAClientIsLeft)
{
    PutOnTheSwitch({"lab"});

    EXPECT_EQ(Ctl({"reset", "--yes"}),
              (Outcome{1, "",
                       "vornovsctl: the registrations could not be removed: see the system "
                       "log.\n"}));
}

TEST_F(Vornovsctl, ResetWantsToBeMeant)
{
    EXPECT_EQ(Ctl({"reset"}), WrongUsage("reset forgets every client: say --yes if that is meant"));
    EXPECT_THAT(Host().calls, ElementsAre());
}

TEST_F(Vornovsctl, IsForRootOnly)
{
    Host().user = 1000;
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

TEST_F(Vornovsctl, RefusesNamesThatCanBeNone)
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

TEST_F(Vornovsctl, TakesAnyOtherName)
{
    Host().act = Convert;
    for (const std::string& name : {std::string("a b"), std::string("caf\xc3\xa9"),
                                    std::string(255, 'a'), std::string("a-b=c")}) {
        Host().calls.clear();
        (void)Ctl({"register", name});
        EXPECT_THAT(Host().calls, ElementsAre("Register " + name));
    }
}

TEST_F(Vornovsctl, RefusesBondModesThatCanBeNone)
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

TEST_F(Vornovsctl, UnregisterPassesLinuxBondModesOn)
{
    PutOnTheSwitch({"lab"});
    Host().act = ConvertBack;

    EXPECT_EQ(Ctl({"unregister", "lab", "--bond-mode", "bond0=active-backup"}).exitStatus, 0);
    EXPECT_THAT(Host().calls, ElementsAre("UnRegister lab bond0=active-backup"));
}

TEST_F(Vornovsctl, RefusesAWrongCommandLine)
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

TEST_F(Vornovsctl, TeachesItsUse)
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
