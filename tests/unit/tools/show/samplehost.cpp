#include "show/samplehost.h"

namespace unit {

using vornovsctl::Bridge;
using vornovsctl::Device;
using vornovsctl::HostModel;
using vornovsctl::Member;
using vornovsctl::Port;

namespace {

std::string Mac(int number)
{
    return "52:54:00:00:00:0" + std::to_string(number);
}

Device OnTheSwitch(Device device)
{
    device.onTheSwitch = true;
    return device;
}

Device Bridged(const std::string& name, int number, const std::string& address)
{
    Device device = OnTheSwitch(MakeDevice(name, number));
    device.kind = "openvswitch";
    device.speed.reset();
    device.addresses = {address};
    return device;
}

Port Wire(const std::string& name, int number)
{
    Port port;
    port.name = name;
    port.wire = true;
    port.members = {Member{name, Mac(number), true, false, ""}};
    return port;
}

Port Tap(const std::string& name, const std::string& error)
{
    Port port;
    port.name = name;
    port.members = {Member{name, "", {}, false, error}};
    return port;
}

Port Bond(const std::string& name, const std::string& mode, int number)
{
    Port port;
    port.name = name;
    port.bond = true;
    port.wire = true;
    port.mode = mode;
    port.lacp = "off";
    port.members = {Member{"eth" + std::to_string(number), Mac(number), true, false, ""},
                    Member{"eth" + std::to_string(number + 1), Mac(number + 1), false, false, ""}};
    return port;
}

std::vector<Bridge> SampleBridges()
{
    Bridge foreign{"br-vms", {}, {}};

    Bridge lacp{"ovs_bond0", {}, {Bond("bond0", "balance-tcp", 1)}};
    lacp.ports[0].lacp = "active";
    lacp.ports[0].members[0].negotiated = true;
    Bridge backup{"ovs_bond1", {}, {Bond("bond1", "active-backup", 4)}};
    backup.ports[0].active = "eth5";

    Bridge plain{"ovs_eth0", 10, {Wire("eth0", 0), Tap("tap0", ""), Tap("tap2", "No such device")}};
    plain.ports[1].tag = 20;
    plain.ports[2].trunks = {30, 40};
    return {foreign, lacp, backup, plain};
}

} // namespace

Device MakeDevice(const std::string& name, int number)
{
    Device device;
    device.name = name;
    device.mac = Mac(number);
    device.mtu = 1500;
    device.up = true;
    device.carrier = true;
    device.speed = 1000;
    return device;
}

HostModel SampleHost()
{
    HostModel host;
    host.name = "nas";
    host.clients = {"apps", "vms"};
    host.takenOff = {"eth3", "eth9"};
    host.switchRuns = true;
    host.bridges = SampleBridges();

    for (const int number : {0, 1, 2, 4, 5}) {
        host.devices.push_back(OnTheSwitch(MakeDevice("eth" + std::to_string(number), number)));
    }
    host.devices[2].carrier = false;
    host.devices.push_back(MakeDevice("eth3", 3));
    host.devices.back().addresses = {"198.51.100.2/24"};
    host.devices.push_back(Bridged("ovs_bond0", 1, "192.0.2.10/24"));
    host.devices.back().routes = {{false, "192.0.2.1", 0, 0}, {true, "fe80::1", 1024, 0}};
    host.devices.push_back(Bridged("ovs_bond1", 4, "203.0.113.4/24"));
    host.devices.push_back(Bridged("ovs_eth0", 0, "2001:db8::2/64"));
    host.devices.push_back(OnTheSwitch(MakeDevice("tap0", 7)));
    host.devices.back().speed = 10000;
    return host;
}

HostModel PlainHost()
{
    HostModel host;
    host.name = "nas";
    host.clients = vornovsctl::Names();
    host.takenOff = vornovsctl::Names();

    Device bond = MakeDevice("bond0", 1);
    bond.kind = "bond";
    bond.speed = 2000;
    bond.bond = {"802.3ad", "", true};
    Device vlan = MakeDevice("bond0.10", 1);
    vlan.kind = "vlan";
    vlan.parent = "bond0";
    vlan.vlan = 10;
    vlan.speed.reset();
    vlan.addresses = {"192.0.2.10/24", "2001:db8::2/64"};
    vlan.routes = {{false, "", 50, 100}, {true, "", 0, 0}};
    Device backup = MakeDevice("bond1", 4);
    backup.kind = "bond";
    backup.bond = {"active-backup", "eth3", {}};
    Device bridge = MakeDevice("br0", 5);
    bridge.kind = "bridge";
    bridge.up = false;
    host.devices = {bond, vlan, backup, bridge};
    const char* const masters[] = {"bond0", "bond0", "bond1", "br0"};
    for (int number = 1; number <= 4; ++number) {
        host.devices.push_back(MakeDevice("eth" + std::to_string(number), number));
        host.devices.back().master = masters[number - 1];
    }
    return host;
}

} // namespace unit
