#include "trip.h"

#include "support/filestates.h"
#include "support/remembered.h"
#include "tools.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sandbox/systemlog.h>
#include <sys/mount.h>
#include <vornplatform/netsdk.h>

namespace {

using contract::Files;
using contract::NetworkCalls;
using contract::ReadFiles;
using contract::ReadGateways;
using testing::ElementsAre;
using testing::IsEmpty;
using vornhost::RememberedBond;

const Files kHost{
    {"bond0", "DEVICE=bond0\nIPADDR=192.0.2.10/24\nBONDING_OPTS=\"mode=802.3ad miimon=100\"\n"},
    {"eth0", "DEVICE=eth0\nMASTER=bond0\nSLAVE=yes\n"},
    {"eth1", "DEVICE=eth1\nMASTER=bond0\nSLAVE=yes\nCOLOUR=blue\n"}};
const Files kApart{{"eth0", "DEVICE=eth0\nIPADDR=192.0.2.10/24\n"},
                   {"eth1", "DEVICE=eth1\nCOLOUR=blue\n"}};
const std::vector<std::string> kSlaves{"eth0", "eth1"};

int Set(int mode, const std::vector<std::string>& slaves = kSlaves)
{
    const VORNLINKAGGROPT opt = contract::BondRecord("bond0", mode, slaves);
    return VORNNetLinkAggrSet(&opt);
}

class BondChange : public testing::Test {
protected:
    BondChange()
    {
        EXPECT_EQ(mount("devices", vornhost::kInterfaceFolder, "tmpfs", 0, nullptr), 0);
        contract::StartWith(kHost);
        Show();
    }
    ~BondChange() override { EXPECT_EQ(umount(vornhost::kInterfaceFolder), 0); }

    static void Show(const std::string& mode = "802.3ad 4")
    {
        contract::ShowBond("bond0", {{"mode", mode}, {"slaves", "eth0 eth1"}});
    }

    static void Write(const std::string& interface, const Files& files)
    {
        const auto file = files.find(interface);
        contract::Delete(contract::IfcfgPath(interface));
        if (file != files.end()) {
            contract::WriteFile(contract::IfcfgPath(interface), file->second);
        }
    }

