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

constexpr char kRefused[] = "the switch refused, or does not answer: see the system log. ";

class Vlan : public unit::OnAHost {
protected:
    Vlan()
    {
        PutOnTheSwitch({"lab"});
        Host().tags = {{"ovs_eth0", 0}, {"tap0", 20}};
    }

    static int Fail(FakeHost& /*host*/) { return -1; }

    static int SetLive(FakeHost& host)
    {
        host.tags["ovs_eth0"] = 10;
        return 0;
    }
    static int ClearLive(FakeHost& host)
    {
        host.tags["ovs_eth0"] = 0;
        return 0;
    }
    static void Record() { WriteInterfaceFile("ovs_eth0", "DEVICE=ovs_eth0\nOVS_VLAN_ID=10\n"); }
    static void Forget() { WriteInterfaceFile("ovs_eth0", "DEVICE=ovs_eth0\n"); }
};

TEST_F(Vlan, GetTellsTheTag)
{
    EXPECT_EQ(Ctl({"vlan", "get", "tap0"}), Done("'tap0' has VLAN tag 20.\n"));
    EXPECT_EQ(Ctl({"vlan", "get", "ovs_eth0"}), Done("'ovs_eth0' has no VLAN tag.\n"));
    EXPECT_EQ(Ctl({"vlan", "get", "eth7"}),
              Failed(1, "'eth7' is no port of the switch, or the switch does not answer. The "
                        "system log tells which."));
}

TEST_F(Vlan, GetPrintsJson)
{
    Record();
    EXPECT_EQ(Ctl({"vlan", "get", "tap0", "--json"}), Done(R"({
  "command": "vlan get",
  "exitStatus": 0,
  "port": "tap0",
  "tagged": true,
  "vlan": 20,
  "recorded": null,
  "error": null
}
)"));
    EXPECT_EQ(Ctl({"vlan", "get", "ovs_eth0", "--json"}), Done(R"({
  "command": "vlan get",
  "exitStatus": 0,
  "port": "ovs_eth0",
  "tagged": false,
  "vlan": null,
  "recorded": "10",
  "error": null
}
)"));
    EXPECT_EQ(Ctl({"vlan", "get", "eth7", "--json"}), (Outcome{1, R"({
  "command": "vlan get",
  "exitStatus": 1,
  "port": "eth7",
  "tagged": null,
  "vlan": null,
  "recorded": null,
  "error": "'eth7' is no port of the switch, or the switch does not answer. The system log tells which."
}
)",
                                                               ""}));
}

TEST_F(Vlan, SetTagsTheLivePort)
{
    Host().act = SetLive;

    EXPECT_EQ(Ctl({"vlan", "set", "ovs_eth0", "10"}),
              Done("'ovs_eth0' has VLAN tag 10 until the network is started again; 'vlan create' "
                   "would record it.\n"));
    EXPECT_THAT(Host().calls, ElementsAre("OVSVlanSet ovs_eth0 10"));
}

TEST_F(Vlan, SetFailsWhenTheSwitchHasAnotherTag)
{
    const std::string message = std::string(kRefused) + "'tap0' has VLAN tag 20.";
    EXPECT_EQ(Ctl({"vlan", "set", "tap0", "10"}), Failed(1, message));
    Host().act = Fail;
    EXPECT_EQ(Ctl({"vlan", "set", "tap0", "10"}), Failed(1, message));
    EXPECT_EQ(Ctl({"vlan", "set", "eth7", "10"}),
              Failed(1, std::string(kRefused) + "'eth7' cannot be read."));
}

TEST_F(Vlan, ClearUntagsTheLivePort)
{
    Host().tags["ovs_eth0"] = 10;
    Host().act = ClearLive;

    EXPECT_EQ(Ctl({"vlan", "clear", "ovs_eth0"}), Done("'ovs_eth0' has no VLAN tag.\n"));
    Record();
    EXPECT_EQ(Ctl({"vlan", "clear", "ovs_eth0"}),
              Done("'ovs_eth0' has no VLAN tag until the network is started again, since its file "
                   "records 10; 'vlan remove' would forget it.\n"));
    EXPECT_THAT(Host().calls, ElementsAre("OVSVlanClear ovs_eth0", "OVSVlanClear ovs_eth0"));
}

TEST_F(Vlan, ClearFailsWhenTheTagStays)
{
    const std::string message = std::string(kRefused) + "'tap0' has VLAN tag 20.";
    EXPECT_EQ(Ctl({"vlan", "clear", "tap0"}), Failed(1, message));
    Host().act = Fail;
    EXPECT_EQ(Ctl({"vlan", "clear", "tap0"}), Failed(1, message));
}

TEST_F(Vlan, CreateSetsAndRecordsATag)
{
    Host().act = [](FakeHost& host) {
        Record();
        return SetLive(host);
    };

    EXPECT_EQ(Ctl({"vlan", "create", "ovs_eth0", "10"}),
              Done("'ovs_eth0' has VLAN tag 10, and its file records it.\n"));
    EXPECT_THAT(Host().calls, ElementsAre("OVSVlanCreate ovs_eth0 10"));
}

