#include "atomicfile.h"

#include "descriptor.h"

#include <cerrno>
#include <cstdlib>
#include <memory>
#include <optional>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace vornhost {
namespace {

/** A file beside the target, which goes again unless it has taken the target's place. */
class TemporaryFile {
public:
    explicit TemporaryFile(const std::string& folder)
        // The leading dot keeps it away from those who list the folder's files by prefix.
        : m_path(folder + "/.vornovs-XXXXXX"),
          m_file(AboveStandard(Descriptor(::mkostemp(m_path.data(), O_CLOEXEC))))
    {
    }
    TemporaryFile(const TemporaryFile&) = delete;
    TemporaryFile& operator=(const TemporaryFile&) = delete;
    ~TemporaryFile()
    {
        if (m_file && !m_renamed) {
            const int reason = errno;
            (void)::unlink(m_path.c_str());
            errno = reason;
        }
    }

    explicit operator bool() const { return static_cast<bool>(m_file); }
    int Get() const { return m_file.Get(); }
    bool Rename(const std::string& target)
    {
        m_renamed = ::rename(m_path.c_str(), target.c_str()) == 0;
        return m_renamed;
    }

private:
    std::string m_path;
    Descriptor m_file;
    bool m_renamed = false;
};

/** The file behind links; the path itself when nothing is there yet. */
std::optional<std::string> Resolve(const std::string& path)
{
    const std::unique_ptr<char, void (*)(void*)> resolved(::realpath(path.c_str(), nullptr),
                                                          std::free);
    if (resolved != nullptr) {
        return std::string(resolved.get());
    }
    struct stat status {};
    if (errno == ENOENT && ::lstat(path.c_str(), &status) != 0 && errno == ENOENT) {
        return path;
    }
    return std::nullopt;
}

std::string FolderOf(const std::string& path)
{
    const size_t slash = path.rfind('/');
    if (slash == std::string::npos) {
        return ".";
    }
    return slash == 0 ? "/" : path.substr(0, slash);
}

bool WriteAll(int file, const std::string& text)
{
    for (size_t written = 0; written < text.size();) {
        const ssize_t size = ::write(file, text.data() + written, text.size() - written);
        if (size < 0 && errno != EINTR) {
            return false;
        }
        written += size > 0 ? static_cast<size_t>(size) : 0;
    }
    return true;
}

/** Gives the temporary file what the target has, or what a new one gets. */
bool SetOwnerAndMode(int file, const std::string& target, mode_t modeForNew)
{
    struct stat status {};
    if (::stat(target.c_str(), &status) != 0) {
        return errno == ENOENT && ::fchmod(file, modeForNew) == 0;
    }
    if (!S_ISREG(status.st_mode)) {
        errno = S_ISDIR(status.st_mode) ? EISDIR : EINVAL;
        return false;
    }
    // The mode comes last, because a change of owner takes bits of it away.
    return ::fchown(file, status.st_uid, status.st_gid) == 0 &&
           ::fchmod(file, status.st_mode & 07777) == 0;
}

} // namespace

bool ReplaceFile(const std::string& path, const std::string& text, mode_t modeForNew)
{
    const std::optional<std::string> target = Resolve(path);
    if (!target) {
        return false;
    }
    const std::string folder = FolderOf(*target);
    TemporaryFile file(folder);
    if (!file || !SetOwnerAndMode(file.Get(), *target, modeForNew) || !WriteAll(file.Get(), text) ||
        ::fsync(file.Get()) != 0 || !file.Rename(*target)) {
        return false;
    }

    // The new content is there for every reader; whether its name has reached the disk cannot
    // be undone any more, and some file systems cannot say.
    const Descriptor directory(::open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (directory) {
        (void)::fsync(directory.Get());
    }
    return true;
}

} // namespace vornhost
