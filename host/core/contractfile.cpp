#include "core/contractfile.h"

#include <cerrno>
#include <cstring>

#include <fcntl.h>
#include <sys/stat.h>
#include <syslog.h>

namespace vornhost {
namespace {

/** Somebody who puts things there again and again does not keep us busy for ever. */
constexpr int kAttempts = 20;

bool OthersCanWriteIn(const std::string& path)
{
    const size_t slash = path.rfind('/');
    const std::string folder = slash == 0 ? "/" : path.substr(0, slash);
    struct stat status {};
    return ::stat(folder.c_str(), &status) == 0 && (status.st_mode & (S_IWGRP | S_IWOTH)) != 0;
}

/** @return whether nobody else can hold a lock on this file. */
bool IsOurs(const struct stat& status)
{
    return S_ISREG(status.st_mode) && status.st_uid == ::geteuid() && status.st_nlink == 1 &&
           (status.st_mode & 07777) == 0600;
}

/** Removes what stands in the file's place. @return whether the place is free now. */
bool RemoveSquatter(const std::string& path, const struct stat& status)
{
    ::syslog(LOG_WARNING, "%s is not our lock file (owner %u, mode %o): removing it", path.c_str(),
             status.st_uid, status.st_mode);
    const int result = S_ISDIR(status.st_mode) ? ::rmdir(path.c_str()) : ::unlink(path.c_str());
    return result == 0 || errno == ENOENT;
}

/** Opens the file if it is fit, or makes it. @return none with errno EAGAIN: look again. */
Descriptor OpenOrMake(const std::string& path, bool hostile)
{
    constexpr int kFlags = O_RDWR | O_NOFOLLOW | O_CLOEXEC | O_NONBLOCK | O_NOCTTY;
    struct stat status {};
    if (::lstat(path.c_str(), &status) != 0) {
        // Only ever made anew: opening another's file with O_CREAT is refused in a sticky folder.
        Descriptor made(errno == ENOENT ? ::open(path.c_str(), kFlags | O_CREAT | O_EXCL, 0600)
                                        : -1);
        if (made) {
            (void)::fchmod(made.Get(), 0600); // whatever the client's mask takes away
        } else if (errno == EEXIST) {
            errno = EAGAIN;
        }
        return made;
    }
    // Looked at before it is opened: opening a device can do something.
    if (hostile ? !IsOurs(status) : !S_ISREG(status.st_mode)) {
        const bool removed = hostile && RemoveSquatter(path, status);
        errno = removed ? EAGAIN : EPERM;
        return {};
    }
    Descriptor file(::open(path.c_str(), kFlags));
    if (!file || ::fstat(file.Get(), &status) != 0 ||
        (hostile ? !IsOurs(status) : !S_ISREG(status.st_mode))) {
        errno = EAGAIN; // it was exchanged in between
        return {};
    }
    return file;
}

} // namespace

ContractLock LockContractFile(const std::string& path, LockDeadline deadline)
{
    const bool hostile = OthersCanWriteIn(path);
    for (int attempt = 0; attempt < kAttempts; ++attempt) {
        Descriptor file = AboveStandard(OpenOrMake(path, hostile));
        if (!file && errno != EAGAIN) {
            ::syslog(LOG_WARNING, "%s cannot be locked: %s", path.c_str(), std::strerror(errno));
            return {};
        }
        if (!file) {
            continue;
        }
        if (!WaitForLock(file.Get(), deadline)) {
            return {ContractLock::Outcome::kHeld, {}};
        }
        // A cleaner may have removed it since it was opened; the lock would then be on nothing.
        if (IsSameFile(AT_FDCWD, path, file.Get())) {
            return {ContractLock::Outcome::kTaken, std::move(file)};
        }
    }
    ::syslog(LOG_WARNING, "%s does not stay in its place", path.c_str());
    return {};
}

} // namespace vornhost
