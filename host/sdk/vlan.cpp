#include "vlanchange.h"

#include "netsdk/ipconfig.h"
#include "support/interfacename.h"
#include "support/vlanrules.h"

#include <arpa/inet.h>
#include <cstring>
#include <exception>
#include <syslog.h>
#include <vornplatform/sdk.h>

namespace {

using vornhost::KeyValueFile;
using vornhost::Link;
using vornhost::LiveNetwork;

constexpr int kLargestId = 4094;

int Get(const std::string& name, _tag_VLIB_VLAN& record)
{
    const LiveNetwork network = LiveNetwork::Read();
    const Link* const vlan = vornhost::FindVlan(network, name);
    if (vlan == nullptr) {
        return 0;
    }
    const Link* const parent = vornhost::ParentOf(network, *vlan);
    const std::string obstacle = vornhost::ObstacleToTag(network, *vlan);
    if (parent == nullptr || !obstacle.empty()) {
        ::syslog(LOG_WARNING,
                 "vornsdk: VLAN %s on %s is not what one tag can say: %s; it goes on to the switch "
                 "as a port of its own",
                 name.c_str(), parent == nullptr ? "nothing here" : parent->name.c_str(),
                 obstacle.c_str());
        return 0;
    }
    record = {};
    name.copy(record.szIfName, VORN_NAME_SIZE - 1);
    parent->name.copy(record.szRealName, VORN_NAME_SIZE - 1);
    record.vlanId = vlan->vlanId;
    return 1;
}

std::string AddressText(int family, const void* bytes)
{
    char text[INET6_ADDRSTRLEN] = {};
    const char* const done = inet_ntop(family, bytes, text, sizeof text);
    return done == nullptr ? "" : done;
}

/** The record that the caller read from the parent, as a file would say it. */
KeyValueFile AddressingOf(const VORNNETIPCONFIG* record)
{
    KeyValueFile file;
    vornhost::IpConfig config{};
    if (record != nullptr) {
        std::memcpy(&config, record, sizeof config);
    }
    if (config.version != vornhost::kIpConfigVersion) {
        return file;
    }
    if ((config.flags & vornhost::kHasIPv4Address) != 0) {
        (void)file.Set("IPADDR", AddressText(AF_INET, config.ipv4Address));
        (void)file.Set("PREFIX", std::to_string(config.ipv4PrefixLength));
    }
    if ((config.flags & vornhost::kHasIPv4Gateway) != 0) {
        (void)file.Set("GATEWAY", AddressText(AF_INET, config.ipv4Gateway));
    }
    if ((config.flags & vornhost::kHasIPv6Address) != 0) {
        (void)file.Set("IPV6ADDR", AddressText(AF_INET6, config.ipv6Address) + '/' +
                                       std::to_string(config.ipv6PrefixLength));
    }
    if ((config.flags & vornhost::kHasIPv6Gateway) != 0) {
        (void)file.Set("IPV6_DEFAULTGW", AddressText(AF_INET6, config.ipv6Gateway));
    }
    return file;
}

} // namespace

int VLIBNetVlanGet(const char* name, _tag_VLIB_VLAN* vlan)
{
    if (name == nullptr || vlan == nullptr) {
        return -1;
    }
    try {
        return Get(name, *vlan);
    } catch (const std::exception& error) {
        ::syslog(LOG_ERR, "vornsdk: cannot tell whether %s is a VLAN: %s", name, error.what());
        return -1;
    }
}

int VLIBNetVlanCreate(const char* parent, int vlanId, const VORNNETIPCONFIG* ipConfig)
{
    if (parent == nullptr || !vornhost::IsInterfaceName(parent) || vlanId < 0 ||
        vlanId > kLargestId) {
        ::syslog(LOG_ERR, "vornsdk: VLAN %d of %s cannot be made", vlanId,
                 parent == nullptr ? "no interface" : parent);
        return -1;
    }
    try {
        return vornhost::GiveVlan(parent, vlanId, AddressingOf(ipConfig));
    } catch (const std::exception& error) {
        ::syslog(LOG_ERR, "vornsdk: cannot make VLAN %d of %s: %s", vlanId, parent, error.what());
        return -1;
    }
}

int VLIBNetVlanRemove(const char* name)
{
    if (name == nullptr || !vornhost::IsInterfaceName(name)) {
        return -1;
    }
    try {
        return vornhost::TakeVlan(LiveNetwork::Read(), name);
    } catch (const std::exception& error) {
        ::syslog(LOG_ERR, "vornsdk: cannot take VLAN %s from its interface: %s", name,
                 error.what());
        return -1;
    }
}
