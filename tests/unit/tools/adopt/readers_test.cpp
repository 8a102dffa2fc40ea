#include "adopt/recordedhost.h"

#include <adopt/boundaries.h>
#include <adopt/writer.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using unit::Recorded;
using unit::RecordedHost;
using vornovsctl::ReadWishes;
using vornovsctl::Wish;
using vornovsctl::Wishes;

constexpr char kMac0[] = "52:54:00:00:00:00";
constexpr char kMac1[] = "52:54:00:00:00:01";
constexpr char kFixed[] = "/etc/systemd/network/20-eth1.network";

/** The only interface that is to be taken over. */
Wish OnlyWish(const RecordedHost& host)
{
    const Wishes wishes = ReadWishes(host.view, {});
    EXPECT_EQ(wishes.size(), 1U);
    return wishes.empty() ? Wish() : wishes.begin()->second;
}

std::string TextOf(const Wish& wish)
{
    EXPECT_THAT(wish.obstacles, IsEmpty());
    return FileTextOf(wish);
}

/** systemd-networkd manages eth1 by this file. */
void PutUnderNetworkd(RecordedHost& host, const std::string& text)
{
    host.AddLink("eth1", kMac1);
    host.Write(kFixed, text);
    host.Answer("networkctl --json=short list",
                R"({"Interfaces":[{"Name":"eth1","AdministrativeState":"configured",)"
                R"("NetworkFile":"/etc/systemd/network/20-eth1.network"}]})");
}

TEST(Networkd, ItsLeaseAndIdentityAreCarriedOver)
{
    RecordedHost host;
    host.AddLink("eth0", kMac0);
    host.AddAddress("eth0", "192.0.2.17", 26, false);
    host.AddAddress("eth0", "2001:db8::5054:ff:fe00:0", 64, false);
    host.AddAddress("eth0", "fe80::5054:ff:fe00:0", 64);
    host.AddDefaultRoute("eth0", "192.0.2.1", 100);
    host.Answer("networkctl --json=short list", Recorded("networkd/list.json"));
    host.Write("/run/systemd/netif/links/2", Recorded("networkd/link2"));
    host.Write("/run/systemd/netif/leases/2", Recorded("networkd/lease2"));
    host.Write("/run/systemd/network/10-netplan-eth0.network",
               "[Match]\nName=eth0\n\n[Network]\nDHCP=ipv4\nLinkLocalAddressing=ipv6\n\n"
               "[DHCP]\nRouteMetric=100\nUseMTU=true\n");

    const Wish wish = ReadWishes(host.view, {"eth0"}).at("eth0");

    EXPECT_EQ(TextOf(wish), "DEVICE=eth0\n"
                            "ONBOOT=yes\n"
                            "BOOTPROTO=dhcp\n"
                            "METRIC=100\n"
                            "IPV6_AUTOCONF=yes\n"
                            "DHCP_CLIENT_ID=ff:30:5f:9d:aa:00:02:00:00:ab:11:4f:06:47:8a:dc:b9:7e:"
                            "4a\n"
                            "DHCPV6_DUID=00:02:00:00:ab:11:4f:06:47:8a:dc:b9:7e:4a\n"
                            "DHCP_IAID=305f9daa\n"
                            "PEERDNS=no\n");
    EXPECT_EQ(wish.origin, "/run/systemd/network/10-netplan-eth0.network");
    const vornovsctl::Lease lease{"192.0.2.17",  "255.255.255.192", "192.0.2.1", {"192.0.2.1"},
                                  {"192.0.2.1"}, "example.net",     600,         0};
    EXPECT_EQ(wish.lease, lease);
}

