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

using System = unit::OnAHost;

TEST_F(System, SwitchStartStartsTheServices)
{
    Host().act = [](FakeHost& host) {
        host.switchRuns = true;
        return 0;
    };

    EXPECT_EQ(Ctl({"switch", "start"}), Done("The switch runs.\n"));
    EXPECT_EQ(Ctl({"switch", "start"}), Failed(5, "the switch runs already."));
    EXPECT_THAT(Host().calls, ElementsAre("StartOVSDaemon"));
}

TEST_F(System, SwitchStartFailsWhenTheServicesDo)
{
    const auto failure = Failed(1, "the switch could not be started: see the system log.");
    EXPECT_EQ(Ctl({"switch", "start"}), failure);
    Host().act = [](FakeHost&) { return -1; };
    EXPECT_EQ(Ctl({"switch", "start"}), failure);
}

TEST_F(System, SwitchStopStopsTheServices)
{
    Host().switchRuns = true;
    Host().act = [](FakeHost& host) {
        host.switchRuns = false;
        return 0;
    };

    EXPECT_EQ(Ctl({"switch", "stop", "--json"}), Done(R"({
  "command": "switch stop",
  "exitStatus": 0,
  "switchRunning": false,
  "error": null
}
)"));
    EXPECT_THAT(Host().calls, ElementsAre("StopOVSBaemon"));
}

TEST_F(System, SwitchStopSparesRegisteredClients)
{
    PutOnTheSwitch({"lab"});
    const auto refusal = Failed(1, "clients are registered, as far as can be told, and would lose "
                                   "the switch: say --yes if that is meant.");
    EXPECT_EQ(Ctl({"switch", "stop"}), refusal);
    Host().clients.reset();
    EXPECT_EQ(Ctl({"switch", "stop"}), refusal);
    EXPECT_THAT(Host().calls, ElementsAre());

    EXPECT_EQ(Ctl({"switch", "stop", "--yes"}),
              Failed(1, "the switch could not be stopped: see the system log."));
    EXPECT_THAT(Host().calls, ElementsAre("StopOVSBaemon"));
}

TEST_F(System, NetworkRunsTheNetworkProgram)
{
    EXPECT_EQ(Ctl({"network", "start", "ovs_eth0", "eth0"}),
              Done("The network is started: ovs_eth0, eth0.\n"));
    EXPECT_EQ(Ctl({"network", "stop"}),
              Done("The network waits to be started again: every interface.\n"));
    EXPECT_THAT(Host().calls, ElementsAre("StartNetwork ovs_eth0 eth0", "StopNetwork"));

    Host().act = [](FakeHost&) { return -1; };
    EXPECT_EQ(Ctl({"network", "start", "eth0"}),
              Failed(1, "'/etc/rc.network' failed for eth0: see the system log."));
    EXPECT_EQ(Ctl({"network", "stop", "--json"}).output, R"({
  "command": "network stop",
  "exitStatus": 1,
  "names": [],
  "error": "'/etc/rc.network' failed for every interface: see the system log."
}
)");
}

TEST_F(System, NetworkTakesAsManyNamesAsTheLibrary)
{
    std::vector<std::string> words{"network", "start"};
    for (int number = 0; number < 124; ++number) {
        words.push_back("eth" + std::to_string(number));
    }
    EXPECT_EQ(Ctl(words).exitStatus, 0);
    words.emplace_back("eth124");
    EXPECT_EQ(Ctl(words).exitStatus, 2);
    EXPECT_EQ(Ctl({"network", "start", "a/b"}), WrongUsage("the interface's name holds a slash"));
    EXPECT_EQ(Host().calls.size(), 1U);
}

TEST_F(System, GatewayCopiesAndRemovesRecords)
{
    EXPECT_EQ(Ctl({"gateway", "copy", "eth0", "ovs_eth0"}),
              Done("'ovs_eth0' has the gateway records of 'eth0'.\n"));
    EXPECT_EQ(Ctl({"gateway", "remove", "eth0"}), Done("'eth0' has no gateway records.\n"));
    EXPECT_THAT(Host().calls,
                ElementsAre("CopyGatewayInfo eth0 ovs_eth0", "RemoveGateWayInfo eth0"));

    Host().act = [](FakeHost&) { return -1; };
    EXPECT_EQ(Ctl({"gateway", "copy", "eth0", "ovs_eth0"}),
              Failed(1, "the gateway records of 'eth0' could not be copied, or not all of them: "
                        "see the system log."));
    EXPECT_EQ(Ctl({"gateway", "remove", "eth0"}),
              Failed(1, "the gateway records of 'eth0' could not be removed, or not all of them: "
                        "see the system log."));
}

} // namespace
