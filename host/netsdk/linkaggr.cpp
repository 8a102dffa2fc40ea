#include "bondmodes.h"

#include "support/bondoptions.h"
#include "support/interfacename.h"
#include "support/switchdatabase.h"
#include "support/uplink.h"
#include "support/vlanrules.h"

#include <algorithm>
#include <cstring>
#include <exception>
#include <optional>
#include <string>
#include <syslog.h>
#include <vector>
#include <vornplatform/netsdk.h>

namespace {

using vornhost::SwitchPort;

struct Bond {
    VORN_LINK_AGGR_MODE mode = VORN_LINK_AGGR_NONE;
    std::vector<std::string> slaves;
};

std::optional<Bond> KernelBond(const std::string& name)
{
    const auto options = vornhost::BondOptions::ReadLive(name);
    const auto slaves = vornhost::ReadLiveSlaves(name);
    if (!options || !slaves) {
        return std::nullopt;
    }
    const std::string mode = options->Get("mode");
    const Bond bond{vornhost::KernelModeNumber(mode), *slaves};
    if (bond.mode == VORN_LINK_AGGR_NONE) {
        ::syslog(LOG_WARNING,
                 "vornnetsdk: bond %s is not taken apart: there is nothing like %s on the switch",
                 name.c_str(), mode.c_str());
        return std::nullopt;
    }
    // Its VLANs cannot live elsewhere meanwhile, but they can on the bond while it is a port.
    const auto network = vornhost::LiveNetwork::Read();
    if (const auto* vlan = vornhost::FindVlanWithObstacle(network, name)) {
        ::syslog(LOG_WARNING,
                 "vornnetsdk: bond %s is not taken apart: its VLAN %s is not what one tag can say; "
                 "it goes on to the switch whole",
                 name.c_str(), vlan->name.c_str());
        return std::nullopt;
    }
    return bond;
}

VORN_LINK_AGGR_MODE SwitchMode(const SwitchPort& port)
{
    const auto column = port.columns.find("bond_mode");
    // Without a mode the switch takes the one that no partner can do harm to.
    const std::string mode = column == port.columns.end() ? "active-backup" : column->second;
    return VORNNetLinkAggrStringToMode(("ovs-" + mode).c_str());
}

/** The members as the file lists them; as the switch does when the file says something else. */
std::vector<std::string> SwitchSlaves(const std::string& bridge, const SwitchPort& port)
{
    const std::vector<std::string> listed = vornhost::ListedSlaves(bridge);
    std::vector<std::string> sorted = listed;
    std::sort(sorted.begin(), sorted.end());
    return sorted == port.interfaces ? listed : port.interfaces;
}

std::optional<Bond> SwitchBond(const std::string& name)
{
    const auto bridges = vornhost::ReadSwitch();
    if (!bridges) {
        return std::nullopt;
    }
    const auto bridge =
        std::find_if(bridges->begin(), bridges->end(),
                     [&](const vornhost::SwitchBridge& each) { return each.name == name; });
    const SwitchPort* const port =
        bridge == bridges->end() ? nullptr : vornhost::FindUplinkByFile(*bridge);
    if (port == nullptr || !port->bond) {
        return std::nullopt;
    }
    return Bond{SwitchMode(*port), SwitchSlaves(name, *port)};
}

int Get(const std::string& name, VORNLINKAGGROPT& opt)
{
    if (!vornhost::IsInterfaceName(name)) {
        return -1;
    }
    const bool ofKernel = vornhost::ReadLiveSlaves(name).has_value();
    const auto bond = ofKernel ? KernelBond(name) : SwitchBond(name);
    if (!bond) {
        ::syslog(LOG_INFO, "vornnetsdk: there is no bond %s to be read", name.c_str());
        return -1;
    }
    VORNLINKAGGROPT filled{};
    name.copy(filled.szMaster, VORN_NAME_SIZE - 1);
    filled.mode = bond->mode;
    for (const std::string& slave : bond->slaves) {
        if (VORNNetLinkAggrOptSlsaveAdd(&filled, slave.c_str()) < 0) {
            ::syslog(LOG_ERR, "vornnetsdk: bond %s has more slaves than a record holds",
                     name.c_str());
            return -1;
        }
    }
    opt = filled;
    return 0;
}

} // namespace

int VORNNetLinkAggrGet(const char* name, VORNLINKAGGROPT* opt)
{
    if (name == nullptr || opt == nullptr) {
        return -1;
    }
    try {
        return Get(name, *opt);
    } catch (const std::exception& error) {
        ::syslog(LOG_ERR, "vornnetsdk: cannot read bond %s: %s", name, error.what());
        return -1;
    }
}

int VORNNetLinkAggrOptSlsaveAdd(VORNLINKAGGROPT* opt, const char* slave)
{
    if (opt == nullptr || slave == nullptr || opt->nSlave < 0 ||
        opt->nSlave >= VORN_LINK_AGGR_SLAVES) {
        return -1;
    }
    const std::size_t length = std::strlen(slave);
    if (length == 0 || length >= VORN_NAME_SIZE) {
        return -1;
    }

    char* const slot = opt->rgszSlave[opt->nSlave];
    std::fill_n(slot, VORN_NAME_SIZE, '\0');
    std::copy_n(slave, length, slot);
    ++opt->nSlave;
    return 0;
}
