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
using unit::WrongUsage;

constexpr char kAdvice[] = "\nSee the system log for the reason, and run '/etc/rc.network start' "
                           "to bring the network up as its files have it.";

class Interface : public unit::OnAHost {
protected:
    /** eth1 was taken off the switch. */
    static void TakeOffEth1()
    {
        PutOnTheSwitch({"lab"});
        Host().devices.erase("ovs_eth1");
        WriteTakenOff("eth1\n");
    }

    static int LoseEth1(FakeHost& host)
    {
        host.devices.erase("ovs_eth1");
        WriteTakenOff("eth1\n");
        return 0;
    }
};

TEST_F(Interface, ListTellsEveryBridge)
{
    PutOnTheSwitch({"lab"});
    Host().bridges->insert("br-vms");

    EXPECT_EQ(Ctl({"interface", "list"}), Done("br-vms\novs_eth0\novs_eth1\n"));
    Host().bridges->erase("ovs_eth1");
    EXPECT_EQ(Ctl({"interface", "list", "--json"}), Done(R"({
  "command": "interface list",
  "exitStatus": 0,
  "clients": [
    "lab"
  ],
  "bridges": [
    {
      "name": "br-vms",
      "interface": null
    },
    {
      "name": "ovs_eth0",
      "interface": "eth0"
    }
  ],
  "error": null
}
)"));
}

TEST_F(Interface, ListTellsThatNobodyIsRegistered)
{
    Host().bridges = {"br-vms"};

    EXPECT_EQ(Ctl({"interface", "list"}),
              Done("No client is registered, so nothing is on the switch.\n"));
}

TEST_F(Interface, ListDoesNotTakeAnEmptyListForAnAnswer)
{
    PutOnTheSwitch({"lab"});
    Host().bridges->clear();

    EXPECT_EQ(Ctl({"interface", "list"}),
              Failed(4, "clients are registered, but the switch lists no bridge: run "
                        "'/etc/rc.network start', then see 'vornovsctl status'."));
}

TEST_F(Interface, ListFailsWhenTheSwitchCannotBeRead)
{
    PutOnTheSwitch({"lab"});
    Host().bridges.reset();

    EXPECT_EQ(Ctl({"interface", "list"}),
              Failed(1, "the registrations or the switch cannot be read: see the system log."));
    EXPECT_EQ(Ctl({"interface", "list", "--json"}), (unit::Outcome{1, R"({
  "command": "interface list",
  "exitStatus": 1,
  "clients": [
    "lab"
  ],
  "bridges": null,
  "error": "the registrations or the switch cannot be read: see the system log."
}
)",
                                                                   ""}));
}

TEST_F(Interface, AddPutsAnInterfaceBack)
{
    TakeOffEth1();
    Host().act = [](FakeHost& host) {
        host.devices.insert("ovs_eth1");
        return 0;
    };

    EXPECT_EQ(Ctl({"interface", "add", "eth1"}),
              Done("'eth1' is on the switch, with bridge 'ovs_eth1'.\n"));
    EXPECT_THAT(Host().calls, ElementsAre("AddInterface eth1"));
    EXPECT_FALSE(Host().interruptible);
}

TEST_F(Interface, AddPrintsJson)
{
    TakeOffEth1();
    Host().act = [](FakeHost& host) {
        host.devices.insert("ovs_eth1");
        return 0;
    };

    EXPECT_EQ(Ctl({"interface", "add", "eth1", "--json"}), Done(R"({
  "command": "interface add",
  "exitStatus": 0,
  "interface": "eth1",
  "bridge": "ovs_eth1",
  "onTheSwitch": true,
  "error": null
}
)"));
}

TEST_F(Interface, AddTellsWhenItIsNotOnTheSwitchAfterwards)
{
    TakeOffEth1();

    EXPECT_EQ(Ctl({"interface", "add", "eth1"}),
              Failed(4, std::string("'eth1' was stopped, but its bridge is not there.") + kAdvice));
    Host().act = [](FakeHost&) { return -1; };
    EXPECT_EQ(Ctl({"interface", "add", "eth1"}),
              Failed(4, std::string("'eth1' was stopped, but could not be put on the switch.") +
                            kAdvice));
}

TEST_F(Interface, AddDoesNotBeginWhatCannotEnd)
{
    PutOnTheSwitch({"lab"});
    EXPECT_EQ(Ctl({"interface", "add", "eth1"}),
              Failed(5, "'eth1' is on the switch already; nothing was changed."));
    EXPECT_EQ(Ctl({"interface", "add", "eth7"}), Failed(1, "there is no interface 'eth7'."));

    Host().devices.insert("eth7");
    EXPECT_EQ(Ctl({"interface", "add", "eth7"}),
              Failed(1, "'eth7' was not taken off the switch with 'interface remove', so it cannot "
                        "be put back; nothing was changed."));

    Host().clients->clear();
    EXPECT_EQ(Ctl({"interface", "add", "eth7"}),
              Failed(1, "no client is registered, so nothing can be on the switch: 'vornovsctl "
                        "register' puts every interface there."));
    EXPECT_THAT(Host().calls, ElementsAre());
}

