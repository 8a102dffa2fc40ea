#include "kills/hostview.h"

#include "run.h"

#include <support/netlink.h>
#include <support/switchdatabase.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <sstream>

namespace reliability {

namespace {

const unit::SimulatedState* g_host = nullptr;

std::vector<std::string> SlavesOf(const std::string& bridge)
{
    std::string list = unit::KeyOf(bridge, "SLAVE_LIST").value_or("");
    std::erase(list, '"');
    std::istringstream words(list);
    std::vector<std::string> slaves;
    for (std::string word; words >> word;) {
        slaves.push_back(word);
    }
    return slaves;
}

vornhost::SwitchPort PortOf(const std::string& name, const std::vector<std::string>& interfaces)
{
    vornhost::SwitchPort port;
    port.name = name;
    port.interfaces = interfaces;
    port.bond = interfaces.size() > 1;
    for (const std::string& interface : interfaces) {
        vornhost::SwitchInterface state;
        state.name = interface;
        port.state.push_back(state);
    }
    return port;
}

vornhost::SwitchBridge BridgeOf(const std::string& name, const unit::SimulatedState::Bridge& from)
{
    vornhost::SwitchBridge bridge;
    bridge.name = name;
    const std::vector<std::string> slaves = SlavesOf(name);
    const std::string plain = name.substr(std::string("ovs_").size());
    vornhost::SwitchPort wire =
        PortOf(plain, slaves.empty() ? std::vector<std::string>{plain} : slaves);
    wire.marked = true;
    vornhost::SwitchPort own = PortOf(name, {name});
    if (!from.tag.empty()) {
        own.tag = static_cast<unsigned>(std::stoul(from.tag));
    }
    bridge.ports = {wire, own};
    for (const std::string& port : from.ports) {
        bridge.ports.push_back(PortOf(port, {port}));
    }
    return bridge;
}

} // namespace

HostView::HostView(const unit::SimulatedState& host)
{
    g_host = &host;
}

HostView::~HostView()
{
    g_host = nullptr;
}

int Ctl(const std::string& command, std::string& text)
{
    const std::array<const char*, 2> words{"vornovsctl", command.c_str()};
    std::ostringstream output;
    const int status =
        vornovsctl::Run(static_cast<int>(words.size()), words.data(), output, output);
    text += command + ":\n" + output.str();
    return status;
}

} // namespace reliability

namespace vornhost {

std::optional<std::vector<SwitchBridge>> ReadSwitch(std::chrono::milliseconds /*limit*/)
{
    std::vector<SwitchBridge> bridges;
    for (const auto& [name, bridge] : reliability::g_host->bridges) {
        bridges.push_back(reliability::BridgeOf(name, bridge));
    }
    return bridges;
}

std::vector<Link> ReadLinks()
{
    const unit::SimulatedState& host = *reliability::g_host;
    std::vector<Link> links;
    const auto add = [&](const std::string& name, const std::string& kind) {
        Link link;
        link.index = static_cast<int>(links.size()) + 1;
        link.name = name;
        link.kind = kind;
        link.up = link.carrier = true;
        links.push_back(link);
    };
    for (const std::string& card : host.cards) {
        add(card, "");
    }
    for (const auto& [name, bond] : host.linuxBonds) {
        add(name, "bond");
        for (Link& link : links) {
            const bool ofIt =
                std::find(bond.slaves.begin(), bond.slaves.end(), link.name) != bond.slaves.end();
            link.master = ofIt ? links.back().index : link.master;
        }
    }
    for (const auto& [name, vlan] : host.linuxVlans) {
        add(name, "vlan");
    }
    for (const auto& [name, bridge] : host.bridges) {
        add(name, "openvswitch");
    }
    return links;
}

std::optional<std::vector<Address>> ReadAddresses()
{
    return std::vector<Address>();
}

std::optional<std::vector<Route>> ReadRoutes()
{
    return std::vector<Route>();
}

} // namespace vornhost
