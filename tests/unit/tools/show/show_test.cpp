#include "ctl.h"

#include <filesystem>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

namespace {

using testing::ElementsAre;
using unit::Ctl;
using unit::Host;
using unit::Outcome;

class Show : public unit::OnAHost {
protected:
    Show()
    {
        vornhost::Link link;
        link.index = 1;
        link.name = "eth7"; // one that this machine is sure not to have a speed of
        link.mac = "52:54:00:00:00:07";
        link.mtu = 1500;
        Host().links = {link};
    }

    static std::string HostName()
    {
        char name[256] = {};
        EXPECT_EQ(gethostname(name, sizeof(name) - 1), 0);
        return name;
    }
};

TEST_F(Show, DrawsAHostWhoseSwitchDoesNotRunAndStartsNothing)
{
    EXPECT_EQ(Ctl({"show"}), unit::Done(HostName() + "\n"
                                                     "|- clients: none\n"
                                                     "|- switch: not running\n"
                                                     "`- interface eth7 down 52:54:00:00:00:07\n"));
    EXPECT_THAT(Host().calls, ElementsAre());
}

TEST_F(Show, DrawsBridgesAndWhatWasTakenOff)
{
    PutOnTheSwitch({"lab"});
    Host().ports = {{"ovs_eth0", {"eth0", "ovs_eth0"}}};
    WriteTakenOff("eth7\n\n");

    EXPECT_EQ(Ctl({"show"}),
              unit::Done(HostName() + "\n"
                                      "|- clients: lab\n"
                                      "|- switch: running\n"
                                      "|  `- bridge ovs_eth0 no device\n"
                                      "|     `- port eth0 up\n"
                                      "`- interface eth7 down 52:54:00:00:00:07 taken off the "
                                      "switch\n"));
}

TEST_F(Show, DrawsWhatItCanAndTellsWhatItCouldNotRead)
{
    PutOnTheSwitch({"lab"});
    Host().clients.reset();
    Host().ports.reset();
    Host().addresses.reset();
    Host().routes.reset();
    std::filesystem::create_directories("/usr/vorn/etc/vornovs/ovs_ignore.conf");

    EXPECT_EQ(Ctl({"show"}),
              (Outcome{1,
                       HostName() + "\n"
                                    "|- clients: not known\n"
                                    "|- switch: running, but what is on it is not known\n"
                                    "`- interface eth7 down 52:54:00:00:00:07\n",
                       "vornovsctl: the registrations cannot be read.\n"
                       "the list of interfaces taken off the switch cannot be read.\n"
                       "the kernel does not tell the addresses.\n"
                       "the kernel does not tell the routes.\n"
                       "the switch's database does not answer.\n"}));
}

TEST_F(Show, IsForAnyone)
{
    unit::PlayUser(1000);

    EXPECT_EQ(Ctl({"show"}).exitStatus, 0);
}

TEST_F(Show, PrintsJsonByTwoNames)
{
    Host().ports.reset();
    Host().switchRuns = true;
    const std::string json = "{\n"
                             "  \"command\": \"show\",\n"
                             "  \"exitStatus\": 1,\n"
                             "  \"host\": \"" +
                             HostName() + R"(",
  "clients": [],
  "takenOff": [],
  "switchRunning": true,
  "bridges": null,
  "devices": [
    {
      "name": "eth7",
      "kind": null,
      "mac": "52:54:00:00:00:07",
      "mtu": 1500,
      "up": false,
      "carrier": false,
      "speed": null,
      "addresses": [],
      "defaultRoutes": [],
      "master": null,
      "parent": null,
      "vlan": null,
      "bond": null,
      "onTheSwitch": false
    }
  ],
  "unread": [
    "the switch's database does not answer"
  ],
  "error": "the switch's database does not answer."
}
)";
    EXPECT_EQ(Ctl({"show", "--json"}), (Outcome{1, json, ""}));
    EXPECT_EQ(Ctl({"show", "--format", "json"}), (Outcome{1, json, ""}));
}

TEST_F(Show, PrintsAGraph)
{
    EXPECT_THAT(Ctl({"show", "--format", "dot"}).output,
                testing::AllOf(testing::StartsWith("graph host {\n"),
                               testing::HasSubstr("\"device eth7\" [label=\"interface eth7")));
}

} // namespace
