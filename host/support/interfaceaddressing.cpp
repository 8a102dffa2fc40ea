#include "interfaceparser.h"
#include "interfacevalues.h"

#include <algorithm>
#include <sstream>

#include <arpa/inet.h>

namespace vornhost {
namespace {

constexpr unsigned kMostNumbered = 256;
constexpr unsigned kMostNameServers = 9;
constexpr size_t kLongestHostName = 253;
constexpr size_t kMostClientIdBytes = 253;
constexpr size_t kMostDuidBytes = 130;
constexpr unsigned kHexadecimal = 16;

/** Letters, digits, "-", "_" and dots between them, as names of hosts and domains have them. */
bool IsDomainName(const std::string& name)
{
    return !name.empty() && name.size() <= kLongestHostName && name.front() != '-' &&
           name.front() != '.' && std::all_of(name.begin(), name.end(), [](unsigned char letter) {
               return std::isalnum(letter) != 0 || letter == '-' || letter == '.' || letter == '_';
           });
}

/** @return  the bytes with a colon between them, empty when the text is none of that many. */
std::string HexBytes(const std::string& text, size_t least, size_t most)
{
    std::string digits = Lower(text);
    std::erase(digits, ':');
    const bool hex = std::all_of(digits.begin(), digits.end(),
                                 [](unsigned char letter) { return std::isxdigit(letter) != 0; });
    const size_t bytes = digits.size() / 2;
    if (!hex || digits.size() % 2 != 0 || bytes < least || bytes > most) {
        return {};
    }
    std::string normal;
    for (size_t at = 0; at < digits.size(); at += 2) {
        normal += (at == 0 ? "" : ":") + digits.substr(at, 2);
    }
    return normal;
}

} // namespace

bool InterfaceFile::ClientHearsRouters() const
{
    return ipv6 && autoconf == true && token.empty();
}

bool InterfaceFile::UsesClient() const
{
    return client.dhcp || client.dhcp6 == true || ClientHearsRouters();
}

std::string InterfaceParser::Hex(const std::string& key, size_t least, size_t most)
{
    const std::string value = Value(key);
    std::string bytes = value.empty() ? std::string() : HexBytes(value, least, most);
    if (bytes.empty() && !value.empty()) {
        Refuse(key, "not " + std::to_string(least) + " to " + std::to_string(most) +
                        " bytes in hexadecimal digits");
    }
    return bytes;
}

void InterfaceParser::ReadIpv4Address(const std::string& number)
{
    const std::string key = "IPADDR" + number;
    std::string text = Value(key);
    if (text.empty()) {
        return;
    }
    std::optional<unsigned> length;
    if (const auto slash = text.find('/'); slash != std::string::npos) {
        length = ToNumber(text.substr(slash + 1), 0, 32);
        text.resize(slash);
    } else if (!Value("PREFIX" + number).empty()) {
        length = Number("PREFIX" + number, 0, 32);
    } else if (!Value("NETMASK" + number).empty()) {
        length = MaskLength(Value("NETMASK" + number));
        if (!length) {
            Refuse("NETMASK" + number, "not a netmask");
        }
    }
    const std::string local = NormalAddress(AF_INET, text);
    if (local.empty()) {
        Refuse(key, "not an IPv4 address");
    } else if (!length) {
        Refuse(key, "no length: neither PREFIX" + number + " nor NETMASK" + number + " is usable");
    } else {
        m_parsed.file.addresses.push_back({AF_INET, local, *length});
    }
}

std::string InterfaceParser::ReadGateway(const std::string& key, int family)
{
    std::string text = Value(key);
    // A zone says through which interface, and that is this one.
    text.resize(std::min(text.size(), text.find('%')));
    if (text.empty()) {
        return {};
    }
    std::string gateway = NormalAddress(family, text);
    if (gateway.empty()) {
        Refuse(key, family == AF_INET ? "not an IPv4 address" : "not an IPv6 address");
    }
    return gateway;
}

void InterfaceParser::ReadIpv4()
{
    ReadIpv4Address("");
    for (unsigned i = 0; i < kMostNumbered; ++i) {
        ReadIpv4Address(std::to_string(i));
    }
    m_parsed.file.gateway = ReadGateway("GATEWAY", AF_INET);
}

void InterfaceParser::ReadIpv6Address(const std::string& key, const std::string& text)
{
    const auto slash = text.find('/');
    const auto length =
        slash == std::string::npos ? std::optional(64U) : ToNumber(text.substr(slash + 1), 0, 128);
    const std::string local = NormalAddress(AF_INET6, text.substr(0, slash));
    if (local.empty() || !length) {
        Refuse(key, "not an IPv6 address with its length");
        return;
    }
    m_parsed.file.addresses.push_back({AF_INET6, local, *length});
}

void InterfaceParser::ReadPrivacy()
{
    const std::string value = Lower(Value("IPV6_PRIVACY"));
    if (value == "rfc3041" || value == "yes") {
        m_parsed.file.privacy = 2;
    } else if (value == "no") {
        m_parsed.file.privacy = 0;
    } else if (!value.empty()) {
        m_parsed.file.privacy = Number("IPV6_PRIVACY", 0, 2);
    }
}

/** Addresses that are made of prefixes go on to end as others know them. */
void InterfaceParser::ReadIpv6Identity()
{
    InterfaceFile& file = m_parsed.file;
    file.token = NormalAddress(AF_INET6, Value("IPV6_TOKEN"));
    if ((file.token.empty() && !Value("IPV6_TOKEN").empty()) ||
        (!file.token.empty() && (file.token == "::" || file.token.rfind("::", 0) != 0))) {
        Refuse("IPV6_TOKEN", "not the lower half of an IPv6 address");
        file.token.clear();
    }
    file.linkLocal = NormalAddress(AF_INET6, Value("IPV6_LINKLOCAL"));
    if (!Value("IPV6_LINKLOCAL").empty() && file.linkLocal.rfind("fe80::", 0) != 0) {
        Refuse("IPV6_LINKLOCAL", "not a link-local address");
        file.linkLocal.clear();
    }
    ReadPrivacy();
}

void InterfaceParser::ReadIpv6()
{
    if (YesOrNo("IPV6INIT") == false) {
        m_parsed.file.ipv6 = false;
        return;
    }
    ReadIpv6Identity();
    m_parsed.file.client.dhcp6 = YesOrNo("DHCPV6C");
    m_parsed.file.autoconf = YesOrNo("IPV6_AUTOCONF");
    if (const std::string address = Value("IPV6ADDR"); !address.empty()) {
        ReadIpv6Address("IPV6ADDR", address);
    }
    std::istringstream secondaries(Value("IPV6ADDR_SECONDARIES"));
    for (std::string address; secondaries >> address;) {
        ReadIpv6Address("IPV6ADDR_SECONDARIES", address);
    }
    m_parsed.file.gateway6 = ReadGateway("IPV6_DEFAULTGW", AF_INET6);
}

void InterfaceParser::ReadClientIdentity()
{
    FileClient& client = m_parsed.file.client;
    if (Lower(Value("DHCP_CLIENT_ID")) == "none") {
        client.id = "";
    } else if (const std::string id = Hex("DHCP_CLIENT_ID", 2, kMostClientIdBytes); !id.empty()) {
        client.id = id;
    }
    const std::string hostName = Value("DHCP_HOSTNAME");
    if (Lower(hostName) == "none") {
        client.hostName = "";
    } else if (IsDomainName(hostName)) {
        client.hostName = hostName;
    } else if (!hostName.empty()) {
        Refuse("DHCP_HOSTNAME", "not the name of a host");
    }
    client.duid = Hex("DHCPV6_DUID", 3, kMostDuidBytes);
    if (std::string iaid = Hex("DHCP_IAID", 4, 4); !iaid.empty()) {
        std::erase(iaid, ':');
        client.iaid = static_cast<std::uint32_t>(std::stoul(iaid, nullptr, kHexadecimal));
    }
}

void InterfaceParser::ReadClient()
{
    FileClient& client = m_parsed.file.client;
    client.dhcp = Lower(Value("BOOTPROTO")) == "dhcp";
    client.nameServers = YesOrNo("PEERDNS").value_or(true);
    client.routes = YesOrNo("PEERROUTES").value_or(true);
    client.defaultRoute = YesOrNo("DEFROUTE").value_or(true);
    ReadClientIdentity();
}

void InterfaceParser::ReadResolver()
{
    for (unsigned i = 1; i <= kMostNameServers; ++i) {
        const std::string key = "DNS" + std::to_string(i);
        const std::string text = Value(key);
        std::string server = NormalAddress(AF_INET, text);
        server = server.empty() ? NormalAddress(AF_INET6, text) : server;
        if (!server.empty()) {
            m_parsed.file.nameServers.push_back(server);
        } else if (!text.empty()) {
            Refuse(key, "not an address");
        }
    }
    std::istringstream domains(Value("DOMAIN"));
    for (std::string domain; domains >> domain;) {
        if (IsDomainName(domain)) {
            m_parsed.file.searchDomains.push_back(domain);
        } else {
            Refuse("DOMAIN", "\"" + domain + "\" is not a domain");
        }
    }
}

void InterfaceParser::ReadRoutes()
{
    for (unsigned i = 0; i < kMostNumbered; ++i) {
        const std::string key = "ROUTE" + std::to_string(i);
        const std::string text = Value(key);
        if (text.empty()) {
            continue;
        }
        std::string problem;
        const auto route = ParseRoute(text, problem);
        if (!route) {
            Refuse(key, problem);
        } else if (route->family == AF_INET || m_parsed.file.ipv6) {
            m_parsed.file.routes.push_back(*route);
        }
    }
}

void InterfaceParser::ReadAddressing()
{
    ReadIpv4();
    ReadIpv6();
    ReadClient();
    ReadResolver();
    ReadRoutes();
}

} // namespace vornhost
