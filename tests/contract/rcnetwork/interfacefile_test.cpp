#include "support/interfacefile.h"

#include "rcnetwork/ipcommand.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <sys/socket.h>

namespace vornhost {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::Optional;

std::vector<std::string> Texts(const ParsedFile& parsed)
{
    std::vector<std::string> texts;
    for (const Remark& remark : parsed.remarks) {
        texts.push_back((remark.severity == Severity::kError ? "error: " : "warning: ") +
                        remark.text);
    }
    return texts;
}

TEST(ParseInterfaceFile, ReadsAPlainFile)
{
    const auto parsed =
        ParseInterfaceFile("eth0", "# made by hand\n"
                                   "DEVICE=\"eth0\"\n"
                                   "BOOTPROTO=static\n"
                                   "IPADDR=192.0.2.5\n"
                                   "NETMASK=255.255.255.0\n"
                                   "IPADDR1='198.51.100.7'\n"
                                   "PREFIX1=31\n"
                                   "IPADDR2=203.0.113.9/28\n"
                                   "GATEWAY=192.0.2.1\n"
                                   "IPV6ADDR=2001:DB8::5/48\n"
                                   "IPV6ADDR_SECONDARIES=\"2001:db8::6/64 fd00::1\"\n"
                                   "IPV6_DEFAULTGW=fe80::1%eth0\n"
                                   "IPV6_AUTOCONF=no\n"
                                   "MTU=9000\n"
                                   "METRIC=7\n"
                                   "HWADDR=02:00:00:00:00:0A\n"
                                   "FIREWALL=yes\n");

    const InterfaceFile& file = parsed.file;
    EXPECT_THAT(Texts(parsed), IsEmpty());
    EXPECT_EQ(file.use, FileUse::kPlain);
    EXPECT_TRUE(file.whole);
    EXPECT_TRUE(file.onBoot);
    EXPECT_THAT(file.addresses, ElementsAre(WantedAddress{AF_INET, "192.0.2.5", 24},
                                            WantedAddress{AF_INET, "198.51.100.7", 31},
                                            WantedAddress{AF_INET, "203.0.113.9", 28},
                                            WantedAddress{AF_INET6, "2001:db8::5", 48},
                                            WantedAddress{AF_INET6, "2001:db8::6", 64},
                                            WantedAddress{AF_INET6, "fd00::1", 64}));
    EXPECT_EQ(file.gateway, "192.0.2.1");
    EXPECT_EQ(file.gateway6, "fe80::1");
    EXPECT_THAT(file.autoconf, Optional(false));
    EXPECT_THAT(file.mtu, Optional(9000U));
    EXPECT_THAT(file.metric, Optional(7U));
    EXPECT_EQ(file.requiredMac, "02:00:00:00:00:0a");
}

TEST(ParseInterfaceFile, ReadsAsWhomAServerKnowsTheHost)
{
    const auto parsed = ParseInterfaceFile("eth0", "BOOTPROTO=\"dhcp\"\n"
                                                   "IPV6_AUTOCONF=yes\n"
                                                   "DHCPV6C=no\n"
                                                   "DHCP_CLIENT_ID=FF:00:00:00:01:00:02:AB\n"
                                                   "DHCP_HOSTNAME=nas-1.example\n"
                                                   "DHCPV6_DUID=00:04:aa:bb\n"
                                                   "DHCP_IAID=0A:00:00:ff\n"
                                                   "PEERDNS=no\n"
                                                   "PEERROUTES=no\n"
                                                   "DEFROUTE=no\n"
                                                   "METRIC=5\n"
                                                   "IPV6_METRIC=6\n");

    FileClient client;
    client.dhcp = true;
    client.dhcp6 = false;
    client.id = "ff:00:00:00:01:00:02:ab";
    client.hostName = "nas-1.example";
    client.duid = "00:04:aa:bb";
    client.iaid = 0x0a0000ff;
    client.nameServers = client.routes = client.defaultRoute = false;
    EXPECT_THAT(Texts(parsed), IsEmpty());
    EXPECT_EQ(parsed.file.use, FileUse::kPlain);
    EXPECT_EQ(parsed.file.client, client);
    EXPECT_TRUE(parsed.file.UsesClient());
    EXPECT_TRUE(parsed.file.ClientHearsRouters());
    EXPECT_THAT(parsed.file.metric, Optional(5U));
    EXPECT_THAT(parsed.file.metric6, Optional(6U));
}

TEST(ParseInterfaceFile, SendsNeitherIdNorNameWhereNoneIsAskedFor)
{
    const auto file =
        ParseInterfaceFile("eth0", "BOOTPROTO=dhcp\nDHCP_CLIENT_ID=none\nDHCP_HOSTNAME=none\n")
            .file;

    EXPECT_THAT(file.client.id, Optional(std::string()));
    EXPECT_THAT(file.client.hostName, Optional(std::string()));
    EXPECT_EQ(ParseInterfaceFile("eth0", "BOOTPROTO=dhcp\n").file.client.id, std::nullopt);
    EXPECT_EQ(ParseInterfaceFile("eth0", "BOOTPROTO=dhcp\n").file.client.hostName, std::nullopt);
}

TEST(ParseInterfaceFile, RunsAClientOnlyWhereItHasWorkToDo)
{
    const auto uses = [](const char* text) {
        return ParseInterfaceFile("eth0", text).file.UsesClient();
    };

    EXPECT_TRUE(uses("BOOTPROTO=dhcp\n"));
    EXPECT_TRUE(uses("DHCPV6C=yes\n"));
    EXPECT_TRUE(uses("IPV6_AUTOCONF=yes\n"));
    EXPECT_TRUE(uses("IPV6_AUTOCONF=yes\nIPV6_TOKEN=::1\nDHCPV6C=yes\n"));
    EXPECT_FALSE(uses("IPADDR=192.0.2.5/24\n"));
    EXPECT_FALSE(uses("IPV6_AUTOCONF=yes\nIPV6_TOKEN=::1\n"));
    EXPECT_FALSE(uses("IPV6INIT=no\nIPV6_AUTOCONF=yes\nDHCPV6C=yes\n"));
}

TEST(ParseInterfaceFile, ReadsHowAddressesOfTheKernelsEnd)
{
    const auto file = ParseInterfaceFile("eth0", "IPV6_TOKEN=::AA:0:1\nIPV6_LINKLOCAL=FE80::7\n"
                                                 "IPV6_PRIVACY=rfc3041\n")
                          .file;

    EXPECT_EQ(file.token, "::aa:0:1");
    EXPECT_EQ(file.linkLocal, "fe80::7");
    EXPECT_THAT(file.privacy, Optional(2U));
    EXPECT_THAT(ParseInterfaceFile("eth0", "IPV6_PRIVACY=1\n").file.privacy, Optional(1U));
    EXPECT_THAT(ParseInterfaceFile("eth0", "IPV6_PRIVACY=no\n").file.privacy, Optional(0U));
}

TEST(ParseInterfaceFile, ReadsResolverAndLinkSettings)
{
    const auto parsed = ParseInterfaceFile(
        "eth0", "DNS1=192.0.2.53\nDNS3=2001:DB8::53\nDOMAIN=\"a.example b.example\"\n"
                "ETHTOOL_OPTS=\"speed 100 duplex full; --offload ${DEVICE} tso off;\"\n");

    EXPECT_THAT(Texts(parsed), IsEmpty());
    EXPECT_THAT(parsed.file.nameServers, ElementsAre("192.0.2.53", "2001:db8::53"));
    EXPECT_THAT(parsed.file.searchDomains, ElementsAre("a.example", "b.example"));
    EXPECT_THAT(parsed.file.linkCommands,
                ElementsAre(LinkCommand{"-s", "speed", "100", "duplex", "full"},
                            LinkCommand{"-K", "tso", "off"}));
}

struct RouteRow {
    const char* text;
    const char* arguments; ///< As "ip" is told of it.
};

TEST(ParseInterfaceFile, ReadsRoutes)
{
    for (const RouteRow& row :
         {RouteRow{"198.51.100.0/24 via 192.0.2.9 metric 50",
                   "198.51.100.0/24 via 192.0.2.9 dev eth0 proto static scope global metric 50"},
          RouteRow{"198.51.100.77/24 dev eth0", "198.51.100.0/24 dev eth0 proto static scope link"},
          RouteRow{
              "default via 192.0.2.1 onlink table 100 src 192.0.2.5",
              "default via 192.0.2.1 dev eth0 table 100 proto static scope global src 192.0.2.5 "
              "onlink"},
          RouteRow{"default via FE80::1", "::/0 via fe80::1 dev eth0 proto static metric 1024"},
          RouteRow{"198.51.100.9 via inet6 fe80::1 mtu 1400",
                   "198.51.100.9/32 via inet6 fe80::1 dev eth0 proto static scope global mtu 1400"},
          RouteRow{"unreachable 10.0.0.0/8 metric 4000",
                   "unreachable 10.0.0.0/8 proto static scope global metric 4000"},
          RouteRow{"blackhole 2001:db8::/32",
                   "blackhole 2001:db8::/32 proto static metric 1024"}}) {
        const auto parsed =
            ParseInterfaceFile("eth0", std::string("ROUTE7=\"") + row.text + "\"\n");

        ASSERT_THAT(Texts(parsed), IsEmpty());
        ASSERT_EQ(parsed.file.routes.size(), 1U);
        EXPECT_EQ(RouteArguments(parsed.file.routes[0], [](int) { return "eth0"; }), row.arguments);
    }
}

TEST(ParseInterfaceFile, SaysWhatIsWrongWithARoute)
{
    const std::pair<const char*, const char*> rows[]{
        {"198.51.100.0/33 via 192.0.2.9", "\"198.51.100.0/33\" is no prefix"},
        {"nowhere", "\"nowhere\" is no prefix"},
        {"2001:db8::/32 via 192.0.2.9", "addresses of two families"},
        {"default via", "\"\" is no address"},
        {"default metric much", "metric is followed by no number"},
        {"default via 192.0.2.1 table vpn", "\"vpn\" is no number of a table"},
        {"unreachable default via 192.0.2.1", "a route that leads nowhere has no gateway"}};
    for (const auto& [text, problem] : rows) {
        EXPECT_THAT(Texts(ParseInterfaceFile("eth0", std::string("ROUTE0=\"") + text + "\"\n")),
                    ElementsAre(std::string("error: ifcfg-eth0: ROUTE0=") + text + ": " + problem));
    }
}

TEST(ParseInterfaceFile, ReadsABridgeFile)
{
    const auto parsed = ParseInterfaceFile("ovs_eth0", "DEVICE=ovs_eth0\nTYPE=OVS\nPRIMARY=eth0\n"
                                                       "OVS_VLAN_ID=10\nONBOOT=no\n");

    EXPECT_THAT(Texts(parsed), IsEmpty());
    EXPECT_EQ(parsed.file.use, FileUse::kBridge);
    EXPECT_EQ(parsed.file.primary, "eth0");
    EXPECT_THAT(parsed.file.vlanId, Optional(10U));
    EXPECT_FALSE(parsed.file.onBoot);
}

TEST(ParseInterfaceFile, TakesAFileWithoutDeviceForItsName)
{
    const auto parsed = ParseInterfaceFile("eth0", "IPADDR=\nNETMASK=\nMTU=1500\n");

    EXPECT_THAT(Texts(parsed), IsEmpty());
    EXPECT_EQ(parsed.file.use, FileUse::kPlain);
    EXPECT_THAT(parsed.file.addresses, IsEmpty());
}

TEST(ParseInterfaceFile, LeavesIpv6OutWhenTheFileTurnsItOff)
{
    const auto parsed = ParseInterfaceFile(
        "eth0", "IPV6INIT=no\nIPV6ADDR=2001:db8::5/64\nIPV6_DEFAULTGW=fe80::1\n");

    EXPECT_THAT(parsed.file.addresses, IsEmpty());
    EXPECT_EQ(parsed.file.gateway6, "");
}

TEST(ParseInterfaceFile, ReadsABondAndItsMember)
{
    const auto bond = ParseInterfaceFile(
        "bond0", "DEVICE=bond0\nBONDING_OPTS=\"mode=802.3ad miimon=100\"\nIPADDR=192.0.2.5/24\n");
    const auto member = ParseInterfaceFile("eth0", "DEVICE=eth0\nMASTER=bond0\nSLAVE=yes\n");

    EXPECT_THAT(Texts(bond), IsEmpty());
    EXPECT_EQ(bond.file.use, FileUse::kPlain);
    EXPECT_TRUE(bond.file.bond);
    EXPECT_THAT(bond.file.bondOptions,
                ElementsAre(std::pair("mode", "802.3ad"), std::pair("miimon", "100")));
    EXPECT_THAT(Texts(member), IsEmpty());
    EXPECT_TRUE(member.file.slave);
    EXPECT_EQ(member.file.master, "bond0");
    EXPECT_FALSE(member.file.bond);
}

TEST(ParseInterfaceFile, PassesOverABondOptionWithoutAValue)
{
    const auto parsed = ParseInterfaceFile(
        "bond0", "DEVICE=bond0\nBONDING_OPTS=\"mode=active-backup primary= miimon=100\"\n");

    EXPECT_THAT(Texts(parsed), IsEmpty());
    EXPECT_THAT(parsed.file.bondOptions,
                ElementsAre(std::pair("mode", "active-backup"), std::pair("miimon", "100")));
}

TEST(ParseInterfaceFile, LeavesOutABondOptionThatNoToolWouldRead)
{
    const auto parsed = ParseInterfaceFile(
        "bond0", "DEVICE=bond0\nBONDING_OPTS=\"mode=1 miimon=soon new_option=x updelay=100\"\n");

    EXPECT_THAT(Texts(parsed),
                ElementsAre("error: ifcfg-bond0: "
                            "BONDING_OPTS=mode=1 miimon=soon new_option=x updelay=100: "
                            "\"miimon=soon\" is not a number from 0 to 4294967295"));
    EXPECT_THAT(parsed.file.bondOptions,
                ElementsAre(std::pair("mode", "1"), std::pair("new_option", "x"),
                            std::pair("updelay", "100")));
}

TEST(ParseInterfaceFile, ReadsABondOfTheSwitchOfAnyName)
{
    for (const char* name : {"ovs_bond0", "uplink"}) {
        const auto parsed =
            ParseInterfaceFile(name, std::string("DEVICE=") + name +
                                         "\nTYPE=OVS\nPRIMARY=eth0\nSLAVE_LIST=\"eth0 eth1 \"\n"
                                         "BONDING_OPTS=\"bond_mode=balance-slb lacp=off\"\n");

        EXPECT_THAT(Texts(parsed), IsEmpty());
        EXPECT_EQ(parsed.file.use, FileUse::kBridge) << name;
        EXPECT_THAT(parsed.file.slaveList, ElementsAre("eth0", "eth1"));
        EXPECT_FALSE(parsed.file.bond);
    }
}

TEST(ParseInterfaceFile, ReadsAVlanByItsNameOrByItsKeys)
{
    EXPECT_EQ(ParseInterfaceFile("eth0.10", "DEVICE=eth0.10\n").file.vlan, (FileVlan{"eth0", 10}));
    EXPECT_EQ(ParseInterfaceFile("office", "PHYSDEV=eth1\nVLAN_ID=20\n").file.vlan,
              (FileVlan{"eth1", 20}));
    EXPECT_EQ(ParseInterfaceFile("eth0.4096", "DEVICE=eth0.4096\n").file.vlan, std::nullopt);
    EXPECT_EQ(ParseInterfaceFile("eth0", "DEVICE=eth0\n").file.vlan, std::nullopt);
}

struct LeftAlone {
    const char* description;
    const char* name;
    const char* text;
    const char* remark;
};

class LeavesAlone : public testing::TestWithParam<LeftAlone> {};

TEST_P(LeavesAlone, AndSaysWhy)
{
    const auto parsed = ParseInterfaceFile(GetParam().name, GetParam().text);

    EXPECT_EQ(parsed.file.use, FileUse::kLeaveAlone);
    EXPECT_THAT(Texts(parsed), ElementsAre(std::string("warning: ifcfg-") + GetParam().name + ": " +
                                           GetParam().remark + "; the interface is left as it is"));
}

INSTANTIATE_TEST_SUITE_P(
    Files, LeavesAlone,
    testing::Values(
        LeftAlone{"NothingInIt", "eth0", "# nothing yet\n", "ignored, because it is empty"},
        LeftAlone{"CopiedButNotYetEdited", "ovs_eth0", "DEVICE=eth0\nIPADDR=192.0.2.5\n",
                  "ignored, because its DEVICE is eth0"},
        LeftAlone{"CopiedBackButNotYetEdited", "eth0", "DEVICE=ovs_eth0\nTYPE=OVS\nPRIMARY=eth0\n",
                  "ignored, because its DEVICE is ovs_eth0"},
        LeftAlone{"BridgeWithoutType", "ovs_eth0", "DEVICE=ovs_eth0\nPRIMARY=eth0\n",
                  "ignored, because its TYPE is not OVS"},
        LeftAlone{"BridgeWithoutPort", "ovs_eth0", "DEVICE=ovs_eth0\nTYPE=OVS\n",
                  "ignored, because its PRIMARY is \"\""},
        LeftAlone{"PlainWithBridgeType", "eth0", "DEVICE=eth0\nTYPE=OVS\n",
                  "ignored, because a plain interface cannot have TYPE=OVS"},
        LeftAlone{"Bootp", "eth0", "BOOTPROTO=BOOTP\n", "BOOTPROTO=bootp is unknown"},
        LeftAlone{"UnknownProtocol", "eth0", "BOOTPROTO=magic\n", "BOOTPROTO=magic is unknown"}),
    [](const testing::TestParamInfo<LeftAlone>& row) { return row.param.description; });

struct Refused {
    const char* description;
    const char* text;
    const char* remark;
};

class RefusesValue : public testing::TestWithParam<Refused> {};

TEST_P(RefusesValue, ButTakesTheRest)
{
    const auto parsed = ParseInterfaceFile("eth0", std::string(GetParam().text) +
                                                       "IPADDR9=192.0.2.9\nPREFIX9=24\n");

    EXPECT_EQ(parsed.file.use, FileUse::kPlain);
    EXPECT_FALSE(parsed.file.whole);
    EXPECT_THAT(Texts(parsed), ElementsAre(std::string("error: ifcfg-eth0: ") + GetParam().remark));
    EXPECT_THAT(parsed.file.addresses, ElementsAre(WantedAddress{AF_INET, "192.0.2.9", 24}));
}

INSTANTIATE_TEST_SUITE_P(
    Values, RefusesValue,
    testing::Values(
        Refused{"Address", "IPADDR=192.0.2.256\nPREFIX=24\n",
                "IPADDR=192.0.2.256: not an IPv4 address"},
        Refused{"MissingLength", "IPADDR=192.0.2.5\n",
                "IPADDR=192.0.2.5: no length: neither PREFIX nor NETMASK is usable"},
        Refused{"Mtu", "MTU=jumbo\n", "MTU=jumbo: not a number from 68 to 65535"},
        Refused{"TooLargeTag", "OVS_VLAN_ID=4096\n",
                "OVS_VLAN_ID=4096: not a number from 0 to 4095"},
        Refused{"NegativeMetric", "METRIC=-1\n", "METRIC=-1: not a number from 0 to 4294967295"},
        Refused{"Gateway", "GATEWAY=2001:db8::1\n", "GATEWAY=2001:db8::1: not an IPv4 address"},
        Refused{"Gateway6", "IPV6_DEFAULTGW=192.0.2.1\n",
                "IPV6_DEFAULTGW=192.0.2.1: not an IPv6 address"},
        Refused{"Address6", "IPV6ADDR=2001:db8::5/129\n",
                "IPV6ADDR=2001:db8::5/129: not an IPv6 address with its length"},
        Refused{"NeitherYesNorNo", "ONBOOT=maybe\n", "ONBOOT=maybe: neither yes nor no"},
        Refused{"Privacy", "IPV6_PRIVACY=much\n", "IPV6_PRIVACY=much: not a number from 0 to 2"},
        Refused{"Token", "IPV6_TOKEN=fd00::1\n",
                "IPV6_TOKEN=fd00::1: not the lower half of an IPv6 address"},
        Refused{"LinkLocal", "IPV6_LINKLOCAL=fd00::1\n",
                "IPV6_LINKLOCAL=fd00::1: not a link-local address"},
        Refused{"ClientId", "DHCP_CLIENT_ID=my-id\n",
                "DHCP_CLIENT_ID=my-id: not 2 to 253 bytes in hexadecimal digits"},
        Refused{"Iaid", "DHCP_IAID=12345\n",
                "DHCP_IAID=12345: not 4 to 4 bytes in hexadecimal digits"},
        Refused{"HostName", "DHCP_HOSTNAME=\"a b\"\n", "DHCP_HOSTNAME=a b: not the name of a host"},
        Refused{"NameServer", "DNS1=dns.example\n", "DNS1=dns.example: not an address"},
        Refused{"SearchDomain", "DOMAIN=\"a.example ;b\"\n",
                "DOMAIN=a.example ;b: \";b\" is not a domain"},
        Refused{"Route", "ROUTE0=\"default veja 192.0.2.1\"\n",
                "ROUTE0=default veja 192.0.2.1: \"veja\" is not supported"},
        Refused{"LinkCommands", "ETHTOOL_OPTS=\"-f eth0 firmware\"\n",
                "ETHTOOL_OPTS=-f eth0 firmware: not settings of a link"},
        Refused{"BondOption", "BONDING_OPTS=\"mode=1 miimon=1\x1b\"\n",
                "BONDING_OPTS=mode=1 miimon=1\x1b: \"miimon=1\x1b\" is not NAME=VALUE"},
        Refused{"BondMode", "BONDING_OPTS=\"mode=7\"\n",
                "BONDING_OPTS=mode=7: \"mode=7\" is none of balance-rr, active-backup,"
                " balance-xor, broadcast, 802.3ad, balance-tlb, balance-alb"},
        Refused{"VlanParent", "PHYSDEV=\"eth1 up\"\nVLAN_ID=5\n",
                "PHYSDEV=eth1 up: no interface name"},
        Refused{"Slave", "SLAVE_LIST=\"eth1 --x\"\n",
                "SLAVE_LIST=eth1 --x: \"--x\" is no interface name"},
        Refused{"LinkAddress", "MACADDR=02:00:00:00:00:01\n",
                "MACADDR=02:00:00:00:00:01: changing the link address is not supported yet"}),
    [](const testing::TestParamInfo<Refused>& row) { return row.param.description; });

TEST(ParseInterfaceFile, NamesTheNetmaskThatIsNone)
{
    const auto parsed = ParseInterfaceFile("eth0", "IPADDR=192.0.2.5\nNETMASK=255.0.255.0\n");

    EXPECT_THAT(Texts(parsed),
                ElementsAre("error: ifcfg-eth0: NETMASK=255.0.255.0: not a netmask",
                            "error: ifcfg-eth0: IPADDR=192.0.2.5: no length: neither PREFIX nor "
                            "NETMASK is usable"));
}

TEST(ParseInterfaceFile, TakesAFileWithoutLastLineBreakForUnfinished)
{
    EXPECT_FALSE(ParseInterfaceFile("eth0", "DEVICE=eth0\nIPADDR=192.0.2.5\nPREFIX=2").file.whole);
    EXPECT_TRUE(ParseInterfaceFile("eth0", "DEVICE=eth0\n").file.whole);
}

TEST(InterfaceOfFileName, KnowsBackupsAndForeignFiles)
{
    EXPECT_EQ(InterfaceOfFileName("ifcfg-eth0"), "eth0");
    EXPECT_EQ(InterfaceOfFileName("ifcfg-ovs_eth0"), "ovs_eth0");
    EXPECT_EQ(InterfaceOfFileName("ifcfg-eth0.10"), "eth0.10");
    for (const char* name :
         {"ifcfg-", "ifcfg-eth0~", "ifcfg-eth0.bak", "ifcfg-eth0.rpmsave", "ifcfg-eth0.orig",
          ".ifcfg-eth0.swp", "route-eth0", "ifcfg-an_interface_of_a_long_name", "network"}) {
        EXPECT_EQ(InterfaceOfFileName(name), "") << name;
    }
}

} // namespace
} // namespace vornhost