TEST(Networkd, FixedAddressesRoutesAndNameServersAreCarriedOver)
{
    RecordedHost host;
    PutUnderNetworkd(host, "[Match]\nName=eth1\n[Link]\nMTUBytes=9000\n"
                           "[Network]\nAddress=192.0.2.70/26\nAddress=2001:db8:1::70/64\n"
                           "Gateway=192.0.2.65\nDNS=192.0.2.65\nDomains=example.org ~example.com\n"
                           "IPv6AcceptRA=no\n"
                           "[Address]\nAddress=192.0.2.71/26\n"
                           "[Route]\nDestination=198.51.100.0/24\nGateway=192.0.2.66\nMetric=50\n"
                           "[Route]\nGateway=2001:db8:1::1\nMetric=7\n"
                           "[Route]\nDestination=203.0.113.0/24\nType=blackhole\n");
    host.Write("/run/systemd/resolve/resolv.conf", "");

    const Wish wish = OnlyWish(host);

    EXPECT_EQ(TextOf(wish), "DEVICE=eth1\n"
                            "ONBOOT=yes\n"
                            "MTU=9000\n"
                            "BOOTPROTO=none\n"
                            "IPADDR=192.0.2.70\n"
                            "PREFIX=26\n"
                            "IPADDR1=192.0.2.71\n"
                            "PREFIX1=26\n"
                            "GATEWAY=192.0.2.65\n"
                            "IPV6_AUTOCONF=no\n"
                            "IPV6INIT=yes\n"
                            "IPV6ADDR=2001:db8:1::70/64\n"
                            "IPV6_DEFAULTGW=2001:db8:1::1\n"
                            "IPV6_METRIC=7\n"
                            "DNS1=192.0.2.65\n"
                            "DOMAIN=\"example.org\"\n"
                            "ROUTE0=\"198.51.100.0/24 via 192.0.2.66 metric 50\"\n"
                            "ROUTE1=\"blackhole 203.0.113.0/24\"\n");
    EXPECT_THAT(wish.remarks, ElementsAre("the routing domain '~example.com' of its resolver has "
                                          "no like and is left out"));
}

TEST(Networkd, NameServersThatNeverReachedTheResolverStayAway)
{
    RecordedHost host;
    PutUnderNetworkd(host, "[Network]\nAddress=192.0.2.70/26\nDNS=192.0.2.65\n");

    EXPECT_EQ(TextOf(OnlyWish(host)), "DEVICE=eth1\n"
                                      "ONBOOT=yes\n"
                                      "BOOTPROTO=none\n"
                                      "IPADDR=192.0.2.70\n"
                                      "PREFIX=26\n"
                                      "IPV6_AUTOCONF=yes\n"
                                      "PEERDNS=no\n");
}

TEST(Networkd, WhatIsDroppedInCounts)
{
    RecordedHost host;
    PutUnderNetworkd(host, "[Network]\nAddress=192.0.2.70/26\nIPv6AcceptRA=no\n");
    host.Write("/usr/lib/systemd/network/20-eth1.network.d/a.conf",
               "[Network]\nGateway=192.0.2.1\n");
    host.Write("/etc/systemd/network/20-eth1.network.d/a.conf", "[Network]\nGateway=192.0.2.65\n");

    EXPECT_EQ(OnlyWish(host).gateway4, "192.0.2.65");
}

TEST(Networkd, WhatHasNoLikeIsRefusedWithItsPlace)
{
    RecordedHost host;
    PutUnderNetworkd(host, "[Network]\nDHCP=yes\nDHCPServer=yes\nBridge=br0\n"
                           "[DHCPv4]\nSendOption=12:string:x\n[RoutingPolicyRule]\nTable=5\n");

    const std::string path = kFixed;
    EXPECT_THAT(OnlyWish(host).obstacles,
                ElementsAre(path + ": DHCPServer=yes cannot be carried over",
                            path + ": Bridge=br0 cannot be carried over",
                            path + ": SendOption=12:string:x cannot be carried over",
                            path + ": the section [RoutingPolicyRule] cannot be carried over"));
}

TEST(Networkd, AnInterfaceThatIsStillBroughtUpIsRefused)
{
    RecordedHost host;
    PutUnderNetworkd(host, "[Network]\nAddress=192.0.2.70/26\n");
    host.Answer("networkctl --json=short list",
                R"({"Interfaces":[{"Name":"eth1","AdministrativeState":"configuring",)"
                R"("NetworkFile":"/etc/systemd/network/20-eth1.network"}]})");

    EXPECT_THAT(OnlyWish(host).obstacles, ElementsAre("systemd-networkd is still bringing it up: "
                                                      "try again in a moment"));
    host.Link("eth1").carrier = false;
    EXPECT_THAT(OnlyWish(host).obstacles, IsEmpty());
}

