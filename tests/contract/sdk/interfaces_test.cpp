#include "tools.h"

#include <cstring>
#include <filesystem>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sandbox/systemlog.h>
#include <sys/mount.h>
#include <vornplatform/sdk.h>

namespace {

using contract::Ip;
using contract::WriteFile;
using testing::ElementsAre;

std::string OwnFile(const std::string& name)
{
    return "DEVICE=" + name + "\nONBOOT=yes\n";
}

// A network of its own: interfaces and files go with the test.
class Interfaces : public testing::Test {
protected:
    Interfaces() { contract::Delete("/etc/sysconfig/network-scripts"); }
    ~Interfaces() override
    {
        for (const std::string& name : m_made) {
            (void)contract::RunProgram({"ip", "link", "del", name});
        }
    }

    void Make(const std::string& name, const std::string& how)
    {
        Ip("link add " + name + " type " + how);
        m_made.push_back(name);
    }

    void MakeTap(const std::string& name)
    {
        Ip("tuntap add dev " + name + " mode tap");
        m_made.push_back(name);
    }

    static std::vector<std::string> List(int capacity = 32)
    {
        std::vector<VLIBNETIFINFO> entries(static_cast<std::size_t>(capacity) + 1);
        std::memset(entries.data(), 'x', entries.size() * sizeof(VLIBNETIFINFO));
        const int count = VLIBNetGetInterfaceInfo(entries.data(), capacity, 2);
        EXPECT_GE(count, 0);
        EXPECT_LE(count, capacity);
        EXPECT_EQ(entries[static_cast<std::size_t>(std::max(count, 0))].szIfName[0], 'x')
            << "the entry behind the last one was written";
        std::vector<std::string> names;
        for (int index = 0; index < count; ++index) {
            names.emplace_back(entries[static_cast<std::size_t>(index)].szIfName);
        }
        return names;
    }

private:
    std::vector<std::string> m_made;
};

TEST_F(Interfaces, AreNoneOnAHostThatHasNothingToConvert)
{
    Make("veth0", "veth peer name veth1");
    Make("br0", "bridge");
    MakeTap("vnet0");

    EXPECT_THAT(List(), ElementsAre());
}

TEST_F(Interfaces, AreListedWhenTheyHaveAFile)
{
    Make("port0", "veth peer name wire0");
    Make("port1", "veth peer name wire1");
    MakeTap("vnet0");
    for (const char* const name : {"port1", "vnet0", "lo", "absent0"}) {
        WriteFile(contract::IfcfgPath(name), OwnFile(name));
    }

    EXPECT_THAT(List(), ElementsAre("port1", "vnet0"));
}

TEST_F(Interfaces, AreNotListedForAFileThatIsAnothersOrAFolder)
{
    Make("port0", "veth peer name port1");
    WriteFile(contract::IfcfgPath("port0"), OwnFile("port1"));
    WriteFile(contract::IfcfgPath("port1") + "/file", "");
    EXPECT_THAT(List(), ElementsAre());

    WriteFile(contract::IfcfgPath("port0"), "IPADDR=192.0.2.1\n");
    EXPECT_THAT(List(), ElementsAre("port0"));
}

TEST_F(Interfaces, PutBridgesAndNamesThatNobodyConvertsLast)
{
    Make("br0", "bridge");
    MakeTap("tun0");
    Make("port0", "veth peer name wire0");
    for (const char* const name : {"br0", "tun0", "port0"}) {
        WriteFile(contract::IfcfgPath(name), OwnFile(name));
    }

    EXPECT_THAT(List(), ElementsAre("port0", "br0", "tun0"));
}

TEST_F(Interfaces, LeaveOutThePortsOfALinuxBridge)
{
    Make("br0", "bridge");
    Make("port0", "veth peer name wire0");
    Ip("link set port0 master br0");
    WriteFile(contract::IfcfgPath("port0"), OwnFile("port0"));

    EXPECT_THAT(List(), ElementsAre());
}

TEST_F(Interfaces, AreAtMostAsManyAsFitAndTheRestIsLogged)
{
    Make("br0", "bridge");
    for (const char* const name : {"port0", "port1", "port2"}) {
        Make(name, "veth peer name far" + std::string(name));
        WriteFile(contract::IfcfgPath(name), OwnFile(name));
    }
    WriteFile(contract::IfcfgPath("br0"), OwnFile("br0"));
    harness::SystemLog log;

    EXPECT_THAT(List(2), ElementsAre("port0", "port1"));
    EXPECT_THAT(log.Lines(), ElementsAre("3 vornsdk: interface port2 is left out: the list is full",
                                         "3 vornsdk: interface br0 is left out: the list is full"));
}

TEST_F(Interfaces, AreLoggedWhenTheirNameIsTooLong)
{
    Make("elevenchars", "veth peer name wire0");
    Make("twelve-chars", "veth peer name wire1");
    WriteFile(contract::IfcfgPath("elevenchars"), OwnFile("elevenchars"));
    WriteFile(contract::IfcfgPath("twelve-chars"), OwnFile("twelve-chars"));
    harness::SystemLog log;

    EXPECT_THAT(List(), ElementsAre("elevenchars"));
    EXPECT_THAT(log.Lines(),
                ElementsAre("3 vornsdk: interface twelve-chars is left out: its name and the "
                            "bridge's prefix exceed 15 characters"));
}

TEST_F(Interfaces, AreListedWithoutAFileWhenADeviceStandsBehindThem)
{
    Make("port0", "veth peer name port1");
    Make("port2", "veth peer name port3");
    // The kernel's view of devices, with a card behind one interface and a radio behind another.
    ASSERT_EQ(mount("devices", "/sys/class/net", "tmpfs", 0, nullptr), 0);
    WriteFile("/sys/class/net/port0/device/uevent", "");
    WriteFile("/sys/class/net/port2/device/uevent", "");
    WriteFile("/sys/class/net/port2/phy80211/uevent", "");

    EXPECT_THAT(List(), ElementsAre("port0"));

    ASSERT_EQ(umount("/sys/class/net"), 0);
}

TEST_F(Interfaces, AreNotListedForWrongArguments)
{
    VLIBNETIFINFO entries[2] = {};
    EXPECT_EQ(VLIBNetGetInterfaceInfo(nullptr, 32, 2), -1);
    EXPECT_EQ(VLIBNetGetInterfaceInfo(entries, 0, 2), -1);
    EXPECT_EQ(VLIBNetGetInterfaceInfo(entries, -1, 2), -1);
    EXPECT_EQ(VLIBNetGetInterfaceInfo(entries, 2, 1), -1);
}

TEST_F(Interfaces, AreBridgesByTheirKindWhateverTheirName)
{
    Make("lan", "bridge");
    Make("br7", "veth peer name wire0");

    EXPECT_NE(VLIBNetBridgeIfIsMaster("lan"), 0);
    EXPECT_EQ(VLIBNetBridgeIfIsMaster("br7"), 0);
    EXPECT_EQ(VLIBNetBridgeIfIsMaster("lo"), 0);
    EXPECT_EQ(VLIBNetBridgeIfIsMaster("absent0"), 0);
    EXPECT_EQ(VLIBNetBridgeIfIsMaster(std::string(5000, 'a').c_str()), 0);
    EXPECT_EQ(VLIBNetBridgeIfIsMaster(nullptr), -1);
}

TEST_F(Interfaces, AreNotOfASwitchThatDoesNotRun)
{
    Make("ovs_port0", "bridge");
    harness::SystemLog log;

    EXPECT_LT(VLIBNetOVSIfIsMaster("ovs_port0"), 0);
    EXPECT_LT(VLIBNetOVSIfIsMaster(nullptr), 0);
    EXPECT_THAT(log.Lines(),
                ElementsAre("3 vornsdk: the switch's database does not tell what ovs_port0 is"));
}

} // namespace
