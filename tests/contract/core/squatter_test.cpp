/**
 * Whatever stands at the lock file's path, put there on purpose or not, the host goes on.
 */
#include "scene.h"

#include "sandbox/systemlog.h"

#include <chrono>
#include <functional>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>
#include <vornplatform/core.h>

namespace {

using namespace std::chrono_literals;
using scene::IsLockFree;
using scene::kLockPath;
using scene::WriteFile;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

struct Squatter {
    const char* name;
    std::function<void()> put;
    bool stays; /**< it cannot be removed without doing harm */
};

void PutFile(mode_t mode)
{
    WriteFile(kLockPath, "squatter");
    ASSERT_EQ(::chmod(kLockPath, mode), 0);
}

class LockPath : public testing::TestWithParam<Squatter> {
protected:
    void SetUp() override
    {
        ::unlink(kLockPath);
        ::rmdir(kLockPath);
        WriteFile("/tmp/precious", "precious");
        GetParam().put();
    }
    void TearDown() override
    {
        ::unlink((std::string(kLockPath) + "/file").c_str());
        ::rmdir(kLockPath);
        ::unlink("/tmp/other-name");
    }
};

TEST_P(LockPath, DoesNotKeepTheLockFromBeingTaken)
{
    harness::SystemLog log;
    int handle = -1;
    ASSERT_EQ(VLIBCFileLockTimeByFile(kLockPath, 1, 5, &handle), 0);

    EXPECT_FALSE(IsLockFree());
    struct stat status {};
    EXPECT_EQ(::lstat(kLockPath, &status), 0);
    if (!GetParam().stays) {
        EXPECT_EQ(status.st_mode, static_cast<mode_t>(S_IFREG | 0600));
        EXPECT_EQ(status.st_uid, 0U);
        EXPECT_EQ(status.st_nlink, 1U);
        EXPECT_THAT(log.Lines(), ElementsAre(HasSubstr("4 /tmp/ovs_config.lock is not our lock")));
    } else {
        EXPECT_THAT(log.Lines(), testing::Contains(HasSubstr("cannot be locked")));
    }
    EXPECT_EQ(scene::ReadFile("/tmp/precious"), "precious");
    EXPECT_EQ(::stat("/tmp/precious", &status), 0);
    EXPECT_EQ(status.st_mode & 07777, 0644U);

    EXPECT_EQ(VLIBCFileUnlockByFile(handle), 0);
    EXPECT_TRUE(IsLockFree());
}

INSTANTIATE_TEST_SUITE_P(
    TakenBy, LockPath,
    testing::Values(Squatter{"AFileThatAnyoneCanOpen", [] { PutFile(0666); }, false},
                    Squatter{"AFileThatAGroupCanRead", [] { PutFile(0640); }, false},
                    Squatter{"ALinkToAFile",
                             [] { ASSERT_EQ(::symlink("/tmp/precious", kLockPath), 0); }, false},
                    Squatter{"ALinkToNothing",
                             [] { ASSERT_EQ(::symlink("/tmp/made-by-lock", kLockPath), 0); },
                             false},
                    Squatter{"AnotherNameOfAFile",
                             [] { ASSERT_EQ(::link("/tmp/precious", kLockPath), 0); }, false},
                    Squatter{"AnotherNameOfALockFile",
                             [] {
                                 PutFile(0600);
                                 ASSERT_EQ(::link(kLockPath, "/tmp/other-name"), 0);
                             },
                             false},
                    Squatter{"AFifo", [] { ASSERT_EQ(::mkfifo(kLockPath, 0600), 0); }, false},
                    Squatter{"AFolder", [] { ASSERT_EQ(::mkdir(kLockPath, 0777), 0); }, false},
                    Squatter{"AFolderWithSomethingInIt",
                             [] {
                                 ASSERT_EQ(::mkdir(kLockPath, 0777), 0);
                                 WriteFile(std::string(kLockPath) + "/file", "");
                             },
                             true}),
    [](const auto& row) { return row.param.name; });

TEST(LockFile, OfAnotherUserIsReplaced)
{
    ::unlink(kLockPath);
    PutFile(0600);
    if (::chown(kLockPath, 65534, 65534) != 0) {
        GTEST_SKIP() << "only root can give a file to another user; run the tests as root";
    }
    harness::SystemLog log;
    int handle = -1;
    ASSERT_EQ(VLIBCFileLockTimeByFile(kLockPath, 1, 5, &handle), 0);
    struct stat status {};
    EXPECT_EQ(::lstat(kLockPath, &status), 0);
    EXPECT_EQ(status.st_uid, 0U);
    EXPECT_THAT(log.Lines(), ElementsAre("4 /tmp/ovs_config.lock is not our lock file (owner "
                                         "65534, mode 100600): removing it"));
    EXPECT_EQ(VLIBCFileUnlockByFile(handle), 0);
}

TEST(LockFile, LockedForEverByAStrangerIsReplaced)
{
    ::unlink(kLockPath);
    PutFile(0644);
    const int stranger = ::open(kLockPath, O_RDONLY | O_CLOEXEC);
    ASSERT_EQ(::flock(stranger, LOCK_EX), 0);
    int handle = -1;
    EXPECT_EQ(VLIBCFileLockTimeByFile(kLockPath, 1, 0, &handle), 0);
    EXPECT_EQ(VLIBCFileUnlockByFile(handle), 0);
    ::close(stranger);
}

TEST(LockFile, OfOursIsUsedAgainInSilence)
{
    ::unlink(kLockPath);
    int handle = -1;
    ASSERT_EQ(VLIBCFileLockTimeByFile(kLockPath, 1, 0, &handle), 0);
    ASSERT_EQ(VLIBCFileUnlockByFile(handle), 0);
    struct stat before {};
    ASSERT_EQ(::stat(kLockPath, &before), 0);
    harness::SystemLog log;
    ASSERT_EQ(VLIBCFileLockTimeByFile(kLockPath, 1, 0, &handle), 0);
    ASSERT_EQ(VLIBCFileUnlockByFile(handle), 0);
    struct stat after {};
    ASSERT_EQ(::stat(kLockPath, &after), 0);
    EXPECT_EQ(before.st_ino, after.st_ino);
    EXPECT_THAT(log.Lines(), IsEmpty());
}

TEST(LockFile, IsNeverRemovedFromAFolderThatIsOurs)
{
    scene::MakeFolder("/etc/sysconfig/own");
    WriteFile("/etc/sysconfig/own/file", "settings");
    int handle = -1;
    ASSERT_EQ(VLIBCFileLockTimeByFile("/etc/sysconfig/own/file", 1, 0, &handle), 0);
    EXPECT_EQ(scene::ReadFile("/etc/sysconfig/own/file"), "settings");
    EXPECT_EQ(VLIBCFileUnlockByFile(handle), 0);
}

TEST(LockFile, IsNotNeededForTheLock)
{
    int handle = -1;
    ASSERT_EQ(VLIBCFileLockTimeByFile("/tmp/missing-folder/x.lock", 1, 0, &handle), 0);
    int second = -1;
    EXPECT_LT(VLIBCFileLockTimeByFile("/tmp/missing-folder/x.lock", 1, 0, &second), 0);
    EXPECT_EQ(VLIBCFileUnlockByFile(handle), 0);
}

} // namespace
