#include "show/kernelreader.h"

#include <algorithm>
#include <fstream>
#include <linux/if_addr.h>
#include <linux/rtnetlink.h>
#include <sys/socket.h>

namespace vornovsctl {

namespace {

constexpr char kNoPartner[] = "00:00:00:00:00:00";

std::string FirstWord(const std::string& path)
{
    std::ifstream file(path);
    std::string word;
    file >> word;
    return word;
}

std::optional<int> ReadSpeed(const std::string& folder)
{
    std::ifstream file(folder + "/speed");
    int speed = 0;
    // A device without a link or without a speed has -1 or cannot be read.
    return file >> speed && speed > 0 ? std::optional<int>(speed) : std::nullopt;
}

std::optional<LinuxBond> ReadLinuxBond(const std::string& folder)
{
    LinuxBond bond;
    bond.mode = FirstWord(folder + "/mode");
    if (bond.mode.empty()) {
        return std::nullopt;
    }
    bond.active = FirstWord(folder + "/active_slave");
    if (bond.mode == "802.3ad") {
        const std::string partner = FirstWord(folder + "/ad_partner_mac");
        if (!partner.empty()) { // the kernel tells it to root only
            bond.negotiated = partner != kNoPartner;
        }
    }
    return bond;
}

using NamesByIndex = std::map<int, std::string>;

std::string NameOfIndex(const NamesByIndex& names, int index)
{
    const auto found = names.find(index);
    return found == names.end() ? "" : found->second;
}

// The kernel's side of the switch: one device for all bridges of a kind, which nobody needs to see.
bool IsDatapath(const vornhost::Link& link)
{
    return link.kind == "openvswitch" && link.name.starts_with("ovs-");
}

Device DeviceOf(const vornhost::Link& link, const NamesByIndex& names,
                const NamesByIndex& datapaths)
{
    Device device;
    device.name = link.name;
    device.kind = link.kind;
    device.mac = link.mac;
    device.mtu = link.mtu;
    device.up = link.up;
    device.carrier = link.carrier;
    device.onTheSwitch = link.kind == "openvswitch" || datapaths.contains(link.master);
    if (!datapaths.contains(link.master)) {
        device.master = NameOfIndex(names, link.master);
    }
    if (link.kind == "vlan") { // for others the index may be one of another network namespace
        device.parent = NameOfIndex(names, link.parent);
        device.vlan = link.vlanId;
    }
    return device;
}

std::vector<std::string> AddressesOf(int index, const std::vector<vornhost::Address>& addresses)
{
    std::vector<std::string> texts;
    for (const vornhost::Address& address : addresses) {
        if (address.index == index) {
            texts.push_back(address.local + '/' + std::to_string(address.prefixLength));
        }
    }
    return texts;
}

std::vector<DefaultRoute> RoutesOf(int index, const std::vector<vornhost::Route>& routes)
{
    std::vector<DefaultRoute> found;
    for (const vornhost::Route& route : routes) {
        if (!route.destination.empty() || route.prefixLength != 0) {
            continue;
        }
        for (const vornhost::NextHop& hop : route.nextHops) {
            if (hop.index == index) {
                found.push_back({route.family == AF_INET6, hop.gateway, route.priority,
                                 route.table == RT_TABLE_MAIN ? 0 : route.table});
            }
        }
    }
    return found;
}

} // namespace

DeviceFacts ReadDeviceFacts(const std::string& folder)
{
    return {ReadSpeed(folder), ReadLinuxBond(folder + "/bonding")};
}

KernelAnswer AskKernel()
{
    KernelAnswer kernel;
    kernel.links = vornhost::ReadLinks();
    kernel.addresses = vornhost::ReadAddresses();
    kernel.routes = vornhost::ReadRoutes();
    for (const vornhost::Link& link : kernel.links) {
        kernel.facts[link.name] = ReadDeviceFacts("/sys/class/net/" + link.name);
    }
    return kernel;
}

std::vector<Device> DevicesOf(const KernelAnswer& kernel)
{
    NamesByIndex names;
    NamesByIndex datapaths;
    for (const vornhost::Link& link : kernel.links) {
        (IsDatapath(link) ? datapaths : names)[link.index] = link.name;
    }

    std::vector<Device> devices;
    for (const vornhost::Link& link : kernel.links) {
        if (link.loopback || IsDatapath(link)) {
            continue;
        }
        Device device = DeviceOf(link, names, datapaths);
        device.addresses =
            AddressesOf(link.index, kernel.addresses.value_or(std::vector<vornhost::Address>()));
        device.routes =
            RoutesOf(link.index, kernel.routes.value_or(std::vector<vornhost::Route>()));
        if (const auto facts = kernel.facts.find(link.name); facts != kernel.facts.end()) {
            device.speed = facts->second.speed;
            device.bond = facts->second.bond;
        }
        devices.push_back(device);
    }
    std::sort(devices.begin(), devices.end(), [](const Device& one, const Device& other) {
        return ComesBefore(one.name, other.name);
    });
    return devices;
}

std::vector<std::string> UnreadOf(const KernelAnswer& kernel)
{
    std::vector<std::string> unread;
    if (kernel.links.empty()) {
        unread.emplace_back("the kernel does not tell its network devices");
    }
    if (!kernel.addresses) {
        unread.emplace_back("the kernel does not tell the addresses");
    }
    if (!kernel.routes) {
        unread.emplace_back("the kernel does not tell the routes");
    }
    return unread;
}

} // namespace vornovsctl
