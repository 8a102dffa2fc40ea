#include "check/halfstates.h"
#include "check/repair.h"
#include "ctl.h"
#include "show/samplehost.h"

#include <filesystem>
#include <fstream>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using unit::Ctl;
using unit::Host;
using unit::Outcome;
using vornhost::KeyValueFile;
using vornovsctl::FileTruthOf;
using vornovsctl::FindHalfStates;
using vornovsctl::HalfState;
using vornovsctl::HostTruths;
using enum vornovsctl::HalfStateClass;

void AddFile(HostTruths& truths, const std::string& name, const std::string& text)
{
    std::erase_if(truths.files, [&](const auto& file) { return file.Name() == name; });
    truths.files.push_back(FileTruthOf(name, KeyValueFile::Parse(text)));
}

void RemoveFile(HostTruths& truths, const std::string& name)
{
    std::erase_if(truths.files, [&](const auto& file) { return file.Name() == name; });
}

/** A port with a tag, two bonds, ports of clients. */
HostTruths OnTheSwitch()
{
    HostTruths truths;
    truths.host = unit::SampleHost();
    for (const std::string number : {"1", "2", "4", "5"}) {
        const std::string master = number < "3" ? "ovs_bond0" : "ovs_bond1";
        AddFile(truths, "eth" + number,
                "DEVICE=eth" + number + "\nSLAVE=yes\nMASTER=" + master + "\n");
    }
    AddFile(truths, "ovs_bond0",
            "DEVICE=ovs_bond0\nTYPE=OVS\nPRIMARY=bond0\nSLAVE_LIST=\"eth1 eth2\"\n"
            "IPADDR=192.0.2.10\n");
    AddFile(truths, "ovs_bond1",
            "DEVICE=ovs_bond1\nTYPE=OVS\nPRIMARY=bond1\nSLAVE_LIST=\"eth4 eth5\"\n");
    AddFile(truths, "ovs_eth0", "DEVICE=ovs_eth0\nTYPE=OVS\nPRIMARY=eth0\nOVS_VLAN_ID=10\n");
    AddFile(truths, "eth0", "DEVICE=eth0\nBRIDGE=ovs_eth0\nOVS_VLAN_ID=10\n");
    AddFile(truths, "tap0", "DEVICE=tap0\nOVS_VLAN_ID=20\n");
    return truths;
}

HostTruths Plain()
{
    HostTruths truths;
    truths.host = unit::PlainHost();
    truths.host.clients.emplace();
    AddFile(truths, "eth0", "DEVICE=eth0\nIPADDR=192.0.2.10\n");
    return truths;
}

vornovsctl::Bridge& BridgeIn(HostTruths& truths, const std::string& name)
{
    for (vornovsctl::Bridge& bridge : *truths.host.bridges) {
        if (bridge.name == name) {
            return bridge;
        }
    }
    throw std::out_of_range(name);
}

vornovsctl::Device& DeviceIn(HostTruths& truths, const std::string& name)
{
    for (vornovsctl::Device& device : truths.host.devices) {
        if (device.name == name) {
            return device;
        }
    }
    throw std::out_of_range(name);
}

TEST(HalfStates, AreNoneOnAWholeHost)
{
    EXPECT_THAT(FindHalfStates(OnTheSwitch()), IsEmpty());
    EXPECT_THAT(FindHalfStates(Plain()), IsEmpty());
}

TEST(HalfStates, AnAddressOfAPortDoesNotAnswerButALinkLocalOneMayStand)
{
    HostTruths truths = OnTheSwitch();
    DeviceIn(truths, "eth0").addresses = {"fe80::1/64", "192.0.2.99/24"};
    DeviceIn(truths, "tap0").addresses = {"192.0.2.98/24"};
    EXPECT_THAT(FindHalfStates(truths),
                ElementsAre(HalfState{kAddressBelowBridge, "eth0",
                                      "has the address 192.0.2.99/24, which does not answer below "
                                      "the bridge ovs_eth0"}));
}

TEST(HalfStates, ABridgesFileWantsItsBridgeUnlessItIsAMembersOrNotForTheBoot)
{
    HostTruths truths = OnTheSwitch();
    AddFile(truths, "ovs_eth7", "DEVICE=ovs_eth7\nTYPE=OVS\nPRIMARY=eth7\n");
    AddFile(truths, "ovs_eth8", "DEVICE=ovs_eth8\nTYPE=OVS\nPRIMARY=eth8\nSLAVE=yes\n");
    AddFile(truths, "ovs_eth9", "DEVICE=ovs_eth9\nTYPE=OVS\nPRIMARY=eth9\nONBOOT=no\n");
    EXPECT_THAT(FindHalfStates(truths),
                ElementsAre(HalfState{kBridgeFileWithoutBridge, "ovs_eth7",
                                      "has a file, and the switch has no such bridge"}));

    truths.host.bridges.reset();
    EXPECT_THAT(FindHalfStates(truths), IsEmpty()) << "a switch that does not answer may have it";

    truths.host.switchRuns = false;
    for (const char* other : {"ovs_bond0", "ovs_bond1", "ovs_eth0"}) {
        RemoveFile(truths, other);
    }
    EXPECT_THAT(FindHalfStates(truths),
                ElementsAre(HalfState{kBridgeFileWithoutBridge, "ovs_eth7",
                                      "has a bridge's file, and the switch does not run"}));
}

