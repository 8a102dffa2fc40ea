#include "check/repair.h"

#include "truths.h"

#include <chrono>
#include <filesystem>
#include <fstream>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using unit::AddFile;
using unit::Check;
using unit::Ctl;
using unit::Host;
using unit::OnTheSwitch;
using unit::Outcome;
using unit::Plain;
using unit::RemoveFile;
using vornovsctl::FindHalfStates;
using vornovsctl::HostTruths;

TEST(PlanRepair, StartsTheNetworkAndConvertsWhatWasCutShort)
{
    using Kind = vornovsctl::RepairStep::Kind;
    const auto plan = [](const HostTruths& truths) {
        return vornovsctl::PlanRepair(truths, FindHalfStates(truths));
    };
    const vornovsctl::RepairStep start{Kind::kStartNetwork, ""};
    EXPECT_THAT(plan(Plain()), IsEmpty());

    HostTruths truths = OnTheSwitch();
    RemoveFile(truths, "ovs_eth0");
    EXPECT_THAT(plan(truths), ElementsAre(start));

    truths.host.clients.emplace();
    EXPECT_THAT(plan(truths),
                ElementsAre(start, vornovsctl::RepairStep{Kind::kRegister, "vornovsctl-repair"},
                            vornovsctl::RepairStep{Kind::kUnregister, "vornovsctl-repair"}));
    truths.host.clients = {"vornovsctl-repair"};
    EXPECT_THAT(plan(truths),
                ElementsAre(start, vornovsctl::RepairStep{Kind::kUnregister, "vornovsctl-repair"}));

    truths = Plain();
    truths.host.clients = {"apps", "vms"};
    truths.strays = {"/a"};
    EXPECT_THAT(plan(truths), ElementsAre(start, vornovsctl::RepairStep{Kind::kUnregister, "apps"},
                                          vornovsctl::RepairStep{Kind::kUnregister, "vms"},
                                          vornovsctl::RepairStep{Kind::kRegister, "apps"},
                                          vornovsctl::RepairStep{Kind::kRegister, "vms"},
                                          vornovsctl::RepairStep{Kind::kRemoveFile, "/a"}));
    truths.host.clients.emplace();
    EXPECT_THAT(plan(truths), ElementsAre(vornovsctl::RepairStep{Kind::kRemoveFile, "/a"}));
}

TEST(PlanRepair, PutsAFileBackThatStandsUnderAnotherNameAlone)
{
    using Kind = vornovsctl::RepairStep::Kind;
    HostTruths truths = OnTheSwitch();
    RemoveFile(truths, "ovs_bond0");
    AddFile(truths, "ovs_eth1",
            "DEVICE=ovs_bond0\nTYPE=OVS\nPRIMARY=eth1\nSLAVE_LIST=\"eth1 eth2\"\n");
    const auto plan = vornovsctl::PlanRepair(truths, FindHalfStates(truths));
    ASSERT_FALSE(plan.empty());
    EXPECT_EQ(plan.front(), (vornovsctl::RepairStep{Kind::kRestoreFile, "ovs_bond0", "ovs_eth1"}));
    EXPECT_EQ(vornovsctl::TextOf(plan.front()),
              "put the file of 'ovs_bond0' back from that of 'ovs_eth1'");
}

TEST(PlanRepair, RemovesTheCopyThatABondWasToBeMadeOf)
{
    using Kind = vornovsctl::RepairStep::Kind;
    HostTruths truths = OnTheSwitch();
    AddFile(truths, "ovs_bond7", "DEVICE=ovs_eth0\nTYPE=OVS\nPRIMARY=eth0\n");
    const auto plan = vornovsctl::PlanRepair(truths, FindHalfStates(truths));
    ASSERT_FALSE(plan.empty());
    EXPECT_EQ(plan.front(),
              (vornovsctl::RepairStep{Kind::kRemoveFile,
                                      "/etc/sysconfig/network-scripts/ifcfg-ovs_bond7"}));
}

