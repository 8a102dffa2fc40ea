/**
 * Having managers let go of interfaces, and take them back, while these go on to work.
 */
#ifndef VORNOVSCTL_ADOPT_HANDOVER_H
#define VORNOVSCTL_ADOPT_HANDOVER_H

#include "adopt/adoptionrecord.h"
#include "adopt/hostview.h"
#include "adopt/standby.h"

#include <set>
#include <string>
#include <vector>

namespace vornovsctl {

constexpr char kNetworkdUnit[] = "systemd-networkd.service";
constexpr char kNetworkManagerUnit[] = "NetworkManager.service";

/** The clients of ifupdown's that work for an interface. */
std::vector<EndedClient> ClientsOf(const HostView& host, const std::string& interface);

/** The line that ifupdown has written down for an interface that is up; empty: there is none. */
std::string StateLineOf(const HostView& host, const std::string& interface);

/** What ifupdown's hooks told the resolver of an interface, which ours have told it as well. */
void ForgetNameServers(const AdoptionRecord& record, const std::set<std::string>& names,
                       Hands& hands);

/** Has them let go of the interfaces; their files keep them away from then on. */
void TakeFromManagers(const HostView& host, const AdoptionRecord& record,
                      const std::set<std::string>& names, Hands& hands);

/** What is left to do when the managers are done with what they got back. */
struct LooseEnds {
    std::set<std::string>
        unchecked; /**< whose addresses are not checked for duplicates meanwhile */
    Standby standby;
};

/** Has them go on with interfaces that they may manage again. */
LooseEnds GiveToManagers(const HostView& host, const AdoptionRecord& record,
                         const std::set<std::string>& names, Hands& hands);

void TieUp(const LooseEnds& ends, const HostView& now, Hands& hands);

} // namespace vornovsctl

#endif
