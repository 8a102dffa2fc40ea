#include "ctl.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using testing::ElementsAre;
using unit::Ctl;
using unit::Done;
using unit::Failed;
using unit::FakeHost;
using unit::Host;
using unit::Outcome;
using unit::WrongUsage;

constexpr char kNobody[] = "no client is registered, so there are no bonds on the switch: "
                           "'vornovsctl register' first.";
constexpr char kNotRead[] = "'ovs_bond0' is no bond that can be read, or another program held the "
                            "configuration lock: see the system log.";
constexpr char kAdvice[] = "See the system log for the reason, and run '/etc/rc.network start' to "
                           "bring the network up as its files have it.";
constexpr char kBuilding[] = "Building 'ovs_bond0' takes some seconds.\n";
constexpr char kRemoving[] = "Taking 'ovs_bond0' apart takes some seconds.\n";

Outcome FailedAfter(const std::string& output, int exitStatus, const std::string& message)
{
    return {exitStatus, output, "vornovsctl: " + message + '\n'};
}

int Build(FakeHost& host)
{
    host.devices.erase("ovs_eth0");
    host.devices.erase("ovs_eth1");
    host.devices.insert("ovs_bond0");
    host.bonds["ovs_bond0"] = {VORN_LINK_AGGR_OVS_BALANCE_TCP, {"eth1", "eth0"}};
    return 0;
}

int TakeApart(FakeHost& host)
{
    host.devices.erase("ovs_bond0");
    host.devices.insert({"ovs_eth0", "ovs_eth1"});
    host.bonds.clear();
    return 0;
}

class Bond : public unit::OnAHost {
protected:
    Bond() { PutOnTheSwitch({"lab"}); }
};

const std::vector<std::string> kCreate{"bond", "create", "ovs_bond0", "ovs-balance-tcp",
                                       "eth1", "eth0"};

TEST_F(Bond, CreateBuildsABond)
{
    Host().act = Build;

    EXPECT_EQ(Ctl(kCreate),
              Done(std::string(kBuilding) + "'ovs_bond0' is ovs-balance-tcp of eth1, eth0.\n"));
    EXPECT_THAT(Host().calls, ElementsAre("OVSBondCreate 8 ovs_bond0 eth1 eth0"));
    EXPECT_FALSE(Host().interruptible);
}

TEST_F(Bond, CreatePrintsJsonAlone)
{
    Host().act = Build;
    std::vector<std::string> words = kCreate;
    words.emplace_back("--json");

    EXPECT_EQ(Ctl(words), Done(R"({
  "command": "bond create",
  "exitStatus": 0,
  "bond": "ovs_bond0",
  "mode": "ovs-balance-tcp",
  "modeNumber": 8,
  "slaves": [
    "eth1",
    "eth0"
  ],
  "error": null
}
)"));
}

TEST_F(Bond, CreateDoesNotBeginWhatWillBeRefused)
{
    Host().devices.insert("ovs_bond0");
    EXPECT_EQ(Ctl(kCreate), Failed(1, "there is an interface 'ovs_bond0' already; 'vornovsctl bond "
                                      "free-name' tells a free name. Nothing was changed."));

    Host().devices = {"eth0", "eth1", "ovs_eth1"};
    EXPECT_EQ(Ctl(kCreate), Failed(1, "'eth0' is not on the switch: it has no bridge 'ovs_eth0'. "
                                      "Nothing was changed."));

    Host().clients->clear();
    EXPECT_EQ(Ctl(kCreate), Failed(1, kNobody));
    EXPECT_THAT(Host().calls, ElementsAre());
}

TEST_F(Bond, CreateFailsWhenTheLibraryRefuses)
{
    Host().act = [](FakeHost&) { return -1; };

    EXPECT_EQ(Ctl(kCreate), FailedAfter(kBuilding, 1,
                                        "'ovs_bond0' was refused, or another program held the "
                                        "configuration lock: see the system log."));
}

TEST_F(Bond, CreateTellsWhenTheBondIsNotThereAfterwards)
{
    const std::string message = std::string("'ovs_bond0' is not there. ") + kAdvice;
    EXPECT_EQ(Ctl(kCreate), FailedAfter(kBuilding, 4, message));

    Host().act = [](FakeHost& host) {
        host.bonds["ovs_bond0"] = {VORN_LINK_AGGR_OVS_BALANCE_TCP, {"eth1", "eth0"}};
        return 0;
    };
    EXPECT_EQ(Ctl(kCreate), FailedAfter(kBuilding, 4, message));
}

TEST_F(Bond, CreateTellsWhenTheBondIsAnotherOne)
{
    Host().act = [](FakeHost& host) {
        Build(host);
        host.bonds["ovs_bond0"].mode = VORN_LINK_AGGR_OVS_ACTIVE_BACKUP;
        return 0;
    };
    EXPECT_EQ(Ctl(kCreate), FailedAfter(kBuilding, 4,
                                        std::string("'ovs_bond0' is not as it was asked for, but "
                                                    "ovs-active-backup of eth1, eth0. ") +
                                            kAdvice));

    TakeApart(Host());
    Host().act = [](FakeHost& host) {
        Build(host);
        host.bonds["ovs_bond0"].slaves = {"eth1"};
        return 0;
    };
    EXPECT_EQ(Ctl(kCreate), FailedAfter(kBuilding, 4,
                                        std::string("'ovs_bond0' is not as it was asked for, but "
                                                    "ovs-balance-tcp of eth1. ") +
                                            kAdvice));
}

