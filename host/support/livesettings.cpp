#include "livesettings.h"

#include <algorithm>
#include <linux/if_addr.h>
#include <linux/rtnetlink.h>
#include <sys/socket.h>

namespace vornhost {
namespace {

constexpr unsigned kUsualMtu = 1500;
constexpr unsigned kUsualIPv6Metric = 1024;

bool IsLasting(const Address& address, const Link& link, int family)
{
    return address.index == link.index && address.family == family &&
           address.scope == RT_SCOPE_UNIVERSE && (address.flags & IFA_F_PERMANENT) != 0;
}

void WriteIPv4(const LiveNetwork& network, const Link& link, KeyValueFile& file)
{
    unsigned count = 0;
    for (const Address& address : network.addresses) {
        if (IsLasting(address, link, AF_INET)) {
            const std::string number = count == 0 ? "" : std::to_string(count);
            (void)file.Set("IPADDR" + number, address.local);
            (void)file.Set("PREFIX" + number, std::to_string(address.prefixLength));
            ++count;
        }
    }
}

void WriteIPv6(const LiveNetwork& network, const Link& link, KeyValueFile& file)
{
    std::string others;
    for (const Address& address : network.addresses) {
        if (!IsLasting(address, link, AF_INET6)) {
            continue;
        }
        const std::string text = address.local + '/' + std::to_string(address.prefixLength);
        if (!file.Get("IPV6ADDR")) {
            (void)file.Set("IPV6INIT", "yes");
            (void)file.Set("IPV6ADDR", text);
        } else {
            others += (others.empty() ? "" : " ") + text;
        }
    }
    if (!others.empty()) {
        (void)file.Set("IPV6ADDR_SECONDARIES", '"' + others + '"');
    }
}

bool IsDefaultRouteOf(const Route& route, const Link& link)
{
    return route.table == RT_TABLE_MAIN && route.prefixLength == 0 &&
           (route.protocol == RTPROT_STATIC || route.protocol == RTPROT_BOOT) &&
           route.nextHops.size() == 1 && route.nextHops[0].index == link.index &&
           route.nextHops[0].gatewayFamily == route.family && !route.nextHops[0].gateway.empty();
}

void WriteGateways(const LiveNetwork& network, const Link& link, KeyValueFile& file)
{
    for (const Route& route : network.routes) {
        const bool ipv4 = route.family == AF_INET;
        const char* const key = ipv4 ? "GATEWAY" : "IPV6_DEFAULTGW";
        if (!IsDefaultRouteOf(route, link) || file.Get(key)) {
            continue; // of several the kernel lists the preferred one first
        }
        (void)file.Set(key, route.nextHops[0].gateway);
        if (route.priority != (ipv4 ? 0 : kUsualIPv6Metric) && !file.Get("METRIC")) {
            (void)file.Set("METRIC", std::to_string(route.priority));
        }
    }
}

} // namespace

LiveNetwork LiveNetwork::Read()
{
    return {ReadLinks(), ReadAddresses().value_or(std::vector<Address>()),
            ReadRoutes().value_or(std::vector<Route>())};
}

const Link* LiveNetwork::Find(const std::string& name) const
{
    const auto found = std::find_if(links.begin(), links.end(),
                                    [&](const Link& link) { return link.name == name; });
    return found == links.end() ? nullptr : &*found;
}

bool LiveNetwork::HasGlobalAddress(const Link& link) const
{
    return std::any_of(addresses.begin(), addresses.end(), [&](const Address& address) {
        return address.index == link.index && address.scope == RT_SCOPE_UNIVERSE;
    });
}

KeyValueFile LiveAddressing(const LiveNetwork& network, const std::string& interface)
{
    KeyValueFile file;
    const Link* const link = network.Find(interface);
    if (link == nullptr) {
        return file;
    }
    (void)file.Set("BOOTPROTO", "none");
    WriteIPv4(network, *link, file);
    WriteIPv6(network, *link, file);
    WriteGateways(network, *link, file);
    if (link->mtu != kUsualMtu) {
        (void)file.Set("MTU", std::to_string(link->mtu));
    }
    return file;
}

} // namespace vornhost
