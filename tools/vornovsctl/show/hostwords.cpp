#include "show/hostwords.h"

#include "wording.h"

namespace vornovsctl {

std::string LinkWord(const Device& device)
{
    if (!device.up) {
        return "down";
    }
    return device.carrier ? "up" : "no link";
}

std::string SpeedWord(const Device& device)
{
    if (!device.speed || !device.up || !device.carrier) {
        return "";
    }
    return *device.speed % 1000 == 0 && *device.speed >= 10000
               ? std::to_string(*device.speed / 1000) + " Gbit/s"
               : std::to_string(*device.speed) + " Mbit/s";
}

std::string KindWord(const Device& device)
{
    if (device.vlan) {
        return "VLAN";
    }
    if (device.kind == "bond") {
        return "Linux bond";
    }
    if (device.kind == "bridge") {
        return "Linux bridge";
    }
    return device.kind == "openvswitch" ? "switch port" : "interface";
}

std::string RouteWords(const DefaultRoute& route)
{
    std::string text = "default";
    text += route.gateway.empty() ? " without gateway" : " via " + route.gateway;
    if (route.gateway.empty() && route.ipv6) {
        text += " (IPv6)";
    }
    if (route.metric != 0) {
        text += " metric " + std::to_string(route.metric);
    }
    if (route.table != 0) {
        text += " table " + std::to_string(route.table);
    }
    return text;
}

std::string VlanWords(int vlan)
{
    return "VLAN " + std::to_string(vlan);
}

std::string LacpWords(const Port& port)
{
    if (!port.bond || port.lacp == "off") {
        return "";
    }
    return port.IsNegotiated() ? "LACP negotiated" : "LACP without partner";
}

std::string LacpWords(const LinuxBond& bond)
{
    if (!bond.negotiated) {
        return "";
    }
    return *bond.negotiated ? "LACP negotiated" : "LACP without partner";
}

std::string ClientWords(const HostModel& host)
{
    if (!host.clients) {
        return "not known";
    }
    return host.clients->empty() ? "none" : List(*host.clients);
}

std::string SwitchWords(const HostModel& host)
{
    if (!host.switchRuns) {
        return "not running";
    }
    return host.bridges ? "running" : "running, but what is on it is not known";
}

std::vector<const Device*> DevicesOnTheirOwn(const HostModel& host)
{
    std::vector<const Device*> devices;
    for (const Device& device : host.devices) {
        const bool belongs = (!device.master.empty() && host.Find(device.master) != nullptr) ||
                             (!device.parent.empty() && host.Find(device.parent) != nullptr);
        if (!belongs && !host.IsDrawnWithTheSwitch(device.name)) {
            devices.push_back(&device);
        }
    }
    return devices;
}

std::vector<const Device*> DevicesOn(const HostModel& host, const std::string& device)
{
    std::vector<const Device*> devices;
    for (const Device& each : host.devices) {
        const bool member = each.master == device && !host.IsDrawnWithTheSwitch(each.name);
        if (member || (each.parent == device && each.master.empty())) {
            devices.push_back(&each);
        }
    }
    return devices;
}

std::vector<std::string> TakenOffWithoutDevice(const HostModel& host)
{
    std::vector<std::string> missing;
    for (const std::string& name : host.takenOff.value_or(Names())) {
        if (host.Find(name) == nullptr) {
            missing.push_back(name);
        }
    }
    return missing;
}

std::string LacpWords(const Port& port, const Member& member)
{
    const bool alone = port.bond && port.lacp != "off" && port.IsNegotiated();
    return alone && !member.negotiated ? "LACP without partner" : "";
}

bool IsTakenOff(const HostModel& host, const std::string& device)
{
    return host.takenOff && host.takenOff->contains(device) && !host.IsDrawnWithTheSwitch(device);
}

} // namespace vornovsctl
