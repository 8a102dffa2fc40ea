/**
 * What stands in for addresses and routes of interfaces while systemd-networkd starts with them. It
 * drops what it did not make itself before it asks servers and routers, and an address of IPv4 that
 * it finds does not become what it would have made of it.
 */
#ifndef VORNOVSCTL_ADOPT_STANDBY_H
#define VORNOVSCTL_ADOPT_STANDBY_H

#include "adopt/hands.h"
#include "adopt/hostview.h"

#include <set>
#include <string>
#include <vector>

namespace vornovsctl {

/** What the interfaces had, and will have again. */
struct Standby {
    std::vector<vornhost::Address> addresses; /**< those of servers and routers */
    std::vector<vornhost::Route> routes;
};

/** @return  what there is to stand in for. */
Standby StandbyFor(const HostView& host, const std::set<std::string>& names);

/** Replaces it by what systemd-networkd keeps when it is told to keep what is lasting. */
void PutUp(const Standby& standby, const HostView& host, Hands& hands);

/** Whether everything is there again by itself. */
bool IsReplaced(const Standby& standby, const HostView& now);

/** Takes away what is there again. What is not ends when it would have ended anyway. */
void TakeDown(const Standby& standby, const HostView& now, Hands& hands);

} // namespace vornovsctl

#endif
