#include "host.h"

#include <gmock/gmock.h>

namespace contract {
namespace {

using testing::HasSubstr;

constexpr char kStatic[] = "DEVICE=eth0\nIPADDR=192.0.2.5\nNETMASK=255.255.255.0\n"
                           "GATEWAY=192.0.2.1\nIPV6ADDR=2001:db8::5/64\nIPV6_DEFAULTGW=fe80::1\n";
constexpr char kStaticNetwork[] =
    "eth0 192.0.2.5/24\n"
    "eth0 2001:db8::5/64\n"
    "default via 192.0.2.1 dev eth0 proto static\n"
    "default via fe80::1 dev eth0 proto static metric 1024 pref medium\n";

TEST_F(Host, StartBringsUpWhatTheFilesAskFor)
{
    File("eth0", kStatic);
    File("eth1", "DEVICE=eth1\nIPADDR=198.51.100.5\nPREFIX=24\nIPADDR1=198.51.100.6\nPREFIX1=24\n"
                 "GATEWAY=198.51.100.1\nMETRIC=20\nMTU=1400\n");

    EXPECT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""}));

    EXPECT_EQ(Network(), "eth0 192.0.2.5/24\n"
                         "eth0 2001:db8::5/64\n"
                         "eth1 198.51.100.5/24\n"
                         "eth1 198.51.100.6/24\n"
                         "default via 192.0.2.1 dev eth0 proto static\n"
                         "default via 198.51.100.1 dev eth1 proto static metric 20\n"
                         "default via fe80::1 dev eth0 proto static metric 1024 pref medium\n");
    EXPECT_THAT(RunProgram({"ip", "link", "show", "dev", "eth1"}).output, HasSubstr("mtu 1400"));
}

TEST_F(Host, ASecondStartFindsNothingToDo)
{
    File("eth0", kStatic);
    ASSERT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""}));

    EXPECT_EQ(RcNetwork({"--dry-run", "start"}), (Outcome{0, "", ""}));
    EXPECT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""}));
    EXPECT_EQ(Network(), kStaticNetwork);
}

TEST_F(Host, DryRunChangesNothing)
{
    File("eth0", kStatic);
    const std::string before = Snapshot();

    EXPECT_EQ(RcNetwork({"--dry-run", "start"}),
              (Outcome{0,
                       "build beside:\n"
                       "  link set dev eth0 up\n"
                       "  addr add 192.0.2.5/24 brd + dev eth0\n"
                       "  addr add 2001:db8::5/64 dev eth0\n"
                       "  route replace default via 192.0.2.1 dev eth0 proto static scope global\n"
                       "  route replace ::/0 via fe80::1 dev eth0 proto static metric 1024\n",
                       ""}));

    EXPECT_EQ(Snapshot(), before);
    EXPECT_EQ(ReadFile("/run/vornovs/network.json"), "(none)");
}

TEST_F(Host, LeaveTakesNothingDownAndForgetsWhatStartMade)
{
    File("eth0", kStatic);
    ASSERT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""}));

    EXPECT_EQ(RcNetwork({"leave", "eth0"}), (Outcome{0, "", ""}));

    EXPECT_EQ(Network(), kStaticNetwork);
    EXPECT_EQ(RcNetwork({"stop"}), (Outcome{0, "", ""}));
    EXPECT_EQ(Network(), kStaticNetwork);
    EXPECT_EQ(RcNetwork({"leave"}).exitCode, 2);
}

TEST_F(Host, StopTakesDownExactlyWhatStartMade)
{
    Ip("link set dev eth0 up");
    Ip("addr add 192.0.2.77/24 dev eth0");
    Ip("route add 203.0.113.0/24 via 192.0.2.78 dev eth0");
    File("eth0", kStatic);
    ASSERT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""}));
    Ip("addr add 198.51.100.1/24 dev eth0");

    EXPECT_EQ(RcNetwork({"stop"}), (Outcome{0, "", ""}));

    EXPECT_EQ(Network(), "eth0 192.0.2.77/24\neth0 198.51.100.1/24\n");
    EXPECT_EQ(RunProgram({"ip", "route", "show", "203.0.113.0/24"}).output,
              "203.0.113.0/24 via 192.0.2.78 dev eth0 \n");
    EXPECT_EQ(RcNetwork({"--dry-run", "stop"}), (Outcome{0, "", ""}));
}

TEST_F(Host, StopPutsLinkAndMtuBack)
{
    File("eth0", std::string(kStatic) + "MTU=1400\nIPV6_AUTOCONF=no\n");
    ASSERT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""}));
    ASSERT_EQ(ReadFile("/proc/sys/net/ipv6/conf/eth0/accept_ra"), "0\n");

    EXPECT_EQ(RcNetwork({"stop"}), (Outcome{0, "", ""}));

    EXPECT_THAT(RunProgram({"ip", "link", "show", "dev", "eth0"}).output,
                testing::AllOf(HasSubstr("mtu 1500"), testing::Not(HasSubstr("UP"))));
    EXPECT_EQ(ReadFile("/proc/sys/net/ipv6/conf/eth0/accept_ra"), "1\n");
}

TEST_F(Host, AnAddressOfTheFileIsReplacedAndOnesMadeByHandStay)
{
    File("eth0", "IPADDR=192.0.2.5\nPREFIX=24\nGATEWAY=192.0.2.1\n");
    ASSERT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""}));
    Ip("addr add 192.0.2.77/24 dev eth0");

    File("eth0", "IPADDR=192.0.2.6\nPREFIX=24\nGATEWAY=192.0.2.2\n");
    EXPECT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""}));

    EXPECT_EQ(Network(), "eth0 192.0.2.77/24\neth0 192.0.2.6/24\n"
                         "default via 192.0.2.2 dev eth0 proto static\n");
}

