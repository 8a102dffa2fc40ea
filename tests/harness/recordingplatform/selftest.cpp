#include "recordingplatform/recordingplatform.h"

#include <vornplatform/core.h>
#include <vornplatform/hook.h>
#include <vornplatform/netsdk.h>
#include <vornplatform/sdk.h>

#include <gmock/gmock.h>
#include <gtest/gtest-spi.h>
#include <gtest/gtest.h>

#include <array>

#include <syslog.h>
#include <unistd.h>

using harness::Err;
using harness::Info;
using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;

namespace {

TEST(RecordingPlatform, KeepsCallsInOrderWithTheirArguments)
{
    RecordingPlatform platform;
    EXPECT_EQ(VLIBCExec("/bin/cp", "-f", "a file", "", nullptr), 0);
    EXPECT_EQ(sleep(3), 0U);
    const std::array<const char*, 3> arguments{"/etc/rc.network", "start", nullptr};
    EXPECT_EQ(VLIBCExecv("/etc/rc.network", arguments.data(), 1), 0);
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBCExec /bin/cp -f 'a file' ''", "sleep 3",
                                              "VLIBCExecv /etc/rc.network start"));
}

TEST(RecordingPlatform, TakesTheLatestAnswerThatMatchesWholeWords)
{
    RecordingPlatform platform;
    platform.Answer("VLIBServiceStart", -1);
    platform.Answer("VLIBServiceStart vornovs-db", 7);
    EXPECT_EQ(VLIBServiceStart("vornovs-db", 0), 7);
    EXPECT_EQ(VLIBServiceStart("vornovs-dbx", 0), -1);
}

TEST(RecordingPlatform, AnswersTheNthCallOnly)
{
    RecordingPlatform platform;
    platform.AnswerNth("sleep 3", 2, 1);
    EXPECT_EQ(sleep(3), 0U);
    EXPECT_EQ(sleep(3), 1U);
    EXPECT_EQ(sleep(3), 0U);
}

TEST(RecordingPlatform, TakesLogLinesApart)
{
    RecordingPlatform platform;
    syslog(LOG_ERR, "%s:%d  Open %s fails", "regconf.cpp", 12, "/x");
    syslog(LOG_INFO, "%s:%d up", "util.cpp", 3);
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err("regconf.cpp", " Open /x fails"), Info("util.cpp", "up")));
}

TEST(RecordingPlatform, FailsTheTestOnALogLineWithoutFileAndLine)
{
    RecordingPlatform platform;
    EXPECT_NONFATAL_FAILURE(syslog(LOG_ERR, "%s:%dup", "util.cpp", 3), "the log format");
    EXPECT_NONFATAL_FAILURE(syslog(LOG_ERR, "%s:%d up", "util.cpp", 0), "the log line");
    EXPECT_NONFATAL_FAILURE(syslog(LOG_ERR, "%s:%d up", "", 3), "the log line");
}

TEST(RecordingPlatform, FailsTheTestOnAWrongConstant)
{
    RecordingPlatform platform;
    EXPECT_NONFATAL_FAILURE(VLIBCExecl("/etc/rc.network", 0xBA, nullptr), "option word");
    EXPECT_NONFATAL_FAILURE(VLIBCSzHashFree(VLIBCSzHashAlloc(512)), "size");
    EXPECT_NONFATAL_FAILURE(VLIBCSzListFree(VLIBCSzListAlloc(1024)), "size");
}

TEST(RecordingPlatform, FailsTheTestOnAHandleLeftOpen)
{
    const auto leakAHash = [] {
        const RecordingPlatform platform;
        (void)VLIBCSzHashAlloc(1024);
    };
    const auto leakAPipe = [] {
        const RecordingPlatform platform;
        (void)VLIBCPopen("/bin/true", "r", nullptr);
    };
    const auto leakALock = [] {
        const RecordingPlatform platform;
        int handle = -1;
        (void)VLIBCFileLockTimeByFile("/tmp/lock", 1, 5, &handle);
    };
    const auto leakThePlatformsLock = [] {
        const RecordingPlatform platform;
        (void)VLIBCFileLock(2054, 5);
    };
    EXPECT_NONFATAL_FAILURE(leakAHash(), "left open: a hash");
    EXPECT_NONFATAL_FAILURE(leakAPipe(), "left open: pipe of /bin/true");
    EXPECT_NONFATAL_FAILURE(leakALock(), "left locked: the lock file");
    EXPECT_NONFATAL_FAILURE(leakThePlatformsLock(), "left locked: the platform's file lock");
}

TEST(RecordingPlatform, FailsTheTestOnADoubleRelease)
{
    const RecordingPlatform platform;
    VLIBCSzHash* const hash = VLIBCSzHashAlloc(1024);
    VLIBCSzHashFree(hash);
    EXPECT_NONFATAL_FAILURE(VLIBCSzHashFree(hash), "not open");
    EXPECT_NONFATAL_FAILURE(VLIBCFileUnlock(2048), "not held");
}

TEST(RecordingPlatform, FailsTheTestOnAWrongLockHandle)
{
    const RecordingPlatform platform;
    int handle = -1;
    EXPECT_EQ(VLIBCFileLockTimeByFile("/tmp/lock", 1, 5, &handle), 0);
    EXPECT_NONFATAL_FAILURE(VLIBCFileUnlockByFile(handle + 1), "handle");
}