TEST_F(Bond, CreateRefusesAWrongCommandLine)
{
    const std::string modes =
        " is none of the switch, which has ovs-active-backup, ovs-balance-slb, ovs-balance-tcp";
    EXPECT_EQ(Ctl({"bond", "create", "b", "active-backup", "eth0", "eth1"}),
              WrongUsage("the mode 'active-backup'" + modes));
    EXPECT_EQ(Ctl({"bond", "create", "b", "fastest", "eth0", "eth1"}),
              WrongUsage("the mode 'fastest'" + modes));
    EXPECT_EQ(Ctl({"bond", "create", "b", "none", "eth0", "eth1"}),
              WrongUsage("the mode 'none'" + modes));
    EXPECT_EQ(Ctl({"bond", "create", "b", "ovs-balance-slb", "eth0"}),
              WrongUsage("the interfaces are fewer than two"));
    EXPECT_EQ(Ctl({"bond", "create", "b", "ovs-balance-slb", "eth0", "eth1", "eth0"}),
              WrongUsage("the interfaces name an interface twice"));
    EXPECT_EQ(Ctl({"bond", "create", "b/0", "ovs-balance-slb", "eth0", "eth1"}),
              WrongUsage("the bond's name holds a slash"));
    EXPECT_EQ(Ctl({"bond", "create", "b", "ovs-balance-slb", "eth0", "e h1"}),
              WrongUsage("the interface's name holds a blank or a colon"));

    std::vector<std::string> many{"bond", "create", "b", "ovs-balance-slb"};
    for (int number = 0; number < 33; ++number) {
        many.push_back("eth" + std::to_string(number));
    }
    EXPECT_EQ(Ctl(many), WrongUsage("the interfaces are more than 32"));
    many.pop_back();
    EXPECT_EQ(Ctl(many).exitStatus, 1) << "32 can be asked for";
    EXPECT_THAT(Host().calls, ElementsAre());
}

TEST_F(Bond, RemoveTakesABondApart)
{
    Build(Host());
    Host().act = TakeApart;

    EXPECT_EQ(Ctl({"bond", "remove", "ovs_bond0"}),
              Done(std::string(kRemoving) + "'ovs_bond0' is gone; it was ovs-balance-tcp of eth1, "
                                            "eth0. Each of them has a bridge of its own again.\n"));
    EXPECT_THAT(Host().calls, ElementsAre("OVSBondRemove ovs_bond0"));
}

TEST_F(Bond, RemoveTellsWhatItLeft)
{
    Build(Host());
    EXPECT_EQ(Ctl({"bond", "remove", "ovs_bond0"}),
              FailedAfter(kRemoving, 4, std::string("'ovs_bond0' is still there. ") + kAdvice));

    Host().act = [](FakeHost& host) {
        TakeApart(host);
        host.devices.erase("ovs_eth1");
        return 0;
    };
    EXPECT_EQ(Ctl({"bond", "remove", "ovs_bond0"}),
              FailedAfter(kRemoving, 4,
                          std::string("'ovs_bond0' is gone, but these bridges are missing: "
                                      "ovs_eth1. ") +
                              kAdvice));
}

TEST_F(Bond, RemoveFailsForWhatIsNoBond)
{
    Host().act = [](FakeHost&) { return -1; };
    EXPECT_EQ(Ctl({"bond", "remove", "ovs_bond0"}), FailedAfter(kRemoving, 1, kNotRead));

    Host().clients->clear();
    EXPECT_EQ(Ctl({"bond", "remove", "ovs_bond0"}), Failed(1, kNobody));
    EXPECT_THAT(Host().calls, ElementsAre("OVSBondRemove ovs_bond0"));
}

TEST_F(Bond, GetTellsTheRecord)
{
    Build(Host());

    EXPECT_EQ(Ctl({"bond", "get", "ovs_bond0"}),
              Done("Bond:    ovs_bond0\nMode:    ovs-balance-tcp\nSlaves:  eth1, eth0\n"));
    Host().bonds["ovs_bond0"] = {static_cast<VORN_LINK_AGGR_MODE>(-1), {}};
    EXPECT_EQ(Ctl({"bond", "get", "ovs_bond0"}),
              Done("Bond:    ovs_bond0\nMode:    unknown mode -1\nSlaves:  none\n"));
    EXPECT_EQ(Ctl({"bond", "get", "ovs_bond0", "--json"}), Done(R"({
  "command": "bond get",
  "exitStatus": 0,
  "bond": "ovs_bond0",
  "mode": null,
  "modeNumber": -1,
  "slaves": [],
  "error": null
}
)"));
}

