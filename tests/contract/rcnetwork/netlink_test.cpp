#include "host.h"

#include "support/netlink.h"

#include <gmock/gmock.h>

#include <algorithm>

#include <linux/if_addr.h>
#include <linux/rtnetlink.h>
#include <sys/socket.h>

namespace contract {
namespace {

using namespace vornhost;

Link Find(const std::string& name)
{
    for (const Link& link : ReadLinks()) {
        if (link.name == name) {
            return link;
        }
    }
    return {};
}

Address FindAddress(const std::string& local)
{
    const auto all = ReadAddresses().value();
    const auto found = std::find_if(all.begin(), all.end(),
                                    [&](const Address& address) { return address.local == local; });
    return found == all.end() ? Address() : *found;
}

Route FindRoute(const std::string& destination)
{
    const auto all = ReadRoutes().value();
    const auto found = std::find_if(all.begin(), all.end(), [&](const Route& route) {
        return route.destination == destination;
    });
    return found == all.end() ? Route() : *found;
}

TEST_F(Host, LinksAreReadWithTheirState)
{
    Ip("link set dev eth0 address 02:00:00:00:00:0a mtu 1400");

    const Link down = Find("eth0");
    EXPECT_EQ(down.mac, "02:00:00:00:00:0a");
    EXPECT_EQ(down.mtu, 1400U);
    EXPECT_EQ(down.kind, "veth");
    EXPECT_FALSE(down.up);
    EXPECT_FALSE(down.carrier);

    Ip("link set dev eth0 up");
    EXPECT_TRUE(Find("eth0").up);
    EXPECT_TRUE(WaitUntil([] { return Find("eth0").carrier; }));
    EXPECT_TRUE(Find("lo").loopback);
}

TEST_F(Host, AddressesAreReadWithAllThatMakesThemAgain)
{
    Ip("link set dev eth0 up");
    Ip("addr add 192.0.2.5/24 brd 192.0.2.255 dev eth0 label eth0:1 noprefixroute");
    Ip("addr add 192.0.2.6 peer 203.0.113.1/32 dev eth0 metric 77");
    Ip("addr add 2001:db8::5/64 dev eth0 nodad valid_lft 1000 preferred_lft 500");

    const Address plain = FindAddress("192.0.2.5");
    EXPECT_EQ(plain.broadcast, "192.0.2.255");
    EXPECT_EQ(plain.label, "eth0:1");
    EXPECT_NE(plain.flags & IFA_F_NOPREFIXROUTE, 0U);
    EXPECT_EQ(plain.validSeconds, UINT32_MAX);

    const Address peer = FindAddress("192.0.2.6");
    EXPECT_EQ(peer.peer, "203.0.113.1");
    EXPECT_EQ(peer.prefixLength, 32U);
    EXPECT_EQ(peer.metric, 77U);

    const Address timed = FindAddress("2001:db8::5");
    EXPECT_EQ(timed.prefixLength, 64U);
    EXPECT_NE(timed.flags & IFA_F_NODAD, 0U);
    EXPECT_THAT(timed.validSeconds, testing::AllOf(testing::Gt(900U), testing::Le(1000U)));
}

TEST_F(Host, RoutesAreReadWithAllThatMakesThemAgain)
{
    Ip("link set dev eth0 up");
    Ip("link set dev eth1 up");
    Ip("addr add 192.0.2.5/24 dev eth0");
    Ip("addr add 2001:db8::5/64 dev eth0 nodad");
    Ip("route add 10.1.0.0/16 via 192.0.2.1 metric 5 src 192.0.2.5 mtu lock 1400 table 1000");
    Ip("route add 10.2.0.0/16 nexthop via 192.0.2.1 weight 3 nexthop dev eth1");
    Ip("route add 10.3.0.0/16 via inet6 fe80::1 dev eth0");
    Ip("-6 route add 2001:db8:1::/48 via 2001:db8::1 expires 100 pref high");

    const Route plain = FindRoute("10.1.0.0");
    EXPECT_EQ(plain.table, 1000U);
    EXPECT_EQ(plain.priority, 5U);
    EXPECT_EQ(plain.source, "192.0.2.5");
    ASSERT_EQ(plain.metrics.size(), 1U);
    EXPECT_EQ(plain.metrics[0].kind, static_cast<unsigned>(RTAX_MTU));
    EXPECT_EQ(plain.metrics[0].value, 1400U);
    EXPECT_TRUE(plain.metrics[0].locked);

    const Route both = FindRoute("10.2.0.0");
    ASSERT_EQ(both.nextHops.size(), 2U);
    EXPECT_EQ(both.nextHops[0].gateway, "192.0.2.1");
    EXPECT_EQ(both.nextHops[0].weight, 3U);
    EXPECT_EQ(both.nextHops[1].index, Find("eth1").index);

    EXPECT_EQ(FindRoute("10.3.0.0").nextHops[0].gatewayFamily, AF_INET6);
    const Route timed = FindRoute("2001:db8:1::");
    EXPECT_THAT(timed.expiresSeconds, testing::AllOf(testing::Gt(90U), testing::Le(100U)));
    EXPECT_EQ(timed.preference, 1);
}

TEST_F(Host, RoutesThatTheKernelMakesOfAddressesAreLeftOut)
{
    Ip("link set dev eth0 up");
    Ip("addr add 192.0.2.5/24 dev eth0");

    EXPECT_EQ(FindRoute("192.0.2.0").destination, "");
}

TEST_F(Host, NeighboursAreRead)
{
    Ip("link set dev eth0 up");
    Ip("neigh add 192.0.2.9 lladdr 02:00:00:00:00:09 dev eth0 nud permanent");

    const auto neighbours = ReadNeighbours().value();
    ASSERT_EQ(neighbours.size(), 1U);
    EXPECT_EQ(neighbours[0].address, "192.0.2.9");
    EXPECT_EQ(neighbours[0].mac, "02:00:00:00:00:09");
    EXPECT_TRUE(neighbours[0].permanent);
}

} // namespace
} // namespace contract