TEST(RecordingPlatform, FailsTheTestOnALockHandleThatIsNotPreset)
{
    const RecordingPlatform platform;
    int handle = 0;
    EXPECT_NONFATAL_FAILURE(VLIBCFileLockTimeByFile("/tmp/lock", 1, 5, &handle), "before the call");
    (void)VLIBCFileUnlockByFile(handle);
}

TEST(RecordingPlatform, FailsTheTestOnAHandleFromBeforeAMove)
{
    const RecordingPlatform platform;
    VLIBCSzHash* hash = VLIBCSzHashAlloc(1024);
    VLIBCSzHash* const old = hash;
    EXPECT_EQ(VLIBCSzHashSetValue(&hash, "DEVICE", "eth0"), 0);
    EXPECT_NONFATAL_FAILURE(VLIBCFileSetKeys("/x", old, nullptr, "%s=%s\n"), "not open");
    VLIBCSzHashFree(hash);
}

TEST(RecordingPlatform, FailsTheTestOnARecordThatIsNotZeroed)
{
    RecordingPlatform platform;
    platform.Bond("bond0", 1, {"eth0"});
    VORNLINKAGGROPT bond{};
    bond.rgszSlave[31][15] = 'x';
    VORNNETIPCONFIG address{};
    address.platformData[17] = 1;
    EXPECT_NONFATAL_FAILURE(VORNNetLinkAggrGet("bond0", &bond), "not zeroed");
    EXPECT_NONFATAL_FAILURE(VORNNetIFGetIPConfig("eth0", &address), "not zeroed");
}

TEST(RecordingPlatform, ListsTheKeysThatAreWrittenAndDeleted)
{
    const RecordingPlatform platform;
    VLIBCSzHash* set = VLIBCSzHashAlloc(1024);
    VLIBCSzHash* remove = VLIBCSzHashAlloc(1024);
    (void)VLIBCSzHashSetValue(&set, "DEVICE", "eth0");
    (void)VLIBCSzHashSetValue(&set, "DEVICE", "eth1");
    (void)VLIBCSzHashSetValue(&remove, "TYPE", "");
    EXPECT_EQ(VLIBCFileSetKeys("/x", set, remove, "%s=%s\n"), 0);
    VLIBCSzHashFree(set);
    VLIBCSzHashFree(remove);
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBCFileSetKeys /x DEVICE=eth1 -TYPE"));
}

TEST(RecordingPlatform, HandsOutAProgramsOutputAndStatus)
{
    RecordingPlatform platform;
    platform.Output("VLIBCPopen /usr/bin/ovs-vsctl r list-br", "ovs_eth0\n", 256);
    FILE* const pipe = VLIBCPopen("/usr/bin/ovs-vsctl", "r", "list-br", nullptr);
    ASSERT_NE(pipe, nullptr);
    std::array<char, 64> line{};
    EXPECT_STREQ(std::fgets(line.data(), static_cast<int>(line.size()), pipe), "ovs_eth0\n");
    EXPECT_EQ(std::fgets(line.data(), static_cast<int>(line.size()), pipe), nullptr);
    EXPECT_EQ(VLIBCPclose(pipe), 256);
}

TEST(RecordingPlatform, SplitsAndTrimsTexts)
{
    const RecordingPlatform platform;
    VLIBCSzList* list = VLIBCSzListAlloc(512);
    (void)VLIBCStrSep("eth0 eth1", " ", &list);
    ASSERT_EQ(list->nItem, 2);
    EXPECT_STREQ(VLIBCSzListGet(list, 1), "eth1");
    EXPECT_EQ(VLIBCSzListGet(list, 2), nullptr);
    VLIBCSzListFree(list);
    std::array<char, 1024> trimmed{};
    EXPECT_EQ(VLIBCStrTrimSpace(" a b \n", trimmed.data()), 0);
    EXPECT_STREQ(trimmed.data(), "a b");
}

TEST(RecordingPlatform, GivesAHookItsEnvironment)
{
    RecordingPlatform platform;
    {
        vornnetsdk::hook::BaseHook hook("net", "net/ovs_change");
        (void)hook.SetEnv("ACTION", "create");
        (void)hook.ExecHook(SDK_PLUGIN_ACTION_DONE);
        EXPECT_THAT(platform.OpenHandles(), ElementsAre("a hook"));
    }
    EXPECT_THAT(platform.OpenHandles(), IsEmpty());
    EXPECT_THAT(platform.Calls(), ElementsAre("ExecHook net net/ovs_change 5 ACTION=create"));
}

TEST(RecordingPlatformDeathTest, EndsTheProgramOnAMissingEndOfTheArguments)
{
    using Exec = int (*)(const char*, ...);
    const Exec volatile exec = &VLIBCExec;
    const auto* const nowhere = reinterpret_cast<const char*>(1);
    const std::array<const char*, 2> endless{"/bin/cp", nowhere};
    EXPECT_DEATH(
        {
            const RecordingPlatform platform;
            (void)exec("/bin/cp", "-f", nowhere);
        },
        "no null pointer ends the arguments");
    EXPECT_DEATH(
        {
            const RecordingPlatform platform;
            (void)VLIBCExecv("/bin/cp", endless.data(), 1);
        },
        "no null pointer ends the arguments");
}

TEST(RecordingPlatformDeathTest, EndsTheProgramOnACallWithoutAPlatform)
{
    EXPECT_DEATH((void)VLIBCFileExist("/"), "no RecordingPlatform lives");
}

} // namespace
