/**
 * Who is registered and what is on the switch, as the library tells it.
 */
#ifndef VORNOVSCTL_HOSTSTATE_H
#define VORNOVSCTL_HOSTSTATE_H

#include <optional>
#include <set>
#include <string>

namespace vornovsctl {

using Names = std::set<std::string>;

struct HostState {
    std::optional<Names> clients; /**< nothing: the registrations cannot be read */
    bool switchRuns = false;
    std::optional<Names> interfaces; /**< plain names of those on the switch; nothing: not known */

    bool IsRegistered(const std::string& client) const
    {
        return clients && clients->count(client) > 0;
    }
    bool HasClients() const { return clients && !clients->empty(); }
    bool HasInterfaces() const { return interfaces && !interfaces->empty(); }

    /** Interfaces are on the switch exactly while clients are registered. */
    bool IsConsistent() const
    {
        return clients && HasClients() == HasInterfaces() && (switchRuns || !HasClients());
    }
};

/** @return the registered clients; nothing: they cannot be read. */
std::optional<Names> ReadClients();

/** Reads the state; starts nothing. */
HostState ReadHostState();

/** The bridge that carries an interface. */
std::string BridgeOf(const std::string& interface);

} // namespace vornovsctl

#endif
