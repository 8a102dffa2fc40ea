/**
 * The platform's lock around edits of configuration files, as clients of the platform take it.
 */
#ifndef VORNHOST_SUPPORT_FILESLOCK_H
#define VORNHOST_SUPPORT_FILESLOCK_H

#include <vornplatform/core.h>

namespace vornhost {

/** Keeps other clients from editing configuration files while it lives. */
class FilesLock {
public:
    FilesLock() : m_held(VLIBCFileLock(kTake, kLimit) != -1) {}
    FilesLock(const FilesLock&) = delete;
    FilesLock& operator=(const FilesLock&) = delete;
    ~FilesLock()
    {
        if (m_held) {
            (void)VLIBCFileUnlock(kRelease);
        }
    }

    explicit operator bool() const { return m_held; }

private:
    static constexpr int kTake = 0x806;
    static constexpr int kRelease = 0x800;
    static constexpr int kLimit = 5;

    bool m_held;
};

} // namespace vornhost

#endif