TEST(PlanRepair, BuildsWhatWasTakenApartWhileNothingIsOnTheSwitch)
{
    using Kind = vornovsctl::RepairStep::Kind;
    using Step = vornovsctl::RepairStep;
    const vornhost::ConvertedBond bond{"802.3ad", {"eth1", "eth2"}};
    HostTruths truths = Plain();
    truths.converted = {{{"bond7", bond}}, {{"bond7", 5}}};
    EXPECT_THAT(PlanRepair(truths, FindHalfStates(truths)),
                ElementsAre(Step{Kind::kStartNetwork, ""},
                            Step{Kind::kBuildBond, "bond7", "", bond},
                            Step{Kind::kMakeVlan, "bond7", "", {}, 5}));

    truths.host.clients = {"apps", "vornovsctl-repair"};
    EXPECT_THAT(
        PlanRepair(truths, FindHalfStates(truths)),
        ElementsAre(Step{Kind::kStartNetwork, ""}, Step{Kind::kUnregister, "vornovsctl-repair"},
                    Step{Kind::kUnregister, "apps"}, Step{Kind::kBuildBond, "bond7", "", bond},
                    Step{Kind::kMakeVlan, "bond7", "", {}, 5}, Step{Kind::kRegister, "apps"}));
}

class Repair : public Check {
protected:
    static constexpr char kStray[] = "/etc/sysconfig/network-scripts/.vornovs-a1B2c3";

    /** What the library does, as far as it is seen from here. */
    static int Convert(unit::FakeHost& host)
    {
        const std::string& call = host.calls.back();
        if (call.starts_with("Register ")) {
            host.clients->insert(call.substr(9));
            host.switchRuns = true;
            host.ports = {{"ovs_eth0", {"eth0", "ovs_eth0"}}};
            host.wires = {"eth0"};
            WriteInterfaceFile("ovs_eth0", "DEVICE=ovs_eth0\nTYPE=OVS\nPRIMARY=eth0\n");
            WriteInterfaceFile("eth0", "DEVICE=eth0\nBRIDGE=ovs_eth0\n");
        } else if (call.starts_with("UnRegister ")) {
            host.clients->erase(call.substr(11));
            host.ports->clear();
            std::filesystem::remove("/etc/sysconfig/network-scripts/ifcfg-ovs_eth0");
            WriteInterfaceFile("eth0", "DEVICE=eth0\n");
        }
        return 0;
    }

    static void LeaveStray()
    {
        std::filesystem::create_directories(std::filesystem::path(kStray).parent_path());
        std::ofstream(kStray) << "half";
        std::filesystem::last_write_time(kStray, std::filesystem::file_time_type::clock::now() -
                                                     std::chrono::minutes(1));
    }

    ~Repair() override { std::filesystem::remove(kStray); }
};

TEST_F(Repair, SaysWhatItDoesAndLeavesNothingForASecondOne)
{
    WriteInterfaceFile("eth0", "DEVICE=ovs_eth0\nTYPE=OVS\nPRIMARY=eth0\n");
    LeaveStray();
    Host().act = Convert;
    const std::string plan = "eth0 has a file that describes 'ovs_eth0'.\n" + std::string(kStray) +
                             " is left over from a writer that was killed.\n"
                             "To do:\n"
                             "  put the file of 'ovs_eth0' back from that of 'eth0'\n"
                             "  make the live network what the files say\n"
                             "  register 'vornovsctl-repair'\n"
                             "  unregister 'vornovsctl-repair'\n"
                             "  remove /etc/sysconfig/network-scripts/.vornovs-a1B2c3\n";
    EXPECT_EQ(Ctl({"repair", "--dry-run"}), unit::Done(plan));
    EXPECT_THAT(Host().calls, IsEmpty());
    EXPECT_TRUE(std::filesystem::exists(kStray));

    EXPECT_EQ(Ctl({"repair"}), unit::Done(plan + "Everything fits together.\n"));
    EXPECT_THAT(Host().calls, ElementsAre("StartNetwork", "Register vornovsctl-repair",
                                          "UnRegister vornovsctl-repair"));
    EXPECT_FALSE(std::filesystem::exists(kStray));
    EXPECT_FALSE(Host().interruptible);

    Host().calls.clear();
    EXPECT_EQ(Ctl({"repair"}), unit::Done("Everything fits together.\n"));
    EXPECT_EQ(Ctl({"repair", "--dry-run"}), unit::Done("Everything fits together.\n"));
    EXPECT_THAT(Host().calls, IsEmpty());
}

