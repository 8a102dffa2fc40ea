#include <vornovs/vornovs.h>

#include "support/support.h"

using harness::Err;
using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::kIfcfg;
using unit::LongName;
using unit::ReadFile;
using unit::WriteFile;
using VORN::OVS::VlanManager;

namespace {

constexpr char kFile[] = "vlanmanager.cpp";
constexpr char kPortFile[] = "/etc/sysconfig/network-scripts/ifcfg-ovs_eth0";
constexpr char kSetKey[] =
    "VLIBCFileSetKeyValue /etc/sysconfig/network-scripts/ifcfg-ovs_eth0 OVS_VLAN_ID=20";
constexpr char kRemoveKey[] =
    "VLIBCFileRemoveKey /etc/sysconfig/network-scripts/ifcfg-ovs_eth0 OVS_VLAN_ID";
constexpr char kSet[] = "VLIBCExecl /usr/bin/ovs-vsctl set port ovs_eth0 tag=20";
constexpr char kClear[] = "VLIBCExec /usr/bin/ovs-vsctl clear port ovs_eth0 tag";

TEST(VlanManagerCreate, WritesTheFileUnderTheLockAndAsksTheSwitchAfterIt)
{
    const RecordingPlatform platform;
    EXPECT_EQ(VlanManager::Create("ovs_eth0", "20"), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCFileLock 2054 5", kSetKey, "VLIBCFileUnlock 2048", kSet));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(VlanManagerCreate, DoesNothingWithoutTheLock)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileLock", -1);
    EXPECT_EQ(VlanManager::Create("ovs_eth0", "20"), -1);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCFileLock 2054 5", "VLIBCErrSetEx 1024 vlanmanager.cpp"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(VlanManagerCreate, TakesEveryAnswerButMinus1AsTheLock)
{
    for (const int answer : {-2, 1}) {
        RecordingPlatform platform;
        platform.Answer("VLIBCFileLock", answer);
        EXPECT_EQ(VlanManager::Create("ovs_eth0", "20"), 0) << answer;
        EXPECT_THAT(platform.Calls(),
                    ElementsAre("VLIBCFileLock 2054 5", kSetKey, "VLIBCFileUnlock 2048", kSet))
            << answer;
    }
}

TEST(VlanManagerCreate, GoesOnWhenTheFileCannotBeWritten)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileSetKeyValue", -1);
    EXPECT_EQ(VlanManager::Create("ovs_eth0", "20"), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCFileLock 2054 5", kSetKey, "VLIBCFileUnlock 2048", kSet));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Add OVS_VLAN_ID key failed")));
}

TEST(VlanManagerCreate, TakesAPositiveAnswerOfTheEditAsSuccess)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileSetKeyValue", 1);
    EXPECT_EQ(VlanManager::Create("ovs_eth0", "20"), 0);
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(VlanManagerCreate, RecordsAnUnlockThatFailsAndGoesOn)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileUnlock", -1);
    EXPECT_EQ(VlanManager::Create("ovs_eth0", "20"), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCFileLock 2054 5", kSetKey, "VLIBCFileUnlock 2048",
                            "VLIBCErrSetEx 1280 vlanmanager.cpp", kSet));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(VlanManagerCreate, TakesEveryAnswerButMinus1AsUnlocked)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileUnlock", -2);
    EXPECT_EQ(VlanManager::Create("ovs_eth0", "20"), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCFileLock 2054 5", kSetKey, "VLIBCFileUnlock 2048", kSet));
}

TEST(VlanManagerCreate, KeepsTheFileWhenTheSwitchRefuses)
{
    RecordingPlatform platform;
    platform.CarryOutFileEdits();
    WriteFile(kPortFile, "DEVICE=ovs_eth0\n");
    platform.Answer("VLIBCExecl", 1);
    EXPECT_EQ(VlanManager::Create("ovs_eth0", "20"), 0);
    EXPECT_EQ(ReadFile(kPortFile), "DEVICE=ovs_eth0\nOVS_VLAN_ID=20\n");
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "set ovs_eth0's vlan tag failed, tag ID = 20"),
                            Err(kFile, "Set ovs_eth0's vlan failed")));
}

TEST(VlanManagerCreate, CutsThePathToItsBuffer)
{
    const RecordingPlatform platform;
    EXPECT_EQ(VlanManager::Create(LongName(), "20"), 0);
    const std::string path = (kIfcfg + LongName()).substr(0, 1023);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCFileLock 2054 5",
                            "VLIBCFileSetKeyValue " + path + " OVS_VLAN_ID=20",
                            "VLIBCFileUnlock 2048",
                            "VLIBCExecl /usr/bin/ovs-vsctl set port " + LongName() + " tag=20"));
}

TEST(VlanManagerRemove, EditsTheFileUnderTheLockAndClearsTheTagAfterIt)
{
    const RecordingPlatform platform;
    EXPECT_EQ(VlanManager::Remove("ovs_eth0"), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCFileLock 2054 5", kRemoveKey, "VLIBCFileUnlock 2048", kClear));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(VlanManagerRemove, DoesNothingWithoutTheLock)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileLock", -1);
    EXPECT_EQ(VlanManager::Remove("ovs_eth0"), -1);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCFileLock 2054 5", "VLIBCErrSetEx 1024 vlanmanager.cpp"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(VlanManagerRemove, TakesEveryAnswerButMinus1AsTheLock)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileLock", -2);
    EXPECT_EQ(VlanManager::Remove("ovs_eth0"), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCFileLock 2054 5", kRemoveKey, "VLIBCFileUnlock 2048", kClear));
}

TEST(VlanManagerRemove, ClearsTheTagWhenTheFileHasNoSuchKey)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileRemoveKey", -1);
    EXPECT_EQ(VlanManager::Remove("ovs_eth0"), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCFileLock 2054 5", kRemoveKey, "VLIBCFileUnlock 2048", kClear));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Remove OVS_VLAN_ID key failed")));
}

TEST(VlanManagerRemove, TakesAPositiveAnswerOfTheEditAsSuccess)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileRemoveKey", 1);
    EXPECT_EQ(VlanManager::Remove("ovs_eth0"), 0);
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(VlanManagerRemove, RecordsAnUnlockThatFailsAndGoesOn)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileUnlock", -1);
    EXPECT_EQ(VlanManager::Remove("ovs_eth0"), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCFileLock 2054 5", kRemoveKey, "VLIBCFileUnlock 2048",
                            "VLIBCErrSetEx 1280 vlanmanager.cpp", kClear));
}

TEST(VlanManagerRemove, SucceedsWhenTheSwitchRefuses)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCExec", 1);
    EXPECT_EQ(VlanManager::Remove("ovs_eth0"), 0);
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "clear ovs_eth0's vlan tag failed"),
                                            Err(kFile, "clear ovs_eth0's vlan failed")));
}

TEST(VlanManagerRemove, CutsThePathToItsBuffer)
{
    const RecordingPlatform platform;
    EXPECT_EQ(VlanManager::Remove(LongName()), 0);
    const std::string path = (kIfcfg + LongName()).substr(0, 1023);
    EXPECT_EQ(platform.Calls()[1], "VLIBCFileRemoveKey " + path + " OVS_VLAN_ID");
}

} // namespace
