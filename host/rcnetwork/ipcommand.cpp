#include "ipcommand.h"

#include <array>

#include <linux/if_addr.h>
#include <linux/rtnetlink.h>
#include <sys/socket.h>

namespace vornhost {
namespace {

struct FlagName {
    std::uint32_t flag;
    const char* name;
};

constexpr std::array kAddressFlags{
    FlagName{IFA_F_NODAD, "nodad"}, FlagName{IFA_F_HOMEADDRESS, "home"},
    FlagName{IFA_F_MANAGETEMPADDR, "mngtmpaddr"}, FlagName{IFA_F_NOPREFIXROUTE, "noprefixroute"},
    FlagName{IFA_F_MCAUTOJOIN, "autojoin"}};

struct MetricName {
    unsigned kind;
    const char* name;
};

constexpr std::array kMetricNames{
    MetricName{RTAX_MTU, "mtu"},           MetricName{RTAX_WINDOW, "window"},
    MetricName{RTAX_SSTHRESH, "ssthresh"}, MetricName{RTAX_CWND, "cwnd"},
    MetricName{RTAX_ADVMSS, "advmss"},     MetricName{RTAX_REORDERING, "reordering"},
    MetricName{RTAX_HOPLIMIT, "hoplimit"}, MetricName{RTAX_INITCWND, "initcwnd"},
    MetricName{RTAX_INITRWND, "initrwnd"}, MetricName{RTAX_QUICKACK, "quickack"},
};

/** Preferences of a router as the kernel codes them; 0, medium, is the default. */
constexpr int kPreferenceHigh = 1;
constexpr int kPreferenceLow = 3;

/** Names that "ip" knows on every host; others are given as numbers. */
std::string ProtocolText(unsigned protocol)
{
    switch (protocol) {
    case RTPROT_BOOT:
        return "boot";
    case RTPROT_STATIC:
        return "static";
    case RTPROT_RA:
        return "ra";
    case RTPROT_DHCP:
        return "dhcp";
    default:
        return std::to_string(protocol);
    }
}

std::string ScopeText(unsigned scope)
{
    switch (scope) {
    case RT_SCOPE_UNIVERSE:
        return "global";
    case RT_SCOPE_LINK:
        return "link";
    case RT_SCOPE_HOST:
        return "host";
    default:
        return std::to_string(scope);
    }
}

std::string TypeText(unsigned type)
{
    switch (type) {
    case RTN_BLACKHOLE:
        return "blackhole ";
    case RTN_UNREACHABLE:
        return "unreachable ";
    case RTN_PROHIBIT:
        return "prohibit ";
    default:
        return {};
    }
}

std::string DestinationText(const Route& route)
{
    if (!route.destination.empty()) {
        return route.destination + "/" + std::to_string(route.prefixLength);
    }
    // "default" alone would mean the IPv4 one.
    return route.family == AF_INET ? "default" : "::/0";
}

std::string HopText(const NextHop& hop, int family, const NameOfIndex& nameOf)
{
    std::string text;
    if (!hop.gateway.empty()) {
        text += hop.gatewayFamily == family ? " via " : " via inet6 ";
        text += hop.gateway;
    }
    return text + " dev " + nameOf(hop.index);
}

std::string MetricsText(const Route& route)
{
    std::string text;
    for (const RouteMetric& metric : route.metrics) {
        for (const MetricName& known : kMetricNames) {
            if (metric.kind == known.kind) {
                text += std::string(" ") + known.name + (metric.locked ? " lock " : " ") +
                        std::to_string(metric.value);
            }
        }
    }
    return text;
}

std::string HopsText(const Route& route, const NameOfIndex& nameOf)
{
    std::string text;
    if (route.nextHops.size() == 1) {
        return route.nextHops[0].onLink ? " onlink" : "";
    }
    for (const NextHop& hop : route.nextHops) {
        text += " nexthop" + HopText(hop, route.family, nameOf) + " weight " +
                std::to_string(hop.weight) + (hop.onLink ? " onlink" : "");
    }
    return text;
}

} // namespace

std::string AddressText(const Address& address)
{
    return address.local + "/" + std::to_string(address.prefixLength);
}

std::string AddressArguments(const Address& address, const std::string& interface,
                             const std::string& formerInterface, bool settled)
{
    std::string text = address.peer.empty() ? AddressText(address)
                                            : address.local + " peer " + address.peer + "/" +
                                                  std::to_string(address.prefixLength);
    if (!address.broadcast.empty()) {
        text += " brd " + address.broadcast;
    }
    text += " dev " + interface;
    // A label begins with the interface's name and has as little room as that.
    if (address.label.rfind(formerInterface + ":", 0) == 0) {
        const std::string label = interface + address.label.substr(formerInterface.size());
        text += label.size() < 16 ? " label " + label : "";
    }
    if (address.family == AF_INET && address.scope != RT_SCOPE_UNIVERSE) {
        text += " scope " + ScopeText(address.scope);
    }
    if (address.metric != 0) {
        text += " metric " + std::to_string(address.metric);
    }
    if (address.validSeconds != UINT32_MAX) {
        text += " valid_lft " + std::to_string(address.validSeconds) + " preferred_lft " +
                std::to_string(address.preferredSeconds);
    }
    std::uint32_t flags = address.flags;
    if (address.family == AF_INET) {
        flags &= IFA_F_NOPREFIXROUTE | IFA_F_MCAUTOJOIN;
    } else if (settled) {
        flags |= IFA_F_NODAD;
    }
    for (const FlagName& known : kAddressFlags) {
        text += (flags & known.flag) != 0 ? std::string(" ") + known.name : "";
    }
    return text;
}

std::string RouteSlot(const Route& route)
{
    std::string text = (route.family == AF_INET ? "inet " : "inet6 ") + DestinationText(route);
    text += " table " + std::to_string(route.table);
    text += " metric " + std::to_string(route.priority);
    return route.tos == 0 ? text : text + " tos " + std::to_string(route.tos);
}

std::string RouteKeyText(const Route& route)
{
    std::string text = TypeText(route.type) + RouteSlot(route);
    for (const NextHop& hop : route.nextHops) {
        text += " via " + (hop.gateway.empty() ? std::string("link") : hop.gateway);
    }
    return text;
}

std::string RouteArguments(const Route& route, const NameOfIndex& nameOf)
{
    std::string text = TypeText(route.type) + DestinationText(route);
    if (route.tos != 0) {
        text += " tos " + std::to_string(route.tos);
    }
    if (route.nextHops.size() == 1) {
        text += HopText(route.nextHops[0], route.family, nameOf);
    }
    if (route.table != RT_TABLE_MAIN) {
        text += " table " + std::to_string(route.table);
    }
    text += " proto " + ProtocolText(route.protocol);
    if (route.family == AF_INET) {
        text += " scope " + ScopeText(route.scope);
    }
    if (!route.source.empty()) {
        text += " src " + route.source;
    }
    if (route.priority != 0) {
        text += " metric " + std::to_string(route.priority);
    }
    text += MetricsText(route);
    if (route.expiresSeconds != 0) {
        text += " expires " + std::to_string(route.expiresSeconds);
    }
    if (route.preference == kPreferenceHigh || route.preference == kPreferenceLow) {
        text += route.preference == kPreferenceHigh ? " pref high" : " pref low";
    }
    return text + HopsText(route, nameOf);
}

} // namespace vornhost
