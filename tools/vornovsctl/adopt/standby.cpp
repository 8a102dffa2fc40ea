#include "adopt/standby.h"

#include <algorithm>
#include <linux/if_addr.h>
#include <linux/rtnetlink.h>
#include <sys/socket.h>

namespace vornovsctl {

namespace {

constexpr unsigned kWholeAddress = 32;
constexpr unsigned kHalfAddress = 64;
constexpr std::uint32_t kEver = UINT32_MAX;

bool IsStoodInFor(const vornhost::Address& address)
{
    return address.scope == RT_SCOPE_UNIVERSE && address.preferredSeconds != kEver &&
           address.peer.empty() && (address.flags & IFA_F_DEPRECATED) == 0 &&
           (address.family == AF_INET6 || address.prefixLength < kWholeAddress);
}

bool IsStoodInFor(const vornhost::Route& route)
{
    return route.type == RTN_UNICAST && route.nextHops.size() == 1 &&
           (route.nextHops.front().gateway.empty() ||
            route.nextHops.front().gatewayFamily == route.family);
}

std::string Length(const vornhost::Address& address)
{
    return '/' + std::to_string(address.prefixLength);
}

std::string Lifetime(std::uint32_t seconds)
{
    return seconds == kEver ? "forever" : std::to_string(seconds);
}

/** "change ADDRESS ..." with what the address shall be good for. */
std::string ChangeOf(const vornhost::Address& address, const std::string& device,
                     std::uint32_t valid, std::uint32_t preferred)
{
    const bool temporary = (address.flags & IFA_F_TEMPORARY) != 0;
    const bool own = address.family == AF_INET6 && address.prefixLength == kHalfAddress;
    return "address change " + address.local +
           (address.family == AF_INET ? "/32" : Length(address)) + " dev " + device +
           (address.family == AF_INET || (address.flags & IFA_F_NOPREFIXROUTE) != 0
                ? " noprefixroute"
                : "") +
           (own && !temporary ? " mngtmpaddr" : "") + " valid_lft " + Lifetime(valid) +
           " preferred_lft " + Lifetime(preferred) + '\n';
}

std::string TextOf(const vornhost::Route& route, const std::string& device)
{
    const vornhost::NextHop& hop = route.nextHops.front();
    const std::string destination =
        route.destination.empty() ? std::string("default")
                                  : route.destination + '/' + std::to_string(route.prefixLength);
    return destination + (hop.gateway.empty() ? "" : " via " + hop.gateway) + " dev " + device +
           " table " + std::to_string(route.table);
}

std::string OriginalOf(const vornhost::Route& route, const std::string& device)
{
    return TextOf(route, device) + " proto " + std::to_string(route.protocol) + " metric " +
           std::to_string(route.priority) + '\n';
}

/** Of a metric of its own: systemd-networkd would take one of the same for what it wants to make.
 */
std::string SubstituteOf(const vornhost::Route& route, const std::string& device)
{
    return TextOf(route, device) + " proto static metric " + std::to_string(route.priority + 1);
}

std::string SubstituteWords(const vornhost::Route& route)
{
    const bool direct = route.nextHops.front().gateway.empty();
    return (route.source.empty() ? "" : " src " + route.source) +
           (route.nextHops.front().onLink ? std::string(" onlink") : "") +
           (route.family == AF_INET && direct ? " scope link" : "") + '\n';
}

void RunBatch(int family, const std::string& lines, Hands& hands)
{
    if (!lines.empty()) {
        (void)hands.Feed({"ip", family == AF_INET ? "-4" : "-6", "-force", "-batch", "-"}, lines);
    }
}

bool IsThere(const vornhost::Address& address, const HostView& now)
{
    const auto& all = now.live.addresses;
    return std::any_of(all.begin(), all.end(), [&](const vornhost::Address& each) {
        return each.index == address.index && each.local == address.local &&
               each.prefixLength == address.prefixLength && each.preferredSeconds != kEver;
    });
}

bool IsThere(const vornhost::Route& route, const Standby& standby, const HostView& now)
{
    const vornhost::NextHop& hop = route.nextHops.front();
    if (hop.gateway.empty()) {
        // It may be the kernel now that makes it of the address.
        return std::all_of(standby.addresses.begin(), standby.addresses.end(),
                           [&](const vornhost::Address& address) {
                               return address.family != route.family ||
                                      address.index != hop.index || IsThere(address, now);
                           });
    }
    const auto& all = now.live.routes;
    return std::any_of(all.begin(), all.end(), [&](const vornhost::Route& each) {
        return each.family == route.family && each.table == route.table &&
               each.destination == route.destination && each.prefixLength == route.prefixLength &&
               each.priority != route.priority + 1 && each.nextHops.size() == 1 &&
               each.nextHops.front().index == hop.index &&
               each.nextHops.front().gateway == hop.gateway;
    });
}

/** Routes that lead to gateways first: those through them need them. */
std::string RouteLines(const Standby& standby, int family, const HostView& host)
{
    std::string lines;
    for (const bool direct : {true, false}) {
        for (const vornhost::Route& route : standby.routes) {
            const vornhost::NextHop& hop = route.nextHops.front();
            if (route.family == family && hop.gateway.empty() == direct) {
                lines += "route replace " + SubstituteOf(route, host.NameOf(hop.index)) +
                         SubstituteWords(route);
            }
        }
    }
    for (const vornhost::Route& route : standby.routes) {
        if (route.family == family) {
            lines += "route del " + OriginalOf(route, host.NameOf(route.nextHops.front().index));
        }
    }
    return lines;
}

} // namespace

Standby StandbyFor(const HostView& host, const std::set<std::string>& names)
{
    Standby standby;
    for (const vornhost::Address& address : host.live.addresses) {
        if (names.contains(host.NameOf(address.index)) && IsStoodInFor(address)) {
            standby.addresses.push_back(address);
        }
    }
    for (const vornhost::Route& route : host.live.routes) {
        if (IsStoodInFor(route) && names.contains(host.NameOf(route.nextHops.front().index))) {
            standby.routes.push_back(route);
        }
    }
    return standby;
}

void PutUp(const Standby& standby, const HostView& host, Hands& hands)
{
    for (const int family : {AF_INET, AF_INET6}) {
        std::string before;
        std::string after;
        for (const vornhost::Address& address : standby.addresses) {
            const std::string device = host.NameOf(address.index);
            if (address.family != family) {
                continue;
            }
            if (family == AF_INET) {
                // The same address with another length, beside which the former one can be anew.
                before +=
                    "address replace " + address.local + "/32 dev " + device + " noprefixroute\n";
                after += "address del " + address.local + Length(address) + " dev " + device + '\n';
            } else {
                before += ChangeOf(address, device, kEver, kEver);
            }
        }
        RunBatch(family, before + RouteLines(standby, family, host) + after, hands);
    }
}

bool IsReplaced(const Standby& standby, const HostView& now)
{
    return std::all_of(standby.addresses.begin(), standby.addresses.end(),
                       [&](const auto& address) { return IsThere(address, now); }) &&
           std::all_of(standby.routes.begin(), standby.routes.end(),
                       [&](const auto& route) { return IsThere(route, standby, now); });
}

void TakeDown(const Standby& standby, const HostView& now, Hands& hands)
{
    for (const int family : {AF_INET, AF_INET6}) {
        std::string lines;
        for (const vornhost::Route& route : standby.routes) {
            if (route.family == family && IsThere(route, standby, now)) {
                lines += "route del " +
                         SubstituteOf(route, now.NameOf(route.nextHops.front().index)) + '\n';
            }
        }
        for (const vornhost::Address& address : standby.addresses) {
            const std::string device = now.NameOf(address.index);
            if (address.family == family && !IsThere(address, now)) {
                lines += ChangeOf(address, device, address.validSeconds, address.preferredSeconds);
            } else if (address.family == family && family == AF_INET) {
                lines += "address del " + address.local + "/32 dev " + device + '\n';
            }
        }
        RunBatch(family, lines, hands);
    }
}

} // namespace vornovsctl
