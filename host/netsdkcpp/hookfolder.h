/**
 * The programs of a hook. They run as root, so only what root alone can have put there counts.
 */
#ifndef VORNHOST_NETSDKCPP_HOOKFOLDER_H
#define VORNHOST_NETSDKCPP_HOOKFOLDER_H

#include "support/descriptor.h"

#include <optional>
#include <string>
#include <vector>

namespace vornhost {

constexpr char kHooksFolder[] = "/usr/vorn/etc/hooks";

/** A program of a hook, opened and looked at. */
struct HookProgram {
    std::string path;
    Descriptor file;
};

struct HookPrograms {
    std::vector<HookProgram> programs; /**< in the order of their names */
    bool refused = false;              /**< something was left out that is no trustworthy program */
};

/** @return whether a hook can have that name: folder names with slashes between them. */
bool IsHookName(const std::string& name);

/**
 * Opens the programs of a hook: the executable regular files of its folder whose name does not
 * begin with a dot. What is not executable is left out in silence, and what others than root could
 * have made or changed is refused, which is logged. The same holds for the folder and each one
 * above it.
 * @return nothing when the hook has no folder, which is usual, or the folder is refused (errno is
 *         then EPERM).
 */
std::optional<HookPrograms> OpenHookPrograms(const std::string& name);

} // namespace vornhost

#endif
