#include <vornovs/vornovs.h>

#include "support/support.h"

#include <filesystem>

using harness::Err;
using harness::LogLine;
using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::BridgeDissolved;
using unit::Calls;
using unit::InterfaceListLoaded;
using unit::kIfcfg;
using unit::kInterfaceList;
using unit::LongName;
using unit::ReadFile;
using unit::Sequence;
using unit::WriteFile;
using VORN::OVS::OVSManager;

namespace {

constexpr char kFile[] = "ovsmanager.cpp";
constexpr char kPlain[] = "/etc/sysconfig/network-scripts/ifcfg-eth0";
constexpr char kBridge[] = "/etc/sysconfig/network-scripts/ifcfg-ovs_eth0";
constexpr char kCopy[] = "VLIBCExec /bin/cp -f /etc/sysconfig/network-scripts/ifcfg-ovs_eth0 "
                         "/etc/sysconfig/network-scripts/ifcfg-eth0";
constexpr char kLooked[] = "VLIBCFileExist /etc/sysconfig/network-scripts/ifcfg-ovs_eth0";
constexpr char kKeys[] = "VLIBCFileSetKeys /etc/sysconfig/network-scripts/ifcfg-eth0 DEVICE=eth0 "
                         "-TYPE -PRIMARY";

const LogLine kNotListed = Err("ifsconf.cpp", "The eth0 has not been used before");
const LogLine kNotRemoved = Err(kFile, "Failed to remove the ovs interface file");

TEST(DestroyOVS, GivesTheBridgesFileBackToTheInterface)
{
    const RecordingPlatform platform;
    WriteFile(kInterfaceList, "eth0\neth1\n");
    WriteFile(kBridge, "");
    EXPECT_EQ(OVSManager().DestroyOVS("ovs_eth0"), 0);
    EXPECT_EQ(platform.Calls(), BridgeDissolved("eth0", true));
    EXPECT_EQ(ReadFile(kInterfaceList), "eth1\n");
    EXPECT_FALSE(std::filesystem::exists(kBridge));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(DestroyOVS, LeavesTheInterfaceTheBridgesSettings)
{
    RecordingPlatform platform;
    platform.CarryOutFileEdits();
    WriteFile(kInterfaceList, "eth0\n");
    WriteFile(kPlain, "DEVICE=eth0\nBRIDGE=ovs_eth0\nIPADDR=10.0.0.9\n");
    WriteFile(kBridge, "# by hand\nDEVICE=ovs_eth0\nIPADDR=10.0.0.2\nTYPE=OVS\nX_UNKNOWN=\"a b\"\n"
                       "PRIMARY=eth0\nNETMASK=\n");
    EXPECT_EQ(OVSManager().DestroyOVS("ovs_eth0"), 0);
    EXPECT_EQ(ReadFile(kPlain),
              "# by hand\nDEVICE=eth0\nIPADDR=10.0.0.2\nX_UNKNOWN=\"a b\"\nNETMASK=\n");
    EXPECT_EQ(ReadFile(kBridge), std::nullopt);
    EXPECT_EQ(ReadFile(kInterfaceList), std::nullopt);
}

TEST(DestroyOVS, UndoesCreateOVS)
{
    RecordingPlatform platform;
    platform.CarryOutFileEdits();
    const std::string before = "# by hand\nDEVICE=eth0\nBOOTPROTO=dhcp\nX_UNKNOWN=1\n";
    WriteFile(kPlain, before);
    EXPECT_EQ(OVSManager().CreateOVS("eth0"), 0);
    EXPECT_EQ(OVSManager().DestroyOVS("ovs_eth0"), 0);
    EXPECT_EQ(ReadFile(kPlain), before);
    EXPECT_THAT(unit::ListFolder("/etc/sysconfig/network-scripts"), ElementsAre("ifcfg-eth0"));
    EXPECT_THAT(unit::ListFolder(unit::kStateFolder), IsEmpty());
}

TEST(DestroyOVS, AllocatesItsHashesAfterTheCopyAndFreesThem)
{
    const RecordingPlatform platform;
    WriteFile(kInterfaceList, "eth0\n");
    EXPECT_EQ(OVSManager().DestroyOVS("ovs_eth0"), 0);
    EXPECT_THAT(platform.AllCalls(),
                ElementsAre("VLIBCFileCheckDir /usr/vorn/etc/vornovs",
                            "VLIBCFileExist /usr/vorn/etc/vornovs/ovs_interface.conf", kCopy,
                            kLooked, "VLIBCSzHashAlloc", "VLIBCSzHashAlloc",
                            "VLIBCSzHashSetValue DEVICE eth0", "VLIBCSzHashSetValue TYPE ''",
                            "VLIBCSzHashSetValue PRIMARY ''", kKeys,
                            "VLIBCFileCheckDir /usr/vorn/etc/vornovs", "VLIBCSzHashFree",
                            "VLIBCSzHashFree"));
}

TEST(DestroyOVS, FailsWhenTheFileCannotBeCopied)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCExec /bin/cp", -1);
    WriteFile(kBridge, "");
    EXPECT_EQ(OVSManager().DestroyOVS("ovs_eth0"), -1);
    EXPECT_EQ(platform.Calls(), Sequence({InterfaceListLoaded(), {kCopy}}));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, std::string("Failed to copy the config ") +
                                                           kBridge + " to " + kPlain)));
    EXPECT_TRUE(std::filesystem::exists(kBridge));
}

TEST(DestroyOVS, TakesAPositiveAnswerOfTheCopyAsSuccess)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCExec /bin/cp", 1);
    WriteFile(kInterfaceList, "eth0\n");
    EXPECT_EQ(OVSManager().DestroyOVS("ovs_eth0"), 0);
    EXPECT_EQ(platform.Calls(), BridgeDissolved("eth0", true));
}

