#include "ctl.h"

#include <csignal>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using unit::Ctl;
using unit::Host;
using unit::Outcome;

using Status = unit::OnAHost;

TEST_F(Status, StatusOfAHostThatNeverHadAClientStartsNothing)
{
    EXPECT_EQ(Ctl({"status"}), (Outcome{0,
                                        "Clients:     none\n"
                                        "Switch:      not running\n"
                                        "Interfaces:  not known while the switch does not run\n",
                                        ""}));
    EXPECT_EQ(Ctl({"status", "--json"}), (Outcome{0, R"({
  "command": "status",
  "exitStatus": 0,
  "clients": [],
  "switchRunning": false,
  "interfaces": null,
  "takenOff": [],
  "consistent": true,
  "error": null
}
)",
                                                  ""}));
    EXPECT_THAT(Host().calls, ElementsAre());
}

TEST_F(Status, StatusOfAHostOnTheSwitchTellsClientsAndInterfaces)
{
    PutOnTheSwitch({"vms", "lab"});

    EXPECT_EQ(Ctl({"status"}), (Outcome{0,
                                        "Clients:     lab, vms\n"
                                        "Switch:      running\n"
                                        "Interfaces:  eth0 (ovs_eth0), eth1 (ovs_eth1)\n",
                                        ""}));
    EXPECT_EQ(Ctl({"status", "--json"}), (Outcome{0, R"({
  "command": "status",
  "exitStatus": 0,
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
  "takenOff": [],
  "consistent": true,
  "error": null
}
)",
                                                  ""}));
}

TEST_F(Status, StatusTellsWhenInterfacesHaveNoClient)
{
    PutOnTheSwitch({});

    EXPECT_EQ(
        Ctl({"status"}),
        (Outcome{4,
                 "Clients:     none\n"
                 "Switch:      running\n"
                 "Interfaces:  eth0 (ovs_eth0), eth1 (ovs_eth1)\n",
                 "vornovsctl: no client is registered, but interfaces are on the switch: run\n"
                 "'/etc/rc.network start', then register a client and unregister it again.\n"}));
}

TEST_F(Status, StatusTellsWhenClientsHaveNoInterface)
{
    const std::string remark =
        "vornovsctl: clients are registered, but no interface is known to be on the switch: run\n"
        "'/etc/rc.network start'.\n";
    PutOnTheSwitch({"lab"});
    Host().bridges = {"br-vms"};
    EXPECT_EQ(Ctl({"status"}), (Outcome{4,
                                        "Clients:     lab\n"
                                        "Switch:      running\n"
                                        "Interfaces:  none\n",
                                        remark}));

    Host().bridges.reset();
    EXPECT_EQ(Ctl({"status"}), (Outcome{4,
                                        "Clients:     lab\n"
                                        "Switch:      running\n"
                                        "Interfaces:  cannot be read\n",
                                        remark}));

    Host().switchRuns = false;
    EXPECT_EQ(Ctl({"status"}).exitStatus, 4);
}

TEST_F(Status, StatusFailsWhenTheRegistrationsCannotBeRead)
{
    Host().clients.reset();

    EXPECT_EQ(Ctl({"status"}),
              (Outcome{1,
                       "Clients:     cannot be read\n"
                       "Switch:      not running\n"
                       "Interfaces:  not known while the switch does not run\n",
                       "vornovsctl: the registrations cannot be read: see the system log.\n"}));
    EXPECT_EQ(Ctl({"status", "--json"}).output, R"({
  "command": "status",
  "exitStatus": 1,
  "clients": null,
  "switchRunning": false,
  "interfaces": null,
  "takenOff": [],
  "consistent": false,
  "error": "the registrations cannot be read: see the system log."
}
)");
}

TEST_F(Status, StatusPrintsJsonWhateverBytesAreInAName)
{
    PutOnTheSwitch({"\xff\"x"});

    EXPECT_THAT(Ctl({"status", "--json"}).output, HasSubstr("\"\xef\xbf\xbd\\\"x\""));
}

TEST_F(Status, TellsWhatWasTakenOffTheSwitch)
{
    PutOnTheSwitch({"lab"});
    WriteTakenOff("eth1\neth7\n"); // eth1 has come back since

    EXPECT_EQ(Ctl({"status"}), (Outcome{0,
                                        "Clients:     lab\n"
                                        "Switch:      running\n"
                                        "Interfaces:  eth0 (ovs_eth0), eth1 (ovs_eth1)\n"
                                        "Taken off:   eth7\n",
                                        ""}));
    Host().clients->clear();
    Host().bridges->clear();
    EXPECT_EQ(Ctl({"status"}), (Outcome{0,
                                        "Clients:     none\n"
                                        "Switch:      running\n"
                                        "Interfaces:  none\n",
                                        ""}));
}

TEST_F(Status, IsConsistentWhenEveryInterfaceWasTakenOff)
{
    PutOnTheSwitch({"lab"});
    Host().bridges->clear();
    WriteTakenOff("eth0\neth1\n");

    EXPECT_EQ(Ctl({"status"}), (Outcome{0,
                                        "Clients:     lab\n"
                                        "Switch:      running\n"
                                        "Interfaces:  none\n"
                                        "Taken off:   eth0, eth1\n",
                                        ""}));
    EXPECT_EQ(Ctl({"interface", "list"}),
              unit::Done("Every interface was taken off the switch.\n"));
    EXPECT_EQ(Ctl({"register", "vms"}).exitStatus, 1) << "which the fake does not record";
    Host().clients->insert("vms");
    EXPECT_EQ(Ctl({"register", "vms"}),
              unit::Done("'vms' is registered. Every interface was taken off the switch: eth0, "
                         "eth1.\n"));
}

} // namespace
