/**
 * What one interface is to have, whoever manages it now: the model between those who read other
 * managers' configurations and the one who writes ours.
 */
#ifndef VORNOVSCTL_ADOPT_WISH_H
#define VORNOVSCTL_ADOPT_WISH_H

#include "adopt/lease.h"

#include <map>
#include <optional>
#include <string>
#include <support/bondoptions.h>
#include <vector>

namespace vornovsctl {

enum class Manager { kNobody, kIfupdown, kNetworkd, kNetworkManager };

/** Its name as people know it; "nobody" for none. */
const char* NameOf(Manager manager);

enum class WishKind { kSingle, kBond, kVlan };

/** How the client presents itself to the servers; what is not set is the client's own choice. */
struct DhcpIdentity {
    std::optional<std::string> clientId;  /**< hex with colons, or "none" */
    std::optional<std::string> hostName;  /**< or "none" */
    std::optional<std::string> hostName6; /**< the same for a client that does IPv6 alone */
    std::optional<std::string> duid;      /**< hex with colons */
    std::optional<std::string> iaid;      /**< eight hex digits */

    bool operator==(const DhcpIdentity&) const = default;
};

struct Wish {
    std::string name;
    Manager manager = Manager::kNobody;
    std::string origin; /**< the file or the profile that says it */

    WishKind kind = WishKind::kSingle;
    std::string master;         /**< of a bond's member */
    vornhost::BondOptions bond; /**< of a bond */
    std::string parent;         /**< of a VLAN */
    unsigned vlanId = 0;

    bool dhcp4 = false;
    std::vector<std::string> addresses4; /**< with their length, "192.0.2.10/24" */
    std::string gateway4;
    std::optional<unsigned> metric4;

    bool ipv6 = true;             /**< false: it is to have none at all */
    std::optional<bool> autoconf; /**< by the client; not set: the kernel's own way */
    std::optional<bool> dhcp6;    /**< not set: as routers say */
    std::vector<std::string> addresses6;
    std::string gateway6;
    std::optional<unsigned> metric6;
    std::string token;     /**< interface identifier, "::1:2:3:4" */
    std::string linkLocal; /**< link-local address, where it is not the MAC's */
    std::string privacy;   /**< "rfc3041" (preferred), "1" (made), "no" or nothing */

    DhcpIdentity identity;
    std::optional<bool> peerDns;
    std::optional<bool> peerRoutes;
    std::optional<bool> defaultRoute;
    std::vector<std::string> dns;
    std::vector<std::string> search;
    std::vector<std::string> routes; /**< in the words of iproute2 */

    std::optional<unsigned> mtu;
    std::string mac;     /**< link address that the manager gave it instead of its own */
    std::string ethtool; /**< forced link settings */

    std::optional<Lease> lease; /**< what a DHCP client of the manager has got */

    std::vector<std::string> obstacles; /**< why it cannot be taken over */
    std::vector<std::string> remarks;   /**< what is worth knowing */

    /** Whether a server or a router has a say in its addresses. */
    bool IsDynamic() const { return dhcp4 || autoconf.value_or(false) || dhcp6.value_or(false); }
    bool operator==(const Wish&) const = default;
};

/** By interface. */
using Wishes = std::map<std::string, Wish>;

} // namespace vornovsctl

#endif
