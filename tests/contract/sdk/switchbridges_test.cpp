#include "tools.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sandbox/systemlog.h>
#include <vornplatform/netsdk.h>
#include <vornplatform/sdk.h>

namespace {

using contract::Ip;
using contract::Outcome;
using contract::WriteFile;
using testing::ElementsAre;

constexpr char kMark[] = "external_ids:vornovs-network=rc.network";

// The database alone: what the bridges are is decided by what it says.
class SwitchBridges : public testing::Test {
protected:
    SwitchBridges()
    {
        EXPECT_EQ(contract::RunProgram({"/etc/init.d/vornovs-db", "start"}).exitCode, 0);
    }
    ~SwitchBridges() override
    {
        EXPECT_EQ(contract::RunProgram({"/etc/init.d/vornovs-db", "stop"}).exitCode, 0);
        contract::Delete("/etc/openvswitch/conf.db");
        contract::Delete("/etc/sysconfig/network-scripts");
    }

    static void Vsctl(std::vector<std::string> words)
    {
        words.insert(words.begin(), {"ovs-vsctl", "--timeout=10", "--no-wait"});
        EXPECT_EQ(contract::RunProgram(words), (Outcome{0, "", ""}));
    }

    static void WriteBridgeFile(const std::string& interface)
    {
        WriteFile(contract::IfcfgPath("ovs_" + interface),
                  "DEVICE=ovs_" + interface + "\nTYPE=OVS\nPRIMARY=" + interface + "\n");
    }
};

TEST_F(SwitchBridges, CarryThePlainInterfaceThatTheirFileNames)
{
    Vsctl({"add-br", "ovs_eth0", "--", "add-port", "ovs_eth0", "eth0"});
    EXPECT_EQ(VLIBNetOVSIfIsMaster("ovs_eth0"), 0) << "without a file any port may be a client's";

    WriteBridgeFile("eth0");
    EXPECT_EQ(VLIBNetOVSIfIsMaster("ovs_eth0"), 1);
}

TEST_F(SwitchBridges, CarryThePortThatTheNetworkProgramMarked)
{
    Vsctl({"add-br", "ovs_eth0", "--", "add-port", "ovs_eth0", "eth0", "--", "set", "port", "eth0",
           kMark});

    EXPECT_EQ(VLIBNetOVSIfIsMaster("ovs_eth0"), 1);
}

TEST_F(SwitchBridges, CarryABond)
{
    Vsctl({"add-br", "ovs_bond0", "--", "add-bond", "ovs_bond0", "bond0", "eth0", "eth1"});
    WriteBridgeFile("bond0");

    EXPECT_EQ(VLIBNetOVSIfIsMaster("ovs_bond0"), 2);
}

TEST_F(SwitchBridges, AreTheSameWithPortsOfClients)
{
    Vsctl({"add-br", "ovs_eth0", "--", "add-port", "ovs_eth0", "eth0", "--", "add-bond", "ovs_eth0",
           "clients", "tap0", "tap1", "--", "add-port", "ovs_eth0", "tap2"});
    WriteBridgeFile("eth0");
    EXPECT_EQ(VLIBNetOVSIfIsMaster("ovs_eth0"), 1);

    Vsctl({"del-port", "ovs_eth0", "eth0"});
    EXPECT_EQ(VLIBNetOVSIfIsMaster("ovs_eth0"), 0);
}

// The bridge of a bond as the network program and the library leave it.
void WriteBondFile(const std::string& slaves)
{
    WriteFile(contract::IfcfgPath("ovs_bond0"),
              "DEVICE=ovs_bond0\nTYPE=OVS\nPRIMARY=eth1\nSLAVE_LIST=\"" + slaves + " \"\n");
}

TEST_F(SwitchBridges, CarryTheBondWhoseMembersTheirFileLists)
{
    Vsctl({"add-br", "ovs_bond0", "--", "add-bond", "ovs_bond0", "uplink", "eth0", "eth1", "--",
           "add-bond", "ovs_bond0", "clients", "tap0", "tap1"});
    EXPECT_EQ(VLIBNetOVSIfIsMaster("ovs_bond0"), 0) << "without a file both may be clients'";

    WriteBondFile("eth1 eth0");
    EXPECT_EQ(VLIBNetOVSIfIsMaster("ovs_bond0"), 2);

    Vsctl({"del-port", "uplink"});
    EXPECT_EQ(VLIBNetOVSIfIsMaster("ovs_bond0"), 0);
}

TEST_F(SwitchBridges, CarryTheBondThatTheNetworkProgramMarkedBesideAClientsBond)
{
    Vsctl({"add-br", "ovs_bond0", "--", "add-bond", "ovs_bond0", "clients", "tap0", "tap1", "--",
           "add-bond", "ovs_bond0", "uplink", "eth0", "eth1", "--", "set", "port", "uplink",
           kMark});

    EXPECT_EQ(VLIBNetOVSIfIsMaster("ovs_bond0"), 2);
}

TEST_F(SwitchBridges, OfOthersCarryNothingThatIsOurs)
{
    Vsctl({"add-br", "lan", "--", "add-port", "lan", "eth3", "--", "add-bond", "lan", "theirs",
           "eth4", "eth5"});

    EXPECT_EQ(VLIBNetOVSIfIsMaster("lan"), 0);
    VORNLINKAGGROPT opt{};
    EXPECT_EQ(VORNNetLinkAggrGet("lan", &opt), -1);
}

TEST_F(SwitchBridges, HaveTheirBondReadWithItsModeAndItsFilesOrder)
{
    Vsctl({"add-br", "ovs_bond0", "--", "add-bond", "ovs_bond0", "uplink", "eth0", "eth1", "--",
           "set", "port", "uplink", kMark});
    WriteBondFile("eth1 eth0");
    const std::pair<const char*, int> rows[] = {
        {"bond_mode=active-backup", 6}, {"bond_mode=balance-slb", 7}, {"bond_mode=balance-tcp", 8}};
    for (const auto& [column, mode] : rows) {
        Vsctl({"set", "port", "uplink", column});
        VORNLINKAGGROPT opt{};
        EXPECT_EQ(VORNNetLinkAggrGet("ovs_bond0", &opt), 0);
        EXPECT_STREQ(opt.szMaster, "ovs_bond0");
        EXPECT_EQ(opt.mode, mode);
        EXPECT_EQ(opt.nSlave, 2);
        EXPECT_STREQ(opt.rgszSlave[0], "eth1");
        EXPECT_STREQ(opt.rgszSlave[1], "eth0");
    }

    Vsctl({"clear", "port", "uplink", "bond_mode"});
    WriteBondFile("eth1 eth2");
    VORNLINKAGGROPT opt{};
    EXPECT_EQ(VORNNetLinkAggrGet("ovs_bond0", &opt), 0);
    EXPECT_EQ(opt.mode, 6) << "what the switch does without a mode";
    EXPECT_STREQ(opt.rgszSlave[0], "eth0") << "the file says something else than the switch";
}

TEST_F(SwitchBridges, WithOneInterfaceHaveNoBondToBeRead)
{
    Vsctl({"add-br", "ovs_eth0", "--", "add-port", "ovs_eth0", "eth0"});
    WriteBridgeFile("eth0");
    VORNLINKAGGROPT opt{};

    EXPECT_EQ(VORNNetLinkAggrGet("ovs_eth0", &opt), -1);
    EXPECT_EQ(VORNNetLinkAggrGet("ovs_eth1", &opt), -1);
}

TEST_F(SwitchBridges, AreOnlyThoseOfTheSwitch)
{
    Vsctl({"add-br", "ovs_eth0", "--", "add-port", "ovs_eth0", "eth0"});
    harness::SystemLog log;

    EXPECT_LT(VLIBNetOVSIfIsMaster("eth0"), 0);
    EXPECT_LT(VLIBNetOVSIfIsMaster("ovs_eth"), 0);
    EXPECT_LT(VLIBNetOVSIfIsMaster(""), 0);
    EXPECT_LT(VLIBNetOVSIfIsMaster(std::string(5000, 'a').c_str()), 0);
    EXPECT_THAT(log.Lines(), ElementsAre());
}

TEST_F(SwitchBridges, AreReadWhenThereAreMany)
{
    std::vector<std::string> words;
    for (int index = 0; index < 100; ++index) {
        words.insert(words.end(), {"--", "add-br", "ovs_port" + std::to_string(index)});
    }
    words.erase(words.begin());
    Vsctl(words);
    WriteBridgeFile("port99");

    EXPECT_EQ(VLIBNetOVSIfIsMaster("ovs_port99"), 0);
}

TEST_F(SwitchBridges, HaveTheSpeedOfTheirBondsFastestMember)
{
    Ip("link add port0 type veth peer name wire0");
    Ip("link add port1 type veth peer name wire1");
    Ip("link add ovs_bond0 type bridge"); // stands in for the switch's device
    Ip("link set ovs_bond0 up");
    Vsctl({"add-br", "ovs_bond0", "--", "add-bond", "ovs_bond0", "bond0", "port0", "port1"});
    WriteBridgeFile("bond0");
    VORNNETETHINFO info{};

    EXPECT_EQ(VORNNetGetEthInfo(&info, "ovs_bond0"), 0);
    EXPECT_EQ(info.speed, -1);

    Ip("link set port1 up");
    Ip("link set wire1 up");
    EXPECT_EQ(VORNNetGetEthInfo(&info, "ovs_bond0"), 0);
    EXPECT_EQ(info.speed, 10000);

    for (const char* const name : {"port0", "port1", "ovs_bond0"}) {
        Ip("link del " + std::string(name));
    }
}

} // namespace
