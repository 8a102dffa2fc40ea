// Locks and errors.
#include "recordingplatform/recorder.h"

#include <vornplatform/core.h>

#include <gtest/gtest.h>

#include <chrono>

#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

using harness::CallText;
using harness::Expect;
using harness::HarnessAllocations;
using harness::PlatformCall;
using harness::Recorder;
using harness::Text;

namespace {

/** No number that another handle has, so that a mix-up shows. */
constexpr int kLockHandle = 7311;

constexpr char kPlatformLock[] = "/tmp/platform.lock";
constexpr std::chrono::milliseconds kBetweenTries{1};

int AskForLock(const char* path, int mode, int seconds, int handle)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCFileLockTimeByFile");
    const std::vector<std::string> words{Text("VLIBCFileLockTimeByFile", path),
                                         std::to_string(mode), std::to_string(seconds)};
    const int result = recorder.Call(CallText("VLIBCFileLockTimeByFile", words)).value_or(0);
    Expect("VLIBCFileLockTimeByFile", "handle before the call", handle, -1);
    if (recorder.m_platformLockHolder == std::this_thread::get_id()) {
        ADD_FAILURE() << "the lock file was asked for after the platform's file lock";
    }
    return result;
}

/** @return a descriptor that holds the lock; -1: others had it all the time, or no lock is real. */
int TakeReal(const char* path, int seconds)
{
    {
        const PlatformCall guard;
        if (!Recorder::Current("flock").m_takesRealLocks) {
            return -1;
        }
    }
    const HarnessAllocations notTheLibrarys;
    const int descriptor = open(path, O_RDWR | O_CREAT | O_CLOEXEC, 0600);
    const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(seconds);
    while (flock(descriptor, LOCK_EX | LOCK_NB) != 0) {
        if (std::chrono::steady_clock::now() >= end) {
            (void)close(descriptor);
            return -1;
        }
        std::this_thread::sleep_for(kBetweenTries);
    }
    return descriptor;
}

} // namespace

int VLIBCFileLockTimeByFile(const char* path, int mode, int seconds, int* handle)
{
    int result = AskForLock(path, mode, seconds, *handle);
    // Outside of the platform, which whoever holds the lock needs to give it back.
    const int real = result < 0 ? -1 : TakeReal(path, seconds);
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCFileLockTimeByFile");
    if (result >= 0 && recorder.m_takesRealLocks && real < 0) {
        result = -1;
    }
    if (result >= 0) {
        Expect("VLIBCFileLockTimeByFile", "lock held already", recorder.m_heldLock, -1);
    }
    const int given = real < 0 ? kLockHandle : real;
    *handle = recorder.m_lockHandle.value_or(result < 0 ? -1 : given);
    if (*handle != -1) {
        recorder.m_heldLock = *handle;
    }
    return result;
}

int VLIBCFileUnlockByFile(int handle)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCFileUnlockByFile");
    const std::optional<int> answer = recorder.Call("VLIBCFileUnlockByFile");
    if (handle == -1) {
        ADD_FAILURE() << "VLIBCFileUnlockByFile was handed no handle";
    }
    Expect("VLIBCFileUnlockByFile", "handle", handle, recorder.m_heldLock);
    recorder.m_heldLock = -1;
    if (recorder.m_takesRealLocks) {
        (void)close(handle);
    }
    return answer.value_or(0);
}

int VLIBCFileLock(int lockWord, int seconds)
{
    const auto ask = [&] {
        const PlatformCall guard;
        return Recorder::Current("VLIBCFileLock")
            .Call(CallText("VLIBCFileLock", {std::to_string(lockWord), std::to_string(seconds)}))
            .value_or(0);
    };
    int result = ask();
    const int real = result == -1 ? -1 : TakeReal(kPlatformLock, seconds);
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCFileLock");
    if (recorder.m_takesRealLocks && real < 0) {
        result = -1;
    }
    if (result != -1) {
        if (recorder.m_platformLockHolder != std::thread::id()) {
            ADD_FAILURE() << "VLIBCFileLock: the lock is held already";
        }
        recorder.m_platformLockHolder = std::this_thread::get_id();
        recorder.m_realPlatformLock = real;
    }
    return result;
}

int VLIBCFileUnlock(int lockWord)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCFileUnlock");
    const std::optional<int> answer =
        recorder.Call(CallText("VLIBCFileUnlock", {std::to_string(lockWord)}));
    if (recorder.m_platformLockHolder != std::this_thread::get_id()) {
        ADD_FAILURE() << "VLIBCFileUnlock: the lock is not held";
    }
    recorder.m_platformLockHolder = std::thread::id();
    if (recorder.m_takesRealLocks) {
        (void)close(recorder.m_realPlatformLock);
    }
    return answer.value_or(0);
}

void VLIBCErrSetEx(int code, const char* file, int line)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCErrSetEx");
    (void)recorder.Call(
        CallText("VLIBCErrSetEx", {std::to_string(code), Text("VLIBCErrSetEx", file)}));
    EXPECT_GT(line, 0) << "VLIBCErrSetEx: line number";
}
