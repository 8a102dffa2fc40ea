/**
 * Who manages which interface, and which interfaces can only change hands together.
 */
#ifndef VORNOVSCTL_ADOPT_BOUNDARIES_H
#define VORNOVSCTL_ADOPT_BOUNDARIES_H

#include "adopt/hostview.h"
#include "adopt/wish.h"

#include <set>
#include <string>
#include <vector>

namespace vornovsctl {

/** Whether an interface is one that can be on the switch: Ethernet over a wire, a bond, a VLAN. */
bool IsWired(const HostView& host, const vornhost::Link& link);

/** Adds to interfaces those that they are made of and that are made of them. */
std::set<std::string> WithTheirGroups(const HostView& host, std::set<std::string> names);

/**
 * Reads what the managers do for interfaces.
 * @param names  empty: every wired interface that somebody manages or that has an address, but
 *               those that have a configuration file of ours already.
 */
Wishes ReadWishes(const HostView& host, const std::set<std::string>& names);

} // namespace vornovsctl

#endif
