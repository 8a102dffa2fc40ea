#include "core/heldlocks.h"

#include <algorithm>
#include <climits>
#include <map>
#include <mutex>
#include <new>

#include <fcntl.h>
#include <pthread.h>
#include <sys/file.h>

namespace vornhost {
namespace {

struct Registry {
    std::mutex mutex;
    std::map<int, HeldLock> locks;
    int nextHandle = 0;
};

/** Never destroyed: threads may still use it while the process exits. */
Registry& Locks()
{
    static auto* const registry = [] {
        auto* const made = new Registry;
        const int failure =
            ::pthread_atfork([] { Locks().mutex.lock(); }, [] { Locks().mutex.unlock(); },
                             [] {
                                 Locks().locks.clear();
                                 Locks().mutex.unlock();
                             });
        if (failure != 0) {
            throw std::bad_alloc();
        }
        return made;
    }();
    return *registry;
}

bool Release(std::map<int, HeldLock>::iterator lock)
{
    if (lock == Locks().locks.end()) {
        return false;
    }
    for (const Descriptor& file : lock->second.files) {
        // Explicitly, because a program that runs at the moment shares the lock.
        (void)::flock(file.Get(), LOCK_UN);
    }
    Locks().locks.erase(lock);
    return true;
}

} // namespace

int AddHeldLock(HeldLock lock)
{
    Registry& registry = Locks();
    const std::lock_guard<std::mutex> guard(registry.mutex);
    while (registry.locks.contains(registry.nextHandle)) {
        registry.nextHandle = registry.nextHandle == INT_MAX ? 0 : registry.nextHandle + 1;
    }
    const int handle = registry.nextHandle;
    registry.locks.emplace(handle, std::move(lock));
    registry.nextHandle = handle == INT_MAX ? 0 : handle + 1;
    return handle;
}

bool ReleaseHeldLock(int handle)
{
    Registry& registry = Locks();
    const std::lock_guard<std::mutex> guard(registry.mutex);
    const auto found = registry.locks.find(handle);
    const bool isFileLock = found != registry.locks.end() && found->second.lockClass == 0;
    return isFileLock && Release(found);
}

bool ReleaseHeldLockOfClass(int lockClass)
{
    Registry& registry = Locks();
    const std::lock_guard<std::mutex> guard(registry.mutex);
    return Release(
        std::find_if(registry.locks.begin(), registry.locks.end(),
                     [&](const auto& lock) { return lock.second.lockClass == lockClass; }));
}

std::vector<Descriptor> DuplicateHeldLocks()
{
    Registry& registry = Locks();
    const std::lock_guard<std::mutex> guard(registry.mutex);
    std::vector<Descriptor> duplicates;
    for (const auto& [handle, lock] : registry.locks) {
        for (const Descriptor& file : lock.files) {
            duplicates.emplace_back(::fcntl(file.Get(), F_DUPFD_CLOEXEC, 3));
            if (!duplicates.back()) {
                // Better no program than one that runs without the lock.
                throw std::bad_alloc();
            }
        }
    }
    return duplicates;
}

} // namespace vornhost
