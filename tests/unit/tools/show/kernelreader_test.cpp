#include "show/kernelreader.h"

#include "show/samplehost.h"

#include <filesystem>
#include <fstream>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <linux/rtnetlink.h>
#include <sys/socket.h>

namespace {

using testing::ElementsAre;
using unit::MakeDevice;
using vornovsctl::Device;
using vornovsctl::DeviceFacts;
using vornovsctl::DevicesOf;
using vornovsctl::KernelAnswer;
using vornovsctl::LinuxBond;
using vornovsctl::ReadDeviceFacts;
using vornovsctl::UnreadOf;

vornhost::Link MakeLink(int index, const std::string& name, const std::string& kind = "")
{
    vornhost::Link link;
    link.index = index;
    link.name = name;
    link.kind = kind;
    link.mac = "52:54:00:00:00:0" + std::to_string(index);
    link.mtu = 1500;
    link.up = true;
    link.carrier = true;
    return link;
}

vornhost::Address MakeAddress(int index, const std::string& local, unsigned length)
{
    vornhost::Address address;
    address.index = index;
    address.local = local;
    address.prefixLength = length;
    return address;
}

vornhost::Route MakeDefault(int family, int index, const std::string& gateway)
{
    vornhost::Route route;
    route.family = family;
    route.table = RT_TABLE_MAIN;
    vornhost::NextHop hop;
    hop.index = index;
    hop.gateway = gateway;
    route.nextHops = {hop};
    return route;
}

std::vector<std::string> NamesOf(const std::vector<Device>& devices)
{
    std::vector<std::string> names;
    names.reserve(devices.size());
    for (const Device& device : devices) {
        names.push_back(device.name);
    }
    return names;
}

TEST(DevicesOf, PutsAddressesDefaultRoutesAndFactsWithTheirDevice)
{
    KernelAnswer kernel;
    kernel.links = {MakeLink(1, "eth1"), MakeLink(2, "eth2")};
    kernel.addresses = {{MakeAddress(1, "192.0.2.2", 24), MakeAddress(2, "198.51.100.2", 25),
                         MakeAddress(1, "2001:db8::2", 64)}};
    vornhost::Route metric = MakeDefault(AF_INET6, 1, "fe80::1");
    metric.priority = 1024;
    vornhost::Route other = MakeDefault(AF_INET, 1, "");
    other.table = 100;
    vornhost::Route net = MakeDefault(AF_INET, 1, "192.0.2.9");
    net.destination = "203.0.113.0";
    net.prefixLength = 24;
    vornhost::Route half = MakeDefault(AF_INET, 1, "192.0.2.9"); // 0.0.0.0/1
    half.prefixLength = 1;
    kernel.routes = {{MakeDefault(AF_INET, 1, "192.0.2.1"), metric, other, net, half}};
    kernel.facts["eth1"].speed = 1000;

    Device first = MakeDevice("eth1", 1);
    first.addresses = {"192.0.2.2/24", "2001:db8::2/64"};
    first.routes = {{false, "192.0.2.1", 0, 0}, {true, "fe80::1", 1024, 0}, {false, "", 0, 100}};
    Device second = MakeDevice("eth2", 2);
    second.addresses = {"198.51.100.2/25"};
    second.speed.reset();
    EXPECT_EQ(DevicesOf(kernel), (std::vector<Device>{first, second}));
}

TEST(DevicesOf, TellsEachWayOfARouteWithSeveral)
{
    KernelAnswer kernel;
    kernel.links = {MakeLink(1, "eth1"), MakeLink(2, "eth2")};
    vornhost::Route route = MakeDefault(AF_INET, 1, "192.0.2.1");
    vornhost::NextHop hop;
    hop.index = 2;
    hop.gateway = "198.51.100.1";
    route.nextHops.push_back(hop);
    kernel.routes = {{route}};

    const std::vector<Device> devices = DevicesOf(kernel);
    ASSERT_EQ(devices.size(), 2U);
    EXPECT_EQ(devices[0].routes.at(0).gateway, "192.0.2.1");
    EXPECT_EQ(devices[1].routes.at(0).gateway, "198.51.100.1");
}

TEST(DevicesOf, SortsByNumberAndLeavesOutLoopbackAndTheSwitchItself)
{
    KernelAnswer kernel;
    kernel.links = {MakeLink(1, "lo"), MakeLink(2, "eth10"), MakeLink(3, "eth2"),
                    MakeLink(4, "ovs-system", "openvswitch"),
                    MakeLink(5, "ovs_eth2", "openvswitch")};
    kernel.links[0].loopback = true;
    kernel.links[2].master = 4;

    const std::vector<Device> devices = DevicesOf(kernel);
    EXPECT_THAT(NamesOf(devices), ElementsAre("eth2", "eth10", "ovs_eth2"));
    EXPECT_TRUE(devices[0].onTheSwitch);
    EXPECT_EQ(devices[0].master, "");
    EXPECT_FALSE(devices[1].onTheSwitch);
    EXPECT_TRUE(devices[2].onTheSwitch);
}

TEST(DevicesOf, NamesMastersAndParents)
{
    KernelAnswer kernel;
    kernel.links = {MakeLink(1, "bond0", "bond"), MakeLink(2, "bond0.10", "vlan"),
                    MakeLink(3, "eth0"), MakeLink(4, "veth0", "veth")};
    kernel.links[1].parent = 1;
    kernel.links[1].vlanId = 10;
    kernel.links[2].master = 1;
    kernel.links[3].parent = 1; // its peer, in another network namespace

    const std::vector<Device> devices = DevicesOf(kernel);
    EXPECT_EQ(devices[1].parent, "bond0");
    EXPECT_EQ(devices[1].vlan, 10);
    EXPECT_EQ(devices[2].master, "bond0");
    EXPECT_EQ(devices[3].parent, "");
    EXPECT_EQ(devices[3].vlan, std::nullopt);
}

TEST(UnreadOf, TellsWhatTheKernelDidNotTell)
{
    KernelAnswer kernel;
    EXPECT_THAT(UnreadOf(kernel), ElementsAre("the kernel does not tell its network devices",
                                              "the kernel does not tell the addresses",
                                              "the kernel does not tell the routes"));
    EXPECT_THAT(DevicesOf(kernel), ElementsAre());

    kernel.links = {MakeLink(1, "eth1")};
    kernel.addresses.emplace();
    kernel.routes.emplace();
    EXPECT_THAT(UnreadOf(kernel), ElementsAre());
}

class DeviceFolder : public testing::Test {
protected:
    DeviceFolder() { std::filesystem::remove_all(m_folder); }

