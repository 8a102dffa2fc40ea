#include "adopt/livedetails.h"

#include <algorithm>
#include <arpa/inet.h>
#include <array>
#include <linux/if_addr.h>
#include <linux/rtnetlink.h>

namespace vornovsctl {

namespace {

constexpr std::size_t kIdentifierSize = 8;
using Identifier = std::array<unsigned char, kIdentifierSize>;

std::optional<Identifier> IdentifierOf(const std::string& address)
{
    in6_addr bytes{};
    if (inet_pton(AF_INET6, address.c_str(), &bytes) != 1) {
        return std::nullopt;
    }
    Identifier identifier{};
    std::copy(std::begin(bytes.s6_addr) + kIdentifierSize, std::end(bytes.s6_addr),
              identifier.begin());
    return identifier;
}

/** The identifier that follows from a link address by itself. */
std::optional<Identifier> IdentifierOfMac(const std::string& mac)
{
    const auto bytes = MacBytes(mac);
    if (!bytes) {
        return std::nullopt;
    }
    const auto& [first, second, third, fourth, fifth, sixth] = *bytes;
    return Identifier{
        static_cast<unsigned char>(first ^ 2U), second, third, 0xff, 0xfe, fourth, fifth, sixth};
}

std::string TextOf(const Identifier& identifier)
{
    in6_addr bytes{};
    std::copy(identifier.begin(), identifier.end(), std::begin(bytes.s6_addr) + kIdentifierSize);
    std::array<char, INET6_ADDRSTRLEN> text{};
    return inet_ntop(AF_INET6, &bytes, text.data(), text.size()) == nullptr ? "" : text.data();
}

/** Made of a router's prefix, and not one of those that change every day. */
bool IsFromRouter(const vornhost::Address& address)
{
    return address.family == AF_INET6 && address.scope == RT_SCOPE_UNIVERSE &&
           address.prefixLength == 64 && (address.flags & IFA_F_PERMANENT) == 0 &&
           (address.flags & IFA_F_TEMPORARY) == 0;
}

bool HasAddressOfServer(const HostView& host, const vornhost::Link& link)
{
    return std::any_of(host.live.addresses.begin(), host.live.addresses.end(),
                       [&](const vornhost::Address& address) {
                           return address.index == link.index && IsOfServer(address);
                       });
}

void ReadIdentifiers(const HostView& host, const vornhost::Link& link, Wish& wish)
{
    const auto ofMac = IdentifierOfMac(link.mac);
    for (const vornhost::Address& address : host.live.addresses) {
        const auto identifier =
            address.index == link.index ? IdentifierOf(address.local) : std::nullopt;
        if (!identifier || identifier == ofMac) {
            continue;
        }
        if (address.scope == RT_SCOPE_LINK && address.family == AF_INET6) {
            wish.linkLocal = address.local;
        } else if (IsFromRouter(address)) {
            wish.token = TextOf(*identifier);
        }
    }
    // The client makes identifiers of the MAC only, so the kernel has to hear the routers, and the
    // client has to be told that there is a server.
    if (!wish.token.empty() && wish.autoconf == true && HasAddressOfServer(host, link)) {
        wish.dhcp6 = wish.dhcp6.value_or(true);
    }
}

/** The default route of a family that goes out of the interface alone or beside others. */
const vornhost::Route* DefaultRouteOf(const HostView& host, const vornhost::Link& link, int family)
{
    const auto& routes = host.live.routes;
    const auto found =
        std::find_if(routes.begin(), routes.end(), [&](const vornhost::Route& route) {
            return route.family == family && route.prefixLength == 0 &&
                   route.table == RT_TABLE_MAIN &&
                   std::any_of(route.nextHops.begin(), route.nextHops.end(),
                               [&](const auto& hop) { return hop.index == link.index; });
        });
    return found == routes.end() ? nullptr : &*found;
}

void ReadMetrics(const HostView& host, const vornhost::Link& link, Wish& wish)
{
    if (const auto* route = DefaultRouteOf(host, link, AF_INET);
        route != nullptr && (wish.dhcp4 || !wish.gateway4.empty())) {
        wish.metric4 = route->priority;
    }
    // The kernel and its managers call the same number the default.
    if (const auto* route = DefaultRouteOf(host, link, AF_INET6); route != nullptr) {
        wish.metric6 = route->priority;
    }
}

void ReadKind(const HostView& host, const vornhost::Link& link, Wish& wish)
{
    if (link.kind == "bond") {
        wish.kind = WishKind::kBond;
        const auto options = host.liveBonds.find(link.name);
        if (options != host.liveBonds.end()) {
            wish.bond = options->second.Chosen({});
        }
    } else if (link.kind == "vlan") {
        wish.kind = WishKind::kVlan;
        wish.parent = host.NameOf(link.parent);
        wish.vlanId = static_cast<unsigned>(std::max(link.vlanId, 0));
    }
    const vornhost::Link* const master = host.LinkOf(link.master);
    if (master != nullptr && master->kind == "bond") {
        wish.master = master->name;
    }
}

/** Whether the kernel itself listens to routers, where nobody does it in its place. */
void ReadKernelAutoconf(const HostView& host, Wish& wish)
{
    const std::string folder = "/proc/sys/net/ipv6/conf/" + wish.name + '/';
    const auto value = [&](const char* name) {
        return host.Text(folder + name).value_or("").substr(0, 1);
    };
    if (value("accept_ra") == "0" || value("autoconf") == "0") {
        wish.autoconf = false;
    }
    if (value("disable_ipv6") == "1" && wish.master.empty()) {
        wish.ipv6 = false;
    }
    if (wish.privacy.empty() && value("use_tempaddr") > "0") {
        wish.privacy = value("use_tempaddr") == "1" ? "1" : "rfc3041";
    }
}

} // namespace

bool IsOfServer(const vornhost::Address& address)
{
    return address.family == AF_INET6 && address.scope == RT_SCOPE_UNIVERSE &&
           address.prefixLength == 128 && (address.flags & IFA_F_PERMANENT) == 0;
}

void CompleteFromKernel(const HostView& host, Wish& wish)
{
    const vornhost::Link* const link = host.live.Find(wish.name);
    if (link == nullptr) {
        wish.obstacles.emplace_back("there is no such interface");
        return;
    }
    ReadKind(host, *link, wish);
    if (!wish.master.empty()) {
        return;
    }
    if (wish.manager == Manager::kIfupdown || wish.manager == Manager::kNobody) {
        ReadKernelAutoconf(host, wish);
    }
    if (wish.ipv6) {
        ReadIdentifiers(host, *link, wish);
    }
    ReadMetrics(host, *link, wish);
    if (!wish.mac.empty() && wish.mac == link->mac && wish.kind != WishKind::kSingle) {
        wish.mac.clear(); // what it is made of has it, too
    }
}

Wish ReadUnmanaged(const HostView& host, const std::string& name)
{
    Wish wish;
    wish.name = name;
    const vornhost::KeyValueFile live = vornhost::LiveAddressing(host.live, name);
    for (unsigned number = 0;; ++number) {
        const std::string suffix = number == 0 ? "" : std::to_string(number);
        const auto address = live.Get("IPADDR" + suffix);
        if (!address) {
            break;
        }
        wish.addresses4.push_back(*address + '/' + live.Get("PREFIX" + suffix).value_or("32"));
    }
    std::string addresses =
        live.Get("IPV6ADDR").value_or("") + ' ' + live.Get("IPV6ADDR_SECONDARIES").value_or("");
    for (std::size_t begin = 0; begin < addresses.size();) {
        const std::size_t end = std::min(addresses.find(' ', begin), addresses.size());
        if (end > begin) {
            wish.addresses6.push_back(addresses.substr(begin, end - begin));
        }
        begin = end + 1;
    }
    wish.gateway4 = live.Get("GATEWAY").value_or("");
    wish.gateway6 = live.Get("IPV6_DEFAULTGW").value_or("");
    const vornhost::Link* const link = host.live.Find(name);
    if (link != nullptr && link->mtu != 1500) {
        wish.mtu = link->mtu;
    }
    return wish;
}

} // namespace vornovsctl
