#include "sandbox/sandbox.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <memory>
#include <stdexcept>

#include <dirent.h>
#include <fcntl.h>
#include <net/if.h>
#include <sched.h>
#include <sys/ioctl.h>
#include <sys/mount.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace harness {
namespace {

/** Folders that the tests find empty, with their modes. */
struct EmptyFolder {
    const char* path;
    mode_t mode;
};
constexpr std::array<EmptyFolder, 5> kEmptyFolders = {{{"/usr/vorn", 0755},
                                                       {"/etc/sysconfig", 0755},
                                                       {"/etc/init.d", 0755},
                                                       {"/run", 0755},
                                                       {"/tmp", 01777}}};
constexpr std::array<const char*, 4> kAbsentFiles = {
    "/dev/log", "/etc/rc.network", "/etc/vorninfo.conf", "/etc/vornovs-host.conf"};

[[noreturn]] void Fail(const std::string& step)
{
    throw std::runtime_error("sandbox: " + step + ": " + std::strerror(errno));
}

void Check(bool succeeded, const std::string& step)
{
    if (!succeeded) {
        Fail(step);
    }
}

void WriteFile(const char* path, const std::string& text)
{
    std::ofstream file(path);
    file << text << std::flush;
    Check(file.good(), std::string("writing ") + path);
}

/** Takes the namespaces, through a user namespace where the privilege for them is missing. */
void Unshare(int namespaces)
{
    const uid_t user = ::geteuid();
    const gid_t group = ::getegid();
    if (user == 0 && ::unshare(namespaces) == 0) {
        return;
    }
    Check(::unshare(CLONE_NEWUSER | namespaces) == 0,
          "unshare (user namespaces may be switched off on this machine)");
    WriteFile("/proc/self/setgroups", "deny");
    WriteFile("/proc/self/uid_map", "0 " + std::to_string(user) + " 1\n");
    WriteFile("/proc/self/gid_map", "0 " + std::to_string(group) + " 1\n");
}

void SetLoopbackUp()
{
    const int socket = ::socket(AF_INET, SOCK_DGRAM | SOCK_CLOEXEC, 0);
    Check(socket >= 0, "socket");
    ifreq request{};
    std::strcpy(request.ifr_name, "lo");
    request.ifr_flags = IFF_UP;
    const bool up = ::ioctl(socket, SIOCSIFFLAGS, &request) == 0;
    ::close(socket);
    Check(up, "setting lo up");
}

bool IsBelow(const std::string& path, const std::string& folder)
{
    return path.size() > folder.size() && path.starts_with(folder) &&
           (folder == "/" || path[folder.size()] == '/');
}

/** Makes the tree that becomes the sandbox's root: new folders, and the machine's bound in. */
class Tree {
public:
    Tree(std::string root, std::vector<std::string> writable)
        : m_root(std::move(root)),
          m_rebuilt(std::move(writable)), m_kept{Keep(VORNOVS_SOURCE_DIR), Keep(VORNOVS_BINARY_DIR)}
    {
        m_rebuilt.insert(m_rebuilt.end(), {"/", "/usr", "/etc", "/dev"});
        Check(::mount("sandbox", m_root.c_str(), "tmpfs", MS_NOSUID, "mode=0755") == 0,
              "mounting a tmpfs");
    }
    Tree(const Tree&) = delete;
    Tree& operator=(const Tree&) = delete;
    ~Tree()
    {
        for (const Kept& kept : m_kept) {
            ::close(kept.descriptor);
        }
    }

    void Build(bool ownNetwork)
    {
        m_ownNetwork = ownNetwork;
        Rebuild("/");
        for (const EmptyFolder& folder : kEmptyFolders) {
            const std::string target = m_root + folder.path;
            Check(::mkdir(target.c_str(), folder.mode) == 0 || errno == EEXIST, "mkdir " + target);
            Check(::chmod(target.c_str(), folder.mode) == 0, "chmod " + target);
        }
        for (const Kept& kept : m_kept) {
            BindKept(kept);
        }
    }

private:
    /** A folder of this project, opened while it can still be seen. */
    struct Kept {
        std::string path;
        int descriptor;
    };

    static Kept Keep(const char* path)
    {
        return {path, ::open(path, O_PATH | O_DIRECTORY | O_CLOEXEC)};
    }

    /** Makes a folder anew, with everything the machine has in it. */
    void Rebuild(const std::string& folder)
    {
        const std::unique_ptr<DIR, int (*)(DIR*)> stream(::opendir(folder.c_str()), ::closedir);
        Check(stream != nullptr, "opendir " + folder);
        while (const dirent* entry = ::readdir(stream.get())) {
            const std::string name = entry->d_name;
            if (name != "." && name != "..") {
                Bring((folder == "/" ? "" : folder) + "/" + name);
            }
        }
    }

