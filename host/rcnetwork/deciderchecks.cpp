#include "decider.h"

#include <algorithm>

namespace vornhost {

/** A bridge of that name that somebody else made is used when asked for, but never dissolved. */
void Decider::GiveUpOnForeignBridge()
{
    if (m_unit.target != Target::kPlain || IsOurs() || m_anyBridge == nullptr) {
        return;
    }
    if (m_anyBridge->FindPort(m_unit.name) != nullptr) {
        Say(Severity::kWarning, m_unit.name + " is a port of " + m_unit.bridge +
                                    ", which another program made; it is left as it is");
        m_unit.target = Target::kLeaveAlone;
    }
    m_unit.switchBridge = nullptr;
    m_unit.bridgeLink = nullptr;
}

bool Decider::IsAsked() const
{
    return m_inputs.request.verb == Verb::kStart &&
           (!m_inputs.request.names.empty() || (m_unit.file != nullptr && m_unit.file->onBoot));
}

/** An interface that has its bond's address meanwhile is still the one that its file means. */
bool Decider::HasRequiredMac() const
{
    if (m_unit.file == nullptr || m_unit.file->requiredMac.empty() || m_unit.port == nullptr ||
        m_unit.IsGroup() || m_unit.kind == UnitKind::kSwitchBond) {
        return true;
    }
    const std::string& wanted = m_unit.file->requiredMac;
    const auto record = m_inputs.runState.interfaces.find(m_unit.name);
    const auto bond = m_inputs.live.bonds.find(m_inputs.live.NameOf(m_unit.port->master));
    std::string own;
    if (record != m_inputs.runState.interfaces.end()) {
        own = record->second.ownMac;
    }
    if (bond != m_inputs.live.bonds.end() && bond->second.ownMacs.contains(m_unit.name)) {
        own = bond->second.ownMacs.at(m_unit.name);
    }
    return wanted == m_unit.port->mac || wanted == own;
}

void Decider::CheckPort()
{
    if (m_unit.target == Target::kLeaveAlone) {
        return;
    }
    const bool isMade = m_unit.IsGroup() || m_unit.kind == UnitKind::kVlan;
    if (m_unit.port == nullptr && !(isMade && m_inputs.request.verb == Verb::kStart)) {
        const auto record = m_inputs.runState.interfaces.find(m_unit.name);
        const bool made = record != m_inputs.runState.interfaces.end() && record->second.made;
        if (m_inputs.request.verb == Verb::kStart || !made) {
            Say(IsAsked() ? Severity::kError : Severity::kWarning,
                m_unit.kind == UnitKind::kSwitchBond ? m_unit.bridge + " has no member that exists"
                                                     : "there is no interface " + m_unit.name);
        }
        m_unit.target = Target::kLeaveAlone;
    } else if (!HasRequiredMac()) {
        Say(Severity::kError, "ifcfg-" + m_unit.file->name +
                                  ": HWADDR=" + m_unit.file->requiredMac + ", but " + m_unit.name +
                                  " has " + m_unit.port->mac + "; it is left as it is");
        m_unit.target = Target::kLeaveAlone;
    } else {
        CheckMaster();
    }
}

/** Whether what an interface is a member of is one of the things that go together. */
bool Decider::IsOwnMaster(const std::string& master) const
{
    const std::string plain = PlainOf(master);
    return master == m_unit.bridge || plain == m_unit.name ||
           m_kinship.HeirOf(plain) == m_unit.name ||
           (m_unit.heldDown && !m_kinship.HeirOf(plain).empty()) ||
           (!m_kinship.HeirOf(plain).empty() && m_kinship.LiveMasterOf(m_unit.name) == plain) ||
           (m_kinship.IsWantedBond(plain) && m_kinship.LiveMasterOf(m_unit.name) == plain);
}

void Decider::SayTaken(Severity severity, const std::string& port, const std::string& owner)
{
    Say(severity, port + " is a port of " + owner + "; it is left as it is");
}

/** An interface that belongs to something else cannot go on our bridge. */
void Decider::CheckMaster()
{
    const std::vector<const Link*> ports = m_unit.IsGroup() ? m_unit.members : m_unit.Ports();
    for (const Link* port : ports) {
        std::string owner;
        const std::string master = m_inputs.live.NameOf(port->master);
        if (!master.empty() && master != kDatapathLink && !IsOwnMaster(master)) {
            owner = master;
        }
        for (const SwitchBridge& bridge : m_inputs.switchState.bridges) {
            const bool carries =
                std::any_of(bridge.ports.begin(), bridge.ports.end(), [&](const SwitchPort& each) {
                    return !each.IsFurther() &&
                           std::find(each.interfaces.begin(), each.interfaces.end(), port->name) !=
                               each.interfaces.end();
                });
            const bool own = bridge.name == BridgeOf(port->name) || IsOwnMaster(bridge.name);
            if (carries && bridge.name != m_unit.bridge && !(own && bridge.marked)) {
                owner = bridge.name;
            }
        }
        if (!owner.empty() && m_unit.target != Target::kLeaveAlone) {
            SayTaken(m_unit.target == Target::kSwitch ? Severity::kError : Severity::kWarning,
                     port->name, owner);
            m_unit.target = Target::kLeaveAlone;
        }
    }
}

/**
 * Without ONBOOT an interface is not brought up, but one that is live keeps what it carries. A bond
 * or VLAN that is not there is not made, either, to take over what its bridge carries.
 */
void Decider::RespectOnBoot()
{
    if (m_unit.target == Target::kLeaveAlone || m_unit.file == nullptr || m_unit.file->onBoot ||
        !m_inputs.request.names.empty()) {
        return;
    }
    m_unit.addWanted = false;
    m_unit.removeUnwanted = false;
    const bool live = m_unit.port != nullptr && m_unit.port->up;
    const bool isMissing =
        m_unit.port == nullptr && (m_unit.IsGroup() || m_unit.kind == UnitKind::kVlan);
    if ((!live && m_unit.switchBridge == nullptr) || isMissing) {
        m_unit.target = Target::kLeaveAlone;
    }
}

/** A switch that does not answer is asked for nothing, and what it carries stays on it. */
void Decider::CheckSwitch()
{
    const SwitchState& state = m_inputs.switchState;
    if (m_unit.target == Target::kLeaveAlone || state.running) {
        return;
    }
    const bool isLive = m_unit.bridgeLink != nullptr;
    if (!state.hung) {
        m_unit.waitsForSwitch = isLive || m_unit.target == Target::kSwitch;
    } else if (isLive) {
        Say(Severity::kError, "the switch does not answer; " + m_unit.bridge + " is left as it is");
        m_unit.target = Target::kLeaveAlone;
    } else if (m_unit.target == Target::kSwitch) {
        Say(Severity::kError, "the switch does not answer; the addresses of " + m_unit.name +
                                  " stay on the plain interface");
        m_unit.target = Target::kPlain;
    }
}

} // namespace vornhost
