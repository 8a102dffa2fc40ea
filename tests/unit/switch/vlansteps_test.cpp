#include <vornovs/vornovs.h>

#include "switch/hostcalls.h"

using harness::Err;
using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::Calls;
using unit::ReadTags;
using unit::Sequence;
using unit::TagCleared;
using unit::TagSet;
using VORN::OVS::OVSManager;
namespace {

constexpr const char* kFile = unit::kManagerFile;

TEST(RemoveLinuxVlan, RemovesTheVlansInTheOrderOfTheirNames)
{
    RecordingPlatform platform;
    platform.Interfaces({"eth1.5", "eth0.10"});
    platform.Vlan("eth1.5", "eth1", 5);
    platform.Vlan("eth0.10", "eth0", 10);
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), 0);
    platform.Forget();
    EXPECT_EQ(manager.RemoveLinuxVlan(), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBNetVlanRemove eth0.10", "VLIBNetVlanRemove eth1.5"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(RemoveLinuxVlan, StopsAtTheFirstThatCannotBeRemoved)
{
    RecordingPlatform platform;
    platform.Interfaces({"eth1.5", "eth0.10"});
    platform.Vlan("eth1.5", "eth1", 5);
    platform.Vlan("eth0.10", "eth0", 10);
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), 0);
    platform.Forget();
    platform.Answer("VLIBNetVlanRemove", -1);
    EXPECT_EQ(manager.RemoveLinuxVlan(), -1);
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBNetVlanRemove eth0.10"));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to remove the vlan of eth0.10")));
}

TEST(RemoveLinuxVlan, TakesAPositiveAnswerAsSuccess)
{
    RecordingPlatform platform;
    platform.Interfaces({"eth0.10"});
    platform.Vlan("eth0.10", "eth0", 10);
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), 0);
    platform.Answer("VLIBNetVlanRemove", 1);
    EXPECT_EQ(manager.RemoveLinuxVlan(), 0);
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(CreateOVSVlan, HasNothingToDoWithoutVlans)
{
    const RecordingPlatform platform;
    EXPECT_EQ(OVSManager().CreateOVSVlan(), 0);
    EXPECT_THAT(platform.Calls(), IsEmpty());
}

TEST(CreateOVSVlan, SetsTheTagsInTheOrderOfTheVlansNamesAndStopsAtTheFirstFailure)
{
    RecordingPlatform platform;
    platform.Interfaces({"eth2.7", "eth1.5", "eth0.10"});
    platform.Vlan("eth2.7", "eth2", 7);
    platform.Vlan("eth1.5", "eth1", 5);
    platform.Vlan("eth0.10", "eth0", 10);
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), 0);
    platform.Forget();
    EXPECT_EQ(manager.CreateOVSVlan(), 0);
    EXPECT_EQ(platform.Calls(), Sequence({TagSet("ovs_eth0", "10"), TagSet("ovs_eth1", "5"),
                                          TagSet("ovs_eth2", "7")}));

    platform.Forget();
    platform.AnswerNth("VLIBCFileLock", 2, -1);
    EXPECT_EQ(manager.CreateOVSVlan(), -1);
    EXPECT_EQ(platform.Calls(),
              Sequence({TagSet("ovs_eth0", "10"),
                        {"VLIBCFileLock 2054 5", "VLIBCErrSetEx 1024 vlanmanager.cpp"}}));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to create the vlan tag 5 of ovs_eth1")));
}

TEST(CreateOVSVlan, WritesTheIdInDecimalWhateverItIs)
{
    RecordingPlatform platform;
    platform.Interfaces({"eth0.1"});
    platform.Vlan("eth0.1", "eth0", -1);
    OVSManager manager;
    EXPECT_EQ(manager.GetInterface(), 0);
    platform.Forget();
    EXPECT_EQ(manager.CreateOVSVlan(), 0);
    EXPECT_EQ(platform.Calls(), TagSet("ovs_eth0", "-1"));
}

