#include <vornovs/vornovs.h>

#include "support/support.h"

#include <filesystem>

using harness::Err;
using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::Calls;
using unit::kRegistry;
using unit::kStateFolder;
using unit::ListFolder;
using unit::LongName;
using unit::MakeUnopenable;
using unit::ReadFile;
using unit::Sequence;
using unit::WriteFile;
using VORN::OVS::Register;
using VORN::OVS::UnRegister;

namespace {

constexpr char kFile[] = "libvornovs.cpp";
constexpr char kLock[] = "VLIBCFileLockTimeByFile /tmp/ovs_config.lock 1 5";
constexpr char kUnlock[] = "VLIBCFileUnlockByFile";
constexpr char kFolder[] = "VLIBCFileCheckDir /usr/vorn/etc/vornovs";
constexpr char kList[] = "VLIBCPopen /usr/bin/ovs-vsctl r list-br";

const Calls kLoaded{kFolder, "VLIBCFileExist /usr/vorn/etc/vornovs/ovs_reg.conf"};
const Calls kSaved{kFolder};

/** A host without a bridge goes back. */
const Calls kConvertedBack{"ExecHook net net/ovs_change 4 ACTION=delete",
                           "VLIBServiceIsRunning vornovs-db",
                           "VLIBServiceIsRunning vornovs-vswitch",
                           kList,
                           "VLIBCPclose /usr/bin/ovs-vsctl list-br",
                           "VLIBCExecl /etc/rc.network stop",
                           "sleep 3",
                           "VLIBCFileCheckKeyValue /etc/vorninfo.conf support_net_topology yes",
                           "VLIBCExecl /etc/rc.network start",
                           "VLIBServiceIsRunning vornwifid",
                           "VLIBServiceRestart vornwifid",
                           "ExecHook net net/ovs_change 5 ACTION=delete"};

TEST(UnRegister, ConvertsTheHostBackForTheLastClientUnderTheLock)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "a\n");
    EXPECT_EQ(UnRegister("a", {}), 0);
    EXPECT_EQ(platform.Calls(), Sequence({{kLock}, kLoaded, kSaved, kConvertedBack, {kUnlock}}));
    EXPECT_THAT(platform.Log(), IsEmpty());
    EXPECT_THAT(ListFolder(kStateFolder), IsEmpty());
}

TEST(UnRegister, OnlyWithdrawsAClientThatIsNotTheLast)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "a\nb\n");
    EXPECT_EQ(UnRegister("a", {{"bond0", "802.3ad"}}), 0);
    EXPECT_EQ(platform.Calls(), Sequence({{kLock}, kLoaded, kSaved, {kUnlock}}));
    EXPECT_THAT(platform.Log(), IsEmpty());
    EXPECT_EQ(ReadFile(kRegistry), "b\n");
}

TEST(UnRegister, Answers1ForAnUnknownNameAndConvertsNothing)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "b\n");
    EXPECT_EQ(UnRegister("c", {}), 1);
    EXPECT_EQ(platform.Calls(), Sequence({{kLock}, kLoaded, {kUnlock}}));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err("regconf.cpp", "The c has not been registered before")));
    EXPECT_EQ(ReadFile(kRegistry), "b\n");
}

TEST(UnRegister, Answers1WithoutAnyRegistry)
{
    const RecordingPlatform platform;
    EXPECT_EQ(UnRegister("a", {}), 1);
    EXPECT_EQ(platform.Calls(), Sequence({{kLock}, kLoaded, {kUnlock}}));
    EXPECT_THAT(ListFolder(kStateFolder), IsEmpty());
}

TEST(UnRegister, FailsAndDoesNothingWithoutTheLock)
{
    RecordingPlatform platform;
    WriteFile(kRegistry, "a\n");
    platform.Answer("VLIBCFileLockTimeByFile", -1);
    EXPECT_EQ(UnRegister("a", {}), -1);
    EXPECT_THAT(platform.Calls(), ElementsAre(kLock));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to lock/tmp/ovs_config.lock"),
                                            Err(kFile, "Failed to lock the file")));
    EXPECT_EQ(ReadFile(kRegistry), "a\n");
}

TEST(UnRegister, GivesAHandleBackThatAFailedLockLeft)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileLockTimeByFile", -1);
    platform.LockHandle(0);
    EXPECT_EQ(UnRegister("a", {}), -1);
    EXPECT_THAT(platform.Calls(), ElementsAre(kLock, kUnlock));
}

TEST(UnRegister, KeepsItsResultWhenTheUnlockFails)
{
    RecordingPlatform platform;
    WriteFile(kRegistry, "a\nb\n");
    platform.Answer("VLIBCFileUnlockByFile", -1);
    EXPECT_EQ(UnRegister("a", {}), 0);
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to unlock/tmp/ovs_config.lock"),
                                            Err(kFile, "Failed to unlock the file")));
}

