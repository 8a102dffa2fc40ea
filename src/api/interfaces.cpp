#include <vornovs/vornovs.h>

#include "api/configlock.h"
#include "api/countnames.h"
#include "bond/bondrecord.h"
#include "state/ifcfg.h"
#include "state/statefiles.h"
#include "system/handles.h"
#include "system/log.h"
#include "system/programs.h"

#include <vornplatform/core.h>
#include <vornplatform/sdk.h>

#include <algorithm>
#include <array>
#include <exception>

namespace VORN::OVS {
namespace {

constexpr char kLogFile[] = "libvornovs.cpp";

// The platform's answers for a switch bridge that carries one plain interface, or a bond.
constexpr int kCarriesInterface = 1;
constexpr int kCarriesBond = 2;

/** A bridge as the client named it, and the list of what was taken off the switch. */
struct Removal {
    const std::string& bridge;
    OVSIfsConf ignored;
};

/** Gives one interface its configuration back and lists it; messages name the client's bridge. */
bool TakeOff(Removal& removal, const std::string& bridge, const std::string& plain)
{
    if (OVSManager().DestroyOVS(bridge) < 0) {
        OVS_ERR("Failed to remove the ovs interface %s", removal.bridge.c_str());
        return false;
    }
    if (removal.ignored.Write(plain) < 0) {
        OVS_ERR("Failed to adde the ovs interface %s into ignore filke", removal.bridge.c_str());
        return false;
    }
    return true;
}

/** @param slaves  receives the slaves' names. */
bool TakeBondOff(Removal& removal, std::vector<std::string>& slaves)
{
    VORNLINKAGGROPT bond{};
    if (!BondManager::Remove(removal.bridge, &bond, false)) {
        OVS_ERR("Failed to remove the ovs bond %s", removal.bridge.c_str());
        return false;
    }
    slaves = SlavesOf(bond);
    return std::all_of(slaves.begin(), slaves.end(), [&](const std::string& slave) {
        return TakeOff(removal, BridgeName(slave), slave);
    });
}

/** What carries neither has nothing to start; the platform is asked to all the same. */
bool StartNothing()
{
    const std::array<const char*, 1> arguments{nullptr};
    return VLIBCExecv(arguments.front(), arguments.data(), 1) == 0;
}

/** @return number of registered clients; negative: the registrations cannot be read. */
int CountClients()
{
    OVSRegConf registry;
    if (registry.LoadFromConfig() < 0) {
        OVS_ERR("Failed to load the ovs config");
        return -1;
    }
    return CountNames(registry);
}

} // namespace

int RemoveInterface(const std::string& bridge)
try {
    Removal removal{bridge, OVSIfsConf(kIgnoreListPath)};
    const int kind = VLIBNetOVSIfIsMaster(bridge.c_str());
    if (kind < 0) {
        OVS_ERR("The %s doesn't belong to OVS", bridge.c_str());
        return -1;
    }
    if (!StopNetwork({bridge})) {
        OVS_ERR("Failed to stop the rc.network");
    }

    std::vector<std::string> plain;
    if (kind == kCarriesInterface) {
        plain = {PlainName(bridge)};
        if (!TakeOff(removal, bridge, plain.front())) {
            return -1;
        }
    } else if (kind == kCarriesBond && !TakeBondOff(removal, plain)) {
        return -1;
    }
    if (!(plain.empty() ? StartNothing() : StartNetwork(plain))) {
        OVS_ERR("Failed to start the rc.network");
    }
    return 0;
} catch (const std::exception&) {
    return -1;
}

int AddInterface(const std::string& name)
try {
    OVSIfsConf ignored(kIgnoreListPath);
    const std::string bridge = BridgeName(name);
    if (VLIBCExecl(kNetworkScript, kExecOptions, "stop", name.c_str(), nullptr) != 0) {
        OVS_ERR("Failed to stop the rc.network");
    }
    if (OVSManager().CreateOVS(name) < 0) {
        // The removal's text, on the way on to the switch as well: log readers know it so.
        OVS_ERR("Failed to remove the ovs interface %s", name.c_str());
        return -1;
    }
    if (ignored.Remove(name) < 0) {
        OVS_ERR("Failed to remove the ovs interface %s from ignore filke", name.c_str());
        return -1;
    }
    if (VLIBCExecl(kNetworkScript, kExecOptions, "start", bridge.c_str(), nullptr) != 0) {
        OVS_ERR("Failed to stop the rc.network"); // the stop's text: log readers know it so
    }
    return 0;
} catch (const std::exception&) {
    return -1;
}

int ListInterface(std::set<std::string>& out)
{
    const int clients = CountClients();
    if (clients <= 0) {
        return clients;
    }
    if (OVSManager().GetSwitchList(out) < 0) {
        OVS_ERR("Failed to get all ovs interface");
        return -1;
    }
    return 0;
}

int AttachPort(const std::string& bridge, const std::string& port)
{
    const ConfigLock lock;
    const int clients = lock ? CountClients() : -1;
    if (clients <= 0) {
        return clients;
    }
    if (!OVSManager().AttachPort(bridge, port)) {
        OVS_ERR("Failed to attach the port %s to interface %s", port.c_str(), bridge.c_str());
        return -1;
    }
    return 1;
}

int DetachPort(const std::string& bridge, const std::string& port)
{
    const ConfigLock lock;
    const int clients = lock ? CountClients() : -1;
    if (clients <= 0) {
        return clients;
    }
    if (!OVSManager().DetachPort(bridge, port)) {
        OVS_ERR("Failed to detach the port %s to interface %s", port.c_str(), bridge.c_str());
        return -1;
    }
    return 1;
}

} // namespace VORN::OVS
