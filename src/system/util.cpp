#include <vornovs/vornovs.h>

#include "state/ifcfg.h"
#include "system/handles.h"
#include "system/log.h"
#include "system/programs.h"

#include <vornplatform/core.h>

#include <array>
#include <cstddef>
#include <exception>

namespace VORN::OVS {
namespace {

constexpr char kLogFile[] = "util.cpp";

constexpr char kDatabaseService[] = "vornovs-db";
constexpr char kSwitchService[] = "vornovs-vswitch";
constexpr char kGatewayTool[] = "/usr/vorn/sbin/vornnetdtool";

// The script's argument list: script, verb, names, terminator.
constexpr std::size_t kArguments = 128;
constexpr std::size_t kMaxNames = kArguments - 4;

bool RunNetworkScript(const char* verb, const std::vector<std::string>& names)
{
    if (names.size() > kMaxNames) {
        OVS_ERR("Fatal Error: The size of interface %d bigger than the limtation",
                static_cast<int>(names.size()));
        return false;
    }

    std::array<const char*, kArguments> arguments{kNetworkScript, verb};
    for (std::size_t at = 0; at < names.size(); ++at) {
        arguments[at + 2] = names[at].c_str();
    }
    return VLIBCExecv(kNetworkScript, arguments.data(), 1) == 0;
}

} // namespace

bool IsDaemonAlive()
{
    if (VLIBServiceIsRunning(kDatabaseService) == 0) {
        return false;
    }
    return VLIBServiceIsRunning(kSwitchService) != 0;
}

bool StartOVSDaemon()
{
    // Database first: the switch reads its configuration from it.
    for (const char* service : {kDatabaseService, kSwitchService}) {
        if (VLIBServiceStart(service, 0) < 0) {
            OVS_ERR("Failed to call the ovs-db related upstart");
            return false;
        }
    }
    return true;
}

bool StopOVSBaemon()
{
    if (VLIBServiceStop(kSwitchService, 0) < 0) {
        OVS_ERR("Failed to kill the process ovs-vswitchd");
        return false;
    }
    if (VLIBServiceStop(kDatabaseService, 0) < 0) {
        OVS_ERR("Failed to kill the process ovsdb-server");
        return false;
    }
    return true;
}

bool StartNetwork(const std::vector<std::string>& names)
{
    return RunNetworkScript("start", names);
}

bool StopNetwork(const std::vector<std::string>& names)
{
    return RunNetworkScript("stop", names);
}

bool IsInterfaceExist(const std::string& name)
try {
    const std::string path =
        Fit(std::string("/sys/class/net/").append(TextOf(name)).append("/flags"), kNameBuffer);
    return VLIBCFileExist(path.c_str()) != 0;
} catch (const std::exception&) {
    return false;
}

int CopyGatewayInfo(const char* from, const char* to)
{
    if (from == nullptr || to == nullptr) {
        return -1;
    }
    for (const char* family : {"-4", "-6"}) {
        if (VLIBCExecl(kGatewayTool, kExecOptions, "--copy-gateway-info", family, from, to,
                       nullptr) != 0) {
            OVS_ERR("Failed to copy the gateway info from %s to %s", from, to);
            return -1;
        }
    }
    return 0;
}

int RemoveGateWayInfo(const char* name)
{
    if (name == nullptr) {
        return -1;
    }
    for (const char* family : {"-4", "-6"}) {
        if (VLIBCExec(kGatewayTool, "--del-gateway-info", family, name, nullptr) != 0) {
            OVS_ERR("Failed to use the vornnetdtool to delete gateway info");
            return -1;
        }
    }
    return 0;
}

int NotSupportOVS()
{
    return 0;
}

} // namespace VORN::OVS
