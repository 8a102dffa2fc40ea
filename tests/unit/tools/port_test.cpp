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

constexpr char kNobody[] =
    "no client is registered, so nothing was done: 'vornovsctl register' first.";
constexpr char kRefused[] = "the switch refused, or another program held the configuration lock: "
                            "see the system log. Nothing was changed.";
constexpr char kNoAnswer[] = "the switch does not answer, so nothing may have been done: see the "
                             "system log and 'vornovsctl status'.";

int PlugIn(FakeHost& host)
{
    (*host.ports)["ovs_eth0"].insert("tap0");
    return 1;
}

int PullOut(FakeHost& host)
{
    (*host.ports)["ovs_eth0"].erase("tap0");
    return 1;
}

class Port : public unit::OnAHost {
protected:
    Port()
    {
        PutOnTheSwitch({"lab"});
        Host().devices.insert("tap0");
    }
};

TEST_F(Port, AttachPlugsAPortIn)
{
    Host().act = PlugIn;

    EXPECT_EQ(Ctl({"port", "attach", "ovs_eth0", "tap0"}),
              Done("'tap0' is a port of 'ovs_eth0'.\n"));
    EXPECT_THAT(Host().calls, ElementsAre("AttachPort ovs_eth0 tap0"));
}

TEST_F(Port, AttachPrintsJson)
{
    Host().act = PlugIn;

    EXPECT_EQ(Ctl({"port", "attach", "ovs_eth0", "tap0", "--json"}), Done(R"({
  "command": "port attach",
  "exitStatus": 0,
  "bridge": "ovs_eth0",
  "port": "tap0",
  "attached": true,
  "device": true,
  "error": null
}
)"));
}

TEST_F(Port, AttachTellsWhenThereIsNoSuchInterfaceYet)
{
    Host().devices.erase("tap0");
    Host().act = PlugIn;

    EXPECT_EQ(Ctl({"port", "attach", "ovs_eth0", "tap0"}),
              Done("'tap0' is a port of 'ovs_eth0'.\nThere is no such interface yet; it begins to "
                   "work when there is one.\n"));
}

TEST_F(Port, AttachHasNothingToDoForAPortOfTheBridge)
{
    PlugIn(Host());

    EXPECT_EQ(Ctl({"port", "attach", "ovs_eth0", "tap0"}),
              Failed(5, "'tap0' is a port of 'ovs_eth0' already; nothing was changed."));
    EXPECT_EQ(Ctl({"port", "attach", "ovs_eth1", "tap0"}),
              Failed(1, "'tap0' is a port of 'ovs_eth0' already; nothing was changed."));
    EXPECT_THAT(Host().calls, ElementsAre());
}

TEST_F(Port, AttachTellsThatNobodyIsRegistered)
{
    Host().ports.reset();
    Host().act = [](FakeHost&) { return 0; };

    EXPECT_EQ(Ctl({"port", "attach", "ovs_eth0", "tap0"}), Failed(1, kNobody));
}

TEST_F(Port, AttachFailsWhenTheSwitchRefuses)
{
    Host().act = [](FakeHost&) { return -1; };

    EXPECT_EQ(Ctl({"port", "attach", "ovs_eth0", "tap0"}), Failed(1, kRefused));
}

TEST_F(Port, AttachDoesNotBelieveASuccessThatTheSwitchDoesNotShow)
{
    Host().act = [](FakeHost&) { return 1; };
    EXPECT_EQ(Ctl({"port", "attach", "ovs_eth0", "tap0"}),
              Failed(1, "the switch did not follow: 'tap0' is not a port of 'ovs_eth0'. The system "
                        "log tells why."));

    Host().ports.reset();
    EXPECT_EQ(Ctl({"port", "attach", "ovs_eth0", "tap0"}), Failed(1, kNoAnswer));
    EXPECT_EQ(Ctl({"port", "attach", "ovs_eth0", "tap0", "--json"}).output, R"({
  "command": "port attach",
  "exitStatus": 1,
  "bridge": "ovs_eth0",
  "port": "tap0",
  "attached": null,
  "device": true,
  "error": "the switch does not answer, so nothing may have been done: see the system log and 'vornovsctl status'."
}
)");
}

TEST_F(Port, DetachPullsAPort)
{
    PlugIn(Host());
    Host().act = PullOut;

    EXPECT_EQ(Ctl({"port", "detach", "ovs_eth0", "tap0"}),
              Done("'tap0' is no port of 'ovs_eth0' any more.\n"));
    EXPECT_THAT(Host().calls, ElementsAre("DetachPort ovs_eth0 tap0"));
}

TEST_F(Port, DetachNeverTakesTheWire)
{
    EXPECT_EQ(Ctl({"port", "detach", "ovs_eth0", "eth0"}),
              Failed(1, "'ovs_eth0' reaches the wire through 'eth0'; nothing was changed. "
                        "'vornovsctl interface remove ovs_eth0' takes the interface off the "
                        "switch."));
    EXPECT_THAT(Host().calls, ElementsAre());
}

TEST_F(Port, DetachHasNothingToDoForWhatIsNoPortOfTheBridge)
{
    EXPECT_EQ(Ctl({"port", "detach", "ovs_eth0", "tap0"}),
              Failed(5, "'tap0' is no port of the switch; nothing was changed."));
    PlugIn(Host());
    EXPECT_EQ(Ctl({"port", "detach", "ovs_eth1", "tap0"}),
              Failed(1, "'tap0' is a port of 'ovs_eth0'; nothing was changed."));
    EXPECT_THAT(Host().calls, ElementsAre());
}

TEST_F(Port, DetachTellsWhyItFailed)
{
    PlugIn(Host());
    Host().act = [](FakeHost&) { return 0; };
    EXPECT_EQ(Ctl({"port", "detach", "ovs_eth0", "tap0"}), Failed(1, kNobody));
    Host().act = [](FakeHost&) { return -1; };
    EXPECT_EQ(Ctl({"port", "detach", "ovs_eth0", "tap0"}), Failed(1, kRefused));
    Host().act = [](FakeHost&) { return 1; };
    EXPECT_EQ(Ctl({"port", "detach", "ovs_eth0", "tap0"}),
              Failed(1, "the switch did not follow: 'tap0' is still a port of 'ovs_eth0'. The "
                        "system log tells why."));
    Host().ports.reset();
    EXPECT_EQ(Ctl({"port", "detach", "ovs_eth0", "tap0"}), Failed(1, kNoAnswer));
}

TEST_F(Port, RefusesNamesThatCanBeNone)
{
    EXPECT_EQ(Ctl({"port", "attach", "ovs:eth0", "tap0"}),
              WrongUsage("the bridge's name holds a blank or a colon"));
    EXPECT_EQ(Ctl({"port", "attach", "ovs_eth0", "tap/0"}),
              WrongUsage("the port's name holds a slash"));
    EXPECT_THAT(Host().calls, ElementsAre());
}

} // namespace
