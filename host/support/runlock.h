/**
 * Locks on files, and the files below /run that only root can reach.
 */
#ifndef VORNHOST_SUPPORT_RUNLOCK_H
#define VORNHOST_SUPPORT_RUNLOCK_H

#include "descriptor.h"

#include <chrono>
#include <string>

namespace vornhost {

/** The host's own state until the next boot. */
constexpr char kRunFolder[] = "/run/vornovs";

using LockDeadline = std::chrono::steady_clock::time_point;

/** @return the moment so many seconds from now; what is below 0 is 0. */
LockDeadline LockDeadlineIn(int seconds);

/** Waits for an exclusive lock on an open file. @return false: not had in time, or failed. */
bool WaitForLock(int file, LockDeadline deadline);

/** @return whether the path is the open file: it may have been removed and made anew. */
bool IsSameFile(int folder, const std::string& path, int file);

/**
 * Takes the lock of that name in kRunFolder. Nobody but root can open its file, so nobody else can
 * hold it, and no cleaner of temporary files comes there.
 * @return the locked file; none: not had in time, or failed.
 */
Descriptor TakeRunLock(const std::string& name, LockDeadline deadline);

} // namespace vornhost

#endif
