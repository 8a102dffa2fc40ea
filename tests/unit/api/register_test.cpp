#include <vornovs/vornovs.h>

#include "support/support.h"

#include <algorithm>
#include <filesystem>

using harness::Err;
using harness::LogLine;
using harness::RecordingPlatform;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::BridgeMade;
using unit::Calls;
using unit::GatewaysCopied;
using unit::kRegistry;
using unit::LongName;
using unit::MakeUnopenable;
using unit::ReadFile;
using unit::Sequence;
using unit::WriteFile;
using VORN::OVS::Register;

namespace {

constexpr char kFile[] = "libvornovs.cpp";
constexpr char kLock[] = "VLIBCFileLockTimeByFile /tmp/ovs_config.lock 1 5";
constexpr char kUnlock[] = "VLIBCFileUnlockByFile";
constexpr char kFolder[] = "VLIBCFileCheckDir /usr/vorn/etc/vornovs";

const Calls kLoaded{kFolder, "VLIBCFileExist /usr/vorn/etc/vornovs/ovs_reg.conf"};
const Calls kSaved{kFolder};

/** A host with the one interface eth0 goes on to the switch. */
const Calls kConverted =
    Sequence({{"ExecHook net net/ovs_change 4 ACTION=create", "VLIBNetGetInterfaceInfo",
               "VLIBNetBridgeIfIsMaster eth0", "VLIBNetVlanGet eth0"},
              GatewaysCopied("eth0", "ovs_eth0"),
              {"VLIBCExecl /etc/rc.network stop", "sleep 3",
               "VLIBCFileCheckKeyValue /etc/vorninfo.conf support_net_topology yes"},
              BridgeMade("eth0"),
              {"VLIBCExecl /etc/rc.network start", "VLIBServiceIsRunning vornwifid",
               "VLIBServiceRestart vornwifid", "VORNNetGetEthInfo ovs_eth0",
               "ExecHook net net/ovs_change 5 ACTION=create"}});

const LogLine kSpeed = Err("ovsmanager.cpp", "[OVS] speed 1000");

TEST(Register, ConvertsTheHostForTheFirstClientUnderTheLock)
{
    const RecordingPlatform platform;
    EXPECT_EQ(Register("a", {}), 0);
    EXPECT_EQ(platform.Calls(), Sequence({{kLock}, kLoaded, kSaved, kConverted, {kUnlock}}));
    EXPECT_THAT(platform.Log(), ElementsAre(kSpeed));
    EXPECT_EQ(ReadFile(kRegistry), "a\n");
}

TEST(Register, ConvertsOnceForTwoClients)
{
    RecordingPlatform platform;
    EXPECT_EQ(Register("a", {}), 0);
    platform.Forget();
    EXPECT_EQ(Register("b", {{"bond0", "balance-rr"}}), 0);
    EXPECT_EQ(platform.Calls(), Sequence({{kLock}, kLoaded, kSaved, {kUnlock}}));
    EXPECT_THAT(platform.Log(), IsEmpty());
    EXPECT_EQ(ReadFile(kRegistry), "a\nb\n");
}

TEST(Register, Answers1ForTheOnlyNameAndConvertsNothing)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "a\n");
    EXPECT_EQ(Register("a", {}), 1);
    EXPECT_EQ(platform.Calls(), Sequence({{kLock}, kLoaded, {kUnlock}}));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err("regconf.cpp", "The a has been registered before")));
    EXPECT_EQ(ReadFile(kRegistry), "a\n");
}

TEST(Register, Answers0AndDoesNothingWithoutTheLock)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileLockTimeByFile", -1);
    EXPECT_EQ(Register("a", {}), 0);
    EXPECT_THAT(platform.Calls(), ElementsAre(kLock));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to lock/tmp/ovs_config.lock"),
                                            Err(kFile, "Failed to lock the file")));
    EXPECT_EQ(ReadFile(kRegistry), std::nullopt);
}

