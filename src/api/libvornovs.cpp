#include <vornovs/vornovs.h>

#include "api/configlock.h"
#include "api/countnames.h"
#include "state/statefiles.h"
#include "system/log.h"

#include <unistd.h>

#include <algorithm>
#include <exception>

namespace VORN::OVS {
namespace {

constexpr char kLogFile[] = "libvornovs.cpp";

void PrimeBondModes(OVSManager& manager, const std::map<std::string, std::string>& bondModes)
{
    for (const auto& [bond, mode] : bondModes) {
        (void)manager.InitBondOpt(bond, mode);
    }
}

} // namespace

int IsRegister(const std::string& name)
{
    OVSRegConf registry;
    if (registry.LoadFromConfig() < 0) {
        OVS_ERR("Failed to load the ovs config");
        return -1;
    }
    return registry.IsRegister(name) > 0 ? 0 : -1;
}

int GetAllRegister(std::set<std::string>& names)
{
    OVSRegConf registry;
    if (registry.LoadFromConfig() < 0) {
        OVS_ERR("Failed to load the ovs config");
        return 0;
    }
    return std::max(registry.GetRegNames(names), 0);
}

bool IsOVSRunning()
{
    std::set<std::string> names;
    return GetAllRegister(names) > 0;
}

int IsOVSSupport()
{
    return std::max(NotSupportOVS(), 0);
}

int Register(const std::string& name, const std::map<std::string, std::string>& bondModes)
{
    OVSRegConf registry;
    OVSManager manager;
    const int reason = NotSupportOVS();
    if (reason > 0) {
        OVS_INFO("Current environment doesn't support OVS for reason %d", reason);
        return reason;
    }

    const ConfigLock lock;
    if (!lock) {
        return reason;
    }
    if (registry.LoadFromConfig() < 0) {
        OVS_ERR("Failed to load the ovs config");
        return reason;
    }

    const int countBefore = CountNames(registry);
    if (countBefore < 0) {
        return -1;
    }
    const int registered = registry.Register(name);
    if (registered == 1) {
        return 1;
    }
    if (registered < 0) {
        OVS_ERR("Failed to register the name %s", name.c_str());
        return -1;
    }
    if (countBefore != 0) {
        return 0;
    }

    PrimeBondModes(manager, bondModes);
    if (!manager.CreateAll()) {
        OVS_ERR("Failed to CreateAll");
        (void)registry.UnRegister(name);
    }
    return 0;
}

int UnRegister(const std::string& name, const std::map<std::string, std::string>& bondModes)
{
    OVSRegConf registry;
    OVSManager manager;
    const ConfigLock lock;
    if (!lock) {
        return -1;
    }
    if (registry.LoadFromConfig() < 0) {
        OVS_ERR("Failed to load the ovs config");
        return -1;
    }

    // Counted before the change, while giving up is still possible.
    const int countBefore = CountNames(registry);
    if (countBefore < 0) {
        return -1;
    }
    const int unregistered = registry.UnRegister(name);
    if (unregistered == 2) {
        return 1;
    }
    if (unregistered < 0) {
        // The same text as on the way in: log readers know it so.
        OVS_ERR("Failed to register the name %s", name.c_str());
        return -1;
    }
    if (countBefore > 1) {
        return 0;
    }

    PrimeBondModes(manager, bondModes);
    if (!manager.DeleteAll()) {
        OVS_ERR("Failed to delete all OVS interface");
    }
    return 0;
}

void OVSSetDefault()
try {
    OVSChangeHook hook("delete");
    const bool wasRunning = IsOVSRunning(); // asked before the answer is removed

    (void)::unlink(kInterfaceListPath);
    (void)::unlink(kIgnoreListPath);
    (void)::unlink(kRegistrationPath);

    if (wasRunning) {
        (void)hook.ExecHook(SDK_PLUGIN_ACTION_BEGIN);
    }
} catch (const std::exception&) {
    // Only building the hook can fail, so nothing has been removed; there is no result to say so.
    OVS_ERR("Failed to set the default");
}

} // namespace VORN::OVS
