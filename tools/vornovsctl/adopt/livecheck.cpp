#include "adopt/livecheck.h"

#include <algorithm>
#include <iterator>
#include <linux/if_addr.h>
#include <linux/rtnetlink.h>
#include <sstream>
#include <sys/socket.h>

namespace vornovsctl {

namespace {

constexpr char kResolverPath[] = "/etc/resolv.conf";

/** Addresses that change by themselves are nobody's to keep. */
bool IsToStay(const vornhost::Address& address)
{
    return address.scope != RT_SCOPE_HOST && (address.flags & IFA_F_TEMPORARY) == 0 &&
           (address.flags & IFA_F_DEPRECATED) == 0;
}

std::string DestinationOf(const vornhost::Route& route)
{
    return route.prefixLength == 0
               ? "the default route"
               : "the route to " + route.destination + '/' + std::to_string(route.prefixLength);
}

void AddResolver(const HostView& host, Belongings& belongings)
{
    std::istringstream stream(host.Text(kResolverPath).value_or(""));
    for (std::string line; std::getline(stream, line);) {
        std::istringstream words(line);
        std::string key;
        words >> key;
        if (key == "nameserver" || key == "search" || key == "domain") {
            for (std::string word; words >> word;) {
                belongings.insert((key == "nameserver" ? "the name server " : "the domain ") +
                                  word);
            }
        }
    }
}

} // namespace

Belongings BelongingsOf(const HostView& host, const std::set<std::string>& names)
{
    Belongings belongings;
    for (const vornhost::Address& address : host.live.addresses) {
        const std::string name = host.NameOf(address.index);
        if (names.contains(name) && IsToStay(address)) {
            belongings.insert(address.local + " on " + name);
        }
    }
    for (const vornhost::Route& route : host.live.routes) {
        for (const vornhost::NextHop& hop : route.nextHops) {
            const std::string name = host.NameOf(hop.index);
            if (names.contains(name) && !hop.gateway.empty()) {
                belongings.insert(DestinationOf(route) + " via " + hop.gateway + " on " + name);
            }
        }
    }
    AddResolver(host, belongings);
    return belongings;
}

Belongings Missing(const Belongings& before, const Belongings& now)
{
    Belongings missing;
    std::set_difference(before.begin(), before.end(), now.begin(), now.end(),
                        std::inserter(missing, missing.end()));
    return missing;
}

} // namespace vornovsctl
