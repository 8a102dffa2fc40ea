#include <vornovs/vornovs.h>

#include "support/support.h"

#include <filesystem>

using harness::Err;
using harness::LogLine;
using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::BridgeMade;
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
constexpr char kCopy[] = "VLIBCExec /bin/cp -f /etc/sysconfig/network-scripts/ifcfg-eth0 "
                         "/etc/sysconfig/network-scripts/ifcfg-ovs_eth0";
constexpr char kBridgeKeys[] =
    "VLIBCFileSetKeys /etc/sysconfig/network-scripts/ifcfg-ovs_eth0 DEVICE=ovs_eth0 TYPE=OVS "
    "PRIMARY=eth0 -BONDING_OPTS -BRIDGE -SLAVE";
constexpr char kPlainKeys[] =
    "VLIBCFileSetKeys /etc/sysconfig/network-scripts/ifcfg-eth0 BRIDGE=ovs_eth0";

LogLine NotHandled()
{
    return Err(kFile, "Failed to handle the ifcfg for non-br interface eth0");
}

TEST(CreateOVS, CopiesAndEditsTheFilesAndListsTheInterface)
{
    const RecordingPlatform platform;
    EXPECT_EQ(OVSManager().CreateOVS("eth0"), 0);
    EXPECT_EQ(platform.Calls(), BridgeMade("eth0"));
    EXPECT_EQ(ReadFile(kInterfaceList), "eth0\n");
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(CreateOVS, MakesTheBridgesFileFromTheInterfaces)
{
    RecordingPlatform platform;
    platform.CarryOutFileEdits();
    WriteFile(kPlain, "# by hand\nDEVICE=eth0\nBOOTPROTO=static\nSLAVE=yes\nIPADDR=10.0.0.2\n"
                      "BRIDGE=br0\nX_UNKNOWN=\"a b\"\nBONDING_OPTS=\"mode=1\"\nNETMASK=\n");
    EXPECT_EQ(OVSManager().CreateOVS("eth0"), 0);
    EXPECT_EQ(ReadFile(kBridge), "# by hand\nDEVICE=ovs_eth0\nBOOTPROTO=static\nIPADDR=10.0.0.2\n"
                                 "X_UNKNOWN=\"a b\"\nNETMASK=\nTYPE=OVS\nPRIMARY=eth0\n");
    EXPECT_EQ(ReadFile(kPlain),
              "# by hand\nDEVICE=eth0\nBOOTPROTO=static\nSLAVE=yes\nIPADDR=10.0.0.2\n"
              "BRIDGE=ovs_eth0\nX_UNKNOWN=\"a b\"\nBONDING_OPTS=\"mode=1\"\nNETMASK=\n");
}

TEST(CreateOVS, AllocatesItsHashBeforeTheFilesAreTouched)
{
    const RecordingPlatform platform;
    EXPECT_EQ(OVSManager().CreateOVS("eth0"), 0);
    EXPECT_THAT(platform.AllCalls(),
                ElementsAre("VLIBCFileCheckDir /usr/vorn/etc/vornovs",
                            "VLIBCFileExist /usr/vorn/etc/vornovs/ovs_interface.conf",
                            "VLIBCSzHashAlloc", "VLIBCSzHashAlloc", "VLIBCSzHashAlloc", kCopy,
                            "VLIBCSzHashSetValue DEVICE ovs_eth0", "VLIBCSzHashSetValue TYPE OVS",
                            "VLIBCSzHashSetValue PRIMARY eth0",
                            "VLIBCSzHashSetValue BONDING_OPTS ''", "VLIBCSzHashSetValue BRIDGE ''",
                            "VLIBCSzHashSetValue SLAVE ''", kBridgeKeys, "VLIBCSzHashFree",
                            "VLIBCSzHashFree", "VLIBCSzHashSetValue BRIDGE ovs_eth0", kPlainKeys,
                            "VLIBCFileCheckDir /usr/vorn/etc/vornovs", "VLIBCSzHashFree"));
}

TEST(CreateOVS, FailsWithoutItsHash)
{
    RecordingPlatform platform;
    platform.AnswerNth("VLIBCSzHashAlloc", 1, 0);
    EXPECT_EQ(OVSManager().CreateOVS("eth0"), -1);
    EXPECT_EQ(platform.Calls(), InterfaceListLoaded());
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to alloc the hash buffer")));
}

TEST(CreateOVS, FailsWithoutTheHashOfTheBridgesKeys)
{
    RecordingPlatform platform;
    platform.AnswerNth("VLIBCSzHashAlloc", 2, 0);
    EXPECT_EQ(OVSManager().CreateOVS("eth0"), -1);
    EXPECT_EQ(platform.Calls(), InterfaceListLoaded());
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to alloc the hash buffer"), NotHandled()));
}

TEST(CreateOVS, FailsWithoutTheHashOfTheKeysToRemove)
{
    RecordingPlatform platform;
    platform.AnswerNth("VLIBCSzHashAlloc", 3, 0);
    EXPECT_EQ(OVSManager().CreateOVS("eth0"), -1);
    EXPECT_EQ(platform.Calls(), InterfaceListLoaded());
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to alloc the hash pshIfsDel"), NotHandled()));
}

TEST(CreateOVS, FailsWhenTheFileCannotBeCopied)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCExec /bin/cp", -1);
    EXPECT_EQ(OVSManager().CreateOVS("eth0"), -1);
    EXPECT_EQ(platform.Calls(), Sequence({InterfaceListLoaded(), {kCopy}}));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, std::string("Failed to copy the config ") +
                                                           kPlain + " to " + kBridge),
                                            NotHandled()));
    EXPECT_EQ(ReadFile(kInterfaceList), std::nullopt);
}