TEST_F(Vlan, CreateMakesNoFileForWhatIsNoPort)
{
    EXPECT_EQ(Ctl({"vlan", "create", "eth7", "10"}),
              Failed(1, "'eth7' is no port of the switch, or the switch does not answer; nothing "
                        "was changed. The system log tells which."));
    EXPECT_THAT(Host().calls, ElementsAre());
}

TEST_F(Vlan, CreateTellsWhichHalfIsMissing)
{
    Host().act = [](FakeHost&) {
        Record();
        return 0;
    };
    EXPECT_EQ(Ctl({"vlan", "create", "ovs_eth0", "10"}),
              Failed(4, "the configuration file of 'ovs_eth0' says so now, but the switch did not "
                        "follow: see the system log, then run '/etc/rc.network start'."));

    Forget();
    Host().act = SetLive;
    EXPECT_EQ(Ctl({"vlan", "create", "ovs_eth0", "10"}),
              Failed(4, "the configuration file of 'ovs_eth0' could not be changed: see the system "
                        "log. 'ovs_eth0' has VLAN tag 10 until the network is started again."));

    Host().act = [](FakeHost& host) {
        host.tags.clear();
        return 0;
    };
    EXPECT_EQ(Ctl({"vlan", "create", "ovs_eth0", "10"}),
              Failed(4, "the configuration file of 'ovs_eth0' could not be changed: see the system "
                        "log. 'ovs_eth0' cannot be read."));
}

TEST_F(Vlan, CreateFailsWhileTheFilesAreLocked)
{
    Host().act = Fail;

    EXPECT_EQ(Ctl({"vlan", "create", "ovs_eth0", "10"}),
              Failed(1, "another program is editing the configuration files; nothing was changed: "
                        "try again."));
}

TEST_F(Vlan, RemoveClearsAndForgetsATag)
{
    Record();
    Host().tags["ovs_eth0"] = 10;
    Host().act = [](FakeHost& host) {
        Forget();
        return ClearLive(host);
    };

    EXPECT_EQ(Ctl({"vlan", "remove", "ovs_eth0"}),
              Done("'ovs_eth0' has no VLAN tag, and its file records none.\n"));
    EXPECT_THAT(Host().calls, ElementsAre("OVSVlanRemove ovs_eth0"));
    EXPECT_EQ(Ctl({"vlan", "remove", "ovs_eth0"}),
              Failed(5, "'ovs_eth0' has no VLAN tag; nothing was changed."));
    EXPECT_EQ(Ctl({"vlan", "remove", "eth7"}).exitStatus, 1);
    EXPECT_EQ(Host().calls.size(), 1U);
}

TEST_F(Vlan, RemoveTellsWhichHalfIsMissing)
{
    Record();
    EXPECT_EQ(Ctl({"vlan", "remove", "ovs_eth0"}),
              Failed(4, "the configuration file of 'ovs_eth0' could not be changed: see the system "
                        "log. 'ovs_eth0' has no VLAN tag until the network is started again."));

    Host().tags["ovs_eth0"] = 10;
    Host().act = [](FakeHost&) {
        Forget();
        return 0;
    };
    EXPECT_EQ(Ctl({"vlan", "remove", "ovs_eth0"}),
              Failed(4, "the configuration file of 'ovs_eth0' says so now, but the switch did not "
                        "follow: see the system log, then run '/etc/rc.network start'."));
}

TEST_F(Vlan, RemoveForgetsTheTagOfAPortThatIsNotLive)
{
    Record();
    Host().tags.clear();
    Host().act = [](FakeHost&) {
        Forget();
        return 0;
    };

    EXPECT_EQ(Ctl({"vlan", "remove", "ovs_eth0"}).exitStatus, 4);
    EXPECT_THAT(Host().calls, ElementsAre("OVSVlanRemove ovs_eth0"));
}

TEST_F(Vlan, RefusesIdsThatCanBeNone)
{
    for (const std::string id : {"", "4095", "10000", "1O", "+1", " 1", "010", "0x1"}) {
        EXPECT_EQ(Ctl({"vlan", "set", "tap0", id}),
                  WrongUsage("the VLAN id '" + id + "' is no number from 1 to 4094"));
        EXPECT_EQ(Ctl({"vlan", "create", "tap0", id}).exitStatus, 2) << id;
    }
    EXPECT_EQ(Ctl({"vlan", "set", "tap0", "0"}),
              WrongUsage("the VLAN id '0' is no number from 1 to 4094; 'vlan clear' and 'vlan "
                         "remove' take a tag away"));
    EXPECT_THAT(Host().calls, ElementsAre());
    for (const std::string id : {"1", "4094"}) {
        (void)Ctl({"vlan", "set", "tap0", id});
    }
    EXPECT_THAT(Host().calls, ElementsAre("OVSVlanSet tap0 1", "OVSVlanSet tap0 4094"));
}

} // namespace
