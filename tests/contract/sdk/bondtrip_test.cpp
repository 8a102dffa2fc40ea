#include "trip.h"

#include "support/remembered.h"
#include "tools.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sandbox/systemlog.h>
#include <sys/mount.h>
#include <vornplatform/netsdk.h>

namespace {

using contract::Files;
using contract::Ip;
using contract::NetworkCalls;
using contract::NetworkRuns;
using contract::ReadFiles;
using contract::ReadGateways;
using testing::ElementsAre;
using testing::IsEmpty;
using vornhost::RememberedBond;

// Comments, unknown keys, quotes, an order of its own and no line break at the end.
constexpr char kBond[] = "# the storage network, caf\xe9\n"
                         "IPADDR=192.0.2.10\n"
                         "NETMASK=255.255.255.0\n"
                         "GATEWAY=192.0.2.1\n"
                         "DEVICE=bond0\n"
                         "BONDING_OPTS='mode=1'\n"
                         "BONDING_OPTS=\"mode=4 miimon=100 lacp_rate=1 xmit_hash_policy=1\"\n"
                         "IPV6INIT=yes\n"
                         "IPV6ADDR=2001:db8::10/64\n"
                         "IPV6ADDR_SECONDARIES=\"2001:db8::11/64 2001:db8::12/64\"\n"
                         "IPV6_DEFAULTGW=2001:db8::1\n"
                         "MTU=9000\n"
                         "HWADDR=02:00:00:00:00:99\n"
                         "\n"
                         "SITE=\"basement left\"\n"
                         "TYPE=Bond";
constexpr char kFirst[] = "DEVICE=eth0\nHWADDR=02:00:00:00:00:01\nMASTER=bond0\nSLAVE=yes\n"
                          "ONBOOT=no\nCOLOUR=red\n";
constexpr char kSecond[] = "SLAVE=yes\n# left socket\nMASTER=bond0\nDEVICE=eth1\nONBOOT=no\n"
                           "BOOTPROTO=dhcp\nIPADDR=198.51.100.7\n";

const Files kHost{{"bond0", kBond}, {"eth0", kFirst}, {"eth1", kSecond}};
const std::vector<std::string> kSlaves{"eth0", "eth1"};

// What the files say while the bond is apart.
const Files kApart{{"eth0", "# the storage network, caf\xe9\n"
                            "IPADDR=192.0.2.10\n"
                            "NETMASK=255.255.255.0\n"
                            "GATEWAY=192.0.2.1\n"
                            "DEVICE=eth0\n"
                            "IPV6INIT=yes\n"
                            "IPV6ADDR=2001:db8::10/64\n"
                            "IPV6ADDR_SECONDARIES=\"2001:db8::11/64 2001:db8::12/64\"\n"
                            "IPV6_DEFAULTGW=2001:db8::1\n"
                            "MTU=9000\n"
                            "\n"
                            "SITE=\"basement left\"\n"
                            "HWADDR=02:00:00:00:00:01"},
                   {"eth1", "# left socket\nDEVICE=eth1\nONBOOT=yes\nBOOTPROTO=none\nMTU=9000\n"}};

int Set(int mode, const std::vector<std::string>& slaves = kSlaves,
        const std::string& name = "bond0")
{
    const VORNLINKAGGROPT opt = contract::BondRecord(name, mode, slaves);
    return VORNNetLinkAggrSet(&opt);
}

/** The kernel's folder of interfaces is the test's own; its bonds are what a test shows there. */
class BondTrip : public testing::Test {
protected:
    BondTrip() { EXPECT_EQ(mount("devices", vornhost::kInterfaceFolder, "tmpfs", 0, nullptr), 0); }
    ~BondTrip() override
    {
        EXPECT_EQ(umount(vornhost::kInterfaceFolder), 0);
        (void)contract::RunProgram({"ip", "link", "del", "bond0"});
    }

    static void StartLive(const Files& files, const std::string& gateways = "")
    {
        contract::StartWith(files, gateways);
        contract::ShowBond("bond0", {{"mode", "802.3ad 4"},
                                     {"slaves", "eth0 eth1"},
                                     {"miimon", "100"},
                                     {"lacp_rate", "fast 1"},
                                     {"xmit_hash_policy", "layer3+4 1"},
                                     {"min_links", "1"}});
    }

    static void TakeApart()
    {
        ASSERT_EQ(Set(0), 0);
        contract::HideBond("bond0");
    }

    static void GoToSwitch()
    {
        contract::ToBridge("eth0");
        contract::ToBridge("eth1");
        contract::ToSwitchBond("ovs_bond0", kSlaves);
    }

