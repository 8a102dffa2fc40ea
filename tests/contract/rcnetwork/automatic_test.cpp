/**
 * Runs that nobody asks for: at boot, when an interface appears, when the switch works again.
 */
#include "host.h"
#include "systemd/fakesystemd.h"

#include <chrono>
#include <filesystem>
#include <string>
#include <thread>

#include <gmock/gmock.h>
#include <sys/syscall.h>

namespace contract {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

constexpr char kStatic[] = "IPADDR=192.0.2.5\nPREFIX=24\n";
constexpr char kBridge[] = "DEVICE=ovs_eth0\nTYPE=OVS\nPRIMARY=eth0\nIPADDR=192.0.2.5\nPREFIX=24\n";
constexpr char kPort[] = "DEVICE=eth0\nBRIDGE=ovs_eth0\n";
constexpr char kWaitingPath[] = "/run/vornovs/network.waiting";
constexpr char kSettings[] = "/etc/vornovs-host.conf";
const Outcome kSilentSuccess{0, "", ""};

class Automatic : public Host {
protected:
    void TearDown() override
    {
        // Whoever tries again may be writing in the folder that is deleted next. With a switch that
        // seems to run the stop fails, and ends the trying all the same.
        (void)RcNetwork({"stop"});
        EXPECT_TRUE(WaitUntil([] { return Retriers() == 0; }));
        Host::TearDown();
        for (const char* service : {"vornovs-db", "vornovs-vswitch"}) {
            Delete(std::string("/etc/init.d/") + service);
        }
    }

    static void Script(const std::string& service, const std::string& body)
    {
        const std::string path = "/etc/init.d/" + service;
        WriteFile(path, "#!/bin/sh\n# pidfile: /run/" + service + ".pid\n# processname: sleep\n" +
                            body + "\n");
        ASSERT_EQ(RunProgram({"chmod", "0755", path}), kSilentSuccess);
    }

    static size_t Retriers()
    {
        return Processes("cmdline", std::string("rc.network\0retry", 16)).size();
    }

    /** Whether the one that tries again has looked at what runs and waits for something else. */
    static bool RetrierWaits()
    {
        const auto retriers = Processes("cmdline", std::string("rc.network\0retry", 16));
        const std::string sleeping = std::to_string(SYS_clock_nanosleep) + ' ';
        return retriers.size() == 1 &&
               ReadFile(retriers.front() / "syscall").rfind(sleeping, 0) == 0;
    }

