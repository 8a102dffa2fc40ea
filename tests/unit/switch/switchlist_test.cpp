#include <vornovs/vornovs.h>

#include "support/support.h"

using harness::Err;
using harness::Info;
using harness::RecordingPlatform;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::Calls;
using unit::kExitedWith1;
using unit::LongName;
using unit::Names;
using unit::Sequence;
using VORN::OVS::OVSManager;

namespace {

constexpr char kFile[] = "ovsmanager.cpp";
constexpr char kList[] = "VLIBCPopen /usr/bin/ovs-vsctl r list-br";
constexpr char kListEnd[] = "VLIBCPclose /usr/bin/ovs-vsctl list-br";

const Calls kAlive{"VLIBServiceIsRunning vornovs-db", "VLIBServiceIsRunning vornovs-vswitch"};

/** What is asked about each bridge. */
Calls Asked(const std::string& bridge)
{
    return {"VLIBCPopen /usr/bin/ovs-vsctl rB get port " + bridge + " tag",
            "VLIBCPclose /usr/bin/ovs-vsctl get port " + bridge + " tag",
            "VLIBNetOVSIfIsMaster " + bridge};
}

Names Listed(RecordingPlatform& platform, const std::string& output)
{
    platform.Output(kList, output);
    OVSManager manager;
    Names bridges;
    EXPECT_EQ(manager.GetSwitchList(bridges), 0);
    return bridges;
}

TEST(GetSwitchList, ReadsTheSwitchsBridges)
{
    RecordingPlatform platform;
    EXPECT_EQ(Listed(platform, "ovs_eth1\novs_eth0\n"), (Names{"ovs_eth0", "ovs_eth1"}));
    EXPECT_EQ(platform.Calls(),
              Sequence({kAlive, {kList}, Asked("ovs_eth1"), Asked("ovs_eth0"), {kListEnd}}));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Info("vlanmanager.cpp", "ovs_eth1 without any vlan tag"),
                            Info("vlanmanager.cpp", "ovs_eth0 without any vlan tag")));
}

TEST(GetSwitchList, ClearsTheCallersSet)
{
    const RecordingPlatform platform;
    OVSManager manager;
    Names bridges{"what was there"};
    EXPECT_EQ(manager.GetSwitchList(bridges), 0);
    EXPECT_THAT(bridges, IsEmpty());
    EXPECT_EQ(platform.Calls(), Sequence({kAlive, {kList, kListEnd}}));
}

TEST(GetSwitchList, StartsTheServicesThatDoNotRun)
{
    RecordingPlatform platform;
    platform.Answer("VLIBServiceIsRunning vornovs-db", 0);
    EXPECT_THAT(Listed(platform, ""), IsEmpty());
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBServiceIsRunning vornovs-db", "VLIBServiceStart vornovs-db",
                            "VLIBServiceStart vornovs-vswitch", kList, kListEnd));
}

TEST(GetSwitchList, FailsWhenTheServicesCannotBeStarted)
{
    RecordingPlatform platform;
    platform.Answer("VLIBServiceIsRunning vornovs-db", 0);
    platform.Answer("VLIBServiceStart", -1);
    OVSManager manager;
    Names bridges{"what was there"};
    EXPECT_EQ(manager.GetSwitchList(bridges), -1);
    EXPECT_THAT(bridges, IsEmpty());
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBServiceIsRunning vornovs-db", "VLIBServiceStart vornovs-db"));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err("util.cpp", "Failed to call the ovs-db related upstart"),
                            Err(kFile, "Failed to start OVS Daemon")));
}

TEST(GetSwitchList, FailsWhenTheToolCannotBeStarted)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCPopen", 0);
    OVSManager manager;
    Names bridges;
    EXPECT_EQ(manager.GetSwitchList(bridges), -1);
    EXPECT_EQ(platform.Calls(), Sequence({kAlive, {kList}}));
    EXPECT_THAT(
        platform.Log(),
        ElementsAre(Err(kFile, "Failed to excute /usr/bin/ovs-vsctl list-br to get all ovs-brs")));
}

TEST(GetSwitchList, DoesNotMindHowTheToolEnds)
{
    RecordingPlatform platform;
    platform.Output(kList, "ovs_eth0\n", kExitedWith1);
    OVSManager manager;
    Names bridges;
    EXPECT_EQ(manager.GetSwitchList(bridges), 0);
    EXPECT_EQ(bridges, Names{"ovs_eth0"});
}

TEST(GetSwitchList, TakesTheFirstWordOfALine)
{
    RecordingPlatform platform;
    EXPECT_EQ(Listed(platform, "  ovs_eth0 more\r\n\tovs_eth1\n"), (Names{"ovs_eth0", "ovs_eth1"}));
}

TEST(GetSwitchList, TakesALastLineWithoutANewline)
{
    RecordingPlatform platform;
    EXPECT_EQ(Listed(platform, "ovs_eth0"), Names{"ovs_eth0"});
}

TEST(GetSwitchList, RepeatsTheWordBeforeAnEmptyLine)
{
    RecordingPlatform platform;
    EXPECT_EQ(Listed(platform, "ovs_eth0\n\n"), Names{"ovs_eth0"});
    EXPECT_EQ(platform.Calls(),
              Sequence({kAlive, {kList}, Asked("ovs_eth0"), Asked("ovs_eth0"), {kListEnd}}));
}

