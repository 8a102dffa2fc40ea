/**
 * What the kernel knows of the network: interfaces, addresses, routes and neighbours, read at once
 * and with everything that is needed to make the same thing again on another interface.
 */
#ifndef VORNHOST_SUPPORT_NETLINK_H
#define VORNHOST_SUPPORT_NETLINK_H

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace vornhost {

/** One network interface as the kernel shows it. */
struct Link {
    int index = 0;
    std::string name;
    std::string mac; ///< Lower case with colons; empty where the interface has none.
    unsigned mtu = 0;
    bool up = false;      ///< Set up by an administrator (IFF_UP).
    bool carrier = false; ///< The cable or the peer answers.
    bool loopback = false;
    unsigned type = 0; ///< Hardware type, ARPHRD_ETHER for everything Ethernet-like.
    std::string kind;  ///< "bond", "vlan", "veth", "openvswitch"...; empty for hardware.
    int master = 0;    ///< Index of the bridge, bond or switch that it is a port of.
    int parent = 0;    ///< Index of the interface that it stands on (VLANs), or its peer (veth).
    int vlanId = -1;   ///< The tag, for the kind "vlan" only.
    std::string token; ///< The lower half of IPv6 addresses, where it was set.
    unsigned vlanProtocol = 0; ///< What its tags are of, ETH_P_8021Q or another.
};

/** One address of an interface, with all that is needed to make it again elsewhere. */
struct Address {
    int index = 0;
    int family = 0;
    std::string local;
    std::string peer; ///< Other end of a point-to-point address, otherwise empty.
    unsigned prefixLength = 0;
    std::string broadcast;
    std::string label;
    unsigned scope = 0;
    std::uint32_t flags = 0; ///< IFA_F_*, all 32 bits.
    std::uint32_t validSeconds = UINT32_MAX;
    std::uint32_t preferredSeconds = UINT32_MAX;
    std::uint32_t metric = 0; ///< Of the route that the kernel makes for the prefix; 0: default.
};

/** One way out of a route. */
struct NextHop {
    int index = 0;
    std::string gateway;
    int gatewayFamily = 0; ///< Differs from the route's for IPv4 through an IPv6 gateway.
    unsigned weight = 1;
    bool onLink = false;
};

/** A metric of a route, such as its own MTU. */
struct RouteMetric {
    unsigned kind = 0; ///< RTAX_*
    std::uint32_t value = 0;
    bool locked = false;
};

/** One route that somebody or something put into a table. */
struct Route {
    int family = 0;
    unsigned type = 1; ///< RTN_UNICAST, or one that leads nowhere and has no hop.
    unsigned table = 0;
    std::string destination; ///< Address without length; empty for the default route.
    unsigned prefixLength = 0;
    unsigned tos = 0;
    unsigned scope = 0;
    unsigned protocol = 0;
    std::uint32_t priority = 0;
    std::string source; ///< Preferred source address.
    std::vector<NextHop> nextHops;
    std::vector<RouteMetric> metrics;
    std::uint32_t expiresSeconds = 0; ///< 0: stays.
    int preference = -1;              ///< Router preference of IPv6 as the kernel codes it.
};

/** One neighbour whose link address is known. */
struct Neighbour {
    int index = 0;
    int family = 0;
    std::string address;
    std::string mac;
    bool permanent = false;
    bool router = false;
};

/** @return  All interfaces; none at all means that the kernel could not be asked. */
std::vector<Link> ReadLinks();

/** @return  All addresses of both families in the kernel's order; nullopt on failure. */
std::optional<std::vector<Address>> ReadAddresses();

/**
 * @return  The routes of both families and every table, in the kernel's order, without
 *          those that the kernel makes of addresses by itself; nullopt on failure.
 */
std::optional<std::vector<Route>> ReadRoutes();

/** @return  The neighbours of both families that can be reached; nullopt on failure. */
std::optional<std::vector<Neighbour>> ReadNeighbours();

} // namespace vornhost

#endif
