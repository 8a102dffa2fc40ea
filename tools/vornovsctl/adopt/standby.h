/**
 * What stands in for addresses and routes of interfaces while their manager begins with them again.
 * systemd-networkd drops what it did not make before it asks servers and routers, and none of the
 * managers makes of an address that it finds what it would have made itself.
 */
#ifndef VORNOVSCTL_ADOPT_STANDBY_H
#define VORNOVSCTL_ADOPT_STANDBY_H

#include "adopt/hands.h"
#include "adopt/hostview.h"
#include "adopt/wish.h"

#include <map>
#include <string>
#include <vector>

namespace vornovsctl {

/** An address as it was, and will be again. */
struct StoodInAddress {
    vornhost::Address address;
    std::string device;
    Manager manager = Manager::kNobody;
};

struct StoodInRoute {
    vornhost::Route route;
    std::string device;
    bool shared = false; /**< with an address that stays */
};

struct Standby {
    std::vector<StoodInAddress> addresses;
    std::vector<StoodInRoute> routes;
};

/**
 * @param managers  the interfaces by their names.
 * @return  what there is to stand in for.
 */
Standby StandbyFor(const HostView& host, const std::map<std::string, Manager>& managers);

/** Replaces it by what the managers leave alone. */
void PutUp(const Standby& standby, Hands& hands);

/** Whether everything is there again by itself. */
bool IsReplaced(const Standby& standby, const HostView& now);

/** Takes away what is there again. What is not ends when it would have ended anyway. */
void TakeDown(const Standby& standby, const HostView& now, Hands& hands);

} // namespace vornovsctl

#endif