    static Files Before()
    {
        const auto memory = RememberedBond::Load("bond0");
        Files files;
        for (const auto& [interface, state] : memory->state.before) {
            files[interface] = state.text.value_or("(none)");
        }
        return files;
    }
};

TEST_F(BondChange, ApartIsFinishedWhereverItWasCutShort)
{
    // The files change in this order; each number of them may have been written.
    const std::vector<std::string> order{"eth1", "eth0", "bond0"};
    for (std::size_t written = 0; written <= order.size(); ++written) {
        contract::StartWith(kHost);
        Show();
        ASSERT_EQ(Set(0), 0);
        for (const std::string& interface : order) {
            Write(interface, kHost);
        }
        for (std::size_t index = 0; index < written; ++index) {
            Write(order[index], kApart);
        }
        contract::InstallNetworkProgram();

        EXPECT_EQ(Set(0), 0) << written;

        EXPECT_EQ(ReadFiles(), kApart) << written;
        EXPECT_EQ(Before(), kHost) << written;
        EXPECT_THAT(NetworkCalls(), ElementsAre("start bond0 eth0 eth1")) << written;
    }
}

TEST_F(BondChange, BuildingIsFinishedWhereverItWasCutShort)
{
    const std::vector<std::string> order{"bond0", "eth0", "eth1"};
    for (std::size_t written = 0; written <= order.size(); ++written) {
        contract::StartWith(kHost);
        Show();
        ASSERT_EQ(Set(0), 0);
        contract::HideBond("bond0");
        for (std::size_t index = 0; index < written; ++index) {
            Write(order[index], kHost);
        }

        EXPECT_EQ(Set(2), 0) << written;

        EXPECT_EQ(ReadFiles(), kHost) << written;
        EXPECT_EQ(RememberedBond::Load("bond0"), std::nullopt) << written;
    }
}

TEST_F(BondChange, ApartAgainAfterAWayBackThatWasCutShortKeepsTheOldMemory)
{
    ASSERT_EQ(Set(0), 0);
    Write("bond0", kHost);
    Write("eth0", kHost);

    EXPECT_EQ(Set(0), 0);

    EXPECT_EQ(ReadFiles(), kApart);
    EXPECT_EQ(Before(), kHost);
}

TEST_F(BondChange, ApartTwiceDoesNothingMore)
{
    ASSERT_EQ(Set(0), 0);
    contract::HideBond("bond0");
    const auto memory = RememberedBond::Load("bond0");

    EXPECT_EQ(Set(0), 0);

    EXPECT_EQ(ReadFiles(), kApart);
    EXPECT_EQ(RememberedBond::Load("bond0"), memory);
    EXPECT_THAT(NetworkCalls(), ElementsAre("start bond0 eth0 eth1", "start bond0 eth0 eth1"));
}

TEST_F(BondChange, ForgetsABondOfFormerTimes)
{
    ASSERT_EQ(Set(0), 0);
    Files later = kHost;
    later["bond0"] = "DEVICE=bond0\nIPADDR=198.51.100.1/24\n";
    later["eth1"] = "# new card\nDEVICE=eth1\nMASTER=bond0\nSLAVE=yes\n";
    for (const char* const interface : {"bond0", "eth0", "eth1"}) {
        Write(interface, later);
    }

    EXPECT_EQ(Set(0), 0);

    EXPECT_EQ(Before(), later);
}

TEST_F(BondChange, LeavesTheBondWhenTheNetworkProgramCannotTakeItApart)
{
    const std::string gateways = "bond0 inet 192.0.2.1\neth0 inet 198.51.100.1\n";
    contract::StartWith(kHost, gateways);
    Show();
    contract::InstallNetworkProgram({1});

    EXPECT_EQ(Set(0), -1);

    EXPECT_EQ(ReadFiles(), kHost);
    EXPECT_EQ(ReadGateways(), gateways);
    EXPECT_EQ(RememberedBond::Load("bond0"), std::nullopt);
    EXPECT_THAT(NetworkCalls(), ElementsAre("start bond0 eth0 eth1", "start bond0 eth0 eth1"));
}

TEST_F(BondChange, KeepsTheMemoryWhenNotEvenTheOldStateCanBeHadBack)
{
    contract::InstallNetworkProgram({1, 1});

    EXPECT_EQ(Set(0), -1);

    EXPECT_EQ(ReadFiles(), kHost);
    EXPECT_NE(RememberedBond::Load("bond0"), std::nullopt);
}

TEST_F(BondChange, ChangesNothingThatCannotBeRemembered)
{
    contract::WriteFile("/usr/vorn/etc/vornnetd/remembered", "in the way");

    EXPECT_EQ(Set(0), -1);

    EXPECT_EQ(ReadFiles(), kHost);
    EXPECT_THAT(NetworkCalls(), IsEmpty());
}

TEST_F(BondChange, LeavesItsFilesToTheNextTryWhenItCannotBeBuilt)
{
    ASSERT_EQ(Set(0), 0);
    contract::HideBond("bond0");
    contract::InstallNetworkProgram({1});

    EXPECT_EQ(Set(2), -1);
    EXPECT_NE(RememberedBond::Load("bond0"), std::nullopt);

    EXPECT_EQ(Set(2), 0);
    EXPECT_EQ(ReadFiles(), kHost);
}

TEST_F(BondChange, WithoutMemoryMakesABondOfTheFirstSlavesAddressing)
{
    contract::StartWith({{"eth0", "# first\nDEVICE=eth0\nHWADDR=02:00:00:00:00:01\n"
                                  "IPADDR=192.0.2.10/24\nBRIDGE=ovs_eth0\nMTU=9000\n"},
                         {"eth1", "DEVICE=eth1\nBOOTPROTO=dhcp\nIPADDR=192.0.2.11/24\n"}},
                        "eth0 inet 192.0.2.1\n");
    contract::HideBond("bond0");

    EXPECT_EQ(Set(4), 0);

    EXPECT_EQ(ReadFiles(),
              (Files{{"bond0", "# first\nDEVICE=bond0\nIPADDR=192.0.2.10/24\nMTU=9000\n"
                               "BONDING_OPTS=\"mode=active-backup miimon=100\"\n"},
                     {"eth0", "# first\nDEVICE=eth0\nHWADDR=02:00:00:00:00:01\nMTU=9000\n"
                              "MASTER=bond0\nSLAVE=yes\n"},
                     {"eth1", "DEVICE=eth1\nBOOTPROTO=none\nMASTER=bond0\nSLAVE=yes\n"}}));
    EXPECT_EQ(ReadGateways(), "bond0 inet 192.0.2.1\n");
    EXPECT_THAT(NetworkCalls(), ElementsAre("start bond0 eth0 eth1"));
}

TEST_F(BondChange, IsOnlyOfTheModeAndTheSlavesWhenTheBondStands)
{
    contract::WriteFile(contract::IfcfgPath("eth2"), "DEVICE=eth2\n");
    Show("active-backup 1");

    EXPECT_EQ(Set(4), 0);
    Files wanted = kHost;
    wanted["eth2"] = "DEVICE=eth2\n";
    wanted["bond0"] = "DEVICE=bond0\nIPADDR=192.0.2.10/24\n"
                      "BONDING_OPTS=\"mode=active-backup miimon=100\"\n";
    EXPECT_EQ(ReadFiles(), wanted);

    EXPECT_EQ(Set(4, {"eth0", "eth1", "eth2"}), 0);
    wanted["eth2"] = "DEVICE=eth2\nMASTER=bond0\nSLAVE=yes\n";
    EXPECT_EQ(ReadFiles(), wanted);
    EXPECT_THAT(NetworkCalls(), ElementsAre("start bond0 eth0 eth1", "start bond0 eth0 eth1 eth2"));
}

TEST_F(BondChange, FailsWhenTheLiveBondKeepsAnotherMode)
{
    harness::SystemLog log;

    EXPECT_EQ(Set(4), -1) << "the network program was content";
    EXPECT_THAT(log.Lines(), ElementsAre("3 vornnetsdk: bond bond0: it keeps the mode that it "
                                         "had"));

    contract::InstallNetworkProgram({1});
    EXPECT_EQ(Set(4), -1) << "the network program was not";

    Show("active-backup 1");
    EXPECT_EQ(Set(4), 0);
    Files wanted = kHost;
    wanted["bond0"] = "DEVICE=bond0\nIPADDR=192.0.2.10/24\n"
                      "BONDING_OPTS=\"mode=active-backup miimon=100\"\n";
    EXPECT_EQ(ReadFiles(), wanted);
}

TEST_F(BondChange, LeavesABondWithoutLinkMonitoringAsItWas)
{
    contract::EditFile("bond0", {{"BONDING_OPTS", "mode=balance-xor"}});
    contract::ShowBond("bond0", {{"mode", "balance-xor 2"}, {"miimon", "0"}});
    const Files host = ReadFiles();
    ASSERT_EQ(Set(0), 0);
    contract::HideBond("bond0");
    contract::InstallNetworkProgram();

    EXPECT_EQ(Set(3), 0);

    EXPECT_EQ(contract::NetworkRuns(),
              (std::vector<contract::NetworkRun>{{"start bond0 eth0 eth1", host}}));
}

TEST_F(BondChange, TakesInASlaveThatTheBondGotMeanwhile)
{
    ASSERT_EQ(Set(0), 0);
    contract::HideBond("bond0");
    contract::WriteFile(contract::IfcfgPath("eth2"), "DEVICE=eth2\nIPADDR=198.51.100.1/24\n");

    EXPECT_EQ(Set(2, {"eth0", "eth1", "eth2"}), 0);

    Files wanted = kHost;
    wanted["eth2"] = "DEVICE=eth2\nMASTER=bond0\nSLAVE=yes\n";
    EXPECT_EQ(ReadFiles(), wanted);
}

TEST_F(BondChange, TakesApartTheSlavesThatTheCallerDoesNotKnowOfToo)
{
    EXPECT_EQ(Set(0, {"eth0"}), 0);

    EXPECT_EQ(ReadFiles(), kApart);
}

TEST_F(BondChange, OfAnotherBondOfThatNameIsNotMixedUpWithWhatIsRemembered)
{
    contract::WriteFile(contract::IfcfgPath("bond0"), "# basement\n" + kHost.at("bond0"));
    ASSERT_EQ(Set(0), 0);
    contract::HideBond("bond0");
    contract::WriteFile(contract::IfcfgPath("eth2"), "DEVICE=eth2\nIPADDR=198.51.100.1/24\n");
    contract::WriteFile(contract::IfcfgPath("eth3"), "DEVICE=eth3\n");

    EXPECT_EQ(Set(2, {"eth2", "eth3"}), 0);

    Files wanted = kApart;
    wanted["eth0"] = "# basement\n" + kApart.at("eth0");
    wanted["bond0"] = "DEVICE=bond0\nIPADDR=198.51.100.1/24\n"
                      "BONDING_OPTS=\"mode=802.3ad miimon=100\"\n";
    wanted["eth2"] = "DEVICE=eth2\nMASTER=bond0\nSLAVE=yes\n";
    wanted["eth3"] = "DEVICE=eth3\nMASTER=bond0\nSLAVE=yes\n";
    EXPECT_EQ(ReadFiles(), wanted);
}

TEST_F(BondChange, IsRefusedForRecordsThatDescribeNone)
{
    VORNLINKAGGROPT opt = contract::BondRecord("bond0", 0, {"eth0", "eth0"});
    EXPECT_EQ(VORNNetLinkAggrSet(&opt), -1) << "a slave twice";
    opt = contract::BondRecord("bond0", 0, {"bond0"});
    EXPECT_EQ(VORNNetLinkAggrSet(&opt), -1) << "its own slave";
    opt = contract::BondRecord("", 0, kSlaves);
    EXPECT_EQ(VORNNetLinkAggrSet(&opt), -1) << "no name";
    opt = contract::BondRecord("../bond", 0, kSlaves);
    EXPECT_EQ(VORNNetLinkAggrSet(&opt), -1) << "no interface's name";
    opt = contract::BondRecord("bond0", 0, kSlaves);
    opt.nSlave = 33;
    EXPECT_EQ(VORNNetLinkAggrSet(&opt), -1) << "an impossible count";
    opt.nSlave = -1;
    EXPECT_EQ(VORNNetLinkAggrSet(&opt), -1) << "a negative count";
    for (const int mode : {6, 7, 8, 9, -1}) {
        EXPECT_EQ(Set(mode), -1) << mode;
    }
    EXPECT_EQ(Set(2, {}), -1) << "no slaves";
    EXPECT_EQ(VORNNetLinkAggrSet(nullptr), -1);

    EXPECT_EQ(ReadFiles(), kHost);
    EXPECT_THAT(NetworkCalls(), IsEmpty());
}

TEST_F(BondChange, IsRefusedForABondThatIsNotThere)
{
    contract::StartWith({{"eth0", "DEVICE=eth0\n"}});
    contract::HideBond("bond0");

    EXPECT_EQ(Set(0), -1);

    EXPECT_EQ(ReadFiles(), (Files{{"eth0", "DEVICE=eth0\n"}}));
}

} // namespace