TEST(Register, GivesAHandleBackThatAFailedLockLeft)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileLockTimeByFile", -2);
    platform.LockHandle(5);
    EXPECT_EQ(Register("a", {}), 0);
    EXPECT_THAT(platform.Calls(), ElementsAre(kLock, kUnlock));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to lock/tmp/ovs_config.lock"),
                                            Err(kFile, "Failed to lock the file")));
}

TEST(Register, GivesBackEveryHandleButMinus1)
{
    for (const int handle : {0, -2}) {
        WriteFile(kRegistry, "a\n");
        RecordingPlatform platform;
        platform.LockHandle(handle);
        EXPECT_EQ(Register("a", {}), 1) << handle;
        EXPECT_EQ(platform.Calls(), Sequence({{kLock}, kLoaded, {kUnlock}})) << handle;
    }
}

TEST(Register, WorksWithoutAHandleWhenTheLockCallSucceeded)
{
    RecordingPlatform platform;
    platform.LockHandle(-1);
    EXPECT_EQ(Register("a", {}), 0);
    EXPECT_EQ(platform.Calls(), Sequence({{kLock}, kLoaded, kSaved, kConverted}));
}

TEST(Register, TakesAPositiveAnswerAsTheLock)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileLockTimeByFile", 1);
    EXPECT_EQ(Register("a", {}), 0);
    EXPECT_EQ(platform.Calls(), Sequence({{kLock}, kLoaded, kSaved, kConverted, {kUnlock}}));
}

TEST(Register, KeepsItsResultWhenTheUnlockFails)
{
    RecordingPlatform platform;
    WriteFile(kRegistry, "a\n");
    platform.Answer("VLIBCFileUnlockByFile", -1);
    EXPECT_EQ(Register("a", {}), 1);
    EXPECT_THAT(platform.Log(), ElementsAre(Err("regconf.cpp", "The a has been registered before"),
                                            Err(kFile, "Failed to unlock/tmp/ovs_config.lock"),
                                            Err(kFile, "Failed to unlock the file")));
}

TEST(Register, TakesAPositiveAnswerAsUnlocked)
{
    RecordingPlatform platform;
    WriteFile(kRegistry, "b\n");
    platform.Answer("VLIBCFileUnlockByFile", 1);
    EXPECT_EQ(Register("a", {}), 0);
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(Register, Answers0ForARegistryThatCannotBeRead)
{
    const RecordingPlatform platform;
    MakeUnopenable(kRegistry);
    EXPECT_EQ(Register("a", {}), 0);
    EXPECT_EQ(platform.Calls(), Sequence({{kLock}, kLoaded, {kUnlock}}));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err("regconf.cpp", " Open /usr/vorn/etc/vornovs/ovs_reg.conf fails"),
                            Err(kFile, "Failed to load the ovs config")));
}

TEST(Register, FailsWhenTheNameCannotBeRecorded)
{
    RecordingPlatform platform;
    MakeUnopenable(kRegistry);
    platform.Answer("VLIBCFileExist", 0);
    EXPECT_EQ(Register("a", {}), -1);
    EXPECT_EQ(platform.Calls(), Sequence({{kLock}, kLoaded, kSaved, {kUnlock}}));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err("regconf.cpp", " Open /usr/vorn/etc/vornovs/ovs_reg.conf fails"),
                            Err(kFile, "Failed to register the name a")));
}

TEST(Register, ConvertsWithoutAStateFolder)
{
    const RecordingPlatform platform;
    std::filesystem::remove_all("/usr/vorn/etc");
    EXPECT_EQ(Register("a", {}), 0);
    EXPECT_THAT(platform.Calls(), Contains("ExecHook net net/ovs_change 5 ACTION=create"));
}

TEST(Register, TakesTheNameBackWhenTheConversionFails)
{
    RecordingPlatform platform;
    platform.Answer("VLIBNetGetInterfaceInfo", -1);
    EXPECT_EQ(Register("a", {}), 0);
    EXPECT_EQ(platform.Calls(),
              Sequence({{kLock},
                        kLoaded,
                        kSaved,
                        {"ExecHook net net/ovs_change 4 ACTION=create", "VLIBNetGetInterfaceInfo"},
                        kSaved,
                        {kUnlock}}));
    EXPECT_THAT(platform.Log(), ElementsAre(Err("ovsmanager.cpp", "Get interface info fail."),
                                            Err("ovsmanager.cpp", "Failed to get all interface"),
                                            Err(kFile, "Failed to CreateAll")));
    EXPECT_EQ(ReadFile(kRegistry), std::nullopt);
}

