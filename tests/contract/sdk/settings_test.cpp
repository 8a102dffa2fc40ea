#include "support/settings.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>
#include <string>

namespace {

using testing::ElementsAre;
using vornhost::KeyValueFile;

KeyValueFile File(const std::string& text)
{
    return KeyValueFile::Parse(text);
}

TEST(KeyValueFileKeys, AreInTheFilesOrderAndOnce)
{
    EXPECT_THAT(File("# A=1\nB=1\n C=\"2\"\n\nB=3\nword\n=4").Keys(), ElementsAre("B", "C"));
    EXPECT_THAT(File("").Keys(), ElementsAre());
}

TEST(KeyValueFileGetWritten, LeavesTheQuotes)
{
    EXPECT_EQ(File("A=1\nA= \"2 3\" \n").GetWritten("A"), " \"2 3\" ");
    EXPECT_EQ(File("A=1\n").GetWritten("B"), std::nullopt);
}

TEST(IsAddressingKey, KnowsWhatBelongsToAnAddress)
{
    for (const char* const key : {"BOOTPROTO",
                                  "IPADDR",
                                  "IPADDR0",
                                  "IPADDR255",
                                  "PREFIX1",
                                  "NETMASK",
                                  "NETWORK",
                                  "BROADCAST",
                                  "GATEWAY",
                                  "GATEWAY0",
                                  "GATEWAYDEV",
                                  "METRIC",
                                  "MTU",
                                  "DNS1",
                                  "DNS2",
                                  "DOMAIN",
                                  "DEFROUTE",
                                  "IPV6INIT",
                                  "IPV6ADDR",
                                  "IPV6ADDR_SECONDARIES",
                                  "IPV6_AUTOCONF",
                                  "IPV6_DEFAULTGW",
                                  "IPV4_FAILURE_FATAL",
                                  "DHCPV6C",
                                  "DHCP_HOSTNAME",
                                  "PEERROUTES",
                                  "IPV6_TOKEN",
                                  "IPV6_METRIC",
                                  "ROUTE0",
                                  "PEERDNS"}) {
        EXPECT_TRUE(vornhost::IsAddressingKey(key)) << key;
    }
    for (const char* const key :
         {"DEVICE", "HWADDR", "MACADDR", "ONBOOT", "OVS_VLAN_ID", "VLAN", "IPADDRESS", "PREFIXES",
          "ETHTOOL_OPTS", "ROUTES", "DNSX", "SITE", "BRIDGE", "ZONE", ""}) {
        EXPECT_FALSE(vornhost::IsAddressingKey(key)) << key;
    }
}

TEST(ReplaceAddressing, TakesTheOthersAndLeavesAllElse)
{
    KeyValueFile to = File("# c\nDEVICE=eth0\nIPADDR=198.51.100.1/24\nGATEWAY=198.51.100.2\n"
                           "MTU=9000\nSITE=a");

    vornhost::ReplaceAddressing(File("DEVICE=x\nIPADDR=192.0.2.1\nPREFIX=\"24\"\nSITE=b\n"), to);

    EXPECT_EQ(to.Text(), "# c\nDEVICE=eth0\nIPADDR=192.0.2.1\nMTU=9000\nSITE=a\nPREFIX=\"24\"");
}

TEST(RemoveAddressing, LeavesTheMtuAndWhetherThereIsIPv6)
{
    KeyValueFile file = File("IPADDR=192.0.2.1/24\nBOOTPROTO=dhcp\nMTU=9000\nIPV6INIT=no\n"
                             "IPV6ADDR=2001:db8::1/64\nSITE=a\n");
    vornhost::RemoveAddressing(file);
    EXPECT_EQ(file.Text(), "BOOTPROTO=none\nMTU=9000\nIPV6INIT=no\nSITE=a\n");

    file = File("IPV6_AUTOCONF=yes\nDHCP_IAID=01020304\n");
    vornhost::RemoveAddressing(file);
    EXPECT_EQ(file.Text(), "");

    file = File("IPV6_AUTOCONF=no\n");
    vornhost::RemoveAddressing(file);
    EXPECT_EQ(file.Text(), "IPV6_AUTOCONF=no\n");

    file = File("BOOTPROTO=static\n");
    vornhost::RemoveAddressing(file);
    EXPECT_EQ(file.Text(), "BOOTPROTO=static\n");
}

bool AnyKey(const std::string& /*key*/)
{
    return true;
}

TEST(CarryChanges, CarriesWhatIsNewOtherOrGone)
{
    KeyValueFile target = File("# own\nA=0\nB=0\nC=\"0\"\nD=0");

    EXPECT_TRUE(vornhost::CarryChanges(File("A=1\nB=1\nC=1\nDEVICE=x\n"),
                                       File("A=1\nC=\"2\"\nE=3\nDEVICE=y\n"), AnyKey, target));

    EXPECT_EQ(target.Text(), "# own\nA=0\nC=\"2\"\nD=0\nE=3");
}

TEST(CarryChanges, LeavesWhatTheConversionsWriteAndWhatTheFilterRefuses)
{
    KeyValueFile target = File("A=0\n");
    const auto onlyB = [](const std::string& key) { return key == "B"; };

    EXPECT_FALSE(vornhost::CarryChanges(
        File("A=1\n"),
        File("A=2\nTYPE=OVS\nPRIMARY=x\nBRIDGE=x\nSLAVE=yes\nMASTER=x\nBOND_MODE=x\n"
             "BONDING_OPTS=x\nSLAVE_LIST=x\nDEVICE=x\n"),
        onlyB, target));

    EXPECT_EQ(target.Text(), "A=0\n");
}

TEST(CarryChanges, IsDoneWithALongFileInTime)
{
    constexpr int kLines = 50000;
    std::string lines;
    for (int line = 0; line < kLines; ++line) {
        lines += "KEY" + std::to_string(line) + "=1\n";
    }
    KeyValueFile target = File(lines);
    const auto begin = std::chrono::steady_clock::now();

    EXPECT_TRUE(vornhost::CarryChanges(File(lines), File(lines + "NEW=1\n"), AnyKey, target));

    EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(10));
    EXPECT_EQ(target.Text(), lines + "NEW=1\n");
}

TEST(SameSettings, GoesByKeysAndValuesAlone)
{
    EXPECT_TRUE(vornhost::SameSettings(File("A=1\nB=2\n"), File("# c\nB=2\nTYPE=OVS\nA=1")));
    EXPECT_FALSE(vornhost::SameSettings(File("A=1\nB=2\n"), File("A=1\n")));
    EXPECT_FALSE(vornhost::SameSettings(File("A=1\n"), File("A=1\nB=2\n")));
    EXPECT_FALSE(vornhost::SameSettings(File("A=1\n"), File("A=2\n")));
    EXPECT_TRUE(vornhost::SameSettings(File(""), File("")));
}

TEST(ConfiguredAddresses, AreReadWhateverTheFileIsFor)
{
    const auto addresses = vornhost::ConfiguredAddresses(
        File("DEVICE=ovs_x\nTYPE=OVS\nPRIMARY=eth0\nSLAVE=yes\nIPADDR=192.0.2.1/24\n"
             "IPV6ADDR=2001:db8::1/64\n"));

    ASSERT_EQ(addresses.size(), 2u);
    EXPECT_EQ(addresses[0].local, "192.0.2.1");
    EXPECT_EQ(addresses[1].prefixLength, 64u);
}

} // namespace
