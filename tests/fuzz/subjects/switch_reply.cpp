/**
 * The reply of the switch's database server. The text is the reply.
 */
#include "subject.h"
#include "text.h"

#include "support/switchdatabase.h"

#include <algorithm>

namespace {

using fuzz::Expect;
using vornhost::SwitchBridge;
using vornhost::SwitchPort;

void CheckPort(const SwitchPort& port)
{
    const auto& interfaces = port.interfaces;
    Expect(std::is_sorted(interfaces.begin(), interfaces.end()), "interfaces are not sorted");
    Expect(port.state.size() == interfaces.size(), "an interface has no state, or two");
    for (const std::string& name : port.working) {
        Expect(std::find(interfaces.begin(), interfaces.end(), name) != interfaces.end(),
               "a foreign interface works");
    }
    Expect(port.bond || interfaces.size() < 2, "several interfaces are no bond");
}

void CheckBridge(const SwitchBridge& bridge)
{
    const auto byName = [](const auto& one, const auto& other) { return one.name < other.name; };
    Expect(std::is_sorted(bridge.ports.begin(), bridge.ports.end(), byName),
           "ports are not sorted");
    for (const SwitchPort& port : bridge.ports) {
        CheckPort(port);
        const SwitchPort* const found = bridge.FindPort(port.name);
        Expect(found != nullptr && found->name == port.name, "a port cannot be found");
        const SwitchPort* const uplink = vornhost::FindUplink(bridge, port.name);
        Expect(uplink == nullptr || uplink->name != bridge.name, "the own port is the uplink");
        Expect(port.name == bridge.name || (uplink != nullptr && uplink->name == port.name),
               "the port of the interface's name is not the uplink");
    }
}

void Run(std::string_view text)
{
    const auto bridges = vornhost::ParseSwitchReply(text);
    if (!bridges) {
        return;
    }
    Expect(bridges == vornhost::ParseSwitchReply(text), "a reply is read in two ways");
    for (const SwitchBridge& bridge : *bridges) {
        CheckBridge(bridge);
    }
}

const fuzz::Subject kSubject("switch_reply", Run);

} // namespace
