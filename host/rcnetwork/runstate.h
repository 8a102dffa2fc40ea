/**
 * What earlier runs made, so that a stop takes down exactly that. It lives under /run and so knows
 * nothing of an earlier boot; without it everything that is live counts as somebody else's.
 */
#ifndef VORNHOST_RCNETWORK_RUNSTATE_H
#define VORNHOST_RCNETWORK_RUNSTATE_H

#include <map>
#include <optional>
#include <set>
#include <string>

namespace vornhost {

constexpr char kRunStatePath[] = "/run/vornovs/network.json";

/** What was made for one plain interface and the bridge that may stand for it. */
struct InterfaceRecord {
    std::set<std::string> addresses; ///< "192.0.2.1/24"
    std::set<std::string> routes;    ///< As RouteKeyText() writes them, without the interface.
    /** IPv6 addresses that are being moved without the check for duplicates. */
    std::set<std::string> unchecked;
    bool broughtUp = false; ///< The link was down before.
    bool made = false;      ///< The link itself: a bond, a VLAN.
    bool client = false;    ///< A DHCP client, and so what that put there.
    std::optional<unsigned> formerMtu;
    std::string resolver;        ///< The interface under whose name servers were told of, and they.
    std::string linkCommands;    ///< What was set on the card.
    std::string ownMac;          ///< Of an interface that has its bond's address.
    std::optional<unsigned> tag; ///< The VLAN tag that was set on the bridge's port.
    /** Settings of the plain interface as they were, by name, such as "ipv6.conf.accept_ra". */
    std::map<std::string, std::string> formerSettings;

    /** Settings of an interface that carries something for a bond, as they were before that. */
    std::map<std::string, std::string> ownSettings;

    bool operator==(const InterfaceRecord&) const = default;
    /** Whether nothing was made. */
    bool Empty() const;
};

struct RunState {
    std::map<std::string, InterfaceRecord> interfaces; ///< By the plain interface's name.

    bool operator==(const RunState&) const = default;
};

/** @return  an empty state when there is none that can be read. */
RunState ParseRunState(const std::string& text);

std::string RunStateText(const RunState& state);

} // namespace vornhost

#endif