TEST_F(Interface, RemoveTakesAnInterfaceOffByItsNameOrItsBridges)
{
    for (const char* const name : {"eth1", "ovs_eth1"}) {
        Host() = FakeHost();
        WriteTakenOff("");
        PutOnTheSwitch({"lab"});
        Host().act = LoseEth1;
        EXPECT_EQ(Ctl({"interface", "remove", name}),
                  Done("'ovs_eth1' is gone from the switch. Plain interfaces now: eth1.\nPut it "
                       "back with: vornovsctl interface add eth1\n"));
        EXPECT_THAT(Host().calls, ElementsAre("RemoveInterface ovs_eth1"));
    }
    EXPECT_FALSE(Host().interruptible);
}

TEST_F(Interface, RemoveTellsEachInterfaceOfABond)
{
    PutOnTheSwitch({"lab"});
    WriteTakenOff("eth7\n");
    Host().devices = {"eth0", "eth1", "ovs_bond0"};
    Host().act = [](FakeHost& host) {
        host.devices.erase("ovs_bond0");
        WriteTakenOff("eth0\neth1\neth7\n");
        return 0;
    };

    EXPECT_EQ(Ctl({"interface", "remove", "ovs_bond0", "--json"}), Done(R"({
  "command": "interface remove",
  "exitStatus": 0,
  "interface": "bond0",
  "bridge": "ovs_bond0",
  "onTheSwitch": false,
  "takenOff": [
    "eth0",
    "eth1"
  ],
  "error": null
}
)"));
}

TEST_F(Interface, RemoveTakesOffWhatIsOnTheSwitchByItsFilesOnly)
{
    PutOnTheSwitch({"lab"});
    Host().devices.erase("ovs_eth1");
    Host().act = LoseEth1;

    EXPECT_EQ(Ctl({"interface", "remove", "eth1"}).exitStatus, 0);
}

TEST_F(Interface, RemoveDoesNotTakeASuccessWithoutAnyEffectForOne)
{
    TakeOffEth1();

    EXPECT_EQ(Ctl({"interface", "remove", "eth1"}),
              Failed(5, "'eth1' is not on the switch; nothing was changed."));
}

TEST_F(Interface, RemoveForgetsAnEarlierRemovalThatWouldStandInItsWay)
{
    PutOnTheSwitch({"lab"});
    WriteTakenOff("eth0\neth1\n");
    Host().act = LoseEth1;

    EXPECT_EQ(Ctl({"interface", "remove", "eth1"}).exitStatus, 0);
    EXPECT_THAT(Host().calls, ElementsAre("OVSIfsConf::Remove eth1", "RemoveInterface ovs_eth1"));
}

TEST_F(Interface, RemoveTellsWhenTheBridgeIsStillThere)
{
    PutOnTheSwitch({"lab"});

    EXPECT_EQ(Ctl({"interface", "remove", "eth1"}),
              Failed(4, std::string("'ovs_eth1' is still there: it carries neither an interface "
                                    "nor a bond, or the network did not follow.") +
                            kAdvice));
}

TEST_F(Interface, RemoveTellsWhatAFailureMayHaveLeft)
{
    const std::string message = std::string("'eth1' could not be taken off the switch, or not as a "
                                            "whole; its network may be stopped.") +
                                kAdvice;
    PutOnTheSwitch({"lab"});
    Host().act = [](FakeHost&) { return -1; };
    EXPECT_EQ(Ctl({"interface", "remove", "eth1"}), Failed(4, message));

    Host().act = [](FakeHost& host) {
        LoseEth1(host);
        return -1;
    };
    EXPECT_EQ(Ctl({"interface", "remove", "eth1"}), Failed(4, message));
}

TEST_F(Interface, RemoveHasNothingToDoForAPlainInterface)
{
    TakeOffEth1();
    Host().act = [](FakeHost&) { return -1; };
    EXPECT_EQ(Ctl({"interface", "remove", "eth1"}),
              Failed(5, "'eth1' is not on the switch; nothing was changed."));

    EXPECT_EQ(Ctl({"interface", "remove", "eth7"}),
              Failed(1, "there is neither an interface 'eth7' nor a bridge 'ovs_eth7'; nothing was "
                        "changed."));
}

TEST_F(Interface, RefusesNamesThatCanBeNone)
{
    EXPECT_EQ(Ctl({"interface", "add", "twelve-bytes"}),
              WrongUsage("the interface's name is longer than 11 characters, which leaves no room "
                         "for its bridge's"));
    EXPECT_EQ(Ctl({"interface", "remove", "sixteen-letters!"}),
              WrongUsage("the interface's name is longer than 15 characters"));
    EXPECT_EQ(Ctl({"interface", "remove", "a/b"}),
              WrongUsage("the interface's name holds a slash"));
    EXPECT_EQ(Ctl({"interface", "remove", "a b"}),
              WrongUsage("the interface's name holds a blank or a colon"));
    EXPECT_EQ(Ctl({"interface", "remove", ".."}),
              WrongUsage("the interface's name cannot be one of an interface"));
    EXPECT_EQ(Ctl({"interface", "remove", "--", "-a"}),
              WrongUsage("the interface's name begins with '-'"));
    EXPECT_EQ(Ctl({"interface", "remove", ""}), WrongUsage("the interface's name is empty"));
    EXPECT_THAT(Host().calls, ElementsAre());
}

} // namespace
