#include "adopt/standby.h"

#include <algorithm>
#include <arpa/inet.h>
#include <array>
#include <linux/if_addr.h>
#include <linux/rtnetlink.h>
#include <sys/socket.h>

namespace vornovsctl {

namespace {

constexpr unsigned kWholeAddress4 = 32;
constexpr unsigned kWholeAddress6 = 128;
constexpr unsigned kHalfAddress6 = 64;
constexpr std::uint32_t kEver = UINT32_MAX;
constexpr char kNoRoute[] = " noprefixroute";
constexpr std::uint32_t kKernelPrefixMetric = 256;

bool Has(const vornhost::Address& address, std::uint32_t flag)
{
    return (address.flags & flag) != 0;
}

bool IsDynamic(const vornhost::Address& address)
{
    return address.preferredSeconds != kEver;
}

/** Whether a manager would not go on with an address as it is. */
bool IsStoodInFor(const vornhost::Address& address, Manager manager)
{
    if (!address.peer.empty() || Has(address, IFA_F_DEPRECATED) ||
        (address.family == AF_INET && address.prefixLength >= kWholeAddress4)) {
        return false;
    }
    const bool isLocal = address.family == AF_INET6 && address.scope == RT_SCOPE_LINK;
    const bool isGlobal = address.scope == RT_SCOPE_UNIVERSE;
    switch (manager) {
    case Manager::kNetworkd:
        // A temporary one is the kernel's, which makes a new one of the address that stays.
        return isGlobal && IsDynamic(address) && !Has(address, IFA_F_TEMPORARY);
    case Manager::kNetworkManager:
        return (isGlobal || isLocal) && !Has(address, IFA_F_NOPREFIXROUTE | IFA_F_TEMPORARY);
    case Manager::kIfupdown:
        // What routers tell is up to the kernel.
        return isGlobal && IsDynamic(address) &&
               (address.family == AF_INET || address.prefixLength == kWholeAddress6);
    case Manager::kNobody:
        break;
    }
    return false;
}

bool IsStoodInFor(const vornhost::Route& route, Manager manager)
{
    const bool simple = route.type == RTN_UNICAST && route.nextHops.size() == 1 &&
                        (route.nextHops.front().gateway.empty() ||
                         route.nextHops.front().gatewayFamily == route.family);
    // Nobody makes the fixed ones again on behalf of ifupdown.
    return simple && (manager == Manager::kNetworkd || manager == Manager::kNetworkManager ||
                      (manager == Manager::kIfupdown && route.protocol == RTPROT_DHCP));
}

std::string NetworkOf(const vornhost::Address& address)
{
    std::array<unsigned char, sizeof(in6_addr)> bytes{};
    std::array<char, INET6_ADDRSTRLEN> text{};
    if (inet_pton(address.family, address.local.c_str(), bytes.data()) != 1) {
        return "";
    }
    for (unsigned bit = address.prefixLength; bit < 8 * bytes.size(); ++bit) {
        bytes.at(bit / 8) &= static_cast<unsigned char>(~(0x80U >> (bit % 8)));
    }
    return inet_ntop(address.family, bytes.data(), text.data(), text.size()) == nullptr
               ? ""
               : text.data();
}

/** The route that the kernel has made of an address, and that goes with it. */
vornhost::Route KernelRouteOf(const vornhost::Address& address)
{
    vornhost::Route route;
    route.family = address.family;
    route.table = RT_TABLE_MAIN;
    route.protocol = RTPROT_KERNEL;
    route.destination = NetworkOf(address);
    route.prefixLength = address.prefixLength;
    route.source = address.family == AF_INET ? address.local : "";
    route.priority =
        address.family == AF_INET6 && address.metric == 0 ? kKernelPrefixMetric : address.metric;
    route.nextHops.push_back({address.index, "", 0, 1, false});
    return route;
}

std::string Length(const vornhost::Address& address)
{
    return '/' + std::to_string(address.prefixLength);
}

std::string TextOf(const StoodInAddress& entry)
{
    return entry.address.local + Length(entry.address) + " dev " + entry.device;
}

/** The same address of IPv4 with another length, beside which the former one can be anew. */
std::string SubstituteOf(const StoodInAddress& entry)
{
    return entry.address.local + "/32 dev " + entry.device;
}

std::string Lifetime(std::uint32_t seconds)
{
    return seconds == kEver ? "forever" : std::to_string(seconds);
}

std::string Lifetimes(std::uint32_t valid, std::uint32_t preferred)
{
    return " valid_lft " + Lifetime(valid) + " preferred_lft " + Lifetime(preferred) + '\n';
}

/** As its manager would have made an address of IPv6, which can be said of one that is there. */
std::string ChangeOf(const StoodInAddress& entry, bool forEver)
{
    const vornhost::Address& address = entry.address;
    const bool bare = entry.manager == Manager::kIfupdown;
    const bool own = entry.manager == Manager::kNetworkd && !Has(address, IFA_F_TEMPORARY) &&
                     address.prefixLength == kHalfAddress6;
    return "address change " + TextOf(entry) +
           (address.scope == RT_SCOPE_LINK ? " scope link" : "") + (bare ? "" : kNoRoute) +
           (own ? " mngtmpaddr" : "") +
           Lifetimes(forEver ? kEver : address.validSeconds,
                     forEver ? kEver : address.preferredSeconds);
}

std::string TextOf(const StoodInRoute& entry)
{
    const vornhost::Route& route = entry.route;
    const std::string& gateway = route.nextHops.front().gateway;
    const std::string destination =
        route.destination.empty() ? std::string("default")
                                  : route.destination + '/' + std::to_string(route.prefixLength);
    return destination + (gateway.empty() ? "" : " via " + gateway) + " dev " + entry.device +
           " table " + std::to_string(route.table);
}

/** With a metric of its own: a manager would believe that one of the same is what it wants. */
std::string SubstituteOf(const StoodInRoute& entry)
{
    return TextOf(entry) + " proto static metric " + std::to_string(entry.route.priority + 1);
}

std::string NewSubstituteOf(const StoodInRoute& entry)
{
    const vornhost::NextHop& hop = entry.route.nextHops.front();
    const bool direct = hop.gateway.empty();
    return "route replace " + SubstituteOf(entry) +
           (entry.route.source.empty() ? "" : " src " + entry.route.source) +
           (hop.onLink ? " onlink" : "") +
           (entry.route.family == AF_INET && direct ? " scope link" : "") + '\n';
}

std::string RemovalOf(const StoodInRoute& entry)
{
    return "route del " + TextOf(entry) + " proto " + std::to_string(entry.route.protocol) +
           " metric " + std::to_string(entry.route.priority) + '\n';
}

/** Routes to networks first: those through gateways there need them. */
std::string RouteLines(const Standby& standby, int family)
{
    std::string lines;
    for (const bool direct : {true, false}) {
        for (const StoodInRoute& entry : standby.routes) {
            if (entry.route.family == family &&
                entry.route.nextHops.front().gateway.empty() == direct) {
                lines += NewSubstituteOf(entry);
            }
        }
    }
    for (const StoodInRoute& entry : standby.routes) {
        if (entry.route.family == family && entry.route.protocol != RTPROT_KERNEL) {
            lines += RemovalOf(entry);
        }
    }
    return lines;
}

/**
 * The kernel leaves a route that it made of a router's word, though the address that came with it
 * does without; one that was made of an address alone is gone by now.
 */
std::string KernelRemovals(const Standby& standby)
{
    std::string lines;
    for (const StoodInRoute& entry : standby.routes) {
        if (entry.route.family == AF_INET6 && entry.route.protocol == RTPROT_KERNEL &&
            !entry.shared) {
            lines += RemovalOf(entry);
        }
    }
    return lines;
}

/** Whether the kernel's route of an address is that of another one, too, which keeps it. */
bool IsShared(const vornhost::Address& address, const HostView& host, Manager manager)
{
    const auto& all = host.live.addresses;
    return std::any_of(all.begin(), all.end(), [&](const vornhost::Address& other) {
        return other.index == address.index && other.family == address.family &&
               other.prefixLength == address.prefixLength && !Has(other, IFA_F_NOPREFIXROUTE) &&
               !IsStoodInFor(other, manager) && NetworkOf(other) == NetworkOf(address);
    });
}

void RunBatch(int family, const std::string& lines, Hands& hands)
{
    if (!lines.empty()) {
        (void)hands.Feed({"ip", family == AF_INET ? "-4" : "-6", "-force", "-batch", "-"}, lines);
    }
}

bool IsThere(const StoodInAddress& entry, const HostView& now)
{
    const vornhost::Address& address = entry.address;
    // Only systemd-networkd gets one that lasts for ever meanwhile.
    if (address.family == AF_INET6 && entry.manager != Manager::kNetworkd) {
        return true;
    }
    const auto& all = now.live.addresses;
    return std::any_of(all.begin(), all.end(), [&](const vornhost::Address& each) {
        return each.index == address.index && each.local == address.local &&
               each.prefixLength == address.prefixLength &&
               (address.family == AF_INET || IsDynamic(each));
    });
}

bool IsThere(const StoodInRoute& entry, const Standby& standby, const HostView& now)
{
    const vornhost::Route& route = entry.route;
    const vornhost::NextHop& hop = route.nextHops.front();
    if (hop.gateway.empty()) {
        // It may be the kernel now that makes it of the address.
        return std::all_of(standby.addresses.begin(), standby.addresses.end(),
                           [&](const StoodInAddress& each) {
                               return each.address.family != route.family ||
                                      each.address.index != hop.index || IsThere(each, now);
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

} // namespace

Standby StandbyFor(const HostView& host, const std::map<std::string, Manager>& managers)
{
    const auto managerOf = [&](const std::string& name) {
        const auto found = managers.find(name);
        return found == managers.end() ? Manager::kNobody : found->second;
    };
    Standby standby;
    for (const vornhost::Address& address : host.live.addresses) {
        const std::string name = host.NameOf(address.index);
        if (!IsStoodInFor(address, managerOf(name))) {
            continue;
        }
        standby.addresses.push_back({address, name, managerOf(name)});
        const bool bare = address.family == AF_INET6 && managerOf(name) == Manager::kIfupdown;
        if (!Has(address, IFA_F_NOPREFIXROUTE) && !bare) {
            standby.routes.push_back(
                {KernelRouteOf(address), name, IsShared(address, host, managerOf(name))});
        }
    }
    for (const vornhost::Route& route : host.live.routes) {
        const std::string name =
            route.nextHops.empty() ? "" : host.NameOf(route.nextHops.front().index);
        if (IsStoodInFor(route, managerOf(name))) {
            standby.routes.push_back({route, name, false});
        }
    }
    return standby;
}

void PutUp(const Standby& standby, Hands& hands)
{
    for (const int family : {AF_INET, AF_INET6}) {
        std::string before;
        std::string after;
        for (const StoodInAddress& entry : standby.addresses) {
            const vornhost::Address& address = entry.address;
            if (address.family != family) {
                continue;
            }
            if (family == AF_INET) {
                before.append("address replace ").append(SubstituteOf(entry)).append(kNoRoute) +=
                    '\n';
                after += "address del " + TextOf(entry) + '\n';
            } else {
                after += ChangeOf(entry, entry.manager == Manager::kNetworkd);
            }
        }
        if (family == AF_INET6) {
            after += KernelRemovals(standby);
        }
        RunBatch(family, before.append(RouteLines(standby, family)).append(after), hands);
    }
}

bool IsReplaced(const Standby& standby, const HostView& now)
{
    return std::all_of(standby.addresses.begin(), standby.addresses.end(),
                       [&](const auto& entry) { return IsThere(entry, now); }) &&
           std::all_of(standby.routes.begin(), standby.routes.end(),
                       [&](const auto& entry) { return IsThere(entry, standby, now); });
}

void TakeDown(const Standby& standby, const HostView& now, Hands& hands)
{
    for (const int family : {AF_INET, AF_INET6}) {
        std::string lines;
        for (const StoodInRoute& entry : standby.routes) {
            if (entry.route.family == family && IsThere(entry, standby, now)) {
                lines += "route del " + SubstituteOf(entry) + '\n';
            }
        }
        for (const StoodInAddress& entry : standby.addresses) {
            const vornhost::Address& address = entry.address;
            const bool there = IsThere(entry, now);
            if (address.family != family || (there && family == AF_INET6)) {
                continue;
            }
            if (there) {
                lines += "address del " + SubstituteOf(entry) + '\n';
            } else if (family == AF_INET) {
                lines.append("address change ").append(SubstituteOf(entry)).append(kNoRoute);
                lines += Lifetimes(address.validSeconds, address.preferredSeconds);
            } else {
                lines += ChangeOf(entry, false);
            }
        }
        RunBatch(family, lines, hands);
    }
}

} // namespace vornovsctl
