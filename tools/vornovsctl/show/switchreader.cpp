#include "show/switchreader.h"

#include <support/switchdatabase.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <iterator>

#include <unistd.h>

namespace vornovsctl {

namespace {

constexpr std::chrono::seconds kLimit(5);

std::string Column(const vornhost::SwitchPort& port, const char* name)
{
    const auto found = port.columns.find(name);
    return found == port.columns.end() ? "" : found->second;
}

Port DrawnPort(const vornhost::SwitchPort& from)
{
    Port port;
    port.name = from.name;
    port.tag = from.tag;
    port.trunks.assign(from.trunks.begin(), from.trunks.end());
    for (const vornhost::SwitchInterface& each : from.state) {
        port.members.push_back({each.name, each.mac, each.link, each.negotiated, each.error});
    }
    std::sort(port.members.begin(), port.members.end(), [](const Member& one, const Member& other) {
        return ComesBefore(one.name, other.name);
    });

    port.bond = from.bond;
    port.wire = from.marked;
    if (port.bond) {
        // What the switch does when nothing is said.
        const std::string mode = Column(from, "bond_mode");
        const std::string lacp = Column(from, "lacp");
        port.mode = mode.empty() ? "active-backup" : mode;
        port.lacp = lacp.empty() ? "off" : lacp;
        const std::string active = Column(from, "bond_active_slave");
        for (const Member& member : port.members) {
            if (!active.empty() && member.mac == active && port.mode == "active-backup") {
                port.active = member.name;
            }
        }
    }
    return port;
}

Bridge DrawnBridge(const vornhost::SwitchBridge& from)
{
    Bridge bridge;
    bridge.name = from.name;
    for (const vornhost::SwitchPort& port : from.ports) {
        if (port.name == bridge.name) {
            bridge.tag = port.tag;
        } else {
            bridge.ports.push_back(DrawnPort(port));
        }
    }
    std::sort(bridge.ports.begin(), bridge.ports.end(), [](const Port& one, const Port& other) {
        return one.wire == other.wire ? ComesBefore(one.name, other.name) : one.wire;
    });
    return bridge;
}

} // namespace

std::vector<Bridge> DrawnBridges(const std::vector<vornhost::SwitchBridge>& bridges)
{
    std::vector<Bridge> drawn;
    std::transform(bridges.begin(), bridges.end(), std::back_inserter(drawn), DrawnBridge);
    std::sort(drawn.begin(), drawn.end(), [](const Bridge& one, const Bridge& other) {
        return ComesBefore(one.name, other.name);
    });
    return drawn;
}

SwitchAnswer AskSwitch()
{
    SwitchAnswer answer;
    if (access(vornhost::kSwitchSocket, R_OK | W_OK) != 0 && errno == EACCES) {
        answer.fault = "the switch can only be asked by root";
        return answer;
    }
    const auto bridges = vornhost::ReadSwitch(kLimit);
    if (bridges) {
        answer.bridges = DrawnBridges(*bridges);
    } else {
        answer.fault = "the switch's database does not answer";
    }
    return answer;
}

const Bridge* FindBridgeOfPort(const std::vector<Bridge>& bridges, const std::string& port)
{
    const auto found = std::find_if(bridges.begin(), bridges.end(), [&](const Bridge& bridge) {
        return bridge.Find(port) != nullptr;
    });
    return found == bridges.end() ? nullptr : &*found;
}

} // namespace vornovsctl
