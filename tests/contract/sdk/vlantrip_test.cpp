#include "trip.h"

#include "netsdk/ipconfig.h"
#include "sdk/vlanchange.h"
#include "support/remembered.h"
#include "tools.h"

#include <arpa/inet.h>
#include <cstring>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <linux/if_addr.h>
#include <linux/rtnetlink.h>
#include <sandbox/systemlog.h>
#include <vornplatform/netsdk.h>
#include <vornplatform/sdk.h>

namespace {

using contract::Files;
using contract::NetworkCalls;
using contract::NetworkRuns;
using contract::ReadFiles;
using contract::ReadGateways;
using testing::ElementsAre;
using testing::IsEmpty;
using vornhost::Link;
using vornhost::LiveNetwork;
using vornhost::RememberedVlan;

const Files kHost{{"eth0", "# the card\nDEVICE=eth0\nBOOTPROTO=none\nCOLOUR=red\nMTU=9000"},
                  {"eth0.10", "VLAN=yes\n# office\nDEVICE=eth0.10\nIPADDR=192.0.2.10\n"
                              "PREFIX=24\nGATEWAY=192.0.2.1\nIPV6ADDR=\"2001:db8::10/64\"\n"
                              "REORDER_HDR=yes\n"}};
const Files kMoved{{"eth0", "# the card\nDEVICE=eth0\nCOLOUR=red\nMTU=9000\nIPADDR=192.0.2.10\n"
                            "PREFIX=24\nGATEWAY=192.0.2.1\nIPV6ADDR=\"2001:db8::10/64\"\n"
                            "OVS_VLAN_ID=10"}};

Link MakeLink(int index, const std::string& name)
{
    Link link;
    link.index = index;
    link.name = name;
    link.mtu = 9000;
    link.type = 1;
    return link;
}

/** The kernel's network of a host that has eth0 and one VLAN on it. */
LiveNetwork Network(const std::string& vlan = "eth0.10", int id = 10)
{
    LiveNetwork network;
    network.links = {MakeLink(2, "eth0"), MakeLink(3, vlan)};
    network.links[1].kind = "vlan";
    network.links[1].parent = 2;
    network.links[1].vlanId = id;
    network.links[1].vlanProtocol = 0x8100;
    return network;
}

TEST(VlanTrip, PutsTheAddressingAndTheTagIntoTheParentsFile)
{
    contract::StartWith(kHost);

    EXPECT_EQ(vornhost::TakeVlan(Network(), "eth0.10"), 0);

    EXPECT_EQ(ReadFiles(), kMoved);
    EXPECT_EQ(NetworkRuns(), (std::vector<contract::NetworkRun>{{"start eth0 eth0.10", kMoved}}));
}

void GoToSwitchAndBack()
{
    contract::ToBridge("eth0");
    contract::EditFile("ovs_eth0", {}, {"OVS_VLAN_ID"});
    contract::FromBridge("eth0");
    contract::InstallNetworkProgram();
}

TEST(VlanTrip, EndsWithTheSameFilesToTheLastByte)
{
    contract::StartWith(kHost);
    ASSERT_EQ(vornhost::TakeVlan(Network(), "eth0.10"), 0);
    GoToSwitchAndBack();

    EXPECT_EQ(VLIBNetVlanCreate("eth0", 10, nullptr), 0);

    EXPECT_EQ(NetworkRuns(), (std::vector<contract::NetworkRun>{{"start eth0 eth0.10", kHost}}));
    EXPECT_EQ(ReadFiles(), kHost);
    EXPECT_EQ(RememberedVlan::LoadOfParent("eth0"), std::vector<RememberedVlan>());
}

TEST(VlanTrip, CarriesChangesThatWereMadeOnTheSwitch)
{
    contract::StartWith(kHost);
    ASSERT_EQ(vornhost::TakeVlan(Network(), "eth0.10"), 0);
    contract::ToBridge("eth0");
    contract::EditFile("ovs_eth0", {{"IPADDR", "192.0.2.20"}, {"COLOUR", "blue"}}, {"GATEWAY"});
    contract::FromBridge("eth0");

    EXPECT_EQ(VLIBNetVlanCreate("eth0", 10, nullptr), 0);

    Files wanted = kHost;
    wanted["eth0"] = "# the card\nDEVICE=eth0\nBOOTPROTO=none\nCOLOUR=blue\nMTU=9000";
    wanted["eth0.10"] = "VLAN=yes\n# office\nDEVICE=eth0.10\nIPADDR=192.0.2.20\nPREFIX=24\n"
                        "IPV6ADDR=\"2001:db8::10/64\"\nREORDER_HDR=yes\n";
    EXPECT_EQ(ReadFiles(), wanted);
}

TEST(VlanTrip, EndsUnderTheNumberThatItGotOnTheSwitch)
{
    contract::StartWith(kHost);
    ASSERT_EQ(vornhost::TakeVlan(Network(), "eth0.10"), 0);
    GoToSwitchAndBack();

    EXPECT_EQ(VLIBNetVlanCreate("eth0", 20, nullptr), 0);

    Files wanted{{"eth0", kHost.at("eth0")}};
    wanted["eth0.20"] = kHost.at("eth0.10");
    wanted["eth0.20"].replace(wanted["eth0.20"].find("eth0.10"), 7, "eth0.20");
    EXPECT_EQ(ReadFiles(), wanted);
    EXPECT_THAT(NetworkCalls(), ElementsAre("start eth0 eth0.20"));
}

TEST(VlanTrip, KeepsANameThatDoesNotTellTheNumber)
{
    Files host{
        {"eth0", "DEVICE=eth0\n"},
        {"office", "DEVICE=office\nVLAN=yes\nPHYSDEV=eth0\nVLAN_ID=10\nIPADDR=192.0.2.10/24\n"}};
    contract::StartWith(host);
    ASSERT_EQ(vornhost::TakeVlan(Network("office"), "office"), 0);
    EXPECT_EQ(ReadFiles(),
              (Files{{"eth0", "DEVICE=eth0\nIPADDR=192.0.2.10/24\nOVS_VLAN_ID=10\n"}}));
    GoToSwitchAndBack();

    EXPECT_EQ(VLIBNetVlanCreate("eth0", 10, nullptr), 0);

    EXPECT_EQ(ReadFiles(), host);
}

TEST(VlanTrip, TakesTheVlansMtuWhereItDiffers)
{
    contract::StartWith(kHost);
    LiveNetwork network = Network();
    network.links[1].mtu = 1500;

    ASSERT_EQ(vornhost::TakeVlan(network, "eth0.10"), 0);
    EXPECT_NE(ReadFiles()["eth0"].find("MTU=1500\n"), std::string::npos);

    EXPECT_EQ(VLIBNetVlanCreate("eth0", 10, nullptr), 0);
    EXPECT_EQ(ReadFiles(), kHost);
}

TEST(VlanTrip, WithoutFilesWritesWhatIsLiveAndLeavesNoFileBehind)
{
    contract::StartWith({});
    LiveNetwork network = Network();
    vornhost::Address address;
    address.index = 3;
    address.family = AF_INET;
    address.local = "192.0.2.10";
    address.prefixLength = 24;
    address.flags = IFA_F_PERMANENT;
    vornhost::Address assigned = address;
    assigned.local = "192.0.2.77";
    assigned.flags = 0;
    network.addresses = {assigned, address};
    vornhost::Route route;
    route.family = AF_INET;
    route.table = RT_TABLE_MAIN;
    route.protocol = RTPROT_BOOT;
    route.nextHops = {{3, "192.0.2.1", AF_INET, 1, false}};
    network.routes = {route};

    ASSERT_EQ(vornhost::TakeVlan(network, "eth0.10"), 0);
    EXPECT_EQ(ReadFiles(),
              (Files{{"eth0", "DEVICE=eth0\nONBOOT=yes\nBOOTPROTO=none\nIPADDR=192.0.2.10\n"
                              "PREFIX=24\nGATEWAY=192.0.2.1\nMTU=9000\nOVS_VLAN_ID=10\n"}}));
    GoToSwitchAndBack();

    EXPECT_EQ(VLIBNetVlanCreate("eth0", 10, nullptr), 0);
    EXPECT_EQ(ReadFiles(), Files{});
    ASSERT_EQ(NetworkRuns().size(), 1u);
    EXPECT_EQ(NetworkRuns()[0].files,
              (Files{{"eth0", "DEVICE=eth0\nONBOOT=yes\n"},
                     {"eth0.10", "DEVICE=eth0.10\nVLAN=yes\nONBOOT=yes\nBOOTPROTO=none\n"
                                 "IPADDR=192.0.2.10\nPREFIX=24\nGATEWAY=192.0.2.1\nMTU=9000\n"}}));
}

TEST(VlanTrip, WithoutMemoryGivesTheVlanItsParentsAddressing)
{
    contract::StartWith({{"eth0", "DEVICE=eth0\nIPADDR=192.0.2.10/24\nCOLOUR=red\n"}},
                        "eth0 inet 192.0.2.1\n");

    EXPECT_EQ(VLIBNetVlanCreate("eth0", 10, nullptr), 0);

    EXPECT_EQ(ReadFiles(),
              (Files{{"eth0", "DEVICE=eth0\nCOLOUR=red\n"},
                     {"eth0.10", "DEVICE=eth0.10\nVLAN=yes\nONBOOT=yes\nIPADDR=192.0.2.10/24\n"}}));
    EXPECT_EQ(ReadGateways(), "eth0.10 inet 192.0.2.1\n");
}

TEST(VlanTrip, WithoutMemoryAndFilesGivesTheVlanWhatTheCallerRead)
{
    contract::StartWith({});
    vornhost::IpConfig config{};
    config.version = vornhost::kIpConfigVersion;
    config.flags = vornhost::kHasIPv4Address | vornhost::kHasIPv6Address |
                   vornhost::kHasIPv4Gateway | vornhost::kHasIPv6Gateway;
    ASSERT_EQ(inet_pton(AF_INET, "192.0.2.10", config.ipv4Address), 1);
    ASSERT_EQ(inet_pton(AF_INET, "192.0.2.1", config.ipv4Gateway), 1);
    ASSERT_EQ(inet_pton(AF_INET6, "2001:db8::10", config.ipv6Address), 1);
    ASSERT_EQ(inet_pton(AF_INET6, "fe80::1", config.ipv6Gateway), 1);
    config.ipv4PrefixLength = 24;
    config.ipv6PrefixLength = 64;
    VORNNETIPCONFIG record{};
    std::memcpy(&record, &config, sizeof record);

    EXPECT_EQ(VLIBNetVlanCreate("eth0", 10, &record), 0);

    EXPECT_EQ(ReadFiles()["eth0.10"],
              "DEVICE=eth0.10\nVLAN=yes\nONBOOT=yes\nIPADDR=192.0.2.10\nPREFIX=24\n"
              "GATEWAY=192.0.2.1\nIPV6ADDR=2001:db8::10/64\nIPV6_DEFAULTGW=fe80::1\n");
}

TEST(VlanTrip, IsFinishedWhereverItWasCutShort)
{
    contract::StartWith(kHost);
    ASSERT_EQ(vornhost::TakeVlan(Network(), "eth0.10"), 0);
    const auto memory = RememberedVlan::Load("eth0.10");
    contract::WriteFile(contract::IfcfgPath("eth0.10"), kHost.at("eth0.10"));

    EXPECT_EQ(vornhost::TakeVlan(Network(), "eth0.10"), 0) << "the parent's file is written";
    EXPECT_EQ(ReadFiles(), kMoved);
    EXPECT_EQ(RememberedVlan::Load("eth0.10"), memory);

    contract::InstallNetworkProgram();
    EXPECT_EQ(vornhost::TakeVlan(LiveNetwork{}, "eth0.10"), 0) << "the interface is gone";
    EXPECT_THAT(NetworkCalls(), ElementsAre("start eth0 eth0.10"));

    GoToSwitchAndBack();
    contract::WriteFile(contract::IfcfgPath("eth0.10"), kHost.at("eth0.10"));
    EXPECT_EQ(VLIBNetVlanCreate("eth0", 10, nullptr), 0) << "the VLAN's file is written";
    EXPECT_EQ(ReadFiles(), kHost);
}

TEST(VlanTrip, IsFinishedWhenBothFilesAreBackButTheProgramHasNotRun)
{
    contract::StartWith(kHost);
    ASSERT_EQ(vornhost::TakeVlan(Network(), "eth0.10"), 0);
    for (const auto& [interface, text] : kHost) {
        contract::WriteFile(contract::IfcfgPath(interface), text);
    }

    EXPECT_EQ(VLIBNetVlanCreate("eth0", 10, nullptr), 0);

    EXPECT_EQ(ReadFiles(), kHost);
    EXPECT_EQ(RememberedVlan::Load("eth0.10"), std::nullopt);
}

TEST(VlanTrip, LeavesTheVlanWhenTheNetworkProgramCannotTakeIt)
{
    const std::string gateways = "eth0 inet 198.51.100.1\neth0.10 inet 192.0.2.1\n";
    contract::StartWith(kHost, gateways);
    contract::InstallNetworkProgram({1});

    EXPECT_EQ(vornhost::TakeVlan(Network(), "eth0.10"), -1);

    EXPECT_EQ(ReadFiles(), kHost);
    EXPECT_EQ(ReadGateways(), gateways);
    EXPECT_EQ(RememberedVlan::Load("eth0.10"), std::nullopt);
}

TEST(VlanTrip, KeepsTheMemoryWhenTheVlanCannotBeMade)
{
    contract::StartWith(kHost);
    ASSERT_EQ(vornhost::TakeVlan(Network(), "eth0.10"), 0);
    contract::InstallNetworkProgram({1});

    EXPECT_EQ(VLIBNetVlanCreate("eth0", 10, nullptr), -1);
    EXPECT_NE(RememberedVlan::Load("eth0.10"), std::nullopt);

    EXPECT_EQ(VLIBNetVlanCreate("eth0", 10, nullptr), 0);
    EXPECT_EQ(ReadFiles(), kHost);
}

TEST(VlanTrip, IsRefusedWhereOneTagCannotSayIt)
{
    const Files host{{"eth0", "DEVICE=eth0\nIPADDR=192.0.2.10/24\n"},
                     {"eth0.10", "DEVICE=eth0.10\nIPADDR=198.51.100.10/24\n"}};
    contract::StartWith(host);
    harness::SystemLog log;

    EXPECT_EQ(vornhost::TakeVlan(Network(), "eth0.10"), -1);

    EXPECT_EQ(ReadFiles(), host);
    EXPECT_THAT(NetworkCalls(), IsEmpty());
    EXPECT_THAT(log.Lines(), ElementsAre("3 vornsdk: VLAN eth0.10: is not what one tag can say: "
                                         "eth0 has addresses of its own"));
}

TEST(VlanTrip, IsRefusedForWrongArguments)
{
    contract::StartWith(kHost);
    EXPECT_EQ(VLIBNetVlanRemove(nullptr), -1);
    EXPECT_EQ(VLIBNetVlanRemove(""), -1);
    EXPECT_EQ(VLIBNetVlanRemove("../eth0.10"), -1);
    EXPECT_EQ(VLIBNetVlanRemove("eth0.10"), -1) << "no such interface";
    EXPECT_EQ(VLIBNetVlanCreate(nullptr, 10, nullptr), -1);
    EXPECT_EQ(VLIBNetVlanCreate("a/b", 10, nullptr), -1);
    EXPECT_EQ(VLIBNetVlanCreate("eth0", 4095, nullptr), -1);
    EXPECT_EQ(VLIBNetVlanCreate("eth0", -1, nullptr), -1);
    EXPECT_EQ(VLIBNetVlanCreate("thirteenchars", 10, nullptr), -1) << "the name is too long";
    EXPECT_EQ(ReadFiles(), kHost);
    EXPECT_THAT(NetworkCalls(), IsEmpty());
}

TEST(VlanTrip, TakesTheGatewayAlong)
{
    contract::StartWith(kHost, "eth0.10 inet 192.0.2.1 metric 5\neth0 inet 198.51.100.1\n");
    contract::CopyGateways("eth0", "ovs_eth0");

    ASSERT_EQ(vornhost::TakeVlan(Network(), "eth0.10"), 0);
    EXPECT_EQ(ReadGateways(), "eth0 inet 192.0.2.1 metric 5\novs_eth0 inet 192.0.2.1 metric 5\n");

    contract::WriteFile("/usr/vorn/etc/vornnetd/gateways.conf", "ovs_eth0 inet 192.0.2.2\n");
    contract::CopyGateways("ovs_eth0", "eth0");
    GoToSwitchAndBack();
    ASSERT_EQ(VLIBNetVlanCreate("eth0", 10, nullptr), 0);
    EXPECT_EQ(ReadGateways(), "eth0 inet 198.51.100.1\n"
                              "eth0.10 inet 192.0.2.2\n");
}

/** A VLAN on a bond: first the VLAN is taken, then the bond, and the other way round back. */
TEST(VlanTrip, OnABondEndsWithTheSameFilesAndGateways)
{
    const Files host{
        {"bond0", "DEVICE=bond0\nBONDING_OPTS=\"mode=802.3ad miimon=100\"\nBOOTPROTO=none\n"},
        {"bond0.5", "DEVICE=bond0.5\nVLAN=yes\nIPADDR=192.0.2.10/24\n"},
        {"eth0", "DEVICE=eth0\nMASTER=bond0\nSLAVE=yes\n"},
        {"eth1", "DEVICE=eth1\nMASTER=bond0\nSLAVE=yes\n"}};
    contract::StartWith(host, "bond0.5 inet 192.0.2.1\n");
    LiveNetwork network = Network("bond0.5", 5);
    network.links[0].name = "bond0";

    contract::CopyGateways("bond0", "ovs_bond0");
    ASSERT_EQ(vornhost::TakeVlan(network, "bond0.5"), 0);
    contract::DeleteGateways("bond0");
    VORNLINKAGGROPT opt = contract::BondRecord("bond0", 0, {"eth0", "eth1"});
    ASSERT_EQ(VORNNetLinkAggrSet(&opt), 0);
    EXPECT_EQ(ReadFiles()["eth0"], "DEVICE=eth0\nIPADDR=192.0.2.10/24\nOVS_VLAN_ID=5\n");
    contract::ToBridge("eth0");
    contract::ToBridge("eth1");
    contract::CopyGateways("eth0", "ovs_bond0");
    contract::ToSwitchBond("ovs_bond0", {"eth0", "eth1"});
    EXPECT_NE(ReadGateways().find("ovs_bond0 inet 192.0.2.1\n"), std::string::npos);

    contract::CopyGateways("ovs_bond0", "bond0");
    contract::EditFile("ovs_bond0", {}, {"OVS_VLAN_ID"});
    contract::FromSwitchBond("ovs_bond0", {"eth0", "eth1"});
    contract::FromBridge("eth0");
    contract::FromBridge("eth1");
    opt.mode = VORN_LINK_AGGR_8023AD;
    ASSERT_EQ(VORNNetLinkAggrSet(&opt), 0);
    EXPECT_EQ(ReadFiles()["bond0"], "DEVICE=bond0\nBONDING_OPTS=\"mode=802.3ad miimon=100\"\n"
                                    "IPADDR=192.0.2.10/24\n");
    ASSERT_EQ(VLIBNetVlanCreate("bond0", 5, nullptr), 0);

    EXPECT_EQ(ReadFiles(), host);
    EXPECT_EQ(ReadGateways(), "bond0.5 inet 192.0.2.1\n");
}

} // namespace
