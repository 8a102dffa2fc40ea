#include "pairplan.h"

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

} // namespace

unsigned PairPlanner::WantedMtu() const
{
    const bool asked = m_pair.addWanted && m_pair.file != nullptr && m_pair.file->mtu.has_value();
    return asked ? *m_pair.file->mtu : m_pair.port->mtu;
}

void PairPlanner::PlanBridge()
{
    if (!ToSwitch()) {
        LeaveBridge();
        return;
    }
    m_moves = !m_pair.joined;
    if (m_pair.switchBridge == nullptr) {
        MakeBridge();
    } else {
        AdjustBridge();
    }
    if (m_pair.bridgeLink == nullptr ||
        (m_pair.bridgeLink->mac != m_pair.port->mac &&
         (m_pair.switchBridge == nullptr || m_pair.switchBridge->marked))) {
        m_steps.waitFor.push_back(m_pair.bridge + " " + m_pair.port->mac);
    }
    if (!m_pair.joined) {
        m_steps.joinAndLeave.push_back("--may-exist add-port " + m_pair.bridge + " " + m_pair.name);
        m_steps.joinAndLeave.push_back("set Port " + m_pair.name + " " + MarkText());
    }
}

/** The MAC is given in the transaction that makes the bridge, so that it never has another one. */
void PairPlanner::MakeBridge()
{
    auto& commands = m_steps.makeBridges;
    commands.push_back("--may-exist add-br " + m_pair.bridge);
    commands.push_back("set Bridge " + m_pair.bridge + " " + MacSetting(m_pair.port->mac) + " " +
                       MarkText());
    commands.push_back("set Interface " + m_pair.bridge +
                       " mtu_request=" + std::to_string(WantedMtu()));
    if (m_pair.file != nullptr && m_pair.file->vlanId) {
        commands.push_back("set Port " + m_pair.bridge +
                           " tag=" + std::to_string(*m_pair.file->vlanId));
        m_record.tag = m_pair.file->vlanId;
    }
}

void PairPlanner::AdjustBridge()
{
    const SwitchBridge& bridge = *m_pair.switchBridge;
    const SwitchPort* own = bridge.FindPort(bridge.name);
    auto& commands = m_steps.makeBridges;
    if (bridge.marked && bridge.hwaddr != m_pair.port->mac) {
        commands.push_back("set Bridge " + bridge.name + " " + MacSetting(m_pair.port->mac));
    }
    if (own == nullptr) {
        return;
    }
    if (bridge.marked && own->mtuRequest != WantedMtu()) {
        commands.push_back("set Interface " + bridge.name +
                           " mtu_request=" + std::to_string(WantedMtu()));
    }
    const auto wantedTag = m_pair.addWanted ? m_pair.file->vlanId : std::nullopt;
    if (wantedTag && own->tag != wantedTag) {
        commands.push_back("set Port " + bridge.name + " tag=" + std::to_string(*wantedTag));
        m_record.tag = wantedTag;
    } else if (m_pair.removeUnwanted && !wantedTag && m_former.tag && own->tag == m_former.tag) {
        commands.push_back("clear Port " + bridge.name + " tag");
        m_record.tag.reset();
    }
}

void PairPlanner::LeaveBridge()
{
    m_record.tag.reset();
    const SwitchBridge* bridge = m_pair.switchBridge;
    if (bridge == nullptr) {
        // A bridge without a switch that answers: only the switch can take the port off it.
        m_steps.needsSwitch =
            m_steps.needsSwitch || (m_pair.bridgeLink != nullptr && !m_inputs.switchState.running);
        return;
    }
    const bool carriesPort = bridge->FindPort(m_pair.name) != nullptr;
    const auto& addresses = m_inputs.live.addresses;
    const bool hasAddresses =
        m_pair.bridgeLink != nullptr &&
        std::any_of(addresses.begin(), addresses.end(), [&](const Address& address) {
            return address.index == m_pair.bridgeLink->index && address.scope == 0;
        });

    m_moves = carriesPort || hasAddresses;
    if (!m_pair.SourceStays()) {
        m_steps.joinAndLeave.push_back("--if-exists del-br " + bridge->name);
        m_moves = true;
    } else if (carriesPort) {
        m_steps.joinAndLeave.push_back("--if-exists del-port " + bridge->name + " " + m_pair.name);
        m_remarks.push_back({Severity::kWarning, bridge->name +
                                                     " stays without uplink and addresses, because "
                                                     "other programs have ports on it"});
    }
    if (m_inputs.request.verb == Verb::kStart && !m_inputs.files.contains(bridge->name)) {
        for (const GatewayRecord& record : m_inputs.gateways) {
            if (record.interface == bridge->name && m_moves) {
                m_steps.forgetGateways.push_back(bridge->name);
                break;
            }
        }
    }
}

} // namespace vornhost