TEST(GetSwitchList, TakesAnEmptyFirstLineAsTheEmptyName)
{
    RecordingPlatform platform;
    EXPECT_EQ(Listed(platform, "\novs_eth0\n"), (Names{"", "ovs_eth0"}));
    EXPECT_EQ(platform.Calls(),
              Sequence({kAlive, {kList}, Asked("''"), Asked("ovs_eth0"), {kListEnd}}));
}

TEST(GetSwitchList, ReadsALineLongerThanItsBufferAsSeveral)
{
    RecordingPlatform platform;
    EXPECT_EQ(Listed(platform, std::string(1023, 'a') + "bcd\n"),
              (Names{std::string(1023, 'a'), "bcd"}));
}

TEST(GetSwitchList, ReadsANewlineBehindAFullBufferAsALineOfItsOwn)
{
    RecordingPlatform platform;
    const std::string name(1023, 'a');
    EXPECT_EQ(Listed(platform, name + "\n"), Names{name});
    EXPECT_EQ(platform.Calls(), Sequence({kAlive, {kList}, Asked(name), Asked(name), {kListEnd}}));
}

TEST(GetSwitchList, StandsALineOf5000Characters)
{
    RecordingPlatform platform;
    EXPECT_EQ(Listed(platform, LongName() + "\n"),
              (Names{std::string(1023, 'x'), std::string(5000 - 4 * 1023, 'x')}));
}

TEST(GetSwitchList, KeepsATagUnderTheBridgesOwnName)
{
    RecordingPlatform platform;
    platform.Output(kList, "ovs_eth0\n");
    platform.Output("VLIBCPopen /usr/bin/ovs-vsctl rB get port ovs_eth0 tag", "10\n");
    OVSManager manager;
    Names bridges;
    EXPECT_EQ(manager.GetSwitchList(bridges), 0);
    EXPECT_EQ(bridges, Names{"ovs_eth0"});

    platform.Forget();
    EXPECT_EQ(manager.CreateLinuxVlan(), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VORNNetIFGetIPConfig eth0", "VLIBNetVlanCreate eth0 10 ip-of-eth0"));
}

TEST(GetSwitchList, TakesNoTagThatCouldNotBeRead)
{
    RecordingPlatform platform;
    platform.Output(kList, "ovs_eth0\n");
    platform.Output("VLIBCPopen /usr/bin/ovs-vsctl rB get port ovs_eth0 tag", "10\n", kExitedWith1);
    OVSManager manager;
    Names bridges;
    EXPECT_EQ(manager.GetSwitchList(bridges), 0);
    EXPECT_EQ(bridges, Names{"ovs_eth0"});

    platform.Forget();
    EXPECT_EQ(manager.CreateLinuxVlan(), 0);
    EXPECT_THAT(platform.Calls(), IsEmpty());
}

TEST(GetSwitchList, LoadsABridgeThatCarriesABond)
{
    RecordingPlatform platform;
    platform.Output(kList, "ovs_eth0\novs_bond0\n");
    platform.Answer("VLIBNetOVSIfIsMaster ovs_bond0", 2);
    platform.Bond("ovs_bond0", 6, {"eth1", "eth2"});
    OVSManager manager;
    Names bridges;
    EXPECT_EQ(manager.GetSwitchList(bridges), 0);
    EXPECT_EQ(bridges, (Names{"ovs_bond0", "ovs_eth0"}));
    EXPECT_THAT(platform.Calls(), Contains("VORNNetLinkAggrGet ovs_bond0"));

    platform.Forget();
    EXPECT_EQ(manager.CreateLinuxBond(), 0);
    EXPECT_THAT(platform.Calls(), ElementsAre("VORNNetLinkAggrSet bond0 mode=4 eth1 eth2",
                                              "VORNNetGetEthInfo bond0"));
}

TEST(GetSwitchList, TakesNoAnswerBut2AsABond)
{
    for (const int answer : {-1, 0, 1, 3}) {
        RecordingPlatform platform;
        platform.Bond("ovs_bond0", 6, {"eth1"});
        platform.Answer("VLIBNetOVSIfIsMaster", answer);
        EXPECT_EQ(Listed(platform, "ovs_bond0\n"), Names{"ovs_bond0"}) << answer;
        EXPECT_THAT(platform.Calls(), testing::Not(Contains("VORNNetLinkAggrGet ovs_bond0")))
            << answer;
    }
}

TEST(GetSwitchList, KeepsAModeForcedBefore)
{
    RecordingPlatform platform;
    platform.Output(kList, "ovs_bond0\n");
    platform.Answer("VLIBNetOVSIfIsMaster", 2);
    platform.Bond("ovs_bond0", 6, {"eth1"});
    OVSManager manager;
    EXPECT_EQ(manager.InitBondOpt("ovs_bond0", "802.3ad"), 0);
    platform.Forget();
    Names bridges;
    EXPECT_EQ(manager.GetSwitchList(bridges), 0);
    EXPECT_EQ(platform.Calls(), Sequence({kAlive, {kList}, Asked("ovs_bond0"), {kListEnd}}));

    platform.Forget();
    EXPECT_EQ(manager.CreateLinuxBond(), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VORNNetLinkAggrSet bond0 mode=2 eth1", "VORNNetGetEthInfo bond0"));
}

} // namespace