    void Bring(const std::string& path)
    {
        const std::string target = m_root + path;
        struct stat status {};
        if (IsReplaced(path) || ::lstat(path.c_str(), &status) != 0) {
            return;
        }
        if (S_ISLNK(status.st_mode)) {
            std::array<char, 4096> text{};
            Check(::readlink(path.c_str(), text.data(), text.size() - 1) > 0, "readlink " + path);
            Check(::symlink(text.data(), target.c_str()) == 0, "symlink " + target);
        } else if (!S_ISDIR(status.st_mode)) {
            Check(::mknod(target.c_str(), S_IFREG | 0600, 0) == 0, "making " + target);
            Bind(path, target);
        } else {
            Check(::mkdir(target.c_str(), 0755) == 0, "mkdir " + target);
            BringFolder(path, target);
        }
    }

    void BringFolder(const std::string& path, const std::string& target)
    {
        const bool rebuilt = std::any_of(m_rebuilt.begin(), m_rebuilt.end(), [&](const auto& one) {
            return one == path || IsBelow(one, path);
        });
        if (rebuilt) {
            Rebuild(path);
        } else if (path == "/sys" && m_ownNetwork) {
            Check(::mount("sysfs", target.c_str(), "sysfs", MS_NOSUID | MS_NODEV | MS_NOEXEC,
                          nullptr) == 0,
                  "mounting sysfs");
        } else {
            Bind(path, target);
        }
    }

    static bool IsReplaced(const std::string& path)
    {
        return std::any_of(kEmptyFolders.begin(), kEmptyFolders.end(),
                           [&](const EmptyFolder& folder) { return path == folder.path; }) ||
               std::find(kAbsentFiles.begin(), kAbsentFiles.end(), path) != kAbsentFiles.end();
    }

    /** Binds a folder of this project again where an empty folder hides it. */
    void BindKept(const Kept& kept)
    {
        const bool hidden =
            std::any_of(kEmptyFolders.begin(), kEmptyFolders.end(),
                        [&](const EmptyFolder& folder) { return IsBelow(kept.path, folder.path); });
        if (!hidden || kept.descriptor < 0) {
            return;
        }
        const std::string target = m_root + kept.path;
        for (size_t slash = target.find('/', m_root.size() + 1);;
             slash = target.find('/', slash + 1)) {
            const std::string folder = target.substr(0, slash);
            Check(::mkdir(folder.c_str(), 0755) == 0 || errno == EEXIST, "mkdir " + folder);
            if (slash == std::string::npos) {
                break;
            }
        }
        Bind("/proc/self/fd/" + std::to_string(kept.descriptor), target);
    }

    static void Bind(const std::string& path, const std::string& target)
    {
        // A mount inherited by a user namespace can only be bound together with what is below it.
        Check(::mount(path.c_str(), target.c_str(), nullptr, MS_BIND | MS_REC, nullptr) == 0,
              "binding " + path);
    }

    std::string m_root;
    std::vector<std::string> m_rebuilt;
    std::array<Kept, 2> m_kept;
    bool m_ownNetwork = false;
};

/** Makes the tree the root and lets go of the old one. */
void ChangeRoot(const char* tree)
{
    Check(::chdir(tree) == 0, "entering the new root");
    // With both names equal the old root is stacked on the new one, where it can be taken off.
    Check(::syscall(SYS_pivot_root, ".", ".") == 0, "pivot_root");
    Check(::umount2(".", MNT_DETACH) == 0, "letting go of the old root");
    Check(::chdir("/") == 0, "entering the new root");
}

} // namespace

void EnterSandbox(const SandboxOptions& options)
{
    constexpr char kTree[] = "/tmp"; // replaced in the sandbox anyway, and there on every machine
    const std::unique_ptr<char, void (*)(void*)> workingFolder(::getcwd(nullptr, 0), std::free);

    Unshare(CLONE_NEWNS | (options.network ? CLONE_NEWNET : 0));
    Check(::mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0,
          "making the mounts private");
    const mode_t mask = ::umask(0);
    Tree(kTree, options.writable).Build(options.network);
    ::umask(mask);
    ChangeRoot(kTree);

    if (options.network) {
        SetLoopbackUp();
    }
    if (workingFolder != nullptr) {
        // It may be hidden now; the root is then as good a place.
        (void)!::chdir(workingFolder.get());
    }
}

} // namespace harness
