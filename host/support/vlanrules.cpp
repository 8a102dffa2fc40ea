#include "vlanrules.h"

#include "interfacefile.h"
#include "interfacename.h"
#include "settings.h"
#include "tagdevice.h"

#include <algorithm>
#include <linux/if_ether.h>
#include <string_view>

namespace vornhost {
namespace {

constexpr std::string_view kSwitchDevice = "ovs-system";

const Link* FindByIndex(const LiveNetwork& network, int index)
{
    const auto found = std::find_if(network.links.begin(), network.links.end(),
                                    [&](const Link& link) { return link.index == index; });
    return found == network.links.end() ? nullptr : &*found;
}

bool IsVlanOn(const Link& link, const Link& parent)
{
    return link.kind == "vlan" && link.parent == parent.index && !IsTagDevice(link);
}

/** @return  null when the VLAN is the only one there. */
const Link* FindOtherVlan(const LiveNetwork& network, const Link& parent, const Link& vlan)
{
    const auto found =
        std::find_if(network.links.begin(), network.links.end(), [&](const Link& link) {
            return link.index != vlan.index && IsVlanOn(link, parent);
        });
    return found == network.links.end() ? nullptr : &*found;
}

bool CanBecomePort(const LiveNetwork& network, const Link& parent)
{
    constexpr std::string_view kNever[] = {kBridgePrefix, "wlan", "ppp", "tun"};
    const Link* const master = FindByIndex(network, parent.master);
    return parent.kind != "bridge" && parent.kind != "openvswitch" &&
           kBridgePrefixSize + parent.name.size() <= kLongestInterfaceName &&
           (parent.master == 0 || (master != nullptr && master->name == kSwitchDevice)) &&
           std::none_of(std::begin(kNever), std::end(kNever),
                        [&](std::string_view prefix) { return parent.name.starts_with(prefix); });
}

/** Addresses of the parent that its file has put into this very VLAN are the VLAN's. */
bool HasOwnConfiguration(const std::string& parent, int vlanId)
{
    const auto file = LoadInterfaceFile(parent);
    if (!file || file->Get("OVS_VLAN_ID") == std::to_string(vlanId)) {
        return false;
    }
    const std::string protocol = file->Get("BOOTPROTO").value_or("");
    return protocol == "dhcp" || protocol == "bootp" || !ConfiguredAddresses(*file).empty();
}

} // namespace

const Link* FindVlan(const LiveNetwork& network, const std::string& name)
{
    const Link* const link = network.Find(name);
    return link != nullptr && link->kind == "vlan" && !IsTagDevice(*link) ? link : nullptr;
}

const Link* ParentOf(const LiveNetwork& network, const Link& vlan)
{
    return FindByIndex(network, vlan.parent);
}

std::string ObstacleToTag(const LiveNetwork& network, const Link& vlan, bool parentsOwn)
{
    const Link* const parent = FindByIndex(network, vlan.parent);
    if (parent == nullptr) {
        return "its parent is out of sight";
    }
    if (vlan.vlanProtocol != 0 && vlan.vlanProtocol != ETH_P_8021Q) {
        return "its tags are not of 802.1Q";
    }
    if (vlan.master != 0) {
        return "it is a port of another interface";
    }
    if (parent->kind == "vlan" || FindOtherVlan(network, vlan, vlan) != nullptr) {
        return "VLANs stand on one another";
    }
    if (const Link* const other = FindOtherVlan(network, *parent, vlan)) {
        return other->name + " is on it too";
    }
    if (parentsOwn || network.HasGlobalAddress(*parent)) {
        return parent->name + " has addresses of its own";
    }
    return CanBecomePort(network, *parent) ? "" : parent->name + " cannot be a port of the switch";
}

std::string ObstacleToTag(const LiveNetwork& network, const Link& vlan)
{
    const Link* const parent = FindByIndex(network, vlan.parent);
    return ObstacleToTag(network, vlan,
                         parent != nullptr && HasOwnConfiguration(parent->name, vlan.vlanId));
}

const Link* FindVlanWithObstacle(const LiveNetwork& network, const std::string& parent)
{
    const Link* const link = network.Find(parent);
    const auto found =
        std::find_if(network.links.begin(), network.links.end(), [&](const Link& vlan) {
            return link != nullptr && IsVlanOn(vlan, *link) &&
                   !ObstacleToTag(network, vlan).empty();
        });
    return found == network.links.end() ? nullptr : &*found;
}

} // namespace vornhost
