#include "trip.h"

#include "tools.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <vornplatform/netsdk.h>

namespace {

using contract::Files;

constexpr char kBond[] = "DEVICE=ovs_bond0\nTYPE=OVS\nPRIMARY=eth0\nSLAVE_LIST=\"eth0 eth1 \"\n";

std::string BridgeFile(const std::string& interface, const std::string& addressing)
{
    return "DEVICE=ovs_" + interface + "\nTYPE=OVS\nPRIMARY=" + interface + '\n' + addressing;
}

/** The name that is found, "none", or the result for a failure. */
std::string Conflict(const Files& files, const std::string& bond = "ovs_bond0")
{
    contract::StartWith(files);
    char name[32] = "untouched";
    unsigned int count = 77;
    const int result = VORNNetBondIPConflict(bond.c_str(), name, sizeof name, &count);
    if (result != 1) {
        EXPECT_STREQ(name, "untouched");
        EXPECT_EQ(count, 77u);
        return result == 0 ? "none" : std::to_string(result);
    }
    return std::to_string(count) + ' ' + name;
}

Files Host(const std::string& ofBond, const std::string& ofOther)
{
    return {{"ovs_bond0", kBond + ofBond},
            {"ovs_eth0", BridgeFile("eth0", ofBond)},
            {"ovs_eth1", BridgeFile("eth1", "SLAVE=yes\n")},
            {"ovs_eth2", BridgeFile("eth2", ofOther)}};
}

TEST(BondIPConflict, IsAnotherInterfaceInTheBondsSubnetInWhateverWayItsLengthIsWritten)
{
    for (const char* const bond :
         {"IPADDR=192.0.2.10\nNETMASK=255.255.255.0\n", "IPADDR=192.0.2.10\nPREFIX=24\n",
          "IPADDR=192.0.2.10/24\n", "IPADDR0=198.51.100.1/24\nIPADDR1=192.0.2.10\nPREFIX1=24\n"}) {
        EXPECT_EQ(Conflict(Host(bond, "IPADDR=192.0.2.200/24\n")), "1 eth2") << bond;
        EXPECT_EQ(Conflict(Host(bond, "IPADDR2=192.0.2.1\nNETMASK2=255.255.255.255\n")), "1 eth2")
            << bond;
        EXPECT_EQ(Conflict(Host(bond, "IPADDR=192.0.3.1/23\n")), "none")
            << "the bond's subnet counts";
    }
}

TEST(BondIPConflict, GoesByTheBondsLengthToTheLastBit)
{
    EXPECT_EQ(Conflict(Host("IPADDR=192.0.2.10/31\n", "IPADDR=192.0.2.11/24\n")), "1 eth2");
    EXPECT_EQ(Conflict(Host("IPADDR=192.0.2.10/31\n", "IPADDR=192.0.2.12/24\n")), "none");
    EXPECT_EQ(Conflict(Host("IPADDR=192.0.2.10/32\n", "IPADDR=192.0.2.10/24\n")), "1 eth2");
    EXPECT_EQ(Conflict(Host("IPADDR=192.0.2.10/32\n", "IPADDR=192.0.2.11/24\n")), "none");
    EXPECT_EQ(Conflict(Host("IPADDR=192.0.2.10/0\n", "IPADDR=203.0.113.1/24\n")), "1 eth2");
}

TEST(BondIPConflict, IsNoneWithoutAddresses)
{
    EXPECT_EQ(Conflict(Host("", "IPADDR=192.0.2.1/24\n")), "none");
    EXPECT_EQ(Conflict(Host("IPADDR=192.0.2.10/24\n", "")), "none");
    EXPECT_EQ(Conflict(Host("IPADDR=\nNETMASK=\n", "IPADDR=192.0.2.1/24\n")), "none");
    EXPECT_EQ(Conflict(Host("IPV6ADDR=2001:db8::1/64\n", "IPV6ADDR=2001:db8::2/64\n")), "none");
    EXPECT_EQ(Conflict(Host("IPADDR=192.0.2.10/24\n", "BOOTPROTO=dhcp\n")), "none");
}

TEST(BondIPConflict, MayBeAnAddressBesideALease)
{
    EXPECT_EQ(Conflict(Host("IPADDR=192.0.2.10/24\n", "BOOTPROTO=dhcp\nIPADDR=192.0.2.1/24\n")),
              "1 eth2");
}

TEST(BondIPConflict, MayBeTheBondsOwnOtherSlave)
{
    Files host = Host("IPADDR=192.0.2.10/24\n", "");
    host["ovs_eth1"] = BridgeFile("eth1", "SLAVE=yes\nIPADDR=192.0.2.11/24\n");

    EXPECT_EQ(Conflict(host), "1 eth1");
}

TEST(BondIPConflict, IsTheFirstByNameOfSeveral)
{
    Files host = Host("IPADDR=192.0.2.10/24\n", "IPADDR=192.0.2.12/24\n");
    host["ovs_eth3"] = BridgeFile("eth3", "IPADDR=192.0.2.13/24\n");
    host["ovs_eth10"] = BridgeFile("eth10", "IPADDR=192.0.2.14/24\n");

    EXPECT_EQ(Conflict(host), "3 eth10");
}

TEST(BondIPConflict, IsNoInterfaceWithoutABridgesFile)
{
    Files host = Host("IPADDR=192.0.2.10/24\n", "");
    host["eth3"] = "DEVICE=eth3\nIPADDR=192.0.2.13/24\n";
    host["ovs_eth4.bak"] = BridgeFile("eth4", "IPADDR=192.0.2.14/24\n");

    EXPECT_EQ(Conflict(host), "none");
}

TEST(BondIPConflict, CutsTheNameToTheCallersBuffer)
{
    contract::StartWith(Host("IPADDR=192.0.2.10/24\n", "IPADDR=192.0.2.12/24\n"));
    char name[4] = "xyz";

    EXPECT_EQ(VORNNetBondIPConflict("ovs_bond0", name, 3, nullptr), 1);
    EXPECT_STREQ(name, "et");
    EXPECT_EQ(VORNNetBondIPConflict("ovs_bond0", name, 1, nullptr), 1);
    EXPECT_STREQ(name, "");
}

TEST(BondIPConflict, FailsForABondWithoutAFileAndForWrongArguments)
{
    EXPECT_EQ(Conflict(Host("", ""), "ovs_bond1"), "-1");
    EXPECT_EQ(Conflict(Host("", ""), "../x"), "-1");
    char name[32] = {};
    EXPECT_EQ(VORNNetBondIPConflict(nullptr, name, sizeof name, nullptr), -1);
    EXPECT_EQ(VORNNetBondIPConflict("ovs_bond0", nullptr, 32, nullptr), -1);
    EXPECT_EQ(VORNNetBondIPConflict("ovs_bond0", name, 0, nullptr), -1);
}

} // namespace
