#include "core/contractfile.h"
#include "core/guard.h"
#include "core/heldlocks.h"
#include "support/runlock.h"

#include <algorithm>
#include <string>

#include <vornplatform/core.h>

namespace {

using vornhost::ContractLock;
using vornhost::Descriptor;
using vornhost::Guarded;
using vornhost::HeldLock;
using vornhost::LockDeadline;

constexpr int kExclusive = 1;
/** Of a lock word, the bits that say which lock; the rest says how it is taken. */
constexpr int kLockClassBits = 0x800;

/** The name below /run of the lock on a file. */
std::string RunLockName(std::string path)
{
    std::replace(path.begin(), path.end(), '/', '!');
    return "file" + path;
}

int LockFile(const std::string& path, LockDeadline deadline)
{
    // The one below /run is what keeps two clients of this library apart. The client's file is for
    // whoever knows nothing but its path, so it is not worth failing when it cannot be had.
    Descriptor runLock = vornhost::TakeRunLock(RunLockName(path), deadline);
    if (!runLock) {
        return -1;
    }
    ContractLock contractLock = vornhost::LockContractFile(path, deadline);
    if (contractLock.outcome == ContractLock::Outcome::kHeld) {
        return -1;
    }

    HeldLock lock;
    lock.files.push_back(std::move(runLock));
    if (contractLock.file) {
        lock.files.push_back(std::move(contractLock.file));
    }
    return vornhost::AddHeldLock(std::move(lock));
}

} // namespace

int VLIBCFileLockTimeByFile(const char* path, int mode, int seconds, int* handle)
{
    if (path == nullptr || path[0] != '/' || mode != kExclusive || handle == nullptr) {
        return -1;
    }
    const int result =
        Guarded(-1, [&] { return LockFile(path, vornhost::LockDeadlineIn(seconds)); });
    if (result < 0) {
        return -1;
    }
    *handle = result;
    return 0;
}

int VLIBCFileUnlockByFile(int handle)
{
    return Guarded(-1, [&] { return vornhost::ReleaseHeldLock(handle) ? 0 : -1; });
}

int VLIBCFileLock(int lockWord, int seconds)
{
    const int lockClass = lockWord & kLockClassBits;
    if (lockClass == 0) {
        return -1;
    }
    return Guarded(-1, [&] {
        Descriptor file = vornhost::TakeRunLock("configuration", vornhost::LockDeadlineIn(seconds));
        if (!file) {
            return -1;
        }
        HeldLock lock;
        lock.lockClass = lockClass;
        lock.files.push_back(std::move(file));
        (void)vornhost::AddHeldLock(std::move(lock));
        return 0;
    });
}

int VLIBCFileUnlock(int lockWord)
{
    const int lockClass = lockWord & kLockClassBits;
    return Guarded(
        -1, [&] { return lockClass != 0 && vornhost::ReleaseHeldLockOfClass(lockClass) ? 0 : -1; });
}
