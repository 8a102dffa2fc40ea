#include "trip.h"

#include "sdk/vlanchange.h"
#include "support/bondoptions.h"

#include <algorithm>
#include <array>
#include <gtest/gtest.h>
#include <random>
#include <sys/mount.h>
#include <vornplatform/netsdk.h>
#include <vornplatform/sdk.h>

namespace {

using contract::Files;
using contract::ReadFiles;

/** Files as administrators write them, made up anew with each number. */
class Author {
public:
    explicit Author(unsigned seed) : m_random(seed) {}

    /** Some lines in any order, the given ones among them. */
    std::string Write(std::vector<std::string> lines)
    {
        static constexpr std::array kMore{
            "# comment",
            "",
            "IPADDR=192.0.2.10",
            "PREFIX=24",
            "NETMASK=255.255.255.0",
            "IPADDR2=198.51.100.1/24",
            "GATEWAY=192.0.2.1",
            "IPV6INIT=yes",
            "IPV6ADDR=2001:db8::10/64",
            "IPV6ADDR_SECONDARIES=\"2001:db8::11/64 2001:db8::12/64\"",
            "IPV6_DEFAULTGW=fe80::1",
            "BOOTPROTO=none",
            "BOOTPROTO=\"static\"",
            "MTU=9000",
            "DNS1=192.0.2.53",
            "ONBOOT=yes",
            "ONBOOT=no",
            "SITE='a b'",
            "SITE=\"c\" ",
            "  SITE=d",
            "no assignment",
            "=nothing",
            "EMPTY=",
            "HWADDR=02:00:00:00:00:01",
            "caf\xe9=\xff",
            "IPADDR=192.0.2.11"};
        for (const char* const line : kMore) {
            if (Chance(3)) {
                lines.emplace_back(line);
            }
        }
        std::shuffle(lines.begin(), lines.end(), m_random);
        const std::string lineBreak = Chance(5) ? "\r\n" : "\n";
        std::string text;
        for (const std::string& line : lines) {
            text += line + lineBreak;
        }
        return Chance(4) ? text.substr(0, text.size() - lineBreak.size()) : text;
    }

    bool Chance(int of) { return m_random() % static_cast<unsigned>(of) == 0; }

private:
    std::mt19937 m_random;
};

void BondGoesAndComes(unsigned seed, Author& author)
{
    const std::vector<std::string> slaves{"eth0", "eth1"};
    Files host{{"bond0", author.Write({"DEVICE=bond0", "BONDING_OPTS=\"mode=1 miimon=100\""})}};
    for (const std::string& slave : slaves) {
        if (!author.Chance(5)) {
            host[slave] = author.Write({"DEVICE=" + slave, "MASTER=bond0", "SLAVE=yes"});
        }
    }
    contract::StartWith(host);
    contract::ShowBond("bond0", {{"mode", "active-backup 1"}, {"slaves", "eth0 eth1"}});

    VORNLINKAGGROPT opt = contract::BondRecord("bond0", 0, slaves);
    ASSERT_EQ(VORNNetLinkAggrSet(&opt), 0) << seed;
    contract::HideBond("bond0");
    for (const std::string& slave : slaves) {
        contract::ToBridge(slave);
    }
    contract::ToSwitchBond("ovs_bond0", slaves);
    contract::FromSwitchBond("ovs_bond0", slaves);
    for (const std::string& slave : slaves) {
        contract::FromBridge(slave);
    }
    opt.mode = VORN_LINK_AGGR_ACTIVE_BACKUP;
    ASSERT_EQ(VORNNetLinkAggrSet(&opt), 0) << seed;

    EXPECT_EQ(ReadFiles(), host) << seed;
}

TEST(AnyFiles, OfABondComeBackToTheLastByte)
{
    ASSERT_EQ(mount("devices", vornhost::kInterfaceFolder, "tmpfs", 0, nullptr), 0);
    for (unsigned seed = 1; seed <= 40 && !testing::Test::HasFailure(); ++seed) {
        Author author(seed);
        BondGoesAndComes(seed, author);
    }
    ASSERT_EQ(umount(vornhost::kInterfaceFolder), 0);
}

vornhost::LiveNetwork NetworkOfVlan()
{
    vornhost::LiveNetwork network;
    network.links.resize(2);
    network.links[0].index = 2;
    network.links[0].name = "eth0";
    network.links[1].index = 3;
    network.links[1].name = "eth0.10";
    network.links[1].kind = "vlan";
    network.links[1].parent = 2;
    network.links[1].vlanId = 10;
    return network;
}

TEST(AnyFiles, OfAVlanComeBackToTheLastByte)
{
    for (unsigned seed = 1; seed <= 40 && !testing::Test::HasFailure(); ++seed) {
        Author author(seed);
        Files host;
        if (!author.Chance(5)) {
            host["eth0"] = "DEVICE=eth0\nSITE=a\n# end";
        }
        if (!author.Chance(5)) {
            host["eth0.10"] = author.Write({"DEVICE=eth0.10", "VLAN=yes"});
        }
        contract::StartWith(host);

        ASSERT_EQ(vornhost::TakeVlan(NetworkOfVlan(), "eth0.10"), 0) << seed;
        contract::ToBridge("eth0");
        contract::EditFile("ovs_eth0", {}, {"OVS_VLAN_ID"});
        contract::FromBridge("eth0");
        ASSERT_EQ(VLIBNetVlanCreate("eth0", 10, nullptr), 0) << seed;

        EXPECT_EQ(ReadFiles(), host) << seed;
    }
}

} // namespace
