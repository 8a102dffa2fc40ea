#include "truths.h"

#include <filesystem>
#include <fstream>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using unit::AddFile;
using unit::BridgeIn;
using unit::Check;
using unit::Ctl;
using unit::DeviceIn;
using unit::Host;
using unit::OnTheSwitch;
using unit::Outcome;
using unit::Plain;
using unit::RemoveFile;
using vornovsctl::FindHalfStates;
using vornovsctl::HalfState;
using vornovsctl::HostTruths;
using enum vornovsctl::HalfStateClass;

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
    AddFile(truths, "ovs_bond0",
            "DEVICE=ovs_bond0\nTYPE=OVS\nPRIMARY=bond0\nSLAVE_LIST=\"eth1 eth2 eth8\"\n");
    EXPECT_THAT(FindHalfStates(truths),
                ElementsAre(HalfState{kBridgeFileWithoutBridge, "ovs_eth7",
                                      "has a file, and the switch has no such bridge"}));

    truths.host.bridges.reset();
    EXPECT_THAT(FindHalfStates(truths), IsEmpty()) << "a switch that does not answer may have it";

    truths.host.switchRuns = false;
    for (const char* other :
         {"ovs_bond0", "ovs_bond1", "ovs_eth0", "ovs_eth8", "eth1", "eth2", "eth4", "eth5"}) {
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

TEST(HalfStates, NoInterfaceIsLeftPlainWhileOthersAreOnTheSwitch)
{
    HostTruths truths = OnTheSwitch();
    vornovsctl::Device card;
    for (const char* name : {"eth6", "eth7", "wlan0"}) {
        card.name = name;
        truths.host.devices.push_back(card);
        AddFile(truths, name, "DEVICE=" + card.name + "\n");
    }
    truths.host.takenOff->insert("eth7");
    AddFile(truths, "eth8", "DEVICE=eth8\n"); // there is no such card
    truths.host.clients = {"apps"};
    EXPECT_THAT(FindHalfStates(truths),
                ElementsAre(HalfState{kRegisteredButPlain, "eth6",
                                      "is not on the switch, and apps are registered"}));
}

TEST(HalfStates, APlainFileNamesItsBridge)
{
    HostTruths truths = OnTheSwitch();
    AddFile(truths, "eth0", "DEVICE=eth0\n");
    EXPECT_THAT(FindHalfStates(truths),
                ElementsAre(HalfState{kUnfinishedFile, "eth0",
                                      "has a file that does not name its bridge ovs_eth0"}));
}

TEST(HalfStates, ABondAndItsMembersKnowOfEachOther)
{
    HostTruths truths = OnTheSwitch();
    AddFile(truths, "eth1", "DEVICE=eth1\nBRIDGE=ovs_eth1\n");
    AddFile(truths, "ovs_eth2", "DEVICE=ovs_eth2\nTYPE=OVS\nPRIMARY=eth2\n");
    const std::string unaware = "has a file that does not know of its bond";
    EXPECT_THAT(FindHalfStates(truths),
                ElementsAre(HalfState{kUnfinishedFile, "eth1", unaware},
                            HalfState{kUnfinishedFile, "ovs_eth2", unaware}));

    truths = OnTheSwitch();
    AddFile(truths, "eth0", "DEVICE=eth0\nBRIDGE=ovs_eth0\nSLAVE=yes\nMASTER=ovs_bond7\n");
    AddFile(truths, "ovs_eth6", "DEVICE=ovs_eth6\nTYPE=OVS\nPRIMARY=eth6\nSLAVE=yes\n");
    const std::string alone = "has a file of a member of a bond, and no bond's file has it";
    EXPECT_THAT(FindHalfStates(truths), ElementsAre(HalfState{kUnfinishedFile, "eth0", alone},
                                                    HalfState{kUnfinishedFile, "ovs_eth6", alone}));
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

} // namespace