TEST(HalfStates, AFileThatWasCopiedAndNotEditedIsUnfinished)
{
    HostTruths truths = OnTheSwitch();
    AddFile(truths, "eth0", "DEVICE=ovs_eth0\nTYPE=OVS\nPRIMARY=eth0\n");
    EXPECT_THAT(
        FindHalfStates(truths),
        ElementsAre(HalfState{kUnfinishedFile, "eth0", "has a file that describes 'ovs_eth0'"}));

    AddFile(truths, "eth0", "DEVICE=eth0\nTYPE=OVS\n");
    AddFile(truths, "ovs_eth7", "DEVICE=eth7\nIPADDR=192.0.2.7\n");
    AddFile(truths, "ovs_eth8", "DEVICE=ovs_eth8\n");
    AddFile(truths, "office", "DEVICE=eth9\n");
    EXPECT_THAT(
        FindHalfStates(truths),
        ElementsAre(HalfState{kUnfinishedFile, "eth0", "has a file that describes a bridge"},
                    HalfState{kUnfinishedFile, "ovs_eth7", "has a file that describes 'eth7'"},
                    HalfState{kUnfinishedFile, "ovs_eth8", "has a file that describes no bridge"}));
}

TEST(HalfStates, ABridgeWithoutAFileGoesWithTheNextStart)
{
    HostTruths truths = OnTheSwitch();
    RemoveFile(truths, "ovs_eth0");
    EXPECT_THAT(FindHalfStates(truths),
                ElementsAre(HalfState{kBridgeWithoutFile, "ovs_eth0",
                                      "is a bridge of the switch without a file; a start of the "
                                      "network takes it away"}));
}

TEST(HalfStates, ClientsAndSwitchBelongTogether)
{
    HostTruths truths = Plain();
    truths.host.clients = {"apps", "vms"};
    const HalfState registered{kRegisteredButPlain, "registrations",
                               "name apps, vms, and no interface is on the switch"};
    EXPECT_THAT(FindHalfStates(truths), ElementsAre(registered));
    truths.host.takenOff = {"eth0"};
    EXPECT_THAT(FindHalfStates(truths), IsEmpty()) << "all were taken off one by one";

    truths = OnTheSwitch();
    truths.host.clients.emplace();
    EXPECT_THAT(FindHalfStates(truths),
                ElementsAre(HalfState{kOnSwitchButUnregistered, "registrations",
                                      "name nobody, and interfaces are on the switch"}));
    truths.host.clients.reset();
    EXPECT_THAT(FindHalfStates(truths), IsEmpty()) << "what cannot be read is not judged";
}

TEST(HalfStates, ABondHasTwoMembers)
{
    HostTruths truths = OnTheSwitch();
    BridgeIn(truths, "ovs_bond0").ports[0].members.pop_back();
    BridgeIn(truths, "ovs_bond1").ports[0].members.clear();
    EXPECT_THAT(
        FindHalfStates(truths),
        ElementsAre(HalfState{kBondOfOne, "bond0", "is a bond of the switch with a single member"},
                    HalfState{kBondOfOne, "bond1", "is a bond of the switch with no member"}));
}

TEST(HalfStates, ATagOfAFileIsInTheSwitch)
{
    HostTruths truths = OnTheSwitch();
    BridgeIn(truths, "ovs_eth0").tag.reset();
    BridgeIn(truths, "ovs_eth0").ports[1].tag = 21;
    EXPECT_THAT(FindHalfStates(truths),
                ElementsAre(HalfState{kLostTag, "tap0",
                                      "has the VLAN tag 20 in its file and 21 in the switch"},
                            HalfState{kLostTag, "ovs_eth0",
                                      "has the VLAN tag 10 in its file and none in the switch"}));

    AddFile(truths, "ovs_eth0", "DEVICE=ovs_eth0\nTYPE=OVS\nPRIMARY=eth0\nOVS_VLAN_ID=0\n");
    AddFile(truths, "tap0", "DEVICE=tap0\n");
    EXPECT_THAT(FindHalfStates(truths), IsEmpty());
}

