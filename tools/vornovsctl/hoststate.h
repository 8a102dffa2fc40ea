/**
 * Who is registered and what is on the switch, as the library and its files tell it.
 */
#ifndef VORNOVSCTL_HOSTSTATE_H
#define VORNOVSCTL_HOSTSTATE_H

#include "answer.h"

#include <optional>
#include <set>
#include <string>

namespace vornovsctl {

using Names = std::set<std::string>;

struct HostState {
    std::optional<Names> clients; /**< nothing: the registrations cannot be read */
    bool switchRuns = false;
    std::optional<Names> interfaces; /**< plain names of those on the switch; nothing: not known */
    std::optional<Names> takenOff;   /**< those taken off it one by one; nothing: not known */

    bool IsRegistered(const std::string& client) const
    {
        return clients && clients->contains(client);
    }
    bool HasClients() const { return clients && !clients->empty(); }
    bool HasInterfaces() const { return interfaces && !interfaces->empty(); }

    /** Whether the switch is empty because everything was taken off it. */
    bool IsEmptied() const
    {
        return interfaces && interfaces->empty() && takenOff && !takenOff->empty();
    }

    /** Interfaces are on the switch exactly while clients are registered. */
    bool IsConsistent() const
    {
        const bool fits = HasClients() == HasInterfaces() || (HasClients() && IsEmptied());
        return clients && fits && (switchRuns || !HasClients());
    }
};

/** @return the registered clients; nothing: they cannot be read. */
std::optional<Names> ReadClients();

/**
 * Reads the list of the interfaces that were taken off the switch one by one. The library leaves
 * those in it that have come back with all the others.
 * @return  nothing: it cannot be read.
 */
std::optional<Names> ReadTakenOff();

/** Takes an interface off that list. */
void ForgetTakenOff(const std::string& interface);

/** @return the VLAN tag in a port's configuration file; empty: none is recorded there. */
std::string ReadRecordedTag(const std::string& port);

/** Reads the state; starts nothing. */
HostState ReadHostState();

/** The state as members of a JSON object. */
Json StateFields(const HostState& state);

/** The bridge that carries an interface. */
std::string BridgeOf(const std::string& interface);

/** @return the interface that a bridge carries by its name; empty: it is no such bridge. */
std::string InterfaceOf(const std::string& bridge);

/** The names, or null when they are not known. */
Json NamesOrNull(const std::optional<Names>& names);

} // namespace vornovsctl

#endif
