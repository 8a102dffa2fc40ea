/**
 * The kernel's network as a plan sees it.
 */
#ifndef VORNHOST_RCNETWORK_LIVESTATE_H
#define VORNHOST_RCNETWORK_LIVESTATE_H

#include "support/netlink.h"

#include <map>
#include <optional>
#include <string>
#include <vector>

namespace vornhost {

// Settings of an interface, by their names in LiveState.
constexpr char kAddressMode[] = "ipv6.conf.addr_gen_mode";
constexpr char kAddressModeNone[] = "1";
constexpr char kAcceptRouters[] = "ipv6.conf.accept_ra";
constexpr char kDisableIpv6[] = "ipv6.conf.disable_ipv6";
constexpr char kRouterMetric[] = "ipv6.conf.ra_defrtr_metric";

/** Settings of one interface by name: "ipv4.conf.rp_filter", "ipv6.neigh.retrans_time_ms"... */
using Settings = std::map<std::string, std::string>;

/** Stands for the settings that a new interface begins with. */
constexpr char kNewInterface[] = "default";

/** A bond of the kernel. */
struct LiveBond {
    std::vector<std::string> members;           ///< In the order in which they joined.
    std::map<std::string, std::string> ownMacs; ///< What members are called again when they leave.
    std::map<std::string, std::string> options{}; ///< As the kernel writes them.
};

struct LiveState {
    std::vector<Link> links;
    std::vector<Address> addresses;
    std::vector<Route> routes;
    std::vector<Neighbour> neighbours;
    std::map<std::string, LiveBond> bonds;
    std::map<std::string, Settings> settings; ///< By interface, for those that a plan may concern.

    const Link* FindLink(const std::string& name) const;
    const Link* FindLink(int index) const;
    /** @return  the names of an interface and of the VLANs' interfaces that stand on it. */
    std::vector<std::string> WithVlans(const Link& link) const;
    /** @return  the interface's name, empty when there is none of that index. */
    std::string NameOf(int index) const;
    /** @return  the setting, empty when the interface or the setting does not exist. */
    std::string Setting(const std::string& interface, const std::string& name) const;
};

/** @return  whether an interface is a bond, VLAN or bridge of the kernel, as are made here. */
bool IsOfMadeKind(const Link& link);

/** Reads the kernel's links, addresses, routes and neighbours. @return  nullopt on failure. */
std::optional<LiveState> ReadLiveState();

/** Adds the settings of one interface to the state. */
void ReadSettings(const std::string& interface, LiveState& live);

/** @return  the file of a setting: "ipv4.conf.rp_filter" of "eth0". */
std::string SettingPath(const std::string& interface, const std::string& name);

} // namespace vornhost

#endif
