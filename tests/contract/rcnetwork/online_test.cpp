#include "rcnetwork/automatic.h"
#include "rcnetwork/online.h"

#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <linux/if_addr.h>
#include <sys/socket.h>

namespace contract {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::UnorderedElementsAre;
using vornhost::Address;
using vornhost::InterfaceFile;
using vornhost::LookWhatAnswers;
using vornhost::NeededInterfaces;
using vornhost::Online;

using Files = std::map<std::string, InterfaceFile>;

Files Parse(const std::map<std::string, std::string>& texts)
{
    Files files;
    for (const auto& [name, text] : texts) {
        files[name] = vornhost::ParseInterfaceFile(name, text).file;
    }
    return files;
}

/** A kernel with some interfaces, which are up and have a carrier. */
class Answers : public testing::Test {
protected:
    vornhost::Link& AddLink(const std::string& name)
    {
        vornhost::Link link;
        link.index = static_cast<int>(m_live.links.size()) + 1;
        link.name = name;
        link.up = true;
        link.carrier = true;
        m_live.links.push_back(link);
        return m_live.links.back();
    }

    Address& AddAddress(const std::string& link, const std::string& local)
    {
        Address address;
        address.index = m_live.FindLink(link)->index;
        address.family = local.find(':') == std::string::npos ? AF_INET : AF_INET6;
        address.local = local;
        m_live.addresses.push_back(address);
        return m_live.addresses.back();
    }

    std::vector<std::string> Missing(const std::map<std::string, std::string>& texts)
    {
        std::vector<std::string> missing;
        for (const vornhost::NotOnline& each : LookWhatAnswers(Parse(texts), m_live).missing) {
            missing.push_back(each.what + (each.isNotOurs ? " (not ours)" : ""));
        }
        return missing;
    }

    vornhost::LiveState m_live;
};

constexpr char kDual[] = "IPADDR=192.0.2.5\nPREFIX=24\nIPV6ADDR=2001:db8::5/64\n";

TEST_F(Answers, ComeFromEveryAddressOfTheFiles)
{
    AddLink("eth0");
    AddAddress("eth0", "192.0.2.5");
    EXPECT_THAT(Missing({{"eth0", kDual}}), ElementsAre("eth0: 2001:db8::5"));
    AddAddress("eth0", "2001:db8::5");
    EXPECT_THAT(Missing({{"eth0", kDual}}), IsEmpty());
}

TEST_F(Answers, DoNotComeFromAnAddressThatIsStillChecked)
{
    AddLink("eth0");
    AddAddress("eth0", "192.0.2.5");
    AddAddress("eth0", "2001:db8::5").flags = IFA_F_TENTATIVE;
    EXPECT_THAT(Missing({{"eth0", kDual}}), ElementsAre("eth0: 2001:db8::5"));
    m_live.addresses.back().flags = IFA_F_DADFAILED | IFA_F_TENTATIVE;
    EXPECT_THAT(Missing({{"eth0", kDual}}), ElementsAre("eth0: 2001:db8::5 (not ours)"));
}

TEST_F(Answers, NeedACable)
{
    AddLink("eth0").carrier = false;
    AddAddress("eth0", "192.0.2.5");
    EXPECT_THAT(Missing({{"eth0", "IPADDR=192.0.2.5\nPREFIX=24\n"}}),
                ElementsAre("eth0: 192.0.2.5 (not ours)"));
}

TEST_F(Answers, ComeFromABridgeWhosePortHasACable)
{
    const std::map<std::string, std::string> files = {
        {"eth0", "DEVICE=eth0\nBRIDGE=ovs_eth0\n"},
        {"ovs_eth0", "DEVICE=ovs_eth0\nTYPE=OVS\nPRIMARY=eth0\nIPADDR=192.0.2.5\nPREFIX=24\n"}};
    AddLink("eth0").carrier = false;
    AddLink("ovs_eth0");
    AddAddress("ovs_eth0", "192.0.2.5");
    EXPECT_THAT(Missing(files), ElementsAre("ovs_eth0: 192.0.2.5 (not ours)"));
    m_live.links.front().carrier = true;
    EXPECT_THAT(Missing(files), IsEmpty());
}

TEST_F(Answers, ComeFromTheInterfaceThatCarriesABridgesAddressMeanwhile)
{
    AddLink("eth0");
    AddAddress("eth0", "192.0.2.5");
    EXPECT_THAT(Missing({{"ovs_eth0", "DEVICE=ovs_eth0\nTYPE=OVS\nPRIMARY=eth0\n"
                                      "IPADDR=192.0.2.5\nPREFIX=24\n"}}),
                IsEmpty());
}

TEST_F(Answers, OfAServerAreNotTheAddressesOfTheFileItself)
{
    const std::map<std::string, std::string> files = {
        {"eth0", "BOOTPROTO=dhcp\nIPADDR1=192.0.2.5\nPREFIX1=24\n"}};
    AddLink("eth0");
    AddAddress("eth0", "192.0.2.5");
    EXPECT_THAT(Missing(files), ElementsAre("eth0: an IPv4 address from a server"));
    AddAddress("eth0", "192.0.2.77");
    EXPECT_THAT(Missing(files), IsEmpty());
}

TEST_F(Answers, OfARouterAreNobodysDuty)
{
    AddLink("eth0");
    EXPECT_THAT(Missing({{"eth0", "IPV6_AUTOCONF=yes\n"}}),
                ElementsAre("eth0: an IPv6 address from a router (not ours)"));
    EXPECT_THAT(Missing({{"eth0", "IPV6_AUTOCONF=yes\nDHCPV6C=yes\n"}}),
                ElementsAre("eth0: an IPv6 address from a server"));
    AddAddress("eth0", "2001:db8::77");
    EXPECT_THAT(Missing({{"eth0", "IPV6_AUTOCONF=yes\n"}}), IsEmpty());
}

TEST_F(Answers, AreNotExpectedOfWhatDoesNotComeUpAtBoot)
{
    EXPECT_THAT(Missing({{"eth0", "ONBOOT=no\nIPADDR=192.0.2.5\nPREFIX=24\n"}}), IsEmpty());
}

TEST(NeededInterfaces, AreThoseThatNoProgramMakes)
{
    EXPECT_THAT(NeededInterfaces(Parse({
                    {"eth0", "IPADDR=192.0.2.5\nPREFIX=24\n"},
                    {"eth1", "MASTER=bond0\nSLAVE=yes\n"},
                    {"bond0", "DEVICE=bond0\n"},
                    {"eth2.10", "VLAN=yes\n"},
                    {"eth3", "ONBOOT=no\n"},
                    {"eth4", "BRIDGE=ovs_eth4\n"},
                    {"ovs_eth4", "DEVICE=ovs_eth4\nTYPE=OVS\nPRIMARY=eth4\n"},
                    {"bond1", "BRIDGE=ovs_bond1\n"},
                    {"ovs_bond1", "DEVICE=ovs_bond1\nTYPE=OVS\nPRIMARY=bond1\nSLAVE_LIST=\"eth5 "
                                  "eth6\"\nBOND_MODE=active-backup\n"},
                })),
                UnorderedElementsAre("eth0", "eth1", "eth2", "eth4", "eth5", "eth6"));
}

} // namespace
} // namespace contract
