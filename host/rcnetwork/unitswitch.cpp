#include "unitplan.h"

#include "portcolumns.h"

#include "support/interfacevalues.h"
#include "support/remembered.h"

#include <algorithm>

namespace vornhost {
namespace {

std::string MarkText()
{
    return std::string("external_ids:") + kSwitchMarkKey + "=" + kSwitchMarkValue;
}

std::string MacSetting(const std::string& mac)
{
    return "other-config:hwaddr=\"" + mac + "\"";
}

std::string Join(const std::vector<std::string>& words, const char* separator)
{
    std::string text;
    for (const std::string& word : words) {
        text += (text.empty() ? "" : separator) + word;
    }
    return text;
}

} // namespace

/** Whether the bond is the one that came from the kernel, and not a client's of the same name. */
const FormerBond* UnitPlanner::Remembered() const
{
    const auto found = m_inputs.formerBonds.find(m_unit.name);
    const bool same = found != m_inputs.formerBonds.end() &&
                      found->second.bond.HasSlaves(m_kinship.MembersOf(m_unit.name));
    return same ? &found->second : nullptr;
}

/** The bridge or bond of the kernel is known to the network outside by this link address. */
std::string UnitPlanner::WantedMac() const
{
    const FormerBond* former = Remembered();
    if (former != nullptr && !former->bond.mac.empty()) {
        return former->bond.mac;
    }
    const auto handed = m_inputs.handover.bonds.find(m_unit.name);
    if (handed != m_inputs.handover.bonds.end() && !handed->second.mac.empty()) {
        return handed->second.mac;
    }
    if (m_unit.kind == UnitKind::kSwitchBond && m_unit.switchBridge != nullptr &&
        m_unit.switchBridge->marked && IsLinkAddress(m_unit.switchBridge->hwaddr)) {
        return Lower(m_unit.switchBridge->hwaddr); // anybody may have set it
    }
    if (m_unit.IsGroup() && m_unit.port == nullptr) {
        return m_unit.members.empty() ? "" : m_unit.members.front()->mac;
    }
    if (m_unit.kind == UnitKind::kVlan && m_unit.port == nullptr) {
        // It will have its parent's, and that its first member's.
        const std::string& parent = m_inputs.files.at(m_unit.name).vlan->parent;
        const auto members = m_kinship.MembersOf(parent);
        const Link* link = m_inputs.live.FindLink(parent);
        link = link == nullptr && !members.empty() ? m_inputs.live.FindLink(members.front()) : link;
        return link == nullptr ? "" : link->mac;
    }
    return m_unit.port == nullptr ? "" : m_unit.port->mac;
}

unsigned UnitPlanner::WantedMtu() const
{
    const bool asked = m_unit.addWanted && m_unit.file != nullptr && m_unit.file->mtu.has_value();
    if (asked) {
        return *m_unit.file->mtu;
    }
    if (m_unit.kind == UnitKind::kSwitchBond && m_unit.MainSource() != nullptr && !m_unit.joined) {
        return m_unit.MainSource()->mtu;
    }
    const auto ports = m_unit.Ports();
    return ports.empty() ? 1500 : ports.front()->mtu;
}

void UnitPlanner::PlanBridge()
{
    if (!ToSwitch()) {
        LeaveBridges();
        return;
    }
    m_moves = m_moves || !m_unit.joined;
    if (m_unit.switchBridge == nullptr) {
        MakeBridge();
    } else {
        AdjustBridge();
    }
    if (m_unit.bridgeLink == nullptr ||
        (m_unit.bridgeLink->mac != WantedMac() &&
         (m_unit.switchBridge == nullptr || m_unit.switchBridge->marked))) {
        m_steps.waitFor.push_back(m_unit.bridge + " " + WantedMac());
    }
    LeaveBridges();
    LeaveFurtherPorts();
    JoinPort();
    JoinFurtherPorts();
}

/** The MAC is given in the transaction that makes the bridge, so that it never has another one. */
void UnitPlanner::MakeBridge()
{
    auto& commands = m_steps.makeBridges;
    commands.push_back("--may-exist add-br " + m_unit.bridge);
    commands.push_back("set Bridge " + m_unit.bridge + " " + MacSetting(WantedMac()) + " " +
                       MarkText());
    commands.push_back("set Interface " + m_unit.bridge +
                       " mtu_request=" + std::to_string(WantedMtu()));
    if (m_unit.tag) {
        commands.push_back("set Port " + m_unit.bridge + " tag=" + std::to_string(*m_unit.tag));
        m_record.tag = m_unit.tag;
    }
}

void UnitPlanner::AdjustBridge()
{
    const SwitchBridge& bridge = *m_unit.switchBridge;
    const SwitchPort* own = bridge.FindPort(bridge.name);
    auto& commands = m_steps.makeBridges;
    if (bridge.marked && bridge.hwaddr != WantedMac()) {
        commands.push_back("set Bridge " + bridge.name + " " + MacSetting(WantedMac()));
    }
    if (own == nullptr) {
        return;
    }
    if (bridge.marked && own->mtuRequest != WantedMtu()) {
        commands.push_back("set Interface " + bridge.name +
                           " mtu_request=" + std::to_string(WantedMtu()));
    }
    if (m_unit.tag && own->tag != m_unit.tag) {
        commands.push_back("set Port " + bridge.name + " tag=" + std::to_string(*m_unit.tag));
        m_record.tag = m_unit.tag;
    } else if (m_unit.removeUnwanted && !m_unit.tag && m_former.tag && own->tag == m_former.tag) {
        commands.push_back("clear Port " + bridge.name + " tag");
        m_record.tag.reset();
    }
}

void UnitPlanner::JoinPort()
{
    if (m_unit.kind == UnitKind::kSwitchBond) {
        JoinBond();
        return;
    }
    const SwitchPort* live =
        m_unit.switchBridge == nullptr ? nullptr : m_unit.switchBridge->FindPort(m_unit.name);
    if (!m_unit.joined) {
        m_steps.join.push_back("--may-exist add-port " + m_unit.bridge + " " + m_unit.name);
        m_steps.join.push_back("set Port " + m_unit.name + " " + MarkText());
    }
    const HandedBond* handed = m_inputs.handover.FirstOf(m_unit.name);
    if (handed != nullptr && handed->lacp && (live == nullptr || !live->columns.contains("lacp"))) {
        // Its partner leaves a port in the aggregate that goes on to speak the protocol.
        m_steps.join.push_back("set Port " + m_unit.name +
                               " lacp=active other_config:lacp-fallback-ab=true");
    }
}

void UnitPlanner::JoinBond()
{
    const std::string port = m_unit.BondPort();
    std::vector<std::string> members;
    for (const Link* member : m_unit.members) {
        members.push_back(member->name);
    }
    const SwitchPort* live =
        m_unit.switchBridge == nullptr ? nullptr : m_unit.switchBridge->FindPort(port);
    const PortColumns columns(*m_unit.file, Remembered());
    RemarkOn(columns);
    if (live == nullptr) {
        m_steps.join.push_back(
            members.size() > 1
                ? "add-bond " + m_unit.bridge + " " + port + " " + vornhost::Join(members, " ")
                : "--id=@member create Interface name=" + members.front() +
                      " -- --id=@port create Port name=" + port +
                      " interfaces=@member -- add Bridge " + m_unit.bridge + " ports @port");
    } else if (!m_unit.joined) {
        AdjustMembers(*live, members);
    }
    std::string settings = columns.Changes(live, m_unit.addWanted);
    if (live == nullptr || !live->marked) {
        settings += " " + MarkText();
    }
    const std::string order = vornhost::Join(m_kinship.MembersOf(m_unit.name), ",");
    if (live == nullptr || !live->externalIds.contains(kMembersKey) ||
        live->externalIds.at(kMembersKey) != order) {
        settings += std::string(" external_ids:") + kMembersKey + "=\"" + order + "\"";
    }
    if (!settings.empty()) {
        m_steps.join.push_back("set Port " + port + settings);
    }
    for (const std::string& removal : columns.Removals(port, live, m_unit.addWanted)) {
        m_steps.join.push_back(removal);
    }
    if (columns.SpeaksLacp() && (live == nullptr || !live->negotiated) && WireHasCarrier()) {
        m_steps.negotiate.push_back("switch " + m_unit.bridge + " " + port);
    }
}

void UnitPlanner::RemarkOn(const PortColumns& columns)
{
    const std::string file = "ifcfg-" + m_unit.file->name + ": ";
    for (const std::string& refusal : columns.Refusals()) {
        m_remarks.push_back({Severity::kWarning, file + refusal});
    }
    // The library takes all options out of a file before it takes the bond apart.
    if (const std::string objection = columns.Objection();
        !objection.empty() && !m_unit.file->bondOptions.empty()) {
        m_remarks.push_back({Severity::kWarning, file + objection + "; the bond keeps its own"});
    }
}

/** Those that stay do not notice. */
void UnitPlanner::AdjustMembers(const SwitchPort& live, const std::vector<std::string>& members)
{
    for (const std::string& member : members) {
        if (std::find(live.interfaces.begin(), live.interfaces.end(), member) ==
            live.interfaces.end()) {
            m_steps.join.push_back("--may-exist add-bond-iface " + live.name + " " + member);
        }
    }
    for (const std::string& member : live.interfaces) {
        if (std::find(members.begin(), members.end(), member) == members.end()) {
            m_steps.leave.push_back("--if-exists del-bond-iface " + live.name + " " + member);
        }
    }
}

/** Every bridge of ours that stands for something that this unit takes over. */
void UnitPlanner::LeaveBridges()
{
    if (!ToSwitch()) {
        m_record.tag.reset();
        if (m_unit.switchBridge == nullptr) {
            // A bridge without a switch that answers: only the switch can take the port off it.
            m_steps.needsSwitch = m_steps.needsSwitch ||
                                  (m_unit.bridgeLink != nullptr && !m_inputs.switchState.running);
        } else {
            LeaveBridge(*m_unit.switchBridge, m_unit);
        }
    }
    for (const std::string& name : m_unit.absorbed) {
        Unit other;
        other.name = name;
        other.bridge = m_kinship.BridgeFor(name);
        other.target = Target::kPlain;
        other.switchBridge = m_inputs.switchState.Find(other.bridge);
        if (other.switchBridge != nullptr && other.switchBridge->marked &&
            other.bridge != m_unit.bridge) {
            LeaveBridge(*other.switchBridge, other);
        }
    }
}

void UnitPlanner::LeaveBridge(const SwitchBridge& bridge, const Unit& owner)
{
    std::vector<std::string> ours;
    for (const SwitchPort& port : bridge.ports) {
        if (port.name != bridge.name && (port.marked || port.name == owner.name)) {
            ours.push_back(port.name);
        }
    }
    m_moves = m_moves || !ours.empty() || HasGlobalAddress(m_inputs.live.FindLink(bridge.name));
    if (!owner.BridgeStays() && !ToSwitch()) {
        m_steps.leave.push_back("--if-exists del-br " + bridge.name);
        m_moves = true;
        ours.clear();
    }
    for (const std::string& port : ours) {
        m_steps.leave.push_back("--if-exists del-port " + bridge.name + " " + port);
    }
    if (!owner.BridgeStays() && ToSwitch()) {
        // The traffic does not wait until a bridge has been taken apart.
        m_steps.removeBridges.push_back("--if-exists del-br " + bridge.name);
        m_moves = true;
    } else if (!ours.empty()) {
        m_remarks.push_back(
            {Severity::kWarning, bridge.name +
                                     " stays without uplink and addresses, because other "
                                     "programs have ports on it: " +
                                     vornhost::Join(owner.ForeignPorts(), ", ")});
    }
    if (m_inputs.request.verb == Verb::kStart && !m_inputs.files.contains(bridge.name)) {
        ForgetGateways(bridge.name);
    }
}

void UnitPlanner::ForgetGateways(const std::string& bridge)
{
    const auto& gateways = m_inputs.gateways;
    if (m_moves && std::any_of(gateways.begin(), gateways.end(), [&](const GatewayRecord& record) {
            return record.interface == bridge;
        })) {
        m_steps.forgetGateways.push_back(bridge);
    }
}

} // namespace vornhost
