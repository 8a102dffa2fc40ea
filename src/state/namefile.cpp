#include "state/namefile.h"

#include "system/handles.h"

#include <vornplatform/core.h>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstdio>
#include <string_view>

namespace VORN::OVS {
namespace {

constexpr mode_t kNewFileMode = 0666; // the process's umask takes its part
constexpr int kMostWriters = 100;

/** A file beside the target that takes its place, or is gone with this object. */
class Replacement {
public:
    explicit Replacement(const std::string& target) : m_target(target), m_file(Open()) {}
    ~Replacement()
    {
        if (m_file && !m_committed) {
            (void)::unlink(m_path.c_str());
        }
    }
    Replacement(const Replacement&) = delete;
    Replacement& operator=(const Replacement&) = delete;

    explicit operator bool() const { return static_cast<bool>(m_file); }
    [[nodiscard]] int Get() const { return m_file.Get(); }

    /** @return whether the target is this file now; errno says why not. */
    bool Commit()
    {
        m_committed = ::rename(m_path.c_str(), m_target.c_str()) == 0;
        return m_committed;
    }

private:
    // One name for all, so that what a killed client left is taken over by the next one and does
    // not pile up. Whoever finds the name in use takes the next number.
    int Open()
    {
        for (int number = 0; number < kMostWriters; ++number) {
            m_path = m_target + ".new" + (number == 0 ? "" : std::to_string(number));
            const int descriptor =
                ::open(m_path.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC | O_NOFOLLOW, kNewFileMode);
            if (descriptor < 0) {
                return descriptor;
            }
            const int error = Take(descriptor);
            if (error == 0) {
                return descriptor;
            }
            (void)::close(descriptor);
            if (error != EWOULDBLOCK) {
                (void)::unlink(m_path.c_str());
                errno = error;
                return -1;
            }
        }
        errno = EAGAIN;
        return -1;
    }

    /**
     * Locks the file and empties it.
     * @return  0 it is ours; EWOULDBLOCK it is another writer's, or was; else an error.
     */
    [[nodiscard]] int Take(int descriptor) const
    {
        struct stat opened {};
        struct stat named {};
        if (::flock(descriptor, LOCK_EX | LOCK_NB) != 0 || ::fstat(descriptor, &opened) != 0) {
            return errno;
        }
        if (::lstat(m_path.c_str(), &named) != 0) {
            return errno == ENOENT ? EWOULDBLOCK : errno;
        }
        if (opened.st_ino != named.st_ino || opened.st_dev != named.st_dev) {
            return EWOULDBLOCK;
        }
        return ::ftruncate(descriptor, 0) == 0 ? 0 : errno;
    }

    const std::string& m_target;
    std::string m_path;
    File m_file;
    bool m_committed = false;
};

bool WriteAll(int descriptor, std::string_view text)
{
    while (!text.empty()) {
        const ssize_t written = ::write(descriptor, text.data(), text.size());
        if (written < 0 && errno == EINTR) {
            continue;
        }
        if (written <= 0) {
            return false;
        }
        text.remove_prefix(static_cast<std::size_t>(written));
    }
    return true;
}

// Not blocking: a FIFO without a reader is refused, not waited for with the lock held.
int OpenInPlace(const std::string& path)
{
    return ::open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC | O_NONBLOCK,
                  kNewFileMode);
}

bool WriteInPlace(const std::string& path, std::string_view text)
{
    const File file(OpenInPlace(path));
    if (!file) {
        return false;
    }
    (void)WriteAll(file.Get(), text);
    return true;
}

void SyncFolderOf(const std::string& path)
{
    const std::string folder = path.substr(0, path.find_last_of('/') + 1);
    const File file(
        ::open(folder.empty() ? "." : folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (file) {
        (void)::fsync(file.Get());
    }
}

bool KeepOwnerAndMode(int descriptor, const struct stat& old)
{
    return ::fchown(descriptor, old.st_uid, old.st_gid) == 0 &&
           ::fchmod(descriptor, old.st_mode & 07777U) == 0;
}

/** What is left when an existing target may be written and no file can be made beside it. */
bool KeepOrWriteInPlace(const std::string& path, std::string_view text, int error)
{
    // The folder is closed to us. Anything else, such as a full disk, is a write error: it leaves
    // the target whole.
    const bool closed = error == EACCES || error == EPERM;
    return !closed || WriteInPlace(path, text);
}

/** @param old  the target's status, or null when there is no target yet. */
bool ReplaceByRename(const std::string& path, std::string_view text, const struct stat* old)
{
    Replacement replacement(path);
    if (!replacement) {
        return old != nullptr && KeepOrWriteInPlace(path, text, errno);
    }
    if (old != nullptr && !KeepOwnerAndMode(replacement.Get(), *old)) {
        return WriteInPlace(path, text);
    }
    if (!WriteAll(replacement.Get(), text) || ::fsync(replacement.Get()) != 0) {
        return true;
    }

    if (replacement.Commit()) {
        SyncFolderOf(path);
    } else if (errno == EBUSY) {
        // A mount point cannot be replaced by a file, only written.
        return WriteInPlace(path, text);
    }
    return true;
}

/** @return whether it may have no end, and holds no list in any case. */
bool IsDevice(int descriptor)
{
    struct stat status {};
    (void)::fstat(descriptor, &status);
    return S_ISCHR(status.st_mode);
}

bool RemoveNames(const std::string& path)
{
    // Truncated first: should the removal fail, what stays is an empty list.
    const File file(OpenInPlace(path));
    if (!file) {
        return false;
    }
    (void)::unlink(path.c_str());
    SyncFolderOf(path);
    return true;
}

} // namespace

bool MakeStateFolder()
{
    return VLIBCFileCheckDir(kStateFolder) != 0 || ::mkdir(kStateFolder, kStateFolderMode) >= 0;
}

bool ReadNames(const std::string& path, std::set<std::string>& names)
{
    const File file(::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
    if (!file || IsDevice(file.Get())) {
        return false;
    }

    std::string text;
    std::array<char, BUFSIZ> part{};
    ssize_t count = 0;
    while ((count = ::read(file.Get(), part.data(), part.size())) > 0 ||
           (count < 0 && errno == EINTR)) {
        text.append(part.data(), count > 0 ? static_cast<std::size_t>(count) : 0);
    }

    std::string_view rest = text;
    while (!rest.empty()) {
        const std::string_view line = rest.substr(0, rest.find('\n'));
        names.emplace(line);
        rest.remove_prefix(line.size() < rest.size() ? line.size() + 1 : line.size());
    }
    return true;
}

bool WriteNames(const std::string& path, const std::set<std::string>& names)
{
    if (names.empty()) {
        return RemoveNames(path);
    }
    std::string text;
    for (const auto& name : names) {
        text.append(name).append("\n");
    }

    struct stat status {};
    if (::lstat(path.c_str(), &status) != 0) {
        return errno == ENOENT && ReplaceByRename(path, text, nullptr);
    }
    if (!S_ISREG(status.st_mode)) {
        return WriteInPlace(path, text);
    }
    const File probe(::open(path.c_str(), O_WRONLY | O_CLOEXEC | O_NOFOLLOW));
    return probe && ReplaceByRename(path, text, &status);
}

} // namespace VORN::OVS