TEST(CreateOVS, TakesAPositiveAnswerOfTheCopyAsSuccess)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCExec /bin/cp", 1);
    EXPECT_EQ(OVSManager().CreateOVS("eth0"), 0);
    EXPECT_EQ(platform.Calls(), BridgeMade("eth0"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(CreateOVS, FailsWhenTheBridgesFileCannotBeEdited)
{
    RecordingPlatform platform;
    platform.AnswerNth("VLIBCFileSetKeys", 1, -1);
    EXPECT_EQ(OVSManager().CreateOVS("eth0"), -1);
    EXPECT_EQ(platform.Calls(), Sequence({InterfaceListLoaded(), {kCopy, kBridgeKeys}}));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, std::string("Failed to set the key-value to ") + kBridge),
                            NotHandled()));
}

TEST(CreateOVS, FailsWhenTheInterfacesFileCannotBeEdited)
{
    RecordingPlatform platform;
    platform.AnswerNth("VLIBCFileSetKeys", 2, -1);
    EXPECT_EQ(OVSManager().CreateOVS("eth0"), -1);
    EXPECT_EQ(platform.Calls(),
              Sequence({InterfaceListLoaded(), {kCopy, kBridgeKeys, kPlainKeys}}));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, std::string("Failed to set the key-value to ") + kPlain)));
    EXPECT_EQ(ReadFile(kInterfaceList), std::nullopt);
}

TEST(CreateOVS, TakesAPositiveAnswerOfTheEditsAsSuccess)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileSetKeys", 1);
    EXPECT_EQ(OVSManager().CreateOVS("eth0"), 0);
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(CreateOVS, LeavesTheCopyOnDiskWhenALaterStepFails)
{
    RecordingPlatform platform;
    platform.CarryOutFileEdits();
    platform.AnswerNth("VLIBCFileSetKeys", 1, -1);
    WriteFile(kPlain, "DEVICE=eth0\n");
    EXPECT_EQ(OVSManager().CreateOVS("eth0"), -1);
    EXPECT_EQ(ReadFile(kBridge), "DEVICE=eth0\n");
}

TEST(CreateOVS, DoesNotMindAnInterfaceThatIsListedAlready)
{
    const RecordingPlatform platform;
    WriteFile(kInterfaceList, "eth0\n");
    EXPECT_EQ(OVSManager().CreateOVS("eth0"), 0);
    EXPECT_THAT(platform.Log(), ElementsAre(Err("ifsconf.cpp", "The eth0 has exist")));
}

TEST(CreateOVS, DoesNotMindAListThatCannotBeWritten)
{
    const RecordingPlatform platform;
    std::filesystem::create_directory(kInterfaceList);
    EXPECT_EQ(OVSManager().CreateOVS("eth0"), 0);
    EXPECT_EQ(platform.Log().back(),
              Err("ifsconf.cpp", std::string("Failed to write to config ") + kInterfaceList));
}

TEST(CreateOVS, CutsNamesAndPathsToTheirBuffers)
{
    const RecordingPlatform platform;
    EXPECT_EQ(OVSManager().CreateOVS(LongName()), 0);
    const std::string bridge = ("ovs_" + LongName()).substr(0, 4095);
    const std::string plainFile = (kIfcfg + LongName()).substr(0, 4095);
    const std::string bridgeFile = (std::string(kIfcfg) + "ovs_" + LongName()).substr(0, 4095);
    EXPECT_EQ(platform.Calls(),
              Sequence({InterfaceListLoaded(),
                        {"VLIBCExec /bin/cp -f " + plainFile + " " + bridgeFile,
                         "VLIBCFileSetKeys " + bridgeFile + " DEVICE=" + bridge +
                             " TYPE=OVS PRIMARY=" + LongName() + " -BONDING_OPTS -BRIDGE -SLAVE",
                         "VLIBCFileSetKeys " + plainFile + " BRIDGE=" + bridge,
                         "VLIBCFileCheckDir /usr/vorn/etc/vornovs"}}));
    EXPECT_EQ(ReadFile(kInterfaceList), LongName() + "\n");
}

TEST(CreateOVSForGeneral, TakesTheNamesAndPathsThatItIsGiven)
{
    const RecordingPlatform platform;
    EXPECT_EQ(OVSManager().CreateOVSForGeneral("a", "b", "/c", "/d"), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCExec /bin/cp -f /c /d",
                            "VLIBCFileSetKeys /d DEVICE=b TYPE=OVS PRIMARY=a -BONDING_OPTS "
                            "-BRIDGE -SLAVE"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(CreateOVSForGeneral, StandsNamesOf5000Characters)
{
    const RecordingPlatform platform;
    const char* const name = LongName().c_str();
    EXPECT_EQ(OVSManager().CreateOVSForGeneral(name, name, name, name), 0);
    EXPECT_EQ(platform.Calls().front(), "VLIBCExec /bin/cp -f " + LongName() + " " + LongName());
}

} // namespace
