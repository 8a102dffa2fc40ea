#include "trip.h"

#include "support/bondoptions.h"
#include "tools.h"

#include <algorithm>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sstream>
#include <sys/mount.h>
#include <vornplatform/netsdk.h>

namespace {

using contract::Files;
using contract::ReadFiles;
using contract::ReadGateways;
using testing::ElementsAre;

const Files kHost{
    {"bond0", "DEVICE=bond0\nIPADDR=192.0.2.10/24\nBONDING_OPTS=\"mode=802.3ad miimon=100\"\n"},
    {"eth0", "DEVICE=eth0\nMASTER=bond0\nSLAVE=yes\n"},
    {"eth1", "DEVICE=eth1\nMASTER=bond0\nSLAVE=yes\nCOLOUR=blue\n"}};
const std::vector<std::string> kSlaves{"eth0", "eth1"};

int Set(int mode)
{
    const VORNLINKAGGROPT opt = contract::BondRecord("bond0", mode, kSlaves);
    return VORNNetLinkAggrSet(&opt);
}

/** What the library does around the bond, with the gateways of the host in one place or another. */
class BondGateways : public testing::Test {
protected:
    BondGateways()
    {
        EXPECT_EQ(mount("devices", vornhost::kInterfaceFolder, "tmpfs", 0, nullptr), 0);
    }
    ~BondGateways() override { EXPECT_EQ(umount(vornhost::kInterfaceFolder), 0); }

    static void Start(const Files& files, const std::string& gateways)
    {
        contract::StartWith(files, gateways);
        contract::ShowBond("bond0", {{"mode", "802.3ad 4"}, {"slaves", "eth0 eth1"}});
    }

    static void GoToSwitch()
    {
        contract::CopyGateways("bond0", "ovs_bond0");
        contract::DeleteGateways("bond0");
        ASSERT_EQ(Set(0), 0);
        contract::HideBond("bond0");
        contract::ToBridge("eth0");
        contract::ToBridge("eth1");
        contract::CopyGateways("eth0", "ovs_bond0");
        contract::ToSwitchBond("ovs_bond0", kSlaves);
    }

    static void ComeBack()
    {
        contract::CopyGateways("ovs_bond0", "bond0");
        contract::FromSwitchBond("ovs_bond0", kSlaves);
        contract::FromBridge("eth0");
        contract::FromBridge("eth1");
        ASSERT_EQ(Set(2), 0);
    }

    static std::vector<std::string> Records()
    {
        std::vector<std::string> lines;
        std::istringstream text(ReadGateways());
        for (std::string line; std::getline(text, line);) {
            lines.push_back(line);
        }
        std::sort(lines.begin(), lines.end());
        return lines;
    }
};

TEST_F(BondGateways, InTheFileAreInTheFilesOnTheSwitchWhateverTheSlavesRecordsSay)
{
    Files host = kHost;
    host["bond0"] += "GATEWAY=192.0.2.1\nIPV6_DEFAULTGW=2001:db8::1\n";
    const std::string stale = "eth0 inet 198.51.100.1\neth0 inet6 fe80::9\n";
    Start(host, stale);

    GoToSwitch();
    EXPECT_EQ(ReadGateways(), "(none)");
    EXPECT_NE(ReadFiles()["ovs_bond0"].find("GATEWAY=192.0.2.1\nIPV6_DEFAULTGW=2001:db8::1\n"),
              std::string::npos);

    ComeBack();
    EXPECT_EQ(ReadFiles(), host);
    EXPECT_EQ(ReadGateways(), stale);
}

TEST_F(BondGateways, InTheRecordsFollowTheAddressing)
{
    Start(kHost, "bond0 inet 192.0.2.1 metric 5\nbond0 inet6 fe80::1\neth0 inet 198.51.100.1\n");

    GoToSwitch();
    EXPECT_THAT(Records(),
                ElementsAre("eth0 inet 192.0.2.1 metric 5", "eth0 inet6 fe80::1",
                            "ovs_bond0 inet 192.0.2.1 metric 5", "ovs_bond0 inet6 fe80::1",
                            "ovs_eth0 inet 192.0.2.1 metric 5", "ovs_eth0 inet6 fe80::1"));

    ComeBack();
    EXPECT_THAT(Records(),
                ElementsAre("bond0 inet 192.0.2.1 metric 5", "bond0 inet6 fe80::1",
                            "eth0 inet 198.51.100.1", "ovs_bond0 inet 192.0.2.1 metric 5",
                            "ovs_bond0 inet6 fe80::1"));
}

TEST_F(BondGateways, OfTheKernelAloneAreNotHinderedByASlavesRecords)
{
    Start(kHost, "eth0 inet 198.51.100.1\novs_eth0 inet6 fe80::9\n");

    GoToSwitch();
    EXPECT_EQ(ReadGateways(), "(none)");

    ComeBack();
    EXPECT_THAT(Records(), ElementsAre("eth0 inet 198.51.100.1"));
}

TEST_F(BondGateways, ChangedOnTheSwitchAreTheBondsAfterwards)
{
    Start(kHost, "bond0 inet 192.0.2.1\n");

    GoToSwitch();
    contract::WriteFile("/usr/vorn/etc/vornnetd/gateways.conf", "ovs_bond0 inet 192.0.2.2\n");
    ComeBack();

    EXPECT_THAT(Records(), ElementsAre("bond0 inet 192.0.2.2", "ovs_bond0 inet 192.0.2.2"));
}

} // namespace
