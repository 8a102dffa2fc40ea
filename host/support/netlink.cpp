#include "netlink.h"

#include <array>
#include <functional>
#include <memory>

#include <linux/if_addr.h>
#include <linux/neighbour.h>
#include <linux/rtnetlink.h>
#include <net/if.h>
#include <netlink/attr.h>
#include <netlink/cache.h>
#include <netlink/msg.h>
#include <netlink/netlink.h>
#include <netlink/route/link.h>
#include <netlink/route/link/inet6.h>
#include <netlink/route/link/vlan.h>
#include <netlink/socket.h>

#include <arpa/inet.h>

namespace vornhost {
namespace {

// A dump that something changed meanwhile is asked for again, but not for ever on a busy host.
constexpr int kDumpTries = 20;

using Attributes = std::array<nlattr*, 64>;

template <auto Free>
struct Freer {
    template <typename T>
    void operator()(T* object) const
    {
        Free(object);
    }
};

using Socket = std::unique_ptr<nl_sock, Freer<nl_socket_free>>;
using Cache = std::unique_ptr<nl_cache, Freer<nl_cache_free>>;

Socket OpenSocket()
{
    Socket socket(nl_socket_alloc());
    if (!socket || nl_connect(socket.get(), NETLINK_ROUTE) < 0) {
        return nullptr;
    }
    return socket;
}

std::string IpText(int family, const void* bytes)
{
    std::array<char, INET6_ADDRSTRLEN> text{};
    const char* done = inet_ntop(family, bytes, text.data(), text.size());
    return done == nullptr ? std::string() : std::string(done);
}

std::string IpText(int family, const nlattr* attribute)
{
    const int length = family == AF_INET ? 4 : 16;
    if (attribute == nullptr || nla_len(attribute) < length) {
        return {};
    }
    return IpText(family, nla_data(attribute));
}

std::string MacText(const unsigned char* bytes, unsigned length)
{
    constexpr char kDigits[] = "0123456789abcdef";
    std::string text;
    for (unsigned i = 0; i < length; ++i) {
        text += text.empty() ? "" : ":";
        text += kDigits[bytes[i] >> 4U];
        text += kDigits[bytes[i] & 0xfU];
    }
    return text;
}

std::uint32_t Number(const nlattr* attribute, std::uint32_t otherwise)
{
    return attribute == nullptr ? otherwise : nla_get_u32(attribute);
}

/** What a dump's callback is handed; the reader must not throw through the C library. */
struct Dump {
    std::function<void(nlmsghdr*)> reader;
    bool failed = false;
};

int ReadMessage(nl_msg* message, void* argument) noexcept
{
    auto* dump = static_cast<Dump*>(argument);
    try {
        dump->reader(nlmsg_hdr(message));
    } catch (...) {
        dump->failed = true;
    }
    return NL_OK;
}

/** One dump: the request's kind and its header, whose first byte is the family. */
bool DumpOnce(int request, const void* header, size_t size, Dump& dump)
{
    const Socket socket = OpenSocket();
    if (!socket) {
        return false;
    }
    void* copy = const_cast<void*>(header); // the library reads it only
    if (nl_socket_modify_cb(socket.get(), NL_CB_VALID, NL_CB_CUSTOM, ReadMessage, &dump) < 0 ||
        nl_send_simple(socket.get(), request, NLM_F_DUMP, copy, size) < 0) {
        return false;
    }
    return nl_recvmsgs_default(socket.get()) >= 0 && !dump.failed;
}

template <typename Record, typename Header>
std::optional<std::vector<Record>> DumpAll(int request, Header header,
                                           void (*read)(nlmsghdr*, std::vector<Record>&))
{
    for (int i = 0; i < kDumpTries; ++i) {
        std::vector<Record> records;
        Dump dump{[&](nlmsghdr* message) { read(message, records); }};
        if (DumpOnce(request, &header, sizeof header, dump)) {
            return records;
        }
    }
    return std::nullopt;
}

template <typename Header>
const Header* ParseMessage(nlmsghdr* message, Attributes& attributes)
{
    attributes.fill(nullptr);
    const int last = static_cast<int>(attributes.size()) - 1;
    if (nlmsg_parse(message, sizeof(Header), attributes.data(), last, nullptr) < 0) {
        return nullptr;
    }
    return static_cast<const Header*>(nlmsg_data(message));
}

void ReadAddress(nlmsghdr* message, std::vector<Address>& addresses)
{
    Attributes attributes;
    const auto* header = ParseMessage<ifaddrmsg>(message, attributes);
    if (header == nullptr || (header->ifa_family != AF_INET && header->ifa_family != AF_INET6)) {
        return;
    }

    Address address;
    address.index = static_cast<int>(header->ifa_index);
    address.family = header->ifa_family;
    address.prefixLength = header->ifa_prefixlen;
    address.scope = header->ifa_scope;
    address.flags = Number(attributes[IFA_FLAGS], header->ifa_flags);
    address.metric = Number(attributes[IFA_RT_PRIORITY], 0);
    // IFA_ADDRESS is the other end where there is one, and the address itself otherwise.
    const std::string prefix = IpText(address.family, attributes[IFA_ADDRESS]);
    address.local = IpText(address.family, attributes[IFA_LOCAL]);
    if (address.local.empty()) {
        address.local = prefix;
    } else if (prefix != address.local) {
        address.peer = prefix;
    }
    address.broadcast = IpText(address.family, attributes[IFA_BROADCAST]);
    if (attributes[IFA_LABEL] != nullptr) {
        address.label = nla_get_string(attributes[IFA_LABEL]);
    }
    if (attributes[IFA_CACHEINFO] != nullptr) {
        const auto* info = static_cast<const ifa_cacheinfo*>(nla_data(attributes[IFA_CACHEINFO]));
        address.validSeconds = info->ifa_valid;
        address.preferredSeconds = info->ifa_prefered;
    }
    addresses.push_back(std::move(address));
}

void ReadGateway(int family, nlattr* const* attributes, NextHop& hop)
{
    hop.gatewayFamily = family;
    if (attributes[RTA_VIA] != nullptr) {
        const auto* via = static_cast<const rtvia*>(nla_data(attributes[RTA_VIA]));
        hop.gatewayFamily = via->rtvia_family;
        hop.gateway = IpText(via->rtvia_family, static_cast<const void*>(via->rtvia_addr));
        return;
    }
    hop.gateway = IpText(family, attributes[RTA_GATEWAY]);
}

std::vector<NextHop> ReadNextHops(int family, nlattr* list)
{
    std::vector<NextHop> hops;
    auto* bytes = static_cast<unsigned char*>(nla_data(list));
    int left = nla_len(list);
    constexpr int kHeader = sizeof(rtnexthop);
    while (left >= kHeader) {
        auto* entry = reinterpret_cast<rtnexthop*>(bytes);
        const int length = entry->rtnh_len;
        if (length < kHeader || length > left) {
            break;
        }
        Attributes attributes{};
        (void)nla_parse(attributes.data(), static_cast<int>(attributes.size()) - 1,
                        reinterpret_cast<nlattr*>(bytes + kHeader), length - kHeader, nullptr);
        NextHop hop;
        hop.index = entry->rtnh_ifindex;
        hop.weight = entry->rtnh_hops + 1U;
        hop.onLink = (entry->rtnh_flags & RTNH_F_ONLINK) != 0;
        ReadGateway(family, attributes.data(), hop);
        hops.push_back(std::move(hop));
        bytes += NLA_ALIGN(length);
        left -= NLA_ALIGN(length);
    }
    return hops;
}

std::vector<RouteMetric> ReadMetrics(nlattr* list)
{
    std::vector<RouteMetric> metrics;
    std::uint32_t locks = 0;
    nlattr* entry = nullptr;
    int left = 0;
    nla_for_each_nested(entry, list, left)
    {
        if (nla_type(entry) == RTAX_LOCK) {
            locks = nla_get_u32(entry);
        } else if (nla_type(entry) != RTAX_CC_ALGO && nla_len(entry) >= 4) {
            metrics.push_back({static_cast<unsigned>(nla_type(entry)), nla_get_u32(entry), false});
        }
    }
    for (RouteMetric& metric : metrics) {
        metric.locked = (locks & (1U << metric.kind)) != 0;
    }
    return metrics;
}

/** Whether somebody can have made it: the kernel makes the other kinds by itself. */
bool IsRouteOfInterest(const rtmsg& header)
{
    const bool leadsNowhere = header.rtm_type == RTN_BLACKHOLE ||
                              header.rtm_type == RTN_UNREACHABLE || header.rtm_type == RTN_PROHIBIT;
    return (header.rtm_family == AF_INET || header.rtm_family == AF_INET6) &&
           (header.rtm_type == RTN_UNICAST || leadsNowhere) &&
           header.rtm_protocol != RTPROT_KERNEL && header.rtm_protocol != RTPROT_REDIRECT &&
           (header.rtm_flags & RTM_F_CLONED) == 0;
}

void ReadRouteAttributes(const rtmsg& header, const Attributes& attributes, Route& route)
{
    route.table = Number(attributes[RTA_TABLE], header.rtm_table);
    route.destination = IpText(route.family, attributes[RTA_DST]);
    route.priority = Number(attributes[RTA_PRIORITY], 0);
    route.source = IpText(route.family, attributes[RTA_PREFSRC]);
    if (attributes[RTA_MULTIPATH] != nullptr) {
        route.nextHops = ReadNextHops(route.family, attributes[RTA_MULTIPATH]);
    } else if (route.type == RTN_UNICAST) {
        NextHop hop;
        hop.index = static_cast<int>(Number(attributes[RTA_OIF], 0));
        hop.onLink = (header.rtm_flags & RTNH_F_ONLINK) != 0;
        ReadGateway(route.family, attributes.data(), hop);
        route.nextHops.push_back(std::move(hop));
    }
    if (attributes[RTA_METRICS] != nullptr) {
        route.metrics = ReadMetrics(attributes[RTA_METRICS]);
    }
    if (attributes[RTA_CACHEINFO] != nullptr) {
        const auto* info = static_cast<const rta_cacheinfo*>(nla_data(attributes[RTA_CACHEINFO]));
        // The kernel counts in ticks of a hundredth of a second here, whatever its own clock is.
        route.expiresSeconds =
            info->rta_expires > 0 ? (static_cast<std::uint32_t>(info->rta_expires) + 99) / 100 : 0;
    }
    if (attributes[RTA_PREF] != nullptr) {
        route.preference = nla_get_u8(attributes[RTA_PREF]);
    }
}

void ReadRoute(nlmsghdr* message, std::vector<Route>& routes)
{
    Attributes attributes;
    const auto* header = ParseMessage<rtmsg>(message, attributes);
    if (header == nullptr || !IsRouteOfInterest(*header)) {
        return;
    }

    Route route;
    route.family = header->rtm_family;
    route.type = header->rtm_type;
    route.prefixLength = header->rtm_dst_len;
    route.tos = header->rtm_tos;
    route.scope = header->rtm_scope;
    route.protocol = header->rtm_protocol;
    ReadRouteAttributes(*header, attributes, route);
    routes.push_back(std::move(route));
}

void ReadNeighbour(nlmsghdr* message, std::vector<Neighbour>& neighbours)
{
    constexpr unsigned kKnown = NUD_REACHABLE | NUD_STALE | NUD_DELAY | NUD_PROBE | NUD_PERMANENT;
    Attributes attributes;
    const auto* header = ParseMessage<ndmsg>(message, attributes);
    if (header == nullptr || (header->ndm_family != AF_INET && header->ndm_family != AF_INET6) ||
        (header->ndm_state & kKnown) == 0 || attributes[NDA_LLADDR] == nullptr) {
        return;
    }

    Neighbour neighbour;
    neighbour.index = header->ndm_ifindex;
    neighbour.family = header->ndm_family;
    neighbour.address = IpText(neighbour.family, attributes[NDA_DST]);
    neighbour.mac = MacText(static_cast<const unsigned char*>(nla_data(attributes[NDA_LLADDR])),
                            static_cast<unsigned>(nla_len(attributes[NDA_LLADDR])));
    neighbour.permanent = (header->ndm_state & NUD_PERMANENT) != 0;
    neighbour.router = (header->ndm_flags & NTF_ROUTER) != 0;
    neighbours.push_back(std::move(neighbour));
}

Link ReadLink(rtnl_link* object)
{
    const unsigned flags = rtnl_link_get_flags(object);
    Link link;
    link.index = rtnl_link_get_ifindex(object);
    link.name = rtnl_link_get_name(object) == nullptr ? "" : rtnl_link_get_name(object);
    if (nl_addr* mac = rtnl_link_get_addr(object); mac != nullptr) {
        link.mac = MacText(static_cast<const unsigned char*>(nl_addr_get_binary_addr(mac)),
                           nl_addr_get_len(mac));
    }
    link.mtu = rtnl_link_get_mtu(object);
    link.up = (flags & IFF_UP) != 0;
    link.carrier = link.up && rtnl_link_get_carrier(object) != 0;
    link.loopback = (flags & IFF_LOOPBACK) != 0;
    link.type = rtnl_link_get_arptype(object);
    const char* kind = rtnl_link_get_type(object);
    link.kind = kind == nullptr ? "" : kind;
    link.master = rtnl_link_get_master(object);
    link.parent = rtnl_link_get_link(object);
    nl_addr* token = nullptr;
    if (rtnl_link_inet6_get_token(object, &token) == 0 && token != nullptr) {
        const std::string text = IpText(AF_INET6, nl_addr_get_binary_addr(token));
        link.token = text == "::" ? std::string() : text;
        nl_addr_put(token);
    }
    if (rtnl_link_is_vlan(object) != 0) {
        link.vlanId = rtnl_link_vlan_get_id(object);
        link.vlanProtocol = ntohs(static_cast<std::uint16_t>(rtnl_link_vlan_get_protocol(object)));
    }
    return link;
}

} // namespace

std::vector<Link> ReadLinks()
{
    const Socket socket = OpenSocket();
    nl_cache* raw = nullptr;
    if (!socket || rtnl_link_alloc_cache(socket.get(), AF_UNSPEC, &raw) < 0) {
        return {};
    }

    const Cache cache(raw);
    std::vector<Link> links;
    for (nl_object* object = nl_cache_get_first(raw); object != nullptr;
         object = nl_cache_get_next(object)) {
        links.push_back(ReadLink(reinterpret_cast<rtnl_link*>(object)));
    }
    return links;
}

// Addresses, routes and neighbours are read from the messages themselves: the library's own
// objects leave out an address's metric, a route's expiry and its preference.

std::optional<std::vector<Address>> ReadAddresses()
{
    return DumpAll<Address>(RTM_GETADDR, ifaddrmsg{}, ReadAddress);
}

std::optional<std::vector<Route>> ReadRoutes()
{
    return DumpAll<Route>(RTM_GETROUTE, rtmsg{}, ReadRoute);
}

std::optional<std::vector<Neighbour>> ReadNeighbours()
{
    return DumpAll<Neighbour>(RTM_GETNEIGH, ndmsg{}, ReadNeighbour);
}

} // namespace vornhost
