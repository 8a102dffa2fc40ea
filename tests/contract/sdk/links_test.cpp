#include "netsdk/ipconfig.h"

#include "tools.h"

#include <arpa/inet.h>
#include <cstring>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <vornplatform/netsdk.h>

namespace {

using contract::Ip;
using contract::WriteFile;
using vornhost::IpConfig;

// A cable of two ends: the driver of such an interface says 10000 Mbit/s.
class Links : public testing::Test {
protected:
    Links()
    {
        contract::Delete("/etc/sysconfig/network-scripts");
        contract::Delete("/usr/vorn/etc");
        Ip("link add port0 type veth peer name wire0");
    }
    ~Links() override
    {
        (void)contract::RunProgram({"ip", "link", "del", "port0"});
        (void)contract::RunProgram({"ip", "link", "del", "ovs_port0"});
    }

    static void Plug()
    {
        Ip("link set port0 up");
        Ip("link set wire0 up");
    }

    static int Speed(const char* name)
    {
        VORNNETETHINFO info;
        std::memset(&info, 'x', sizeof(info));
        EXPECT_EQ(VORNNetGetEthInfo(&info, name), 0) << name;
        return info.speed;
    }

    // The bridge as the network program leaves it, with a device of another kind in its place.
    static void MakeBridge()
    {
        Ip("link add ovs_port0 type bridge");
        WriteFile(contract::IfcfgPath("ovs_port0"), "DEVICE=ovs_port0\nTYPE=OVS\nPRIMARY=port0\n");
    }
};

TEST_F(Links, HaveNoSpeedWhileTheyAreDownOrWithoutACable)
{
    EXPECT_EQ(Speed("port0"), -1);

    Ip("link set port0 up");
    EXPECT_EQ(Speed("port0"), -1);

    Ip("link set wire0 up");
    EXPECT_EQ(Speed("port0"), 10000);

    Ip("link set port0 down");
    EXPECT_EQ(Speed("port0"), -1);
}

TEST_F(Links, HaveSpeed0WhenTheDriverKnowsNone)
{
    Ip("link set lo up");

    EXPECT_EQ(Speed("lo"), 0);
}

TEST_F(Links, OfABridgeAreItsPorts)
{
    MakeBridge();
    Plug();
    EXPECT_EQ(Speed("ovs_port0"), -1) << "the bridge itself is down";

    Ip("link set ovs_port0 up");
    EXPECT_EQ(Speed("ovs_port0"), 10000);

    Ip("link set wire0 down");
    EXPECT_EQ(Speed("ovs_port0"), -1);
}

TEST_F(Links, OfABondsBridgeAreUpWhileOneOfItsMembersIs)
{
    MakeBridge();
    Plug();
    Ip("link set ovs_port0 up");
    WriteFile(contract::IfcfgPath("ovs_port0"), "DEVICE=ovs_port0\nTYPE=OVS\nPRIMARY=absent0\n"
                                                "SLAVE_LIST=\"absent0 port0 \"\n");

    EXPECT_EQ(Speed("ovs_port0"), 10000);

    Ip("link set wire0 down");
    EXPECT_EQ(Speed("ovs_port0"), -1);
}

TEST_F(Links, OfABridgeWhosePortIsGoneAreNotUp)
{
    MakeBridge();
    Ip("link set ovs_port0 up");
    Ip("link del port0");

    EXPECT_EQ(Speed("ovs_port0"), -1);
}

TEST_F(Links, FailForAnInterfaceThatDoesNotExist)
{
    WriteFile(contract::IfcfgPath("ovs_port0"), "DEVICE=ovs_port0\nTYPE=OVS\nPRIMARY=port0\n");
    VORNNETETHINFO info;
    std::memset(&info, 'x', sizeof(info));
    const VORNNETETHINFO before = info;

    EXPECT_NE(VORNNetGetEthInfo(&info, "absent0"), 0);
    EXPECT_NE(VORNNetGetEthInfo(&info, "ovs_port0"), 0);
    EXPECT_NE(VORNNetGetEthInfo(&info, std::string(5000, 'a').c_str()), 0);
    EXPECT_NE(VORNNetGetEthInfo(&info, nullptr), 0);
    EXPECT_NE(VORNNetGetEthInfo(nullptr, "port0"), 0);
    EXPECT_EQ(std::memcmp(&info, &before, sizeof(info)), 0);
}

std::string Text(int family, const std::uint8_t* bytes)
{
    char text[INET6_ADDRSTRLEN] = {};
    return inet_ntop(family, bytes, text, sizeof(text));
}

std::string Describe(const char* name)
{
    VORNNETIPCONFIG record{};
    EXPECT_EQ(VORNNetIFGetIPConfig(name, &record), 0);
    IpConfig config{};
    std::memcpy(&config, &record, sizeof(config));
    return std::to_string(config.version) + ' ' + config.interface + " flags " +
           std::to_string(config.flags) + " mtu " + std::to_string(config.mtu) + ' ' +
           Text(AF_INET, config.ipv4Address) + '/' + std::to_string(config.ipv4PrefixLength) +
           " via " + Text(AF_INET, config.ipv4Gateway) + ' ' + Text(AF_INET6, config.ipv6Address) +
           '/' + std::to_string(config.ipv6PrefixLength) + " via " +
           Text(AF_INET6, config.ipv6Gateway);
}

TEST_F(Links, HaveTheirAddressesAndGatewaysRead)
{
    Plug();
    Ip("link set port0 mtu 9000");
    Ip("addr add 192.0.2.10/24 dev port0");
    Ip("addr add 192.0.2.11/24 dev port0");
    Ip("addr add 2001:db8::10/64 dev port0 nodad");
    Ip("route add default via 192.0.2.1");
    Ip("-6 route add default via fe80::1 dev port0");

    EXPECT_EQ(Describe("port0"), "1 port0 flags 15 mtu 9000 192.0.2.10/24 via 192.0.2.1 "
                                 "2001:db8::10/64 via fe80::1");
}

TEST_F(Links, HaveTheirRecordedGatewayReadWhileTheyAreDown)
{
    WriteFile("/usr/vorn/etc/vornnetd/gateways.conf", "port0 inet 192.0.2.1\n");
    WriteFile(contract::IfcfgPath("port0"), "DEVICE=port0\nBOOTPROTO=dhcp\n");

    EXPECT_EQ(Describe("port0"), "1 port0 flags 18 mtu 1500 0.0.0.0/0 via 192.0.2.1 ::/0 via ::");
}

TEST_F(Links, HaveNoConfigurationWhenTheyDoNotExist)
{
    VORNNETIPCONFIG record{};
    EXPECT_LT(VORNNetIFGetIPConfig("absent0", &record), 0);
    EXPECT_LT(VORNNetIFGetIPConfig(nullptr, &record), 0);
    EXPECT_LT(VORNNetIFGetIPConfig("port0", nullptr), 0);
    const VORNNETIPCONFIG zeros{};
    EXPECT_EQ(std::memcmp(&record, &zeros, sizeof(record)), 0);
}

} // namespace