TEST_F(Bond, GetFailsForWhatIsNoBond)
{
    EXPECT_EQ(Ctl({"bond", "get", "ovs_bond0"}), Failed(1, kNotRead));
    EXPECT_EQ(Ctl({"bond", "get", "ovs_bond0", "--json"}).output,
              R"({
  "command": "bond get",
  "exitStatus": 1,
  "bond": "ovs_bond0",
  "mode": null,
  "modeNumber": null,
  "slaves": null,
  "error": ")" + std::string(kNotRead) +
                  "\"\n}\n");

    Host().clients->clear();
    EXPECT_EQ(Ctl({"bond", "get", "ovs_bond0"}), Failed(1, kNobody));
}

TEST_F(Bond, ModeChangesABond)
{
    Build(Host());
    Host().act = [](FakeHost& host) {
        host.bonds["ovs_bond0"].mode = VORN_LINK_AGGR_OVS_BALANCE_SLB;
        return 0;
    };

    EXPECT_EQ(Ctl({"bond", "mode", "ovs_bond0", "ovs-balance-slb"}),
              Done("'ovs_bond0' is ovs-balance-slb of eth1, eth0.\n"));
    EXPECT_THAT(Host().calls, ElementsAre("OVSBodChMode 7 ovs_bond0"));
}

TEST_F(Bond, ModeTellsWhenTheSwitchDidNotFollow)
{
    Build(Host());

    EXPECT_EQ(Ctl({"bond", "mode", "ovs_bond0", "ovs-balance-slb"}),
              Failed(4, std::string("the mode is in the file of 'ovs_bond0', but the switch did "
                                    "not follow. ") +
                            kAdvice));
    Host().act = [](FakeHost&) { return -1; };
    EXPECT_EQ(Ctl({"bond", "mode", "ovs_bond0", "ovs-balance-slb"}),
              Failed(1, "the mode of 'ovs_bond0' could not be changed, or another program held the "
                        "configuration lock: see the system log."));
}

TEST_F(Bond, ModeIsForBondsOfTheSwitchOnly)
{
    EXPECT_EQ(Ctl({"bond", "mode", "ovs_bond0", "ovs-balance-slb"}), Failed(1, kNotRead));
    Host().bonds["bond0"] = {VORN_LINK_AGGR_8023AD, {"eth0", "eth1"}};
    EXPECT_EQ(Ctl({"bond", "mode", "bond0", "ovs-balance-slb"}),
              Failed(1, "'bond0' is no bond of the switch, but 802.3ad of eth0, eth1; nothing was "
                        "changed."));
    Host().clients->clear();
    EXPECT_EQ(Ctl({"bond", "mode", "ovs_bond0", "ovs-balance-slb"}), Failed(1, kNobody));
    EXPECT_THAT(Host().calls, ElementsAre());
}

TEST_F(Bond, FreeNameTellsTheFirstOne)
{
    unit::PlayUser(1000);
    Host().devices = {"ovs_bond0", "ovs_bond2"};

    EXPECT_EQ(Ctl({"bond", "free-name"}), Done("ovs_bond1\n"));
    EXPECT_EQ(Ctl({"bond", "free-name", "--json"}), Done(R"({
  "command": "bond free-name",
  "exitStatus": 0,
  "name": "ovs_bond1",
  "error": null
}
)"));
}

TEST_F(Bond, FreeNameFailsWhenAllAreInUse)
{
    for (int number = 0; number < 10; ++number) {
        Host().devices.insert("ovs_bond" + std::to_string(number));
    }

    EXPECT_EQ(Ctl({"bond", "free-name"}), Failed(1, "ovs_bond0 to ovs_bond9 are all in use."));
    EXPECT_EQ(Ctl({"bond", "free-name", "--json"}), (Outcome{1, R"({
  "command": "bond free-name",
  "exitStatus": 1,
  "name": null,
  "error": "ovs_bond0 to ovs_bond9 are all in use."
}
)",
                                                             ""}));
}

TEST_F(Bond, FreeNameFailsWhenTheLibraryDoes)
{
    Host().freeNameResult = -1;

    EXPECT_EQ(Ctl({"bond", "free-name"}).exitStatus, 1);
}

TEST_F(Bond, ModesTellsEveryModeAndItsOtherSide)
{
    unit::PlayUser(1000);

    EXPECT_EQ(Ctl({"bond", "modes"}), Done("Linux   balance-rr        becomes ovs-balance-slb\n"
                                           "Linux   802.3ad           becomes ovs-balance-tcp\n"
                                           "Linux   balance-xor       becomes ovs-balance-slb\n"
                                           "Linux   active-backup     becomes ovs-active-backup\n"
                                           "Linux   balance-alb       becomes ovs-balance-slb\n"
                                           "switch  ovs-active-backup becomes active-backup\n"
                                           "switch  ovs-balance-slb   becomes balance-xor\n"
                                           "switch  ovs-balance-tcp   becomes 802.3ad\n"));
    EXPECT_THAT(Ctl({"bond", "modes", "--json"}).output, testing::HasSubstr(R"(
    {
      "name": "802.3ad",
      "number": 2,
      "on": "linux",
      "becomes": "ovs-balance-tcp"
    },)"));
}

} // namespace
