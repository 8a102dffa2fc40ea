/**
 * The host as it is drawn: what the kernel, the switch and the library's files say of its network.
 */
#ifndef VORNOVSCTL_SHOW_HOSTMODEL_H
#define VORNOVSCTL_SHOW_HOSTMODEL_H

#include "hoststate.h"

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace vornovsctl {

/** A default route through a device. */
struct DefaultRoute {
    bool ipv6 = false;
    std::string gateway; /**< empty: the net is on the link itself */
    std::uint32_t metric = 0;
    unsigned table = 0; /**< 0: the main table */

    bool operator==(const DefaultRoute&) const = default;
};

/** A bond of the kernel. */
struct LinuxBond {
    std::string mode;
    std::string active;             /**< the member that carries the traffic, in modes with one */
    std::optional<bool> negotiated; /**< LACP has found a partner; nothing: no LACP, or not known */

    bool operator==(const LinuxBond&) const = default;
};

/** A network device of the kernel. */
struct Device {
    std::string name;
    std::string kind; /**< "bond", "vlan", "veth"...; empty for hardware */
    std::string mac;
    unsigned mtu = 0;
    bool up = false;
    bool carrier = false;
    std::optional<int> speed;           /**< Mbit/s */
    std::vector<std::string> addresses; /**< with prefix length */
    std::vector<DefaultRoute> routes;
    std::string master; /**< bond or bridge that it is a member of */
    std::string parent; /**< of a VLAN: the device that carries it */
    std::optional<int> vlan;
    std::optional<LinuxBond> bond;
    bool onTheSwitch = false; /**< the kernel says that it belongs to a switch */

    bool operator==(const Device&) const = default;
};

/** An interface of a port of the switch. */
struct Member {
    std::string name;
    std::string mac;
    std::optional<bool> link; /**< nothing: the switch does not know */
    bool negotiated = false;  /**< its partner speaks LACP */
    std::string error;        /**< why the switch cannot use it */

    bool operator==(const Member&) const = default;
};

/** A port of the switch. */
struct Port {
    std::string name;
    std::optional<int> tag;
    std::vector<int> trunks; /**< VLANs that it carries tagged; empty: all */
    bool bond = false;
    std::string mode;   /**< of a bond */
    std::string lacp;   /**< of a bond: "active", "passive" or "off" */
    std::string active; /**< of a bond: the member that carries the traffic, in modes with one */
    bool wire = false;  /**< made by the network program, for the bridge to reach the wire */
    std::vector<Member> members;

    bool IsNegotiated() const;
    bool operator==(const Port&) const = default;
};

/** A bridge of the switch. */
struct Bridge {
    std::string name;
    std::optional<int> tag;  /**< of its own port */
    std::vector<Port> ports; /**< without its own port */

    const Port* Find(const std::string& port) const;
    bool operator==(const Bridge&) const = default;
};

struct HostModel {
    std::string name;
    std::optional<Names> clients;
    std::optional<Names> takenOff; /**< interfaces that were taken off the switch one by one */
    bool switchRuns = false;
    std::optional<std::vector<Bridge>> bridges; /**< nothing: not known */
    std::vector<Device> devices;                /**< without the loopback device */
    std::vector<std::string> unread;            /**< what could not be read, in words */

    const Device* Find(const std::string& device) const;
    /** Whether a bridge or port of the switch has that name. */
    bool IsDrawnWithTheSwitch(const std::string& device) const;
};

/** Compares names so that eth2 comes before eth10. */
bool ComesBefore(const std::string& one, const std::string& other);

} // namespace vornovsctl

#endif
