#include "ctl.h"

#include <csignal>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using testing::ElementsAre;
using unit::Ctl;
using unit::FakeHost;
using unit::Host;
using unit::Outcome;

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

using Registration = unit::OnAHost;

TEST_F(Registration, RegisterOfTheFirstClientTellsWhatIsOnTheSwitch)
{
    Host().act = Convert;

    EXPECT_EQ(
        Ctl({"register", "lab"}),
        (Outcome{0, std::string(kFirstClient) + "'lab' is registered. On the switch: eth0, eth1.\n",
                 ""}));
    EXPECT_THAT(Host().calls, ElementsAre("Register lab"));
}

TEST_F(Registration, RegisterOfAFurtherClientIsSilentAboutTheConversion)
{
    PutOnTheSwitch({"vms"});
    Host().act = Convert;

    EXPECT_EQ(Ctl({"register", "lab"}),
              (Outcome{0, "'lab' is registered. On the switch: eth0, eth1.\n", ""}));
}

TEST_F(Registration, RegisterOfAClientThatIsRegisteredChangesNothing)
{
    PutOnTheSwitch({"lab"});
    Host().act = [](FakeHost&) { return 1; };

    EXPECT_EQ(Ctl({"register", "lab"}),
              (Outcome{5, "", "vornovsctl: 'lab' was registered already; nothing was changed.\n"}));
}

TEST_F(Registration, RegisterFailsOnAHostThatCannotRunTheSwitch)
{
    Host().act = [](FakeHost&) { return 5; };

    EXPECT_EQ(Ctl({"register", "lab"}),
              (Outcome{1, kFirstClient,
                       "vornovsctl: this host cannot run Open vSwitch (reason 5); nothing was "
                       "changed.\n"}));
}

TEST_F(Registration, RegisterFailsWhenTheLibrarySaysSuccessAndNobodyIsRegistered)
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

TEST_F(Registration, RegisterTellsWhatAFailedConversionLeftOnTheSwitch)
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

TEST_F(Registration, RegisterTellsWhenNothingIsOnTheSwitch)
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

TEST_F(Registration, UnregisterOfTheLastClientTellsThatTheHostIsBack)
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

TEST_F(Registration, UnregisterOfAnotherThanTheLastClientTellsWhoIsLeft)
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

TEST_F(Registration, UnregisterOfAnUnknownClientChangesNothing)
{
    PutOnTheSwitch({"vms"});
    Host().act = [](FakeHost&) { return 1; };

    EXPECT_EQ(Ctl({"unregister", "lab"}),
              (Outcome{5, "", "vornovsctl: 'lab' was not registered; nothing was changed.\n"}));
}

TEST_F(Registration, UnregisterFailsWhileTheClientIsStillRegistered)
{
    for (const int result : {0, -1}) {
        PutOnTheSwitch({"lab", "vms"});
        Host().act = [=](FakeHost&) { return result; };
        EXPECT_EQ(Ctl({"unregister", "lab"}), (Outcome{1, "", kStillRegistered})) << result;
    }

    Host().clients.reset();
    EXPECT_EQ(Ctl({"unregister", "lab"}), (Outcome{1, "", kStillRegistered}));
}

TEST_F(Registration, UnregisterTellsWhatAFailedConversionBackLeftOnTheSwitch)
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

TEST_F(Registration, ConversionsCannotBeInterruptedAndStatusCan)
{
    // A shell starts what runs in the background with SIGINT ignored.
    ASSERT_NE(std::signal(SIGINT, SIG_DFL), SIG_ERR);
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

TEST_F(Registration, ResetForgetsTheClientsAndTellsWhatStays)
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

TEST_F(Registration, ResetFailsWhenAClientIsLeft)
{
    PutOnTheSwitch({"lab"});

    EXPECT_EQ(Ctl({"reset", "--yes"}),
              (Outcome{1, "",
                       "vornovsctl: the registrations could not be removed: see the system "
                       "log.\n"}));
}

} // namespace