TEST(UnRegister, FailsForARegistryThatCannotBeRead)
{
    const RecordingPlatform platform;
    MakeUnopenable(kRegistry);
    EXPECT_EQ(UnRegister("a", {}), -1);
    EXPECT_EQ(platform.Calls(), Sequence({{kLock}, kLoaded, {kUnlock}}));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err("regconf.cpp", " Open /usr/vorn/etc/vornovs/ovs_reg.conf fails"),
                            Err(kFile, "Failed to load the ovs config")));
}

TEST(UnRegister, FailsWhenTheWithdrawalCannotBeRecorded)
{
    const RecordingPlatform platform;
    unit::ScopedMount disk(kStateFolder, "size=1m");
    WriteFile(kRegistry, "a\n");
    disk.MakeReadOnly();
    EXPECT_EQ(UnRegister("a", {}), -1);
    EXPECT_EQ(platform.Calls(), Sequence({{kLock}, kLoaded, kSaved, {kUnlock}}));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err("regconf.cpp", " Open /usr/vorn/etc/vornovs/ovs_reg.conf fails"),
                            Err(kFile, "Failed to register the name a")));
    EXPECT_EQ(ReadFile(kRegistry), "a\n");
}

TEST(UnRegister, Answers0WhenTheConversionBackFailsAndLeavesTheNameOut)
{
    RecordingPlatform platform;
    WriteFile(kRegistry, "a\n");
    platform.Answer("VLIBCPopen", 0);
    EXPECT_EQ(UnRegister("a", {}), 0);
    EXPECT_EQ(platform.Calls(), Sequence({{kLock},
                                          kLoaded,
                                          kSaved,
                                          Calls(kConvertedBack.begin(), kConvertedBack.begin() + 4),
                                          {kUnlock}}));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err("ovsmanager.cpp",
                                "Failed to excute /usr/bin/ovs-vsctl list-br to get all ovs-brs"),
                            Err("ovsmanager.cpp", "Fail to get all ovs switch list"),
                            Err(kFile, "Failed to delete all OVS interface")));
    EXPECT_EQ(ReadFile(kRegistry), std::nullopt);
}

TEST(UnRegister, PrimesTheBondModesInTheOrderOfTheBonds)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "a\n");
    EXPECT_EQ(UnRegister("a", {{"ovs_bond1", "802.3ad"}, {"ovs_bond0", "balance-rr"}}), 0);
    const Calls begin =
        Sequence({{kLock},
                  kLoaded,
                  kSaved,
                  {"VORNNetLinkAggrGet ovs_bond0", "VORNNetLinkAggrStringToMode balance-rr",
                   "VORNNetLinkAggrGet ovs_bond1", "VORNNetLinkAggrStringToMode 802.3ad",
                   "ExecHook net net/ovs_change 4 ACTION=delete"}});
    ASSERT_GE(platform.Calls().size(), begin.size());
    EXPECT_EQ(Calls(platform.Calls().begin(),
                    platform.Calls().begin() + static_cast<std::ptrdiff_t>(begin.size())),
              begin);
}

TEST(UnRegister, BringsTheFilesBackThatRegisterChanged)
{
    RecordingPlatform platform;
    platform.CarryOutFileEdits();
    platform.Output(kList, "ovs_eth0\n");
    const std::string file = std::string(unit::kIfcfg) + "eth0";
    const std::string before = "# the port\nDEVICE=eth0\nIPADDR=10.0.0.2\nX_UNKNOWN=\"a b\"\n";
    WriteFile(file, before);
    EXPECT_EQ(Register("a", {}), 0);
    EXPECT_EQ(ReadFile(file), before + "BRIDGE=ovs_eth0\n");
    EXPECT_EQ(Register("b", {}), 0);
    EXPECT_EQ(UnRegister("a", {}), 0);
    EXPECT_EQ(ReadFile(file), before + "BRIDGE=ovs_eth0\n");
    EXPECT_EQ(UnRegister("b", {}), 0);
    EXPECT_EQ(ReadFile(file), before);
    EXPECT_THAT(ListFolder("/etc/sysconfig/network-scripts"), ElementsAre("ifcfg-eth0"));
    EXPECT_THAT(ListFolder(kStateFolder), IsEmpty());
}

TEST(UnRegister, StandsNamesOf5000Characters)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, LongName() + "\n");
    EXPECT_EQ(UnRegister(LongName() + "y", {}), 1);
    EXPECT_EQ(UnRegister(LongName(), {{LongName(), LongName()}}), 0);
    EXPECT_EQ(ReadFile(kRegistry), std::nullopt);
}

} // namespace