TEST(NetworkManager, ItsLeaseIdentityAndIdentifiersAreCarriedOver)
{
    RecordedHost host;
    host.AddLink("eth0", kMac0);
    host.AddAddress("eth0", "192.0.2.18", 26, false);
    host.AddAddress("eth0", "2001:db8::180", 128, false);
    host.AddAddress("eth0", "2001:db8::1f97:2d92:38c6:f800", 64, false);
    host.AddAddress("eth0", "fe80::5b29:55b1:21d9:af76", 64);
    host.AddDefaultRoute("eth0", "192.0.2.1", 100);
    host.AddDefaultRoute("eth0", "fe80::1", 100);
    host.Answer("nmcli -t -e yes -f DEVICE,STATE,CON-UUID device",
                Recorded("networkmanager/devices"));
    host.Answer("nmcli -t connection show 11111111-2222-3333-4444-555555555555",
                Recorded("networkmanager/profile-eth0"));
    host.Answer("nmcli -t -f DHCP4.OPTION,DHCP6.OPTION device show eth0",
                Recorded("networkmanager/options-eth0"));

    const Wish wish = OnlyWish(host);

    EXPECT_EQ(TextOf(wish), "DEVICE=eth0\n"
                            "ONBOOT=yes\n"
                            "BOOTPROTO=dhcp\n"
                            "METRIC=100\n"
                            "IPV6_AUTOCONF=yes\n"
                            "DHCPV6C=yes\n"
                            "IPV6_METRIC=100\n"
                            "IPV6_TOKEN=::1f97:2d92:38c6:f800\n"
                            "IPV6_LINKLOCAL=fe80::5b29:55b1:21d9:af76\n"
                            "DHCP_CLIENT_ID=01:52:54:00:00:00:00\n"
                            "DHCPV6_DUID=00:04:e9:af:34:be:6d:72:04:f9:ee:c7:5d:72:5c:01:a1:8b\n"
                            "DHCP_IAID=2b506735\n");
    EXPECT_EQ(wish.manager, vornovsctl::Manager::kNetworkManager);
    EXPECT_EQ(wish.origin, "lan");
    ASSERT_TRUE(wish.lease);
    EXPECT_EQ(wish.lease->address, "192.0.2.18");
    EXPECT_EQ(wish.lease->seconds, 600U);
}

TEST(NetworkManager, FixedAddressesRoutesAndLinkSettingsAreCarriedOver)
{
    RecordedHost host;
    host.AddLink("eth1", kMac1);
    host.AddDefaultRoute("eth1", "192.0.2.65", 101);
    host.Answer("nmcli -t -e yes -f DEVICE,STATE,CON-UUID device", "eth1:connected:one\n");
    host.Answer("nmcli -t connection show one", Recorded("networkmanager/profile-eth1"));

    EXPECT_EQ(TextOf(OnlyWish(host)),
              "DEVICE=eth1\n"
              "ONBOOT=yes\n"
              "MTU=9000\n"
              "ETHTOOL_OPTS=\"speed 1000 duplex full autoneg off wol g; -K eth1 tso off\"\n"
              "BOOTPROTO=none\n"
              "IPADDR=192.0.2.70\n"
              "PREFIX=26\n"
              "IPADDR1=192.0.2.71\n"
              "PREFIX1=26\n"
              "GATEWAY=192.0.2.65\n"
              "METRIC=101\n"
              "IPV6_AUTOCONF=no\n"
              "IPV6INIT=yes\n"
              "IPV6ADDR=2001:db8:1::70/64\n"
              "DNS1=192.0.2.65\n"
              "DOMAIN=\"example.org\"\n"
              "ROUTE0=\"198.51.100.0/24 via 192.0.2.66 metric 50\"\n"
              "ROUTE1=\"203.0.113.0/24 via 192.0.2.66 src 192.0.2.71\"\n");
}

