#include "support/descriptor.h"
#include "support/interfacefile.h"
#include "support/netlink.h"
#include "support/switchdatabase.h"
#include "support/uplink.h"

#include <algorithm>
#include <cstdint>
#include <exception>
#include <linux/ethtool.h>
#include <linux/sockios.h>
#include <net/if.h>
#include <optional>
#include <string>
#include <sys/ioctl.h>
#include <sys/socket.h>
#include <syslog.h>
#include <vector>
#include <vornplatform/netsdk.h>

namespace {

using vornhost::Link;

constexpr int kNotUp = -1;
constexpr int kUnknownSpeed = 0;

// What the driver says. Asked for by ioctl because /sys may show another network than ours.
int DriverSpeed(const std::string& interface)
{
    const vornhost::Descriptor control(socket(AF_INET, SOCK_DGRAM | SOCK_CLOEXEC, 0));
    ethtool_cmd settings{};
    settings.cmd = ETHTOOL_GSET;
    ifreq request{};
    interface.copy(request.ifr_name, IFNAMSIZ - 1);
    request.ifr_data = reinterpret_cast<char*>(&settings);
    if (!control || ioctl(control.Get(), SIOCETHTOOL, &request) != 0) {
        return kUnknownSpeed;
    }

    const std::uint32_t speed = ethtool_cmd_speed(&settings);
    return speed > INT32_MAX ? kUnknownSpeed : static_cast<int>(speed);
}

const Link* Find(const std::vector<Link>& links, const std::string& name)
{
    const auto found = std::find_if(links.begin(), links.end(),
                                    [&](const Link& link) { return link.name == name; });
    return found == links.end() ? nullptr : &*found;
}

int SpeedOf(const std::vector<Link>& links, const std::string& name)
{
    const Link* const link = Find(links, name);
    return link != nullptr && link->up && link->carrier ? DriverSpeed(name) : kNotUp;
}

// The interfaces that connect a bridge of the switch with the wire; nothing when it is none.
std::optional<std::vector<std::string>> Uplinks(const std::vector<Link>& links,
                                                const std::string& bridge)
{
    const auto file = vornhost::LoadInterfaceFile(bridge);
    const bool fileOfBridge = file && file->Get("TYPE") == "OVS";
    auto named = fileOfBridge ? vornhost::ListedSlaves(bridge) : std::vector<std::string>();
    if (fileOfBridge && named.empty()) {
        named.push_back(file->Get("PRIMARY").value_or(""));
    }
    std::erase_if(named, [&](const std::string& name) { return Find(links, name) == nullptr; });
    if (!named.empty()) {
        return named;
    }

    const Link* const link = Find(links, bridge);
    if (!fileOfBridge && (link == nullptr || link->kind != "openvswitch")) {
        return std::nullopt;
    }
    const auto bridges = vornhost::ReadSwitch();
    if (!bridges) {
        return std::vector<std::string>();
    }
    for (const vornhost::SwitchBridge& each : *bridges) {
        if (each.name == bridge) {
            const vornhost::SwitchPort* const uplink = vornhost::FindUplinkByFile(each);
            return uplink == nullptr ? std::vector<std::string>() : uplink->interfaces;
        }
    }
    return std::nullopt;
}

// A bond is as fast as its fastest member for a single connection.
int BridgeSpeed(const std::vector<Link>& links, const std::vector<std::string>& uplinks)
{
    int speed = kNotUp;
    for (const std::string& uplink : uplinks) {
        speed = std::max(speed, SpeedOf(links, uplink));
    }
    return speed;
}

std::optional<int> EthernetSpeed(const std::string& name)
{
    const auto links = vornhost::ReadLinks();
    const Link* const link = Find(links, name);
    if (link == nullptr) {
        return std::nullopt;
    }
    const auto uplinks = Uplinks(links, name);
    if (!uplinks) {
        return SpeedOf(links, name);
    }
    // The bridge itself has to be up as well before traffic can use its port.
    return link->up ? BridgeSpeed(links, *uplinks) : kNotUp;
}

} // namespace

int VORNNetGetEthInfo(VORNNETETHINFO* info, const char* name)
{
    if (info == nullptr || name == nullptr) {
        return -1;
    }
    try {
        const auto speed = EthernetSpeed(name);
        if (!speed) {
            return -1;
        }
        *info = {};
        info->speed = *speed;
        return 0;
    } catch (const std::exception& error) {
        ::syslog(LOG_ERR, "vornnetsdk: cannot read the link of %s: %s", name, error.what());
        return -1;
    }
}