TEST_F(Host, WithoutItsRecordsItTakesNothingAway)
{
    File("eth0", kStatic);
    ASSERT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""}));
    Delete("/run/vornovs");

    EXPECT_EQ(RcNetwork({"stop"}), (Outcome{0, "", ""}));
    EXPECT_EQ(Network(), kStaticNetwork);
}

TEST_F(Host, HalfWrittenFilesTakeNothingAway)
{
    File("eth0", kStatic);
    ASSERT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""}));

    for (const char* text : {"", "DEVICE=ovs_eth0\nTYPE=OVS\nPRIMARY=eth0\n", "DEVICE=eth0\nIPAD",
                             "DEVICE=eth0\nIPADDR=192.0.2.5\nPREFIX=24"}) {
        File("eth0", text);
        EXPECT_EQ(RcNetwork({"start"}).exitCode, 0) << text;
        EXPECT_EQ(Network(), kStaticNetwork) << text;
    }
    Delete(IfcfgPath("eth0"));
    EXPECT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""}));
    EXPECT_EQ(Network(), kStaticNetwork);
}

TEST_F(Host, AMalformedValueIsNamedAndTheRestGoesOn)
{
    File("eth0", "IPADDR=192.0.2\nPREFIX=24\n");
    File("eth1", "IPADDR=198.51.100.5\nPREFIX=24\n");

    EXPECT_EQ(RcNetwork({"start"}),
              (Outcome{1, "", "rc.network: ifcfg-eth0: IPADDR=192.0.2: not an IPv4 address\n"}));
    EXPECT_EQ(Network(), "eth1 198.51.100.5/24\n");
}

TEST_F(Host, NamesLimitWhatIsDone)
{
    File("eth0", kStatic);
    File("eth1", "IPADDR=198.51.100.5\nPREFIX=24\n");

    EXPECT_EQ(RcNetwork({"start", "ovs_eth1"}), (Outcome{0, "", ""}));
    EXPECT_EQ(Network(), "eth1 198.51.100.5/24\n");

    ASSERT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""}));
    EXPECT_EQ(RcNetwork({"stop", "eth1"}), (Outcome{0, "", ""}));
    EXPECT_EQ(Network(), kStaticNetwork);
}

TEST_F(Host, MissingInterfacesAndFilesAreErrors)
{
    File("eth7", "IPADDR=198.51.100.5\nPREFIX=24\n");
    EXPECT_EQ(RcNetwork({"start"}), (Outcome{1, "", "rc.network: there is no interface eth7\n"}));

    File("eth7", "IPADDR=198.51.100.5\nPREFIX=24\nONBOOT=no\n");
    EXPECT_EQ(RcNetwork({"start"}).exitCode, 0);

    EXPECT_EQ(RcNetwork({"start", "eth1"}),
              (Outcome{1, "", "rc.network: eth1 has no configuration file\n"}));
}

TEST_F(Host, GatewayRecordsGoBeforeTheFile)
{
    File("eth0", kStatic);
    WriteFile("/usr/vorn/etc/vornnetd/gateways.conf", "eth0 inet 192.0.2.254 metric 5\n");

    EXPECT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""}));
    EXPECT_EQ(Network(), "eth0 192.0.2.5/24\n"
                         "eth0 2001:db8::5/64\n"
                         "default via 192.0.2.254 dev eth0 proto static metric 5\n"
                         "default via fe80::1 dev eth0 proto static metric 1024 pref medium\n");
}

TEST_F(Host, ASwitchThatDoesNotStartLeavesTheHostReachable)
{
    File("eth0", kStatic);
    File("ovs_eth0", "DEVICE=ovs_eth0\nTYPE=OVS\nPRIMARY=eth0\nIPADDR=192.0.2.5\nPREFIX=24\n"
                     "GATEWAY=192.0.2.1\n");
    WriteFile("/etc/init.d/vornovs-db", "#!/bin/sh\necho no database >&2\nexit 1\n");
    ASSERT_EQ(RunProgram({"chmod", "0755", "/etc/init.d/vornovs-db"}).exitCode, 0);

    const Outcome outcome = RcNetwork({"start"});

    EXPECT_EQ(outcome.exitCode, 1);
    EXPECT_THAT(outcome.errors, HasSubstr("vornovs-db start failed: no database"));
    EXPECT_THAT(outcome.errors, HasSubstr("the addresses of eth0 stay on the plain interface"));
    EXPECT_EQ(Network(), "eth0 192.0.2.5/24\ndefault via 192.0.2.1 dev eth0 proto static\n");
}

TEST_F(Host, TakesWhatFollowsTheVerbForNames)
{
    for (const char* const name : {"--dry-run", "--boot", "--help", "-", "--", "eth0/..", ""}) {
        EXPECT_EQ(RcNetwork({"start", name}).exitCode, 2) << name;
        EXPECT_EQ(RcNetwork({"stop", "lo", name}).exitCode, 2) << name;
        EXPECT_EQ(RcNetwork({"set-ovs-bond", name}).exitCode, 2) << name;
    }
}

TEST_F(Host, WrongUsageIsToldFromFailure)
{
    for (const auto& arguments : std::vector<std::vector<std::string>>{
             {}, {"restart"}, {"start", "a/b"}, {"start", "-x"}, {"holder"}}) {
        EXPECT_EQ(RcNetwork(arguments).exitCode, 2);
    }
}

} // namespace
} // namespace contract
