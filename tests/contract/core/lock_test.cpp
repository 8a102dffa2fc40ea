#include "scene.h"

#include <atomic>
#include <chrono>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>
#include <vornplatform/core.h>

#include "core/error.h"

namespace {

using namespace std::chrono_literals;
using scene::Child;
using scene::Exists;
using scene::IsLockFree;
using scene::kLockPath;
using scene::Within;
using scene::WriteFile;

constexpr int kLockWord = 0x806;
constexpr int kUnlockWord = 0x800;

int Lock(int seconds, int* handle)
{
    return VLIBCFileLockTimeByFile(kLockPath, 1, seconds, handle);
}

TEST(FileLock, IsTakenAndReleased)
{
    int handle = -1;
    ASSERT_EQ(Lock(5, &handle), 0);
    EXPECT_GE(handle, 0);
    EXPECT_FALSE(IsLockFree());
    EXPECT_EQ(VLIBCFileUnlockByFile(handle), 0);
    EXPECT_TRUE(IsLockFree());
}

TEST(FileLock, LeavesTheHandleAloneWhenItIsNotTaken)
{
    int first = -1;
    ASSERT_EQ(Lock(0, &first), 0);
    int second = -1;
    EXPECT_LT(Lock(0, &second), 0);
    EXPECT_EQ(second, -1);
    EXPECT_EQ(VLIBCFileUnlockByFile(first), 0);
}

TEST(FileLock, IsWaitedForAsLongAsSaid)
{
    int handle = -1;
    ASSERT_EQ(Lock(0, &handle), 0);
    const auto begin = std::chrono::steady_clock::now();
    int second = -1;
    EXPECT_LT(Lock(1, &second), 0);
    const auto waited = std::chrono::steady_clock::now() - begin;
    EXPECT_GE(waited, 1s);
    EXPECT_LT(waited, 3s);
    EXPECT_EQ(VLIBCFileUnlockByFile(handle), 0);
}

TEST(FileLock, IsHadWhenItBecomesFreeInTime)
{
    (void)::unlink("/tmp/held");
    Child owner([] {
        int handle = -1;
        const int result = Lock(0, &handle);
        WriteFile("/tmp/held", "");
        std::this_thread::sleep_for(200ms);
        return result;
    });
    ASSERT_TRUE(Within(10s, [] { return Exists("/tmp/held"); }));
    int handle = -1;
    EXPECT_EQ(Lock(10, &handle), 0);
    EXPECT_EQ(VLIBCFileUnlockByFile(handle), 0);
}

TEST(FileLock, IsFreeAgainWhenItsOwnerIsKilled)
{
    (void)::unlink("/tmp/held");
    Child owner([] {
        int handle = -1;
        (void)Lock(0, &handle);
        WriteFile("/tmp/held", "");
        std::this_thread::sleep_for(60s);
        return 0;
    });
    ASSERT_TRUE(Within(10s, [] { return Exists("/tmp/held"); }));
    EXPECT_FALSE(IsLockFree());
    owner.Kill();
    (void)owner.Wait();
    EXPECT_TRUE(IsLockFree());
}

TEST(FileLock, KeepsThreadsApart)
{
    std::atomic<int> inside{0};
    std::atomic<int> together{0};
    std::atomic<int> taken{0};
    std::vector<std::thread> threads;
    threads.reserve(8);
    for (int index = 0; index < 8; ++index) {
        threads.emplace_back([&] {
            for (int round = 0; round < 4; ++round) {
                int handle = -1;
                if (Lock(30, &handle) != 0) {
                    continue;
                }
                together += ++inside > 1 ? 1 : 0;
                std::this_thread::sleep_for(2ms);
                --inside;
                ++taken;
                (void)VLIBCFileUnlockByFile(handle);
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(together, 0);
    EXPECT_EQ(taken, 32);
}

TEST(FileLock, IsHonouredByWhoeverLocksTheFile)
{
    int handle = -1;
    ASSERT_EQ(Lock(0, &handle), 0);
    const int file = ::open(kLockPath, O_RDWR | O_CLOEXEC);
    ASSERT_GE(file, 0);
    EXPECT_EQ(::flock(file, LOCK_EX | LOCK_NB), -1);
    EXPECT_EQ(VLIBCFileUnlockByFile(handle), 0);
    EXPECT_EQ(::flock(file, LOCK_EX | LOCK_NB), 0);
    EXPECT_FALSE(IsLockFree());
    ::close(file);
}

TEST(FileLock, HasAFileThatNobodyElseCanOpen)
{
    const mode_t mask = ::umask(0);
    ::unlink(kLockPath);
    int handle = -1;
    ASSERT_EQ(Lock(0, &handle), 0);
    struct stat status {};
    ASSERT_EQ(::lstat(kLockPath, &status), 0);
    EXPECT_EQ(status.st_mode, static_cast<mode_t>(S_IFREG | 0600));
    ASSERT_EQ(::lstat("/run/vornovs", &status), 0);
    EXPECT_EQ(status.st_mode, static_cast<mode_t>(S_IFDIR | 0700));
    EXPECT_EQ(VLIBCFileUnlockByFile(handle), 0);
    ::umask(mask);
}

TEST(FileLock, StaysHeldWhenACleanerRemovesTheFile)
{
    int handle = -1;
    ASSERT_EQ(Lock(0, &handle), 0);
    ASSERT_EQ(::unlink(kLockPath), 0);
    EXPECT_FALSE(IsLockFree());
    EXPECT_EQ(VLIBCFileUnlockByFile(handle), 0);
    EXPECT_TRUE(IsLockFree());
}

TEST(FileLock, IsOnTheFileThatBearsTheNameWhenItWasRemovedMeanwhile)
{
    // Somebody who only knows the file holds it, and removes it before he lets go of it.
    ::unlink(kLockPath);
    const int old = ::open(kLockPath, O_RDWR | O_CREAT | O_CLOEXEC, 0600);
    ASSERT_EQ(::flock(old, LOCK_EX | LOCK_NB), 0);
    std::thread cleaner([&] {
        std::this_thread::sleep_for(200ms);
        ::unlink(kLockPath);
        ::close(old);
    });
    int handle = -1;
    EXPECT_EQ(Lock(10, &handle), 0);
    cleaner.join();
    const int named = ::open(kLockPath, O_RDWR | O_CLOEXEC);
    ASSERT_GE(named, 0);
    EXPECT_EQ(::flock(named, LOCK_EX | LOCK_NB), -1) << "the file of that name is locked";
    ::close(named);
    EXPECT_EQ(VLIBCFileUnlockByFile(handle), 0);
}

TEST(FileLock, SurvivesThatTheRunFolderIsEmptied)
{
    int handle = -1;
    ASSERT_EQ(Lock(0, &handle), 0);
    ASSERT_EQ(VLIBCFileUnlockByFile(handle), 0);
    for (const std::string& name : scene::Names("/run/vornovs")) {
        ASSERT_EQ(::unlink(("/run/vornovs/" + name).c_str()), 0);
    }
    ASSERT_EQ(::rmdir("/run/vornovs"), 0);
    ASSERT_EQ(Lock(0, &handle), 0);
    EXPECT_FALSE(IsLockFree());
    EXPECT_EQ(VLIBCFileUnlockByFile(handle), 0);
}

TEST(FileLock, KeepsOthersOutAfterTheRunFolderWasEmptiedWhileItWasWaitedFor)
{
    int first = -1;
    ASSERT_EQ(Lock(0, &first), 0);
    std::thread administrator([&] {
        std::this_thread::sleep_for(100ms);
        for (const std::string& name : scene::Names("/run/vornovs")) {
            ::unlink(("/run/vornovs/" + name).c_str());
        }
        // Nobody is kept out by the client's file alone.
        ::unlink(kLockPath);
        (void)VLIBCFileUnlockByFile(first);
    });
    int handle = -1;
    EXPECT_EQ(Lock(10, &handle), 0);
    administrator.join();
    ::unlink(kLockPath);
    EXPECT_FALSE(IsLockFree());
    EXPECT_EQ(VLIBCFileUnlockByFile(handle), 0);
}

TEST(FileLock, IsNotReleasedTwiceNorUnderAStrangeHandle)
{
    int handle = -1;
    ASSERT_EQ(Lock(0, &handle), 0);
    EXPECT_LT(VLIBCFileUnlockByFile(-1), 0);
    EXPECT_LT(VLIBCFileUnlockByFile(handle + 1), 0);
    EXPECT_FALSE(IsLockFree());
    EXPECT_EQ(VLIBCFileUnlockByFile(handle), 0);
    EXPECT_LT(VLIBCFileUnlockByFile(handle), 0);
}

TEST(FileLock, IsRefusedForArgumentsThatMakeNoSense)
{
    int handle = -1;
    EXPECT_LT(VLIBCFileLockTimeByFile(nullptr, 1, 0, &handle), 0);
    EXPECT_LT(VLIBCFileLockTimeByFile("ovs_config.lock", 1, 0, &handle), 0);
    EXPECT_LT(VLIBCFileLockTimeByFile(kLockPath, 3, 0, &handle), 0);
    EXPECT_LT(VLIBCFileLockTimeByFile(kLockPath, 1, 0, nullptr), 0);
    EXPECT_EQ(handle, -1);
}

TEST(FileLock, DoesNotOutliveAnExecByTheClient)
{
    (void)::unlink("/tmp/held");
    Child owner([] {
        int handle = -1;
        (void)Lock(0, &handle);
        WriteFile("/tmp/held", "");
        ::execl("/bin/sleep", "sleep", "60", nullptr);
        return 1;
    });
    ASSERT_TRUE(Within(10s, [] { return Exists("/tmp/held"); }));
    EXPECT_TRUE(Within(2s, IsLockFree));
}

TEST(PlatformLock, ShutsOutOthersUntilItIsReleasedWithTheOtherWord)
{
    ASSERT_EQ(VLIBCFileLock(kLockWord, 5), 0);
    EXPECT_EQ(scene::ResultOf([] { return VLIBCFileLock(kLockWord, 0) == -1 ? 0 : 1; }), 0);
    EXPECT_EQ(VLIBCFileLock(kLockWord, 0), -1) << "other threads of the process too";
    EXPECT_EQ(VLIBCFileUnlock(kUnlockWord), 0);
    EXPECT_EQ(scene::ResultOf([] { return VLIBCFileLock(kLockWord, 0) == 0 ? 0 : 1; }), 0);
    EXPECT_EQ(VLIBCFileLock(kLockWord, 0), 0) << "its owner has ended";
    EXPECT_EQ(VLIBCFileUnlock(kUnlockWord), 0);
}

TEST(PlatformLock, IsNotReleasedWhenItIsNotHeld)
{
    EXPECT_EQ(VLIBCFileUnlock(kUnlockWord), -1);
    EXPECT_EQ(VLIBCFileUnlock(0), -1);
    EXPECT_EQ(VLIBCFileLock(0x6, 0), -1) << "a word that names no lock";
}

TEST(PlatformLock, IsAnotherThanTheLockOnAFile)
{
    int handle = -1;
    ASSERT_EQ(Lock(0, &handle), 0);
    EXPECT_EQ(VLIBCFileLock(kLockWord, 0), 0);
    EXPECT_EQ(VLIBCFileUnlock(kUnlockWord), 0);
    EXPECT_FALSE(IsLockFree());
    EXPECT_EQ(VLIBCFileUnlockByFile(handle), 0);
}

TEST(LastError, IsEachThreadsOwn)
{
    VLIBCErrSetEx(0x400, "vlanmanager.cpp", 12);
    std::thread([] {
        EXPECT_EQ(VLIBCErrGetEx(nullptr, nullptr), 0);
        VLIBCErrSetEx(0x500, nullptr, 1);
    }).join();
    const char* file = nullptr;
    int line = 0;
    EXPECT_EQ(VLIBCErrGetEx(&file, &line), 0x400);
    EXPECT_STREQ(file, "vlanmanager.cpp");
    EXPECT_EQ(line, 12);
}

TEST(LastError, CutsANameThatIsTooLong)
{
    VLIBCErrSetEx(1, std::string(5000, 'x').c_str(), 1);
    const char* file = nullptr;
    EXPECT_EQ(VLIBCErrGetEx(&file, nullptr), 1);
    EXPECT_EQ(file, std::string(255, 'x'));
}

} // namespace
