#include <vornovs/vornovs.h>

#include "support/support.h"

using harness::Err;
using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::LongName;

namespace {

constexpr char kFile[] = "libvornovs.cpp";
constexpr char kAsk[] = "VLIBCPopen /usr/bin/ovs-vsctl rB get port ovs_eth0 tag";
const std::string kPath = std::string(unit::kIfcfg) + "ovs_eth0";

TEST(OVSVlanGet, AnswersWhatTheSwitchSays)
{
    RecordingPlatform platform;
    _tag_VLIB_VLAN vlan{};
    EXPECT_EQ(VORN::OVS::OVSVlanGet("ovs_eth0", &vlan), 0);
    platform.Output(kAsk, "10\n");
    EXPECT_EQ(VORN::OVS::OVSVlanGet("ovs_eth0", &vlan), 1);
    EXPECT_EQ(vlan.vlanId, 10);
    EXPECT_STREQ(vlan.szIfName, "ovs_eth0");
    EXPECT_STREQ(vlan.szRealName, "ovs_eth0");
    EXPECT_THAT(platform.Log(),
                ElementsAre(harness::Info("vlanmanager.cpp", "ovs_eth0 without any vlan tag")));
}

TEST(OVSVlanGet, SpeaksOfClearingWhenTheSwitchCannotBeAsked)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCPopen", 0);
    _tag_VLIB_VLAN vlan{};
    EXPECT_EQ(VORN::OVS::OVSVlanGet("ovs_eth0", &vlan), -1);
    EXPECT_THAT(platform.Calls(), ElementsAre(kAsk));
    EXPECT_EQ(platform.Log().size(), 2U);
    EXPECT_EQ(platform.Log().back(),
              Err(kFile, "Failed to clear the current valn tag of ovs_eth0"));
}

TEST(OVSVlanSet, SetsTheTagOfTheLivePort)
{
    const RecordingPlatform platform;
    EXPECT_EQ(VORN::OVS::OVSVlanSet("ovs_eth0", "10"), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCExecl /usr/bin/ovs-vsctl set port ovs_eth0 tag=10"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(OVSVlanSet, FailsWhenTheSwitchRefuses)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCExecl /usr/bin/ovs-vsctl", 1);
    EXPECT_EQ(VORN::OVS::OVSVlanSet("ovs_eth0", "10"), -1);
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err("vlanmanager.cpp", "set ovs_eth0's vlan tag failed, tag ID = 10"),
                            Err(kFile, "Failed to set vlan 10 into config of ovs_eth0")));
}

TEST(OVSVlanClear, ClearsTheTagOfTheLivePort)
{
    const RecordingPlatform platform;
    EXPECT_EQ(VORN::OVS::OVSVlanClear("ovs_eth0"), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCExec /usr/bin/ovs-vsctl clear port ovs_eth0 tag"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(OVSVlanClear, FailsWhenTheSwitchRefuses)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCExec /usr/bin/ovs-vsctl", -1);
    EXPECT_EQ(VORN::OVS::OVSVlanClear("ovs_eth0"), -1);
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err("vlanmanager.cpp", "clear ovs_eth0's vlan tag failed"),
                            Err(kFile, "Failed to clear the current valn tag of ovs_eth0")));
}

TEST(OVSVlanCreate, RecordsAndSetsTheTagWithoutTheConfigurationLock)
{
    const RecordingPlatform platform;
    EXPECT_EQ(VORN::OVS::OVSVlanCreate("ovs_eth0", "10"), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCFileLock 2054 5",
                            "VLIBCFileSetKeyValue " + kPath + " OVS_VLAN_ID=10",
                            "VLIBCFileUnlock 2048",
                            "VLIBCExecl /usr/bin/ovs-vsctl set port ovs_eth0 tag=10"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(OVSVlanCreate, FailsWithoutThePlatformsLock)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileLock", -1);
    EXPECT_EQ(VORN::OVS::OVSVlanCreate("ovs_eth0", "10"), -1);
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to Creat the vlan tag 10 of ovs_eth0")));
}

TEST(OVSVlanRemove, RemovesTheRecordAndClearsTheTag)
{
    const RecordingPlatform platform;
    EXPECT_EQ(VORN::OVS::OVSVlanRemove("ovs_eth0"), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCFileLock 2054 5", "VLIBCFileRemoveKey " + kPath + " OVS_VLAN_ID",
                            "VLIBCFileUnlock 2048",
                            "VLIBCExec /usr/bin/ovs-vsctl clear port ovs_eth0 tag"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(OVSVlanRemove, FailsWithoutThePlatformsLock)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileLock", -1);
    EXPECT_EQ(VORN::OVS::OVSVlanRemove("ovs_eth0"), -1);
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to remove the vlan tag of ovs_eth0")));
}

TEST(OVSVlan, StandsNamesAndIdsOf5000Characters)
{
    const RecordingPlatform platform;
    _tag_VLIB_VLAN vlan{};
    EXPECT_EQ(VORN::OVS::OVSVlanGet(LongName(), &vlan), 0);
    EXPECT_EQ(VORN::OVS::OVSVlanSet(LongName(), LongName()), 0);
    EXPECT_EQ(VORN::OVS::OVSVlanClear(LongName()), 0);
    EXPECT_EQ(VORN::OVS::OVSVlanCreate(LongName(), LongName()), 0);
    EXPECT_EQ(VORN::OVS::OVSVlanRemove(LongName()), 0);
}

} // namespace
