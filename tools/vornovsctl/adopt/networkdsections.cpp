#include "adopt/networkdsections.h"

#include "wording.h"

#include <algorithm>
#include <functional>
#include <map>
#include <set>
#include <sstream>
#include <support/interfacevalues.h>

namespace vornovsctl {

namespace {

using Take = std::function<bool(const std::string& value, Wish& wish)>;
using Takes = std::map<std::string, Take>;

std::optional<bool> YesOrNo(const std::string& value)
{
    const std::string word = vornhost::Lower(value);
    if (word == "yes" || word == "true" || word == "on" || word == "1") {
        return true;
    }
    if (word == "no" || word == "false" || word == "off" || word == "0") {
        return false;
    }
    return std::nullopt;
}

bool IsIpv6(const std::string& address)
{
    return address.find(':') != std::string::npos;
}

bool Ignore(const std::string& /*value*/, Wish& /*wish*/)
{
    return true;
}

/** For a setting that is carried over only in one of its states. */
Take Only(bool state)
{
    return [state](const std::string& value, Wish&) { return YesOrNo(value) == state; };
}

Take Flag(std::optional<bool> Wish::*member)
{
    return [member](const std::string& value, Wish& wish) {
        wish.*member = YesOrNo(value);
        return (wish.*member).has_value();
    };
}

Take Metric(std::optional<unsigned> Wish::*member)
{
    return [member](const std::string& value, Wish& wish) {
        wish.*member = vornhost::ToNumber(value, 0, UINT32_MAX);
        return (wish.*member).has_value();
    };
}

bool TakeAddress(const std::string& value, Wish& wish)
{
    if (value.empty()) {
        wish.addresses4.clear();
        wish.addresses6.clear();
        return true;
    }
    const bool ipv6 = IsIpv6(value);
    const bool whole = value.find('/') != std::string::npos;
    (ipv6 ? wish.addresses6 : wish.addresses4)
        .push_back(whole  ? value
                   : ipv6 ? value + "/128"
                          : value + "/32");
    return value.starts_with("0.0.0.0") || value.starts_with("::/") ? false : true;
}

bool TakeGateway(const std::string& value, Wish& wish)
{
    (IsIpv6(value) ? wish.gateway6 : wish.gateway4) = value;
    return !value.starts_with('_');
}

bool TakeDhcp(const std::string& value, Wish& wish)
{
    const auto both = YesOrNo(value);
    wish.dhcp4 = both.value_or(value == "ipv4" || value == "both");
    return both || value == "ipv4" || value == "ipv6" || value == "both" || value == "none";
}

bool TakeDns(const std::string& value, Wish& wish)
{
    if (value.empty()) {
        wish.dns.clear();
    }
    for (std::string server : vornhost::Words(value)) {
        server.resize(std::min(server.find_first_of("#%"), server.size()));
        wish.dns.push_back(server);
    }
    return true;
}

bool TakeDomains(const std::string& value, Wish& wish)
{
    if (value.empty()) {
        wish.search.clear();
    }
    for (const std::string& domain : vornhost::Words(value)) {
        if (domain.starts_with('~')) {
            wish.remarks.push_back("the routing domain " + Quoted(domain) +
                                   " of its resolver has no like and is left out");
        } else {
            wish.search.push_back(domain);
        }
    }
    return true;
}

bool TakePrivacy(const std::string& value, Wish& wish)
{
    wish.privacy = value == "prefer-public" ? "1" : YesOrNo(value) == true ? "rfc3041" : "no";
    return true;
}

bool TakeLinkLocal(const std::string& value, Wish& wish)
{
    const auto both = YesOrNo(value);
    wish.ipv6 = both.value_or(value == "ipv6");
    return value == "ipv6" || both == false;
}

bool TakeToken(const std::string& value, Wish& wish)
{
    // What it makes of it is read from the kernel.
    return value.empty() || value == "eui64" || value.starts_with("::") ||
           value.starts_with("static:") || (value.starts_with("prefixstable") && wish.ipv6);
}

bool TakeDhcp6Client(const std::string& value, Wish& wish)
{
    if (value == "always") {
        wish.dhcp6 = true;
    } else if (YesOrNo(value) == false) {
        wish.dhcp6 = false;
    }
    return true;
}

bool TakeHostName(const std::string& value, Wish& wish)
{
    wish.identity.hostName = value;
    return !value.empty();
}

bool TakeSendHostName(const std::string& value, Wish& wish)
{
    if (YesOrNo(value) == false) {
        wish.identity.hostName = "none";
    }
    return true;
}

bool TakeMtu(const std::string& value, Wish& wish)
{
    std::string number = value;
    unsigned factor = 1;
    if (!number.empty() && (number.back() == 'K' || number.back() == 'k')) {
        factor = 1024;
        number.pop_back();
    }
    const auto mtu = vornhost::ToNumber(number, 1, 65535);
    if (mtu) {
        wish.mtu = *mtu * factor;
    }
    return mtu.has_value();
}

bool TakeMac(const std::string& value, Wish& wish)
{
    wish.mac = vornhost::Lower(value);
    return value.find(':') != std::string::npos;
}

bool IsUp(const std::string& value, Wish& /*wish*/)
{
    return value == "up" || value == "always-up";
}

const Takes& LinkKeys()
{
    static const Takes kKeys{{"MTUBytes", TakeMtu},
                             {"MACAddress", TakeMac},
                             {"ActivationPolicy", IsUp},
                             {"RequiredForOnline", Ignore},
                             {"RequiredFamilyForOnline", Ignore},
                             {"ARP", Only(true)},
                             {"Multicast", Only(true)},
                             {"AllMulticast", Only(false)},
                             {"Promiscuous", Only(false)},
                             {"Unmanaged", Only(false)}};
    return kKeys;
}

const Takes& NetworkKeys()
{
    static const Takes kKeys{{"Description", Ignore},
                             {"DHCP", TakeDhcp},
                             {"Address", TakeAddress},
                             {"Gateway", TakeGateway},
                             {"DNS", TakeDns},
                             {"Domains", TakeDomains},
                             {"IPv6AcceptRA", Flag(&Wish::autoconf)},
                             {"IPv6PrivacyExtensions", TakePrivacy},
                             {"LinkLocalAddressing", TakeLinkLocal},
                             {"IPv6LinkLocalAddressGenerationMode", Ignore},
                             {"IPv6StableSecretAddress", Ignore},
                             {"IPv6DuplicateAddressDetection", Ignore},
                             {"IPv6MTUBytes", Ignore},
                             {"LLMNR", Ignore},
                             {"MulticastDNS", Ignore},
                             {"DNSSEC", Ignore},
                             {"DNSSECNegativeTrustAnchors", Ignore},
                             {"DNSOverTLS", Ignore},
                             {"DNSDefaultRoute", Ignore},
                             {"NTP", Ignore},
                             {"LLDP", Ignore},
                             {"EmitLLDP", Ignore},
                             {"BindCarrier", Ignore},
                             {"ConfigureWithoutCarrier", Ignore},
                             {"IgnoreCarrierLoss", Ignore},
                             {"KeepConfiguration", Ignore},
                             {"DefaultRouteOnDevice", Only(false)},
                             {"IPForward", Only(false)},
                             {"IPMasquerade", Only(false)},
                             {"DHCPServer", Only(false)},
                             {"IPv6SendRA", Only(false)},
                             // Bonds and VLANs are read from the kernel.
                             {"Bond", Ignore},
                             {"PrimarySlave", Ignore},
                             {"ActiveSlave", Ignore},
                             {"VLAN", Ignore}};
    return kKeys;
}

const Takes& AddressKeys()
{
    static const Takes kKeys{{"Address", TakeAddress},
                             {"Broadcast", Ignore},
                             {"Scope", Ignore},
                             {"RouteMetric", Ignore},
                             {"DuplicateAddressDetection", Ignore},
                             {"ManageTemporaryAddress", Ignore},
                             {"AddPrefixRoute", Only(true)}};
    return kKeys;
}

const Takes& Dhcp4Keys()
{
    static const Takes kKeys{{"RouteMetric", Metric(&Wish::metric4)},
                             {"UseDNS", Flag(&Wish::peerDns)},
                             {"UseRoutes", Flag(&Wish::peerRoutes)},
                             {"UseGateway", Flag(&Wish::defaultRoute)},
                             {"SendHostname", TakeSendHostName},
                             {"Hostname", TakeHostName},
                             // The identity is read from the lease.
                             {"ClientIdentifier", Ignore},
                             {"DUIDType", Ignore},
                             {"DUIDRawData", Ignore},
                             {"IAID", Ignore},
                             {"UseDomains", Ignore},
                             {"UseNTP", Ignore},
                             {"UseSIP", Ignore},
                             {"UseMTU", Ignore},
                             {"UseHostname", Ignore},
                             {"UseTimezone", Ignore},
                             {"SendRelease", Ignore},
                             {"SendDecline", Ignore},
                             {"RequestBroadcast", Ignore},
                             {"MaxAttempts", Ignore},
                             {"RoutesToDNS", Ignore},
                             {"RoutesToNTP", Ignore},
                             {"FallbackLeaseLifetimeSec", Ignore},
                             {"UserClass", [](const std::string&, Wish&) { return false; }}};
    return kKeys;
}

const Takes& Dhcp6Keys()
{
    static const Takes kKeys{{"UseDNS", Flag(&Wish::peerDns)},
                             {"DUIDType", Ignore},
                             {"DUIDRawData", Ignore},
                             {"IAID", Ignore},
                             {"UseDomains", Ignore},
                             {"UseNTP", Ignore},
                             {"UseHostname", Ignore},
                             {"RapidCommit", Ignore},
                             {"SendRelease", Ignore},
                             {"UseAddress", Only(true)},
                             {"WithoutRA", [](const std::string& value, Wish& wish) {
                                  wish.dhcp6 =
                                      value == "solicit" ? std::optional(true) : wish.dhcp6;
                                  return value == "no" || value == "solicit";
                              }}};
    return kKeys;
}

const Takes& RouterKeys()
{
    static const Takes kKeys{{"Token", TakeToken},
                             {"UseDNS", Flag(&Wish::peerDns)},
                             {"UseDomains", Ignore},
                             {"UseMTU", Ignore},
                             {"UseGateway", Flag(&Wish::defaultRoute)},
                             {"UseRoutePrefix", Flag(&Wish::peerRoutes)},
                             {"UseAutonomousPrefix", Only(true)},
                             {"UseOnLinkPrefix", Only(true)},
                             {"UseICMP6RateLimit", Ignore},
                             {"RouteMetric", Metric(&Wish::metric6)},
                             {"DHCPv6Client", TakeDhcp6Client}};
    return kKeys;
}

/** A route of its own section; a default one is a gateway as far as there is none yet. */
bool TakeRoute(const IniSection& section, Wish& wish)
{
    static const std::set<std::string> kKnown{
        "Gateway", "GatewayOnLink", "Destination", "Metric",   "PreferredSource",
        "Table",   "Type",          "Scope",       "Protocol", "IPv6Preference"};
    const bool known = std::all_of(section.keys.begin(), section.keys.end(),
                                   [](const auto& key) { return kKnown.contains(key.first); });
    const std::string gateway = section.Get("Gateway");
    std::string destination = section.Get("Destination");
    const std::string type = section.Get("Type");
    const bool ipv6 = IsIpv6(destination + gateway);
    const bool isDefault =
        destination.empty() || destination == "0.0.0.0/0" || destination == "::/0";
    if (!known || gateway.starts_with('_') || (isDefault && gateway.empty() && type.empty())) {
        return false;
    }
    const bool onLink = YesOrNo(section.Get("GatewayOnLink")) == true;
    const std::string metric = section.Get("Metric");
    const std::string source = section.Get("PreferredSource");
    const std::string table = section.Get("Table");
    std::string& ownGateway = ipv6 ? wish.gateway6 : wish.gateway4;
    if (isDefault && type.empty() && ownGateway.empty() && !onLink && source.empty() &&
        (table.empty() || table == "main" || table == "254")) {
        ownGateway = gateway;
        (ipv6 ? wish.metric6 : wish.metric4) = vornhost::ToNumber(metric, 0, UINT32_MAX);
        return true;
    }
    std::string route = type.empty() || type == "unicast" ? "" : type + ' ';
    route += isDefault ? (ipv6 ? "::/0" : "default") : destination;
    route += gateway.empty() ? "" : " via " + gateway;
    route += metric.empty() ? "" : " metric " + metric;
    route += source.empty() ? "" : " src " + source;
    route += onLink ? " onlink" : "";
    route += table.empty() ? "" : " table " + table;
    wish.routes.push_back(route);
    return type.empty() || type == "unicast" || type == "unreachable" || type == "blackhole";
}

const Takes* KeysOf(const std::string& section)
{
    static const std::map<std::string, const Takes& (*)()> kSections{
        {"Link", LinkKeys},          {"Network", NetworkKeys}, {"Address", AddressKeys},
        {"DHCPv4", Dhcp4Keys},       {"DHCP", Dhcp4Keys},      {"DHCPv6", Dhcp6Keys},
        {"IPv6AcceptRA", RouterKeys}};
    const auto found = kSections.find(section);
    return found == kSections.end() ? nullptr : &found->second();
}

} // namespace

void TakeNetworkdSection(const IniSection& section, const std::string& path, Wish& wish)
{
    if (section.name == "Match") {
        return;
    }
    if (section.name == "Route") {
        if (!TakeRoute(section, wish)) {
            wish.obstacles.push_back(path + ": a route cannot be carried over");
        }
        return;
    }
    const Takes* const keys = KeysOf(section.name);
    if (keys == nullptr) {
        wish.obstacles.push_back(path + ": the section [" + section.name +
                                 "] cannot be carried over");
        return;
    }
    for (const auto& [key, value] : section.keys) {
        const auto take = keys->find(key);
        if (take == keys->end() || !take->second(value, wish)) {
            std::string obstacle = path;
            obstacle.append(": ").append(key).append("=").append(value);
            wish.obstacles.push_back(obstacle.append(" cannot be carried over"));
        }
    }
}

} // namespace vornovsctl