TEST(HalfStates, WhatAConversionTookApartIsSomewhereAgain)
{
    HostTruths truths = Plain();
    truths.converted = {{{"bond7", {"802.3ad", {"eth1", "eth2"}}}}, {{"eth3", 30}, {"bond7", 5}}};
    EXPECT_THAT(
        FindHalfStates(truths),
        ElementsAre(
            HalfState{kUnfinishedBond, "bond7",
                      "is a bond that a conversion which was cut short has taken apart"},
            HalfState{kUnfinishedVlan, "eth3",
                      "has had the VLAN 30, which a conversion that was cut short has taken "
                      "from it"},
            HalfState{kUnfinishedVlan, "bond7",
                      "has had the VLAN 5, which a conversion that was cut short has taken "
                      "from it"}));

    AddFile(truths, "bond7", "DEVICE=bond7\nBONDING_OPTS=\"mode=802.3ad\"\n");
    EXPECT_EQ(FindHalfStates(truths).front().kind, kUnfinishedBond)
        << "a bond without members is none";
    AddFile(truths, "eth1", "DEVICE=eth1\nSLAVE=yes\nMASTER=bond7\n");
    AddFile(truths, "eth3.30", "DEVICE=eth3.30\nVLAN=yes\nPHYSDEV=eth3\n");
    AddFile(truths, "bond7.5", "DEVICE=bond7.5\nVLAN=yes\nPHYSDEV=bond7\n");
    EXPECT_THAT(FindHalfStates(truths), IsEmpty()) << "they are the kernel's again";

    truths.remembered = truths.converted;
    EXPECT_THAT(
        FindHalfStates(truths),
        ElementsAre(
            HalfState{kUnfinishedBond, "bond7", "is a bond that is built only half"},
            HalfState{kUnfinishedVlan, "eth3", "has had the VLAN 30, which is made only half"},
            HalfState{kUnfinishedVlan, "bond7", "has had the VLAN 5, which is made only half"}));

    truths = OnTheSwitch();
    truths.converted = {{{"bond0", {"802.3ad", {"eth1", "eth2"}}}}, {{"eth0", 10}}};
    truths.remembered = truths.converted;
    EXPECT_THAT(FindHalfStates(truths), IsEmpty()) << "they are the switch's";
}

class Check : public unit::OnAHost {
protected:
    Check()
    {
        vornhost::Link link;
        link.index = 1;
        link.name = "eth0";
        Host().links = {link};
    }
};

TEST_F(Check, FindsNothingOnAWholeHostAndStartsNothing)
{
    WriteInterfaceFile("eth0", "DEVICE=eth0\nIPADDR=192.0.2.10\n");
    EXPECT_EQ(Ctl({"check"}), unit::Done("Everything fits together.\n"));
    EXPECT_THAT(Host().calls, IsEmpty());
}

TEST_F(Check, TellsEveryFindingAndEndsWithTheCostliest)
{
    Host().clients = {"apps"};
    WriteInterfaceFile("eth0", "DEVICE=ovs_eth0\nTYPE=OVS\nPRIMARY=eth0\n");
    const std::string strays[] = {"/etc/sysconfig/network-scripts/.vornovs-a1B2c3",
                                  "/usr/vorn/etc/vornovs/ovs_ignore.conf.new",
                                  "/usr/vorn/etc/vornovs/ovs_ignore.conf.new1"};
    std::filesystem::create_directories("/usr/vorn/etc/vornovs");
    for (const std::string& path : strays) {
        std::ofstream(path) << "half";
    }
    const std::string left = " is left over from a writer that was killed.\n";
    EXPECT_EQ(Ctl({"check"}),
              (Outcome{12,
                       "eth0 has a file that describes 'ovs_eth0'.\n"
                       "registrations name apps, and no interface is on the switch.\n" +
                           strays[0] + left + strays[1] + left + strays[2] + left,
                       ""}));
    for (const std::string& path : strays) {
        std::filesystem::remove(path);
    }
    Host().clients.emplace();
    EXPECT_EQ(Ctl({"check", "--json"}), (Outcome{12, R"({
  "command": "check",
  "exitStatus": 12,
  "halfStates": [
    {
      "class": "unfinished-file",
      "subject": "eth0",
      "text": "has a file that describes 'ovs_eth0'"
    }
  ],
  "error": null
}
)",
                                                 ""}));
}

TEST_F(Check, SaysWhatItCouldNotRead)
{
    Host().clients.reset();
    EXPECT_EQ(Ctl({"check"}), unit::Failed(1, "the registrations cannot be read."));
}

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

TEST(PlanRepair, BuildsWhatWasTakenApartWhileNothingIsOnTheSwitch)
{
    using Kind = vornovsctl::RepairStep::Kind;
    using Step = vornovsctl::RepairStep;
    const vornhost::ConvertedBond bond{"802.3ad", {"eth1", "eth2"}};
    HostTruths truths = Plain();
    truths.converted = {{{"bond7", bond}}, {{"bond7", 5}}};
    EXPECT_THAT(PlanRepair(truths, FindHalfStates(truths)),
                ElementsAre(Step{Kind::kStartNetwork, ""}, Step{Kind::kBuildBond, "bond7", bond},
                            Step{Kind::kMakeVlan, "bond7", {}, 5}));

    truths.host.clients = {"apps", "vornovsctl-repair"};
    EXPECT_THAT(PlanRepair(truths, FindHalfStates(truths)),
                ElementsAre(Step{Kind::kStartNetwork, ""},
                            Step{Kind::kUnregister, "vornovsctl-repair"},
                            Step{Kind::kUnregister, "apps"}, Step{Kind::kBuildBond, "bond7", bond},
                            Step{Kind::kMakeVlan, "bond7", {}, 5}, Step{Kind::kRegister, "apps"}));
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