    static void ComeBack()
    {
        contract::FromSwitchBond("ovs_bond0", kSlaves);
        contract::FromBridge("eth0");
        contract::FromBridge("eth1");
        contract::InstallNetworkProgram();
    }
};

TEST_F(BondTrip, LeavesTheAddressingWithTheFirstSlave)
{
    StartLive(kHost);

    EXPECT_EQ(Set(0), 0);

    EXPECT_EQ(ReadFiles(), kApart);
    EXPECT_EQ(NetworkRuns(),
              (std::vector<contract::NetworkRun>{{"start bond0 eth0 eth1", kApart}}));
}

TEST_F(BondTrip, EndsWithTheSameFilesToTheLastByte)
{
    StartLive(kHost);
    TakeApart();
    GoToSwitch();
    ComeBack();

    EXPECT_EQ(Set(2), 0);

    EXPECT_EQ(ReadFiles(), kHost);
    EXPECT_THAT(NetworkCalls(), ElementsAre("start bond0 eth0 eth1"));
    EXPECT_EQ(RememberedBond::Load("bond0"), std::nullopt);
}

TEST_F(BondTrip, HasWhatWasSetByHandInEffectAgainThoughNoFileSaysIt)
{
    StartLive(kHost);
    TakeApart();
    GoToSwitch();
    ComeBack();

    EXPECT_EQ(Set(2), 0);

    ASSERT_EQ(NetworkRuns().size(), 1u);
    Files built = kHost;
    built["bond0"].replace(built["bond0"].find("BONDING_OPTS="),
                           built["bond0"].find("IPV6INIT") - built["bond0"].find("BONDING_OPTS="),
                           "BONDING_OPTS=\"mode=802.3ad lacp_rate=fast miimon=100 min_links=1 "
                           "xmit_hash_policy=layer3+4\"\n");
    EXPECT_EQ(NetworkRuns()[0].files, built);
}

TEST_F(BondTrip, RemembersWhatTheBondWas)
{
    StartLive(kHost);
    Ip("link add bond0 address 02:00:00:00:00:77 type bridge");
    Ip("link set bond0 mtu 9000");

    EXPECT_EQ(Set(0), 0);

    const auto memory = RememberedBond::Load("bond0");
    ASSERT_TRUE(memory);
    EXPECT_EQ(memory->mac, "02:00:00:00:00:77");
    EXPECT_EQ(memory->mtu, 9000u);
    EXPECT_EQ(memory->slaves, kSlaves);
    EXPECT_EQ(memory->options.Text(), "mode=802.3ad lacp_rate=fast miimon=100 min_links=1 "
                                      "xmit_hash_policy=layer3+4");
}

TEST_F(BondTrip, NamesWhatHasNoEffectMeanwhile)
{
    StartLive(kHost);
    harness::SystemLog log;

    EXPECT_EQ(Set(0), 0);

    EXPECT_THAT(log.Lines(), ElementsAre("5 vornnetsdk: bond bond0: min_links=1 "
                                         "xmit_hash_policy=layer3+4 has no effect on the switch "
                                         "and comes back with the bond"));
}

TEST_F(BondTrip, CarriesChangesThatWereMadeOnTheSwitch)
{
    StartLive(kHost);
    TakeApart();
    GoToSwitch();
    contract::EditFile("ovs_bond0",
                       {{"IPADDR", "192.0.2.20"}, {"DNS1", "192.0.2.53"}, {"HWADDR", "2"}},
                       {"IPV6_DEFAULTGW"});
    contract::EditFile("ovs_eth1", {{"COLOUR", "blue"}, {"BOOTPROTO", "dhcp"}, {"IPADDR", ""}});
    ComeBack();

    EXPECT_EQ(Set(2), 0);

    Files wanted = kHost;
    std::string& bond = wanted["bond0"];
    bond.replace(bond.find("IPADDR=192.0.2.10"), 17, "IPADDR=192.0.2.20");
    bond.erase(bond.find("IPV6_DEFAULTGW"), std::string("IPV6_DEFAULTGW=2001:db8::1\n").size());
    bond += "\nDNS1=192.0.2.53";
    std::string& first = wanted["eth0"];
    first.replace(first.find("02:00:00:00:00:01"), 17, "2");
    wanted["eth1"] += "COLOUR=blue\n";
    EXPECT_EQ(ReadFiles(), wanted);
}

TEST_F(BondTrip, EndsInTheModeThatTheSwitchHadNoNumberFor)
{
    for (const char* const mode : {"balance-rr", "balance-alb"}) {
        Files host = kHost;
        host["bond0"] = std::string("DEVICE=bond0\nBONDING_OPTS=\"mode=") + mode + "\"\n";
        contract::StartWith(host);
        contract::ShowBond("bond0", {{"mode", mode}, {"slaves", "eth0 eth1"}});
        TakeApart();
        GoToSwitch();
        ComeBack();
        harness::SystemLog log;

        EXPECT_EQ(Set(3), 0);

        EXPECT_EQ(ReadFiles(), host);
        EXPECT_THAT(log.Lines(), ElementsAre(std::string("5 vornnetsdk: bond bond0 is ") + mode +
                                             " again, for which the switch had balance-xor"));
    }
}

TEST_F(BondTrip, EndsInAnotherModeWhenThatWasChangedOnTheSwitch)
{
    StartLive(kHost);
    TakeApart();
    GoToSwitch();
    ComeBack();

    EXPECT_EQ(Set(4), 0);

    Files wanted = kHost;
    std::string& bond = wanted["bond0"];
    bond.replace(bond.find("BONDING_OPTS="), bond.find("IPV6INIT") - bond.find("BONDING_OPTS="),
                 "BONDING_OPTS=\"mode=active-backup miimon=100\"\n");
    EXPECT_EQ(ReadFiles(), wanted);
}

TEST_F(BondTrip, MayBeTakenByAnyNumberOfSlaves)
{
    Files host{{"bond0", "DEVICE=bond0\nIPADDR=192.0.2.10/24\nBONDING_OPTS=\"mode=802.3ad\"\n"}};
    std::vector<std::string> slaves;
    for (int number = 0; number < 32; ++number) {
        slaves.push_back("eth" + std::to_string(number));
        host[slaves.back()] = "DEVICE=" + slaves.back() + "\nMASTER=bond0\nSLAVE=yes\n";
    }
    StartLive(host);

    EXPECT_EQ(Set(0, slaves), 0);
    contract::HideBond("bond0");
    EXPECT_EQ(ReadFiles().size(), 32u);
    EXPECT_EQ(Set(2, slaves), 0);
    EXPECT_EQ(ReadFiles(), host);
}

TEST_F(BondTrip, WithoutFilesWritesWhatIsLiveAndLeavesNoFileBehind)
{
    contract::StartWith({});
    contract::ShowBond("bond0", {{"mode", "active-backup 1"},
                                 {"slaves", "eth1 eth0"},
                                 {"miimon", "100"},
                                 {"primary", "eth1"}});
    Ip("link add bond0 type bridge");
    Ip("link set bond0 up mtu 9000");
    Ip("addr add 192.0.2.10/24 dev bond0");
    Ip("addr add 192.0.2.11/25 dev bond0");
    Ip("addr add 2001:db8::10/64 dev bond0 nodad");
    Ip("route add default via 192.0.2.1 dev bond0 metric 50");
    Ip("-6 route add default via fe80::1 dev bond0");

    EXPECT_EQ(Set(0, {"eth1", "eth0"}), 0);
    EXPECT_EQ(ReadFiles(),
              (Files{{"eth1", "DEVICE=eth1\nBOOTPROTO=none\nONBOOT=yes\nIPADDR=192.0.2.10\n"
                              "PREFIX=24\nIPADDR1=192.0.2.11\nPREFIX1=25\nIPV6INIT=yes\n"
                              "IPV6ADDR=2001:db8::10/64\nGATEWAY=192.0.2.1\nMETRIC=50\n"
                              "IPV6_DEFAULTGW=fe80::1\nMTU=9000\n"},
                     {"eth0", "DEVICE=eth0\nBOOTPROTO=none\nONBOOT=yes\nMTU=9000\n"}}));

    contract::HideBond("bond0");
    contract::InstallNetworkProgram();
    EXPECT_EQ(Set(4, {"eth1", "eth0"}), 0);
    EXPECT_EQ(ReadFiles(), Files{});
    ASSERT_EQ(NetworkRuns().size(), 1u);
    EXPECT_EQ(
        NetworkRuns()[0].files,
        (Files{{"bond0", "DEVICE=bond0\nBOOTPROTO=none\nONBOOT=yes\nIPADDR=192.0.2.10\nPREFIX=24\n"
                         "IPADDR1=192.0.2.11\nPREFIX1=25\nIPV6INIT=yes\n"
                         "IPV6ADDR=2001:db8::10/64\nGATEWAY=192.0.2.1\nMETRIC=50\n"
                         "IPV6_DEFAULTGW=fe80::1\nMTU=9000\n"
                         "BONDING_OPTS=\"mode=active-backup miimon=100 primary=eth1\"\n"},
               {"eth0", "DEVICE=eth0\nBOOTPROTO=none\nONBOOT=yes\nMASTER=bond0\nSLAVE=yes\n"},
               {"eth1", "DEVICE=eth1\nBOOTPROTO=none\nONBOOT=yes\nMASTER=bond0\nSLAVE=yes\n"}}));
}

} // namespace