TEST(DestroyOVS, FailsWhenTheBridgesFileCannotBeDeleted)
{
    const RecordingPlatform platform;
    WriteFile(kInterfaceList, "eth0\n");
    std::filesystem::create_directory(kBridge);
    EXPECT_EQ(OVSManager().DestroyOVS("ovs_eth0"), -1);
    EXPECT_EQ(platform.Calls(), Sequence({InterfaceListLoaded(), {kCopy, kLooked}}));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, std::string("Failed to unlink ") + kBridge +
                                                           " for bridge interface")));
    EXPECT_EQ(ReadFile(kInterfaceList), "eth0\n");
}

TEST(DestroyOVS, DeletesTheBridgesFileOnlyWhenThePlatformAnswers1)
{
    for (const int answer : {-1, 0, 2}) {
        RecordingPlatform platform;
        platform.Answer(kLooked, answer);
        WriteFile(kInterfaceList, "eth0\n");
        WriteFile(kBridge, "");
        EXPECT_EQ(OVSManager().DestroyOVS("ovs_eth0"), 0) << answer;
        EXPECT_TRUE(std::filesystem::exists(kBridge)) << answer;
    }
}

TEST(DestroyOVS, FailsWithoutTheHashOfTheKeysToSet)
{
    RecordingPlatform platform;
    platform.AnswerNth("VLIBCSzHashAlloc", 1, 0);
    WriteFile(kBridge, "");
    EXPECT_EQ(OVSManager().DestroyOVS("ovs_eth0"), -1);
    EXPECT_EQ(platform.Calls(), Sequence({InterfaceListLoaded(), {kCopy, kLooked}}));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to alloc the hash pshIfsUpdate")));
    EXPECT_FALSE(std::filesystem::exists(kBridge));
}

TEST(DestroyOVS, FailsWithoutTheHashOfTheKeysToRemove)
{
    RecordingPlatform platform;
    platform.AnswerNth("VLIBCSzHashAlloc", 2, 0);
    EXPECT_EQ(OVSManager().DestroyOVS("ovs_eth0"), -1);
    EXPECT_EQ(platform.Calls(), Sequence({InterfaceListLoaded(), {kCopy, kLooked}}));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to alloc the hash pshIfsDel")));
}

TEST(DestroyOVS, FailsWhenTheInterfacesFileCannotBeEdited)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileSetKeys", -1);
    WriteFile(kInterfaceList, "eth0\n");
    EXPECT_EQ(OVSManager().DestroyOVS("ovs_eth0"), -1);
    EXPECT_EQ(platform.Calls(), BridgeDissolved("eth0", false));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, std::string("Failed to set the key-value to ") + kPlain)));
    EXPECT_EQ(ReadFile(kInterfaceList), "eth0\n");
}

TEST(DestroyOVS, TakesAPositiveAnswerOfTheEditAsSuccess)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileSetKeys", 1);
    WriteFile(kInterfaceList, "eth0\n");
    EXPECT_EQ(OVSManager().DestroyOVS("ovs_eth0"), 0);
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(DestroyOVS, DoesNotMindAnInterfaceThatIsNotListed)
{
    const RecordingPlatform platform;
    EXPECT_EQ(OVSManager().DestroyOVS("ovs_eth0"), 0);
    EXPECT_EQ(platform.Calls(), BridgeDissolved("eth0", false));
    EXPECT_THAT(platform.Log(), ElementsAre(kNotListed, kNotRemoved));
}

TEST(DestroyOVS, ReadsTheNameAsAScanDoes)
{
    const RecordingPlatform platform;
    WriteFile(kInterfaceList, "eth0\n");
    EXPECT_EQ(OVSManager().DestroyOVS("ovs_ eth0"), 0);
    const std::string prefix = kIfcfg;
    EXPECT_EQ(platform.Calls(),
              Sequence({InterfaceListLoaded(),
                        {"VLIBCExec /bin/cp -f '" + prefix + "ovs_ eth0' " + prefix + "eth0",
                         "VLIBCFileExist '" + prefix + "ovs_ eth0'", kKeys,
                         "VLIBCFileCheckDir /usr/vorn/etc/vornovs"}}));
}

TEST(DestroyOVS, TakesANameWithoutThePrefixAsTheEmptyName)
{
    const RecordingPlatform platform;
    EXPECT_EQ(OVSManager().DestroyOVS("br0"), 0);
    const std::string prefix = kIfcfg;
    EXPECT_EQ(platform.Calls(),
              Sequence({InterfaceListLoaded(),
                        {"VLIBCExec /bin/cp -f " + prefix + "br0 " + prefix,
                         "VLIBCFileExist " + prefix + "br0",
                         "VLIBCFileSetKeys " + prefix + " DEVICE= -TYPE -PRIMARY"}}));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err("ifsconf.cpp", "The  has not been used before"), kNotRemoved));
}

TEST(DestroyOVS, CutsNamesAndPathsToTheirBuffers)
{
    const RecordingPlatform platform;
    EXPECT_EQ(OVSManager().DestroyOVS("ovs_" + LongName()), 0);
    const std::string plain = LongName().substr(0, 4095);
    const std::string plainFile = (kIfcfg + LongName()).substr(0, 4095);
    const std::string bridgeFile = (std::string(kIfcfg) + "ovs_" + LongName()).substr(0, 4095);
    EXPECT_EQ(platform.Calls(), Sequence({InterfaceListLoaded(),
                                          {"VLIBCExec /bin/cp -f " + bridgeFile + " " + plainFile,
                                           "VLIBCFileExist " + bridgeFile,
                                           "VLIBCFileSetKeys " + plainFile + " DEVICE=" + plain +
                                               " -TYPE -PRIMARY"}}));
}

} // namespace