    static void OnSwitch()
    {
        File("eth0", kPort);
        File("ovs_eth0", kBridge);
        Script("vornovs-db", "echo no database >&2; exit 1");
    }
};

TEST_F(Automatic, WhatTheSwitchDoesNotCarryIsReachableAndTriedAgain)
{
    OnSwitch();

    EXPECT_EQ(RcNetwork({"start"}).exitCode, 1);

    EXPECT_EQ(Network(), "eth0 192.0.2.5/24\n");
    EXPECT_EQ(ReadFile(kWaitingPath), "[\"eth0\"]\n");
    EXPECT_TRUE(WaitUntil([] { return Retriers() == 1; }));
}

TEST_F(Automatic, OnlyOneRunTriesAgain)
{
    OnSwitch();
    EXPECT_EQ(RcNetwork({"start"}).exitCode, 1);
    ASSERT_TRUE(WaitUntil([] { return Retriers() == 1; }));
    ASSERT_TRUE(WaitUntil([] { return std::filesystem::exists("/run/vornovs/retry.lock"); }));

    EXPECT_EQ(RcNetwork({"start"}).exitCode, 1);
    EXPECT_EQ(RcNetwork({"retry"}), kSilentSuccess) << "it leaves the work to the other one";

    EXPECT_EQ(Retriers(), 1U);
}

TEST_F(Automatic, NobodyTriesAgainOnceTheFilesWantNoSwitch)
{
    OnSwitch();
    EXPECT_EQ(RcNetwork({"start"}).exitCode, 1);
    ASSERT_TRUE(WaitUntil([] { return Retriers() == 1; }));
    Delete(IfcfgPath("ovs_eth0"));
    File("eth0", std::string("DEVICE=eth0\n") + kStatic);

    EXPECT_EQ(RcNetwork({"start"}), kSilentSuccess);

    EXPECT_EQ(ReadFile(kWaitingPath), "(none)");
    EXPECT_TRUE(WaitUntil([] { return Retriers() == 0; }));
}

TEST_F(Automatic, AnAdministratorsStopEndsTheTrying)
{
    OnSwitch();
    EXPECT_EQ(RcNetwork({"start"}).exitCode, 1);
    ASSERT_TRUE(WaitUntil([] { return Retriers() == 1; }));

    EXPECT_EQ(RcNetwork({"stop"}).exitCode, 0);

    EXPECT_EQ(ReadFile(kWaitingPath), "(none)");
    EXPECT_TRUE(WaitUntil([] { return Retriers() == 0; }));
    EXPECT_EQ(Network(), "");
}

TEST_F(Automatic, AnInterfaceThatIsLeftToSomebodyElseIsNotBroughtToTheSwitch)
{
    OnSwitch();
    EXPECT_EQ(RcNetwork({"start"}).exitCode, 1);
    ASSERT_TRUE(WaitUntil([] { return Retriers() == 1; }));

    EXPECT_EQ(RcNetwork({"leave", "eth0"}), kSilentSuccess);

    EXPECT_EQ(ReadFile(kWaitingPath), "(none)");
    EXPECT_EQ(Network(), "eth0 192.0.2.5/24\n");
}

TEST_F(Automatic, DaemonsThatWereStartedAreTriedAtOnce)
{
    OnSwitch();
    Script("vornovs-vswitch", "exit 1");
    EXPECT_EQ(RcNetwork({"start"}).exitCode, 1);
    ASSERT_TRUE(WaitUntil(RetrierWaits));
    const auto begin = std::chrono::steady_clock::now();
    // They run and do not answer; that they were tried is seen by what every run puts right.
    Ip("address del 192.0.2.5/24 dev eth0");
    (void)RunProgram({"sh", "-c",
                      "for service in db vswitch; do sleep 60 >/dev/null 2>&1 & "
                      "echo $! >/run/vornovs-$service.pid; done"});

    EXPECT_TRUE(WaitUntil([] { return Network() == "eth0 192.0.2.5/24\n"; }));

    EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(14))
        << "which is when it would have been tried anyway";
    (void)RunProgram({"sh", "-c", "kill $(cat /run/vornovs-db.pid /run/vornovs-vswitch.pid)"});
}

TEST_F(Automatic, SystemdStartsTheSwitchAndRunsWhatTriesAgain)
{
    harness::FakeSystemd systemd([](const std::string&, const std::string& unit) {
        return unit == "vornovs-db.service" ? "failed" : "done";
    });
    for (const char* unit : {"vornovs-db", "vornovs-vswitch", "vornovs-network-retry"}) {
        systemd.AddUnit(std::string(unit) + ".service");
    }
    OnSwitch();

    const Outcome outcome = RcNetwork({"start"});

    EXPECT_EQ(outcome.exitCode, 1);
    EXPECT_THAT(outcome.errors,
                HasSubstr("vornovs-db start failed: vornovs-db.service: result failed"));
    EXPECT_THAT(systemd.Jobs(), ElementsAre("StartUnit vornovs-db.service",
                                            "StartUnit vornovs-network-retry.service"));
    EXPECT_EQ(Network(), "eth0 192.0.2.5/24\n");
    EXPECT_EQ(Retriers(), 0U);
}

TEST_F(Automatic, BootWaitsForAnInterfaceThatIsSlow)
{
    File("eth2", kStatic);
    std::thread card([] {
        std::this_thread::sleep_for(std::chrono::milliseconds(500));
        Ip("link add eth2 type veth peer name cable2");
    });

    EXPECT_EQ(RcNetwork({"--boot", "start"}), kSilentSuccess);

    card.join();
    EXPECT_EQ(Network(), "eth2 192.0.2.5/24\n");
    Ip("link del dev eth2");
}

TEST_F(Automatic, BootGoesOnWithoutAnInterfaceThatDoesNotCome)
{
    WriteFile(kSettings, "DEVICE_SECONDS=1\n");
    File("eth0", kStatic);
    File("eth2", "IPADDR=198.51.100.5\nPREFIX=24\n");

    const Outcome outcome = RcNetwork({"--boot", "start"});

    EXPECT_EQ(outcome.exitCode, 1);
    EXPECT_THAT(outcome.errors, HasSubstr("eth2 has not appeared; the others go on without it"));
    EXPECT_EQ(Network(), "eth0 192.0.2.5/24\n");
    EXPECT_TRUE(std::filesystem::exists("/run/vornovs/network.boot"));
}