TEST(NetworkManager, WhatHasNoLikeIsRefused)
{
    RecordedHost host;
    host.AddLink("eth1", kMac1);
    host.Answer("nmcli -t -e yes -f DEVICE,STATE,CON-UUID device", "eth1:connected:one\n");
    host.Answer("nmcli -t connection show one", "connection.id:box\n"
                                                "connection.type:802-3-ethernet\n"
                                                "connection.slave-type:bridge\n"
                                                "802-1x.eap:tls\n"
                                                "ipv4.method:shared\n"
                                                "ipv4.routing-rules:priority 5 from 0.0.0.0/0\n"
                                                "ipv6.method:ignore\n");

    EXPECT_THAT(OnlyWish(host).obstacles,
                ElementsAre("profile 'box': connection.slave-type=bridge cannot be carried over",
                            "profile 'box': 802-1x.eap=tls cannot be carried over",
                            "profile 'box': ipv4.method=shared cannot be carried over",
                            "profile 'box': ipv4.routing-rules=priority 5 from 0.0.0.0/0 cannot be "
                            "carried over"));
}

TEST(Ifupdown, ItsLeaseAndIdentityAreCarriedOver)
{
    RecordedHost host;
    host.AddLink("eth0", kMac0);
    host.AddDefaultRoute("eth0", "192.0.2.1", 0);
    host.Write("/etc/network/interfaces", "auto eth0\niface eth0 inet dhcp\n"
                                          "iface eth0 inet6 auto\n\tprivext 2\n");
    host.Write("/var/lib/dhcp/dhclient.eth0.leases", Recorded("ifupdown/dhclient.eth0.leases"));
    host.Write("/etc/dhcp/dhclient.conf",
               "# option host-name\nsend host-name = gethostname();\nrequest subnet-mask,\n"
               "\trouters;\n");

    const Wish wish = OnlyWish(host);

    EXPECT_EQ(TextOf(wish), "DEVICE=eth0\n"
                            "ONBOOT=yes\n"
                            "BOOTPROTO=dhcp\n"
                            "METRIC=0\n"
                            "IPV6_PRIVACY=rfc3041\n"
                            "DHCP_CLIENT_ID=ff:00:00:00:00:00:01:00:01:32:94:16:f4:52:54:00:00:00:"
                            "00\n"
                            "DHCPV6_DUID=00:01:00:01:32:94:16:f4:52:54:00:00:00:00\n");
    const vornovsctl::Lease lease{"192.0.2.19",  "255.255.255.192", "192.0.2.1", {"192.0.2.1"},
                                  {"192.0.2.1"}, "example.net",     600,         1795250807};
    EXPECT_EQ(wish.lease, lease);
}

TEST(Ifupdown, ItsClientTellsServersOfIpv6NoNameUnlessItIsAskedTo)
{
    RecordedHost host;
    host.AddLink("eth0", kMac0);
    host.Write("/etc/network/interfaces", "auto eth0\niface eth0 inet6 dhcp\n");

    EXPECT_THAT(TextOf(OnlyWish(host)), HasSubstr("DHCP_HOSTNAME=none\n"));

    host.Write("/etc/dhcp/dhclient.conf", "send fqdn.fqdn = gethostname();\n");

    EXPECT_THAT(TextOf(OnlyWish(host)), Not(HasSubstr("DHCP_HOSTNAME")));

    host.Write("/etc/dhcp/dhclient.conf", "send host-name = gethostname();\n");
    host.Write("/etc/network/interfaces",
               "auto eth0\niface eth0 inet dhcp\niface eth0 inet6 dhcp\n");

    EXPECT_THAT(TextOf(OnlyWish(host)), Not(HasSubstr("DHCP_HOSTNAME")));
    EXPECT_THAT(OnlyWish(host).remarks,
                ElementsAre("servers of IPv6 will be told the host's name as well"));
}

