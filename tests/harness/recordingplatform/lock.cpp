// Locks and errors.
#include "recordingplatform/recorder.h"

#include <vornplatform/core.h>

#include <gtest/gtest.h>

using harness::CallText;
using harness::Expect;
using harness::HarnessAllocations;
using harness::Recorder;
using harness::Text;

namespace {

/** No number that another handle has, so that a mix-up shows. */
constexpr int kLockHandle = 7311;

} // namespace

int VLIBCFileLockTimeByFile(const char* path, int mode, int seconds, int* handle)
{
    const HarnessAllocations guard;
    Recorder& recorder = Recorder::Current("VLIBCFileLockTimeByFile");
    const int result = recorder
                           .Call(CallText("VLIBCFileLockTimeByFile",
                                          {Text("VLIBCFileLockTimeByFile", path),
                                           std::to_string(mode), std::to_string(seconds)}))
                           .value_or(0);
    Expect("VLIBCFileLockTimeByFile", "handle before the call", *handle, -1);
    Expect("VLIBCFileLockTimeByFile", "lock held already", recorder.m_heldLock, -1);
    if (recorder.m_holdsPlatformLock) {
        ADD_FAILURE() << "the lock file was asked for after the platform's file lock";
    }

    *handle = recorder.m_lockHandle.value_or(result < 0 ? -1 : kLockHandle);
    recorder.m_heldLock = *handle;
    return result;
}

int VLIBCFileUnlockByFile(int handle)
{
    const HarnessAllocations guard;
    Recorder& recorder = Recorder::Current("VLIBCFileUnlockByFile");
    const std::optional<int> answer = recorder.Call("VLIBCFileUnlockByFile");
    if (handle == -1) {
        ADD_FAILURE() << "VLIBCFileUnlockByFile was handed no handle";
    }
    Expect("VLIBCFileUnlockByFile", "handle", handle, recorder.m_heldLock);
    recorder.m_heldLock = -1;
    return answer.value_or(0);
}

int VLIBCFileLock(int lockWord, int seconds)
{
    const HarnessAllocations guard;
    Recorder& recorder = Recorder::Current("VLIBCFileLock");
    const int result =
        recorder
            .Call(CallText("VLIBCFileLock", {std::to_string(lockWord), std::to_string(seconds)}))
            .value_or(0);
    if (recorder.m_holdsPlatformLock) {
        ADD_FAILURE() << "VLIBCFileLock: the lock is held already";
    }
    recorder.m_holdsPlatformLock = result != -1;
    return result;
}

int VLIBCFileUnlock(int lockWord)
{
    const HarnessAllocations guard;
    Recorder& recorder = Recorder::Current("VLIBCFileUnlock");
    const std::optional<int> answer =
        recorder.Call(CallText("VLIBCFileUnlock", {std::to_string(lockWord)}));
    if (!recorder.m_holdsPlatformLock) {
        ADD_FAILURE() << "VLIBCFileUnlock: the lock is not held";
    }
    recorder.m_holdsPlatformLock = false;
    return answer.value_or(0);
}

void VLIBCErrSetEx(int code, const char* file, int line)
{
    const HarnessAllocations guard;
    Recorder& recorder = Recorder::Current("VLIBCErrSetEx");
    (void)recorder.Call(
        CallText("VLIBCErrSetEx", {std::to_string(code), Text("VLIBCErrSetEx", file)}));
    EXPECT_GT(line, 0) << "VLIBCErrSetEx: line number";
}
