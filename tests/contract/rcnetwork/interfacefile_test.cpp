#include "support/interfacefile.h"

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
        LeftAlone{"Dhcp", "eth0", "BOOTPROTO=DHCP\n", "BOOTPROTO=dhcp is not supported yet"},
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
