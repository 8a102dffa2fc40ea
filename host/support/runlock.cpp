#include "runlock.h"

#include <algorithm>
#include <cerrno>
#include <thread>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>

namespace vornhost {
namespace {

using Clock = std::chrono::steady_clock;

/** flock() has no limit of its own to wait by, so the lock is asked for this often. */
constexpr std::chrono::milliseconds kPause{10};

/** @return the folder, if it is what we made of it or better. */
Descriptor OpenRunFolder()
{
    if (::mkdir(kRunFolder, 0700) != 0 && errno != EEXIST) {
        return {};
    }
    Descriptor folder(::open(kRunFolder, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
    struct stat status {};
    if (!folder || ::fstat(folder.Get(), &status) != 0) {
        return {};
    }
    if (status.st_uid != ::geteuid() || (status.st_mode & (S_IWGRP | S_IWOTH)) != 0) {
        errno = EPERM;
        return {};
    }
    return folder;
}

} // namespace

LockDeadline LockDeadlineIn(int seconds)
{
    return Clock::now() + std::chrono::seconds(std::max(seconds, 0));
}

bool WaitForLock(int file, LockDeadline deadline)
{
    while (::flock(file, LOCK_EX | LOCK_NB) != 0) {
        if (errno == EINTR) {
            continue;
        }
        const auto left = deadline - Clock::now();
        if (errno != EWOULDBLOCK || left <= Clock::duration::zero()) {
            return false;
        }
        std::this_thread::sleep_for(std::min<Clock::duration>(left, kPause));
    }
    return true;
}

bool IsSameFile(int folder, const std::string& path, int file)
{
    struct stat named {};
    struct stat opened {};
    return ::fstatat(folder, path.c_str(), &named, AT_SYMLINK_NOFOLLOW) == 0 &&
           ::fstat(file, &opened) == 0 && named.st_dev == opened.st_dev &&
           named.st_ino == opened.st_ino;
}

Descriptor TakeRunLock(const std::string& name, LockDeadline deadline)
{
    for (;;) {
        const Descriptor folder = OpenRunFolder();
        if (!folder) {
            return {};
        }
        Descriptor file = AboveStandard(
            Descriptor(::openat(folder.Get(), name.c_str(),
                                O_RDWR | O_CREAT | O_NOFOLLOW | O_CLOEXEC | O_NOCTTY, 0600)));
        if (!file || !WaitForLock(file.Get(), deadline)) {
            return {};
        }
        // An administrator may have emptied the folder while we waited.
        if (IsSameFile(AT_FDCWD, std::string(kRunFolder) + "/" + name, file.Get())) {
            return file;
        }
    }
}

} // namespace vornhost