TEST(Ifupdown, FixedAddressesRoutesAndCommandsAreCarriedOver)
{
    RecordedHost host;
    host.AddLink("eth1", kMac1);
    host.Write("/etc/network/interfaces",
               "auto eth1\n"
               "iface eth1 inet static\n"
               "\taddress 192.0.2.70\n\tnetmask 255.255.255.192\n\tgateway 192.0.2.65\n"
               "\tmetric 5\n\tmtu 9000\n\tdns-nameservers 192.0.2.65 192.0.2.66\n"
               "\tdns-search example.org\n"
               "\tup ip route add 198.51.100.0/24 via 192.0.2.66 dev $IFACE metric 50 || true\n"
               "\tup /sbin/route add -net 203.0.113.0 netmask 255.255.255.0 gw 192.0.2.66\n"
               "\tpost-up ip link set $IFACE up\n"
               "\tpost-up ethtool -K $IFACE tso off\n"
               "\tdown ip route del 198.51.100.0/24\n"
               "iface eth1 inet6 static\n"
               "\taddress 2001:db8:1::70\n\tnetmask 64\n\tgateway 2001:db8:1::1\n");
    host.Write("/proc/sys/net/ipv6/conf/eth1/accept_ra", "0\n");
    host.Write("/proc/sys/net/ipv6/conf/eth1/use_tempaddr", "0\n");

    EXPECT_EQ(TextOf(OnlyWish(host)), "DEVICE=eth1\n"
                                      "ONBOOT=yes\n"
                                      "MTU=9000\n"
                                      "ETHTOOL_OPTS=\"-K eth1 tso off\"\n"
                                      "BOOTPROTO=none\n"
                                      "IPADDR=192.0.2.70\n"
                                      "PREFIX=26\n"
                                      "GATEWAY=192.0.2.65\n"
                                      "METRIC=5\n"
                                      "IPV6_AUTOCONF=no\n"
                                      "IPV6INIT=yes\n"
                                      "IPV6ADDR=2001:db8:1::70/64\n"
                                      "IPV6_DEFAULTGW=2001:db8:1::1\n"
                                      "DNS1=192.0.2.65\n"
                                      "DNS2=192.0.2.66\n"
                                      "DOMAIN=\"example.org\"\n"
                                      "ROUTE0=\"198.51.100.0/24 via 192.0.2.66 metric 50\"\n"
                                      "ROUTE1=\"203.0.113.0/24 via 192.0.2.66\"\n");
}

TEST(Ifupdown, WhatHasNoLikeIsRefusedWithItsPlace)
{
    RecordedHost host;
    host.AddLink("eth1", kMac1);
    host.Write("/etc/network/interfaces",
               "auto eth1\niface eth1 inet static\n\taddress 192.0.2.70/26\n"
               "\tpointopoint 192.0.2.1\n\tup iptables-restore < /etc/rules\n"
               "\tdown rm /run/marker\niface eth1 inet6 6to4\n");

    const std::string path = "/etc/network/interfaces: ";
    EXPECT_THAT(OnlyWish(host).obstacles,
                ElementsAre(path + "its option 'pointopoint' cannot be carried over",
                            path + "its command 'up iptables-restore < /etc/rules' cannot be "
                                   "carried over",
                            path + "its command 'down rm /run/marker' cannot be carried over",
                            path + "its method 'inet6 6to4' cannot be carried over"));
}

TEST(ReadWishes, BringsBondsWithTheirMembersAndVlans)
{
    RecordedHost host;
    const int bond = host.AddLink("bond0", kMac0, "bond");
    host.AddLink("eth0", kMac0);
    host.AddLink("eth1", kMac1);
    host.AddLink("bond0.10", kMac0, "vlan");
    host.Link("eth0").master = bond;
    host.Link("eth1").master = bond;
    host.Link("bond0.10").parent = bond;
    host.Link("bond0.10").vlanId = 10;
    host.view.liveBonds["bond0"] =
        vornhost::BondOptions::Parse("mode=active-backup miimon=100 primary=eth0");
    host.Write("/etc/network/interfaces",
               "auto bond0\niface bond0 inet manual\n\tbond-slaves eth0 eth1\n\tbond-mode 1\n"
               "auto bond0.10\niface bond0.10 inet static\n\taddress 192.0.2.70/26\n");

    const Wishes wishes = ReadWishes(host.view, {"eth1"});

    ASSERT_EQ(wishes.size(), 4U);
    EXPECT_EQ(TextOf(wishes.at("bond0")),
              "DEVICE=bond0\n"
              "ONBOOT=yes\n"
              "TYPE=Bond\n"
              "BONDING_OPTS=\"mode=active-backup miimon=100 primary=eth0\"\n"
              "BOOTPROTO=none\n");
    EXPECT_EQ(TextOf(wishes.at("bond0.10")), "DEVICE=bond0.10\n"
                                             "ONBOOT=yes\n"
                                             "VLAN=yes\n"
                                             "PHYSDEV=bond0\n"
                                             "VLAN_ID=10\n"
                                             "BOOTPROTO=none\n"
                                             "IPADDR=192.0.2.70\n"
                                             "PREFIX=26\n");
    EXPECT_EQ(TextOf(wishes.at("eth0")), "DEVICE=eth0\n"
                                         "ONBOOT=yes\n"
                                         "MASTER=bond0\n"
                                         "SLAVE=yes\n");
    EXPECT_EQ(wishes.at("eth1").manager, vornovsctl::Manager::kIfupdown);
}

