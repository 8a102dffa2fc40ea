#include "state/ifcfg.h"

#include <vornplatform/records.h>

#include "support/support.h"

using unit::LongName;
using VORN::OVS::BridgeName;
using VORN::OVS::CopyName;
using VORN::OVS::FirstWord;
using VORN::OVS::Fit;
using VORN::OVS::IfcfgPath;
using VORN::OVS::NameOf;
using VORN::OVS::PlainName;

namespace {

TEST(BridgeName, PutsThePrefixBeforeTheName)
{
    EXPECT_EQ(BridgeName("eth0"), "ovs_eth0");
    EXPECT_EQ(BridgeName(""), "ovs_");
}

TEST(BridgeName, CutsWhatABufferDoesNotHold)
{
    EXPECT_EQ(BridgeName(LongName()), "ovs_" + std::string(1019, 'x'));
    EXPECT_EQ(BridgeName("abcdefghijkl", 16), "ovs_abcdefghijk");
    EXPECT_EQ(BridgeName("abcdefghijk", 16), "ovs_abcdefghijk");
}

TEST(BridgeName, EndsAtANulByteAsAFormattedTextDoes)
{
    EXPECT_EQ(BridgeName(std::string("a\0b", 3)), "ovs_a");
}

TEST(PlainName, TakesThePrefixOff)
{
    EXPECT_EQ(PlainName("ovs_eth0"), "eth0");
    EXPECT_EQ(PlainName("ovs_ovs_eth0"), "ovs_eth0");
}

TEST(PlainName, IsEmptyWithoutThePrefix)
{
    EXPECT_EQ(PlainName("eth0"), "");
    EXPECT_EQ(PlainName(""), "");
    EXPECT_EQ(PlainName("ovs"), "");
    EXPECT_EQ(PlainName(" ovs_eth0"), "");
    EXPECT_EQ(PlainName("OVS_eth0"), "");
}

TEST(PlainName, ReadsOneWordAfterWhiteSpaceAsAScanDoes)
{
    EXPECT_EQ(PlainName("ovs_"), "");
    EXPECT_EQ(PlainName("ovs_ \t"), "");
    EXPECT_EQ(PlainName("ovs_ eth0"), "eth0");
    EXPECT_EQ(PlainName("ovs_\t\n\v\f\r eth0"), "eth0");
    EXPECT_EQ(PlainName("ovs_eth0 eth1"), "eth0");
    EXPECT_EQ(PlainName(std::string("ovs_e\0th0", 9)), "e");
}

TEST(PlainName, CutsWhatABufferDoesNotHold)
{
    EXPECT_EQ(PlainName("ovs_" + LongName()), std::string(1023, 'x'));
    EXPECT_EQ(PlainName("ovs_" + LongName(), 4096), std::string(4095, 'x'));
}

TEST(IfcfgPath, PutsTheFolderBeforeTheName)
{
    EXPECT_EQ(IfcfgPath("eth0"), "/etc/sysconfig/network-scripts/ifcfg-eth0");
}

TEST(IfcfgPath, CutsWhatABufferDoesNotHold)
{
    EXPECT_EQ(IfcfgPath(LongName()).size(), 4095U);
    EXPECT_EQ(IfcfgPath(LongName(), 1024).size(), 1023U);
}

TEST(FirstWord, EndsAtWhiteSpace)
{
    EXPECT_EQ(FirstWord("ovs_eth0\n"), "ovs_eth0");
    EXPECT_EQ(FirstWord(" \ta b"), "a");
    EXPECT_EQ(FirstWord("\n"), "");
    EXPECT_EQ(FirstWord(""), "");
}

TEST(Fit, LeavesRoomForTheTerminator)
{
    EXPECT_EQ(Fit("abc", 4), "abc");
    EXPECT_EQ(Fit("abc", 3), "ab");
}

TEST(NameOf, StopsAtTheFieldsEndWhenItHasNoTerminator)
{
    _tag_VLIB_VLAN vlan{};
    for (char& one : vlan.szIfName) {
        one = 'a';
    }
    vlan.szRealName[0] = 'b';
    EXPECT_EQ(NameOf(vlan.szIfName), std::string(16, 'a'));
    EXPECT_EQ(NameOf(vlan.szRealName), "b");
}

TEST(CopyName, CutsToTheFieldAndZeroesTheRest)
{
    _tag_VLIB_VLAN vlan{};
    CopyName(vlan.szIfName, "abcdefghijklmnopq");
    EXPECT_STREQ(vlan.szIfName, "abcdefghijklmno");
    CopyName(vlan.szIfName, "b");
    EXPECT_EQ(std::string(vlan.szIfName, sizeof(vlan.szIfName)), "b" + std::string(15, '\0'));
}

} // namespace
