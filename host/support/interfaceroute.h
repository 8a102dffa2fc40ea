/**
 * Routes and link settings as configuration files write them.
 */
#ifndef VORNHOST_SUPPORT_INTERFACEROUTE_H
#define VORNHOST_SUPPORT_INTERFACEROUTE_H

#include "netlink.h"

#include <optional>
#include <string>
#include <vector>

namespace vornhost {

/**
 * Reads a route in the words of "ip route": a type or none, "default" or a prefix, then via, src,
 * metric, table, mtu, scope, dev and onlink. Its interface is the one of the file, whatever dev
 * says, so its hop has no index.
 * @param problem  Receives what is wrong when nothing is returned.
 */
std::optional<Route> ParseRoute(const std::string& text, std::string& problem);

/** One call of ethtool without the name of the interface: "-s", "speed", "100". */
using LinkCommand = std::vector<std::string>;

/**
 * Reads commands of ethtool, separated by semicolons: "speed 100 duplex full; -K IFACE tso off".
 * Without an option at its beginning a command is one of "-s".
 * @return  nothing when one of them could do anything else than set something on a link.
 */
std::optional<std::vector<LinkCommand>> ParseLinkCommands(const std::string& text);

} // namespace vornhost

#endif