TEST_F(Repair, KeepsClientsRegistered)
{
    Host().clients = {"apps", "vms"};
    Host().act = Convert;
    WriteInterfaceFile("eth0", "DEVICE=eth0\n");
    EXPECT_EQ(Ctl({"repair"}).exitStatus, 0);
    EXPECT_EQ(Host().clients, (std::set<std::string>{"apps", "vms"}));
    EXPECT_TRUE(std::filesystem::exists("/etc/sysconfig/network-scripts/ifcfg-ovs_eth0"));
}

TEST_F(Repair, BuildsABondAndMakesAVlanUnderTheLibrarysLock)
{
    WriteInterfaceFile("eth0", "DEVICE=eth0\n");
    Host().devices = {"eth0"};
    ASSERT_TRUE(
        (vornhost::ConversionRecord{{{"bond0", {"802.3ad", {"eth1", "eth2"}}}}, {{"eth0", 30}}}
             .Save()));
    Host().act = [](unit::FakeHost& host) {
        if (host.calls.back().starts_with("VORNNetLinkAggrSet")) {
            WriteInterfaceFile("bond0", "DEVICE=bond0\nBONDING_OPTS=\"mode=802.3ad\"\n");
            WriteInterfaceFile("eth1", "DEVICE=eth1\nSLAVE=yes\nMASTER=bond0\n");
        } else if (host.calls.back().starts_with("VLIBNetVlanCreate")) {
            WriteInterfaceFile("eth0.30", "DEVICE=eth0.30\nVLAN=yes\nPHYSDEV=eth0\n");
        }
        return 0;
    };
    EXPECT_EQ(
        Ctl({"repair"}),
        unit::Done("bond0 is a bond that a conversion which was cut short has taken apart.\n"
                   "eth0 has had the VLAN 30, which a conversion that was cut short has taken "
                   "from it.\n"
                   "To do:\n"
                   "  make the live network what the files say\n"
                   "  build bond0 of eth1, eth2 again\n"
                   "  make the VLAN 30 of eth0 again\n"
                   "Everything fits together.\n"));
    const std::string lock = "VLIBCFileLockTimeByFile /tmp/ovs_config.lock 1 5";
    const std::string unlock = "VLIBCFileUnlockByFile 7";
    EXPECT_THAT(Host().calls,
                ElementsAre("StartNetwork", lock, "VORNNetLinkAggrSet 2 bond0 eth1 eth2", unlock,
                            lock, "VLIBNetVlanCreate eth0 30", unlock));
    EXPECT_TRUE(vornhost::ConversionRecord{}.Save());
}

TEST_F(Repair, BuildsNothingWhileSomebodyElseHasTheLock)
{
    ASSERT_TRUE(
        (vornhost::ConversionRecord{{{"bond0", {"802.3ad", {"eth1", "eth2"}}}}, {}}.Save()));
    Host().lockResult = -1;
    EXPECT_EQ(Ctl({"repair"}).exitStatus, 18);
    EXPECT_THAT(Host().calls, testing::Not(testing::Contains(testing::StartsWith("VORNNet"))));
    EXPECT_TRUE(vornhost::ConversionRecord{}.Save());
}

TEST_F(Repair, TellsWhatItCouldNotMend)
{
    Host().clients = {"apps"};
    const Outcome outcome = Ctl({"repair", "--json"});
    EXPECT_EQ(outcome.exitStatus, 14);
    EXPECT_THAT(Host().calls, ElementsAre("StartNetwork", "UnRegister apps", "Register apps",
                                          "StartNetwork", "UnRegister apps", "Register apps",
                                          "StartNetwork", "UnRegister apps", "Register apps"));
    EXPECT_THAT(outcome.output, testing::HasSubstr("\"error\": \"not mended:"));
}

TEST_F(Repair, ChangesNothingWhenSomethingCannotBeRead)
{
    Host().clients.reset();
    LeaveStray();
    EXPECT_EQ(Ctl({"repair"}), unit::Failed(1, "the registrations cannot be read.\nNothing was "
                                               "changed: what cannot be read cannot be judged."));
    EXPECT_TRUE(std::filesystem::exists(kStray));
}

} // namespace
