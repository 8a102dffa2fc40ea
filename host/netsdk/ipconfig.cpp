#include "ipconfig.h"

#include "support/gatewaystore.h"
#include "support/interfacefile.h"
#include "support/netlink.h"
#include "support/tagdevice.h"

#include <algorithm>
#include <arpa/inet.h>
#include <cstring>
#include <exception>
#include <linux/rtnetlink.h>
#include <optional>
#include <string>
#include <syslog.h>
#include <vornplatform/netsdk.h>

namespace {

using vornhost::AddressFamily;
using vornhost::IpConfig;
using vornhost::Link;

// The parts of the record that one family fills.
struct FamilyFields {
    int family;
    AddressFamily storeFamily;
    std::uint8_t* address;
    std::uint8_t* prefixLength;
    std::uint8_t* gateway;
    std::uint32_t hasAddress;
    std::uint32_t hasGateway;
};

bool Put(const FamilyFields& fields, const std::string& text, std::uint8_t* field)
{
    return inet_pton(fields.family, text.c_str(), field) == 1;
}

bool FillAddress(const Link& link, const FamilyFields& fields, IpConfig& config)
{
    const auto addresses = vornhost::ReadAddresses();
    if (!addresses) {
        return false;
    }
    for (const vornhost::Address& address : *addresses) {
        if (address.index == link.index && address.family == fields.family &&
            address.scope == RT_SCOPE_UNIVERSE && Put(fields, address.local, fields.address)) {
            *fields.prefixLength = static_cast<std::uint8_t>(address.prefixLength);
            config.flags |= fields.hasAddress;
            break;
        }
    }
    return true;
}

std::string LiveGateway(const std::vector<vornhost::Route>& routes, const Link& link, int family)
{
    for (const vornhost::Route& route : routes) {
        if (route.family != family || route.table != RT_TABLE_MAIN || route.prefixLength != 0) {
            continue;
        }
        for (const vornhost::NextHop& hop : route.nextHops) {
            if (hop.index == link.index && hop.gatewayFamily == family) {
                return hop.gateway;
            }
        }
    }
    return "";
}

// The gateway in use, else the one that is recorded for when the interface is up.
bool FillGateway(const Link& link, const FamilyFields& fields, IpConfig& config)
{
    const auto routes = vornhost::ReadRoutes();
    if (!routes) {
        return false;
    }
    std::string gateway = LiveGateway(*routes, link, fields.family);
    if (gateway.empty()) {
        const auto store = vornhost::GatewayStore::Load();
        const auto recorded =
            store ? store->Find(config.interface, fields.storeFamily) : std::nullopt;
        gateway = recorded ? recorded->address : "";
    }
    if (!gateway.empty() && Put(fields, gateway, fields.gateway)) {
        config.flags |= fields.hasGateway;
    }
    return true;
}

bool FillFamily(const Link& link, const FamilyFields& fields, IpConfig& config)
{
    return FillAddress(link, fields, config) && FillGateway(link, fields, config);
}

// Where a tag puts an interface's addressing into a VLAN, a device of its own carries it.
const Link& CarrierOf(const std::vector<Link>& links, const Link& link)
{
    const auto tag = std::find_if(links.begin(), links.end(), [&](const Link& each) {
        return each.parent == link.index && vornhost::IsTagDevice(each);
    });
    return tag == links.end() ? link : *tag;
}

std::optional<IpConfig> ReadIpConfig(const std::string& name)
{
    const auto links = vornhost::ReadLinks();
    const auto link = std::find_if(links.begin(), links.end(),
                                   [&](const Link& each) { return each.name == name; });
    if (link == links.end()) {
        return std::nullopt;
    }

    IpConfig config{};
    config.version = vornhost::kIpConfigVersion;
    config.mtu = link->mtu;
    name.copy(config.interface, sizeof(config.interface) - 1);
    const FamilyFields ipv4{AF_INET,
                            AddressFamily::kIPv4,
                            config.ipv4Address,
                            &config.ipv4PrefixLength,
                            config.ipv4Gateway,
                            vornhost::kHasIPv4Address,
                            vornhost::kHasIPv4Gateway};
    const FamilyFields ipv6{AF_INET6,
                            AddressFamily::kIPv6,
                            config.ipv6Address,
                            &config.ipv6PrefixLength,
                            config.ipv6Gateway,
                            vornhost::kHasIPv6Address,
                            vornhost::kHasIPv6Gateway};
    const Link& carrier = CarrierOf(links, *link);
    if (!FillFamily(carrier, ipv4, config) || !FillFamily(carrier, ipv6, config)) {
        return std::nullopt;
    }

    const auto file = vornhost::LoadInterfaceFile(name);
    if (file && file->Get("BOOTPROTO") == "dhcp") {
        config.flags |= vornhost::kUsesDhcp;
    }
    return config;
}

} // namespace

int VORNNetIFGetIPConfig(const char* name, VORNNETIPCONFIG* ipConfig)
{
    if (name == nullptr || ipConfig == nullptr) {
        return -1;
    }
    try {
        const auto config = ReadIpConfig(name);
        if (!config) {
            ::syslog(LOG_ERR, "vornnetsdk: the IP configuration of %s cannot be read", name);
            return -1;
        }
        std::memcpy(ipConfig, &*config, sizeof(*ipConfig));
        return 0;
    } catch (const std::exception& error) {
        ::syslog(LOG_ERR, "vornnetsdk: the IP configuration of %s cannot be read: %s", name,
                 error.what());
        return -1;
    }
}