TEST(Register, TakesTheNameBackWithoutMemoryForTheHook)
{
    RecordingPlatform platform;
    platform.Answer("BaseHook", 0);
    EXPECT_EQ(Register("a", {}), 0);
    EXPECT_EQ(platform.Calls(), Sequence({{kLock}, kLoaded, kSaved, kSaved, {kUnlock}}));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to CreateAll")));
    EXPECT_EQ(ReadFile(kRegistry), std::nullopt);
}

TEST(Register, ConvertsAgainAfterAConversionThatFailed)
{
    RecordingPlatform platform;
    platform.AnswerNth("VLIBNetGetInterfaceInfo", 1, -1);
    EXPECT_EQ(Register("a", {}), 0);
    platform.Forget();
    EXPECT_EQ(Register("a", {}), 0);
    EXPECT_EQ(platform.Calls(), Sequence({{kLock}, kLoaded, kSaved, kConverted, {kUnlock}}));
}

TEST(Register, PrimesTheBondModesInTheOrderOfTheBonds)
{
    RecordingPlatform platform;
    platform.Bond("bond0", 1, {"eth1", "eth2"});
    EXPECT_EQ(Register("a", {{"bond1", "802.3ad"}, {"bond0", "ovs-balance-tcp"}}), 0);
    const Calls begin =
        Sequence({{kLock},
                  kLoaded,
                  kSaved,
                  {"VORNNetLinkAggrGet bond0", "VORNNetLinkAggrStringToMode ovs-balance-tcp",
                   "VORNNetLinkAggrGet bond1", "VORNNetLinkAggrStringToMode 802.3ad",
                   "ExecHook net net/ovs_change 4 ACTION=create"}});
    ASSERT_GE(platform.Calls().size(), begin.size());
    EXPECT_EQ(Calls(platform.Calls().begin(),
                    platform.Calls().begin() + static_cast<std::ptrdiff_t>(begin.size())),
              begin);
}

TEST(Register, IgnoresTheBondModesOfANameThatIsThere)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "a\n");
    EXPECT_EQ(Register("a", {{"bond0", "802.3ad"}}), 1);
    EXPECT_EQ(platform.Calls(), Sequence({{kLock}, kLoaded, {kUnlock}}));
}

TEST(Register, CountsTheEmptyNameOfAnEmptyLineAsAClient)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "\n");
    EXPECT_EQ(Register("a", {}), 0);
    EXPECT_EQ(platform.Calls(), Sequence({{kLock}, kLoaded, kSaved, {kUnlock}}));
    EXPECT_EQ(ReadFile(kRegistry), "\na\n");
}

TEST(Register, StandsNamesOf5000Characters)
{
    const RecordingPlatform platform;
    EXPECT_EQ(Register(LongName(), {}), 0);
    EXPECT_EQ(ReadFile(kRegistry), LongName() + "\n");
    EXPECT_EQ(Register(LongName(), {}), 1);
}

TEST(Register, ForgetsTheNameWhenABondThatItNamesCannotBeBuilt)
{
    for (const std::string& bond : {std::string("bond9"), LongName()}) {
        const RecordingPlatform platform;
        EXPECT_EQ(Register("a", {{bond, LongName()}}), 0);
        EXPECT_EQ(ReadFile(kRegistry), std::nullopt);
        EXPECT_EQ(platform.Log().back(), Err(kFile, "Failed to CreateAll"));
    }
}

TEST(Register, NamesALongNameThatCannotBeRecordedWhole)
{
    RecordingPlatform platform;
    MakeUnopenable(kRegistry);
    platform.Answer("VLIBCFileExist", 0);
    EXPECT_EQ(Register(LongName(), {}), -1);
    EXPECT_EQ(platform.Log().back(), Err(kFile, "Failed to register the name " + LongName()));
}

} // namespace