TEST_F(Automatic, BootGoesOnWithoutASwitchThatTakesTooLong)
{
    WriteFile(kSettings, "SWITCH_SECONDS=1\n");
    OnSwitch();
    Script("vornovs-db", "exec sleep 30");
    const auto begin = std::chrono::steady_clock::now();

    const Outcome outcome = RcNetwork({"--boot", "start"});

    EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(10));
    EXPECT_EQ(outcome.exitCode, 1);
    EXPECT_THAT(outcome.errors, HasSubstr("vornovs-db start failed: did not end in time"));
    EXPECT_EQ(Network(), "eth0 192.0.2.5/24\n");
    EXPECT_EQ(ReadFile(kWaitingPath), "[\"eth0\"]\n");
    EXPECT_EQ(RcNetwork({"stop"}).exitCode, 0);
}

TEST_F(Automatic, BootDoesNotWaitWhenNothingIsMissing)
{
    File("eth0", kStatic);
    File("bond0", "DEVICE=bond0\nONBOOT=no\n");
    File("eth7", "ONBOOT=no\nIPADDR=198.51.100.5\nPREFIX=24\n");
    const auto begin = std::chrono::steady_clock::now();

    EXPECT_EQ(RcNetwork({"--boot", "start"}).exitCode, 0);

    EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(5));
}

TEST_F(Automatic, AnInterfaceThatAppearsIsBroughtUpIfItsFileSaysSo)
{
    File("eth0", kStatic);
    File("eth1", "ONBOOT=no\nIPADDR=198.51.100.5\nPREFIX=24\n");

    EXPECT_EQ(RcNetwork({"appeared", "eth0"}), kSilentSuccess);
    EXPECT_EQ(RcNetwork({"appeared", "eth1"}), kSilentSuccess);
    EXPECT_EQ(RcNetwork({"appeared", "cable0"}), kSilentSuccess) << "which has no file";

    EXPECT_EQ(Network(), "eth0 192.0.2.5/24\n");
}

TEST_F(Automatic, AnInterfaceThatAppearsWaitsForTheEndOfAConversion)
{
    WriteFile(kSettings, "HOLD_SECONDS=60\n");
    File("eth0", kStatic);
    ASSERT_EQ(RcNetworkOfLibrary({"stop", "eth1"}), kSilentSuccess);
    std::thread appeared([] { EXPECT_EQ(RcNetwork({"appeared", "eth0"}), kSilentSuccess); });
    std::this_thread::sleep_for(std::chrono::milliseconds(500));
    EXPECT_EQ(Network(), "");

    EXPECT_EQ(RcNetworkOfLibrary({"start", "eth1"}).exitCode, 1) << "it has no file";
    Delete("/run/vornovs/network.hold");

    appeared.join();
    EXPECT_EQ(Network(), "eth0 192.0.2.5/24\n");
}

TEST_F(Automatic, WaitOnlineEndsWhenTheAddressesAnswer)
{
    File("eth0", std::string(kStatic) + "IPV6ADDR=2001:db8::5/64\n");
    ASSERT_EQ(RcNetwork({"start"}), kSilentSuccess);

    EXPECT_EQ(RcNetwork({"wait-online"}), kSilentSuccess);

    const std::string addresses = RunProgram({"ip", "-6", "address", "show", "dev", "eth0"}).output;
    EXPECT_THAT(addresses, HasSubstr("2001:db8::5/64"));
    EXPECT_THAT(addresses.substr(addresses.find("2001:db8::5"), 60),
                testing::Not(HasSubstr("tentative")));
}

TEST_F(Automatic, WaitOnlineSaysWhatDoesNotAnswer)
{
    WriteFile(kSettings, "ONLINE_SECONDS=1\n");
    File("eth0", kStatic);

    EXPECT_EQ(RcNetwork({"wait-online"}),
              (Outcome{1, "", "rc.network: does not answer: eth0: 192.0.2.5\n"}));
}

} // namespace
} // namespace contract
