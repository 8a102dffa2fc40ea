#include "core/refusal.h"

#include <algorithm>

#include <sys/stat.h>
#include <syslog.h>

namespace vornhost {
namespace {

constexpr char kSwitchTool[] = "/usr/bin/ovs-vsctl";
constexpr char kCopyProgram[] = "/bin/cp";

/** @return  whether there is something of that name, and it is no file. */
bool IsNoFile(const std::string& path)
{
    struct stat status {};
    return path.starts_with('/') && ::stat(path.c_str(), &status) == 0 && !S_ISREG(status.st_mode);
}

} // namespace

std::string RefusalOf(const std::vector<std::string>& argv)
{
    if (argv[0] == kSwitchTool && std::find(argv.begin(), argv.end(), "--") != argv.end()) {
        return "\"--\" is no name";
    }
    if (argv[0] == kCopyProgram) {
        const auto odd = std::find_if(argv.begin() + 1, argv.end(), IsNoFile);
        return odd == argv.end() ? "" : *odd + " is no file";
    }
    return "";
}

bool IsRefused(const std::vector<std::string>& argv)
{
    const std::string reason = RefusalOf(argv);
    if (!reason.empty()) {
        ::syslog(LOG_WARNING, "%s is not run: %s", argv[0].c_str(), reason.c_str());
    }
    return !reason.empty();
}

} // namespace vornhost