TEST(ReadWishes, LeavesWirelessAndForeignInterfacesAlone)
{
    RecordedHost host;
    host.AddLink("wlan0", kMac0);
    host.AddLink("eth1", kMac1);
    host.AddLink("veth7", kMac1, "veth");
    host.AddAddress("veth7", "198.51.100.1", 24);
    host.Write("/sys/class/net/wlan0/wireless/retry", "");
    host.Write("/etc/network/interfaces", "iface wlan0 inet dhcp\niface eth1 inet manual\n");

    const Wishes wishes = ReadWishes(host.view, {});

    EXPECT_EQ(wishes.size(), 1U);
    EXPECT_TRUE(wishes.contains("eth1"));
    EXPECT_THAT(ReadWishes(host.view, {"wlan0"}).at("wlan0").obstacles,
                ElementsAre("it is no wired interface, bond or VLAN"));
    EXPECT_THAT(ReadWishes(host.view, {"eth9"}).at("eth9").obstacles,
                ElementsAre("there is no such interface"));
}

TEST(ReadWishes, RefusesWhatIsPartOfABridgeOrOfTwoManagers)
{
    RecordedHost host;
    const int bridge = host.AddLink("br0", kMac0, "bridge");
    host.AddLink("eth0", kMac0);
    host.Link("eth0").master = bridge;
    PutUnderNetworkd(host, "[Network]\nAddress=192.0.2.70/26\n");
    host.Write("/etc/network/interfaces", "iface eth0 inet manual\niface eth1 inet dhcp\n");

    const Wishes wishes = ReadWishes(host.view, {});

    EXPECT_THAT(wishes.at("eth0").obstacles,
                ElementsAre("it is a port of br0, which is a bridge and cannot be carried over"));
    EXPECT_THAT(wishes.at("eth1").obstacles,
                ElementsAre("several managers have it in their files: decide on one first"));
}

TEST(ReadWishes, TakesOverWhatNobodyManages)
{
    RecordedHost host;
    host.AddLink("eth0", kMac0);
    host.AddAddress("eth0", "192.0.2.10", 24);
    host.AddAddress("eth0", "2001:db8::10", 64);
    host.AddDefaultRoute("eth0", "192.0.2.1", 7);

    EXPECT_EQ(TextOf(OnlyWish(host)), "DEVICE=eth0\n"
                                      "ONBOOT=yes\n"
                                      "BOOTPROTO=none\n"
                                      "IPADDR=192.0.2.10\n"
                                      "PREFIX=24\n"
                                      "GATEWAY=192.0.2.1\n"
                                      "METRIC=7\n"
                                      "IPV6INIT=yes\n"
                                      "IPV6ADDR=2001:db8::10/64\n");
}

TEST(ReadWishes, TellsOfAddressesThatAreInNoFile)
{
    RecordedHost host;
    PutUnderNetworkd(host, "[Network]\nAddress=192.0.2.70/26\nIPv6AcceptRA=no\n");
    host.AddAddress("eth1", "192.0.2.70", 26);
    host.AddAddress("eth1", "192.0.2.99", 26);

    EXPECT_THAT(OnlyWish(host).remarks,
                ElementsAre("192.0.2.99 is in no file and will be gone after the next boot"));
}

} // namespace
