#include "support/vlanrules.h"

#include "support/tagdevice.h"

#include <gtest/gtest.h>
#include <linux/rtnetlink.h>
#include <sys/socket.h>

namespace {

using vornhost::Address;
using vornhost::Link;
using vornhost::LiveNetwork;

Link MakeLink(int index, const std::string& name, const std::string& kind = "")
{
    Link link;
    link.index = index;
    link.name = name;
    link.kind = kind;
    return link;
}

Link MakeVlan(int index, const std::string& name, int parent, int id)
{
    Link link = MakeLink(index, name, "vlan");
    link.parent = parent;
    link.vlanId = id;
    link.vlanProtocol = 0x8100;
    return link;
}

/** eth0 and, as the last one, its VLAN. */
LiveNetwork Host()
{
    LiveNetwork network;
    network.links = {MakeLink(2, "eth0"), MakeVlan(3, "eth0.10", 2, 10)};
    return network;
}

std::string Obstacle(const LiveNetwork& network, bool parentsOwn = false)
{
    return vornhost::ObstacleToTag(network, *network.Find("eth0.10"), parentsOwn);
}

Address MakeAddress(int index, unsigned scope)
{
    Address address;
    address.index = index;
    address.family = AF_INET;
    address.scope = scope;
    return address;
}

TEST(ObstacleToTag, IsNoneForTheOnlyVlanOfAParentWithoutAddresses)
{
    LiveNetwork network = Host();
    network.addresses = {MakeAddress(3, RT_SCOPE_UNIVERSE), MakeAddress(2, RT_SCOPE_LINK)};
    EXPECT_EQ(Obstacle(network), "");

    network.links.push_back(MakeVlan(4, "tag2.10", 2, 10));
    network.links.push_back(MakeVlan(5, "eth1.10", 6, 10));
    EXPECT_EQ(Obstacle(network), "") << "made for a tag, and another's";
}

TEST(ObstacleToTag, IsAnAddressOfTheParent)
{
    LiveNetwork network = Host();
    EXPECT_EQ(Obstacle(network, true), "eth0 has addresses of its own");

    network.addresses = {MakeAddress(2, RT_SCOPE_UNIVERSE)};
    EXPECT_EQ(Obstacle(network), "eth0 has addresses of its own");
}

TEST(ObstacleToTag, IsAnotherVlanOnTheParentOrOnTheVlan)
{
    LiveNetwork network = Host();
    network.links.push_back(MakeVlan(4, "eth0.20", 2, 20));
    EXPECT_EQ(Obstacle(network), "eth0.20 is on it too");

    network.links.back().parent = 3;
    EXPECT_EQ(Obstacle(network), "VLANs stand on one another");

    network = Host();
    network.links[0].kind = "vlan";
    EXPECT_EQ(Obstacle(network), "VLANs stand on one another");
}

TEST(ObstacleToTag, IsAnotherKindOfTags)
{
    LiveNetwork network = Host();
    network.links[1].vlanProtocol = 0x88a8;

    EXPECT_EQ(Obstacle(network), "its tags are not of 802.1Q");
}

TEST(ObstacleToTag, IsAParentThatCannotBecomeAPort)
{
    for (const char* const name : {"wlan0", "tun0", "ppp0", "ovs_eth0", "twelve-chars"}) {
        LiveNetwork network = Host();
        network.links[0].name = name;
        EXPECT_EQ(Obstacle(network), std::string(name) + " cannot be a port of the switch");
    }
    for (const char* const kind : {"bridge", "openvswitch"}) {
        LiveNetwork network = Host();
        network.links[0].kind = kind;
        EXPECT_EQ(Obstacle(network), "eth0 cannot be a port of the switch") << kind;
    }

    LiveNetwork network = Host();
    network.links[0].master = 9;
    network.links.push_back(MakeLink(9, "bond0", "bond"));
    EXPECT_EQ(Obstacle(network), "eth0 cannot be a port of the switch");
    network.links.back().name = "ovs-system";
    EXPECT_EQ(Obstacle(network), "");
}

TEST(ObstacleToTag, IsAVlanThatIsAPortItselfOrWhoseParentIsElsewhere)
{
    LiveNetwork network = Host();
    network.links[1].master = 9;
    EXPECT_EQ(Obstacle(network), "it is a port of another interface");

    network = Host();
    network.links[1].parent = 77;
    EXPECT_EQ(Obstacle(network), "its parent is out of sight");
}

TEST(FindVlanWithObstacle, FindsNoneWhereOneTagSaysItAll)
{
    EXPECT_EQ(vornhost::FindVlanWithObstacle(Host(), "eth0"), nullptr);
    EXPECT_EQ(vornhost::FindVlanWithObstacle(Host(), "eth1"), nullptr) << "no such interface";
}

TEST(FindVlanWithObstacle, FindsOneOfSeveralAndOneBesideAnAddress)
{
    LiveNetwork network = Host();
    network.addresses = {MakeAddress(2, RT_SCOPE_UNIVERSE)};
    EXPECT_EQ(vornhost::FindVlanWithObstacle(network, "eth0"), &network.links[1]);

    network = Host();
    network.links.push_back(MakeVlan(4, "eth0.20", 2, 20));
    network.links.push_back(MakeLink(5, "eth1"));
    network.links.push_back(MakeVlan(6, "eth1.10", 5, 10));
    EXPECT_EQ(vornhost::FindVlanWithObstacle(network, "eth0"), &network.links[1]);
    EXPECT_EQ(vornhost::FindVlanWithObstacle(network, "eth1"), nullptr);
}

TEST(TagDevices, AreKnownByTheirNameAndTheirNumber)
{
    EXPECT_EQ(vornhost::TagDeviceName(2, 10), "tag2.10");
    EXPECT_TRUE(vornhost::IsTagDevice(MakeVlan(4, "tag2.10", 2, 10)));
    EXPECT_TRUE(vornhost::IsTagDevice(MakeVlan(4, "tag2.10", 3, 10)));
    EXPECT_FALSE(vornhost::IsTagDevice(MakeVlan(4, "tag.10", 2, 10)));
    EXPECT_FALSE(vornhost::IsTagDevice(MakeVlan(4, "tag2.10", 2, 11)));
    EXPECT_FALSE(vornhost::IsTagDevice(MakeLink(4, "tag2.10")));
}

} // namespace
