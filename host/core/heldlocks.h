/**
 * The locks that this process holds.
 */
#ifndef VORNHOST_CORE_HELDLOCKS_H
#define VORNHOST_CORE_HELDLOCKS_H

#include "support/descriptor.h"

#include <vector>

namespace vornhost {

/** A lock: every file on which flock() was called for it. */
struct HeldLock {
    int lockClass = 0; /**< of the platform's file locks; 0 for the lock on a file */
    std::vector<Descriptor> files;
};

/**
 * Notes a lock down. In a child that the process forks, which has not asked for the lock, it is
 * closed: a lock ends with its owner.
 * @return its handle, at least 0.
 */
int AddHeldLock(HeldLock lock);

/** Releases the lock of that handle. @return whether there was one. */
bool ReleaseHeldLock(int handle);

/** Releases a lock of that class, whose number is not 0. @return whether there was one. */
bool ReleaseHeldLockOfClass(int lockClass);

/** New descriptors of all that is held. A lock stays held until they are closed or it is released.
 */
std::vector<Descriptor> DuplicateHeldLocks();

} // namespace vornhost

#endif