    DeviceFacts Read(const std::map<std::string, std::string>& files)
    {
        std::filesystem::create_directories(m_folder + "/bonding");
        for (const auto& [name, text] : files) {
            std::ofstream(m_folder + '/' + name) << text;
        }
        return ReadDeviceFacts(m_folder);
    }

private:
    std::string m_folder = "/tmp/device";
};

TEST_F(DeviceFolder, HasNoFactsOfADeviceThatIsGone)
{
    EXPECT_EQ(ReadDeviceFacts("/tmp/no-such-device"), DeviceFacts());
}

TEST_F(DeviceFolder, TellsTheSpeedOfALinkThatHasOne)
{
    EXPECT_EQ(Read({{"speed", "2500\n"}}), (DeviceFacts{2500, {}}));
    EXPECT_EQ(Read({{"speed", "-1\n"}}), DeviceFacts());
    EXPECT_EQ(Read({{"speed", ""}}), DeviceFacts());
}

TEST_F(DeviceFolder, TellsTheActiveMemberOfABond)
{
    EXPECT_EQ(Read({{"bonding/mode", "active-backup 1\n"}, {"bonding/active_slave", "eth1\n"}}),
              (DeviceFacts{{}, LinuxBond{"active-backup", "eth1", {}}}));
}

TEST_F(DeviceFolder, TellsWhetherABondHasAnLacpPartner)
{
    const auto lacp = [&](const std::string& partner) {
        return Read({{"bonding/mode", "802.3ad 4\n"},
                     {"bonding/active_slave", "\n"},
                     {"bonding/ad_partner_mac", partner}})
            .bond;
    };
    EXPECT_EQ(lacp("52:54:00:00:00:01\n"), (LinuxBond{"802.3ad", "", true}));
    EXPECT_EQ(lacp("00:00:00:00:00:00\n"), (LinuxBond{"802.3ad", "", false}));
    EXPECT_EQ(lacp("\n"), (LinuxBond{"802.3ad", "", {}})) << "as the kernel answers users";
}

} // namespace
