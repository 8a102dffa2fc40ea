#include "hookfolder.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <memory>
#include <sstream>

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <syslog.h>

namespace vornhost {
namespace {

std::vector<std::string> Components(const std::string& path)
{
    std::vector<std::string> components;
    std::istringstream stream(path);
    for (std::string component; std::getline(stream, component, '/');) {
        components.push_back(component);
    }
    return components;
}

/** @return whether nobody but root can have changed it. */
bool BelongsToRootAlone(const struct stat& status)
{
    return status.st_uid == 0 && (status.st_mode & (S_IWGRP | S_IWOTH)) == 0;
}

bool IsTrustedFolder(int folder)
{
    struct stat status {};
    return ::fstat(folder, &status) == 0 && S_ISDIR(status.st_mode) && BelongsToRootAlone(status);
}

/** Goes down from the root folder, so that no name is looked up twice and no link is followed. */
Descriptor OpenTrustedFolder(const std::string& path)
{
    constexpr int kFlags = O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC;
    Descriptor folder(::open("/", kFlags));
    bool trusted = folder && IsTrustedFolder(folder.Get());
    for (const std::string& component : Components(path.substr(1))) {
        Descriptor next(trusted ? ::openat(folder.Get(), component.c_str(), kFlags) : -1);
        if (trusted && !next && errno == ENOENT) {
            return {}; // no such hook on this host
        }
        trusted = next && IsTrustedFolder(next.Get());
        folder = std::move(next);
    }
    if (!trusted) {
        ::syslog(LOG_ERR, "%s is not run: others than root can change it or a folder above it",
                 path.c_str());
        errno = EPERM;
        return {};
    }
    return folder;
}

std::vector<std::string> SortedNames(const Descriptor& folder)
{
    std::vector<std::string> names;
    const std::unique_ptr<DIR, int (*)(DIR*)> stream(
        ::fdopendir(::fcntl(folder.Get(), F_DUPFD_CLOEXEC, 3)), ::closedir);
    while (const dirent* entry = stream != nullptr ? ::readdir(stream.get()) : nullptr) {
        if (entry->d_name[0] != '.') {
            names.emplace_back(entry->d_name);
        }
    }
    std::sort(names.begin(), names.end());
    return names;
}

} // namespace

bool IsHookName(const std::string& name)
{
    const std::vector<std::string> components = Components(name);
    return !components.empty() && !name.ends_with('/') && name.find('\0') == std::string::npos &&
           std::none_of(components.begin(), components.end(), [](const std::string& component) {
               return component.empty() || component == "." || component == "..";
           });
}

std::optional<HookPrograms> OpenHookPrograms(const std::string& name)
{
    const std::string path = std::string(kHooksFolder) + "/" + name;
    const Descriptor folder = OpenTrustedFolder(path);
    if (!folder) {
        return std::nullopt;
    }

    HookPrograms found;
    for (const std::string& file : SortedNames(folder)) {
        HookProgram program{
            std::string(path).append("/").append(file),
            Descriptor(::openat(folder.Get(), file.c_str(),
                                O_RDONLY | O_NOFOLLOW | O_CLOEXEC | O_NONBLOCK | O_NOCTTY))};
        struct stat status {};
        const bool opened = program.file && ::fstat(program.file.Get(), &status) == 0;
        if (opened && S_ISREG(status.st_mode) && (status.st_mode & S_IXUSR) == 0) {
            continue; // a note, or a program that the administrator switched off
        }
        if (opened && S_ISREG(status.st_mode) && BelongsToRootAlone(status)) {
            found.programs.push_back(std::move(program));
            continue;
        }
        ::syslog(LOG_ERR, "%s is not run: it is no regular file that only root can change",
                 program.path.c_str());
        found.refused = true;
    }
    return found;
}

} // namespace vornhost