TEST(RemoveOVSVlan, HasNothingToDoWithoutVlans)
{
    const RecordingPlatform platform;
    EXPECT_EQ(OVSManager().RemoveOVSVlan(), 0);
    EXPECT_THAT(platform.Calls(), IsEmpty());
}

TEST(RemoveOVSVlan, ClearsTheTagsInTheOrderOfTheNamesAndStopsAtTheFirstFailure)
{
    RecordingPlatform platform;
    OVSManager manager;
    ReadTags(platform, manager, {"ovs_eth3", "ovs_eth2", "ovs_eth1"});
    EXPECT_EQ(manager.RemoveOVSVlan(), 0);
    EXPECT_EQ(platform.Calls(),
              Sequence({TagCleared("ovs_eth1"), TagCleared("ovs_eth2"), TagCleared("ovs_eth3")}));

    platform.Forget();
    platform.AnswerNth("VLIBCFileLock", 2, -1);
    EXPECT_EQ(manager.RemoveOVSVlan(), -1);
    EXPECT_EQ(platform.Calls(),
              Sequence({TagCleared("ovs_eth1"),
                        {"VLIBCFileLock 2054 5", "VLIBCErrSetEx 1024 vlanmanager.cpp"}}));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to remove vlan of ovs_eth2")));
}

TEST(CreateLinuxVlan, HasNothingToDoWithoutVlans)
{
    const RecordingPlatform platform;
    EXPECT_EQ(OVSManager().CreateLinuxVlan(), 0);
    EXPECT_THAT(platform.Calls(), IsEmpty());
}

TEST(CreateLinuxVlan, MakesEachVlanWithItsParentsAddress)
{
    RecordingPlatform platform;
    OVSManager manager;
    ReadTags(platform, manager, {"ovs_eth2", "ovs_eth1"});
    EXPECT_EQ(manager.CreateLinuxVlan(), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VORNNetIFGetIPConfig eth1", "VLIBNetVlanCreate eth1 1 ip-of-eth1",
                            "VORNNetIFGetIPConfig eth2", "VLIBNetVlanCreate eth2 2 ip-of-eth2"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(CreateLinuxVlan, StopsAtAParentWhoseAddressCannotBeRead)
{
    RecordingPlatform platform;
    OVSManager manager;
    ReadTags(platform, manager, {"ovs_eth2", "ovs_eth1"});
    platform.Answer("VORNNetIFGetIPConfig", -1);
    EXPECT_EQ(manager.CreateLinuxVlan(), -1);
    EXPECT_THAT(platform.Calls(), ElementsAre("VORNNetIFGetIPConfig eth1"));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to get config of eth1")));
}

TEST(CreateLinuxVlan, StopsAtTheFirstThatCannotBeMade)
{
    RecordingPlatform platform;
    OVSManager manager;
    ReadTags(platform, manager, {"ovs_eth2", "ovs_eth1"});
    platform.Answer("VLIBNetVlanCreate", -1);
    EXPECT_EQ(manager.CreateLinuxVlan(), -1);
    EXPECT_EQ(platform.Calls().size(), 2U);
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to create vlan tag 1 of eth1")));
}

TEST(CreateLinuxVlan, TakesPositiveAnswersAsSuccess)
{
    RecordingPlatform platform;
    OVSManager manager;
    ReadTags(platform, manager, {"ovs_eth1"});
    platform.Answer("VORNNetIFGetIPConfig", 1);
    platform.Answer("VLIBNetVlanCreate", 1);
    EXPECT_EQ(manager.CreateLinuxVlan(), 0);
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(CreateLinuxVlan, TakesAParentWithoutThePrefixAsTheEmptyName)
{
    RecordingPlatform platform;
    OVSManager manager;
    ReadTags(platform, manager, {"br1"});
    EXPECT_EQ(manager.CreateLinuxVlan(), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VORNNetIFGetIPConfig ''", "VLIBNetVlanCreate '' 1 ip-of-"));
}

} // namespace
