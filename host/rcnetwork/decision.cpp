#include "decision.h"

#include <algorithm>

namespace vornhost {
namespace {

constexpr char kBridgePrefix[] = "ovs_";
constexpr char kDatapathLink[] = "ovs-system";
constexpr char kUserspaceDatapath[] = "netdev";

/** Decides one pair. */
class Decider {
public:
    Decider(const Inputs& inputs, const std::string& name, std::vector<Remark>& remarks);
    Pair Decide();

private:
    const InterfaceFile* File(const std::string& name) const;
    void Say(Severity severity, const std::string& text) { m_remarks.push_back({severity, text}); }
    bool IsJoined() const;
    bool IsOurs() const;
    bool BridgeIsLive() const;
    void ChooseForStop();
    void ChooseForStart();
    void ChooseWithoutBridgeFile();
    void GiveUpOnForeignBridge();
    void CheckPort();
    void CheckMaster();
    void RespectOnBoot();
    void CheckSwitch();

    const Inputs& m_inputs;
    std::vector<Remark>& m_remarks;
    Pair m_pair;
    const SwitchBridge* m_anyBridge = nullptr;
};

Decider::Decider(const Inputs& inputs, const std::string& name, std::vector<Remark>& remarks)
    : m_inputs(inputs), m_remarks(remarks)
{
    m_pair.name = name;
    m_pair.bridge = BridgeOf(name);
    m_pair.port = inputs.live.FindLink(name);
    m_pair.bridgeLink = inputs.live.FindLink(m_pair.bridge);
    m_anyBridge = inputs.switchState.Find(m_pair.bridge);
    m_pair.switchBridge = m_anyBridge;
    m_pair.joined = IsJoined();
}

const InterfaceFile* Decider::File(const std::string& name) const
{
    const auto found = m_inputs.files.find(name);
    return found == m_inputs.files.end() ? nullptr : &found->second;
}

bool Decider::IsJoined() const
{
    if (m_anyBridge == nullptr || m_pair.port == nullptr || m_pair.bridgeLink == nullptr) {
        return false;
    }
    const SwitchPort* port = m_anyBridge->FindPort(m_pair.name);
    return port != nullptr && !port->working.empty() &&
           (m_anyBridge->datapathType == kUserspaceDatapath ||
            m_inputs.live.NameOf(m_pair.port->master) == kDatapathLink);
}

/** Whether this program made the bridge or at least put the port on it. */
bool Decider::IsOurs() const
{
    if (m_anyBridge == nullptr) {
        return false;
    }
    const SwitchPort* port = m_anyBridge->FindPort(m_pair.name);
    return m_anyBridge->marked || (port != nullptr && port->marked);
}

bool Decider::BridgeIsLive() const
{
    return m_pair.bridgeLink != nullptr || m_anyBridge != nullptr;
}

void Decider::ChooseForStop()
{
    const auto record = m_inputs.runState.interfaces.find(m_pair.name);
    const bool recorded = record != m_inputs.runState.interfaces.end() && !record->second.Empty();
    if (!recorded && !IsOurs()) {
        return;
    }
    m_pair.target = Target::kPlain;
    m_pair.removeUnwanted = true;
    m_pair.takeDown = true;
}

void Decider::ChooseForStart()
{
    const InterfaceFile* file = File(m_pair.bridge);
    if (file != nullptr && file->use == FileUse::kBridge) {
        m_pair.target = Target::kSwitch;
        m_pair.file = file;
    } else if (file == nullptr || !BridgeIsLive()) {
        ChooseWithoutBridgeFile();
    }
    if (m_pair.target == Target::kSwitch && m_inputs.request.withoutSwitch.contains(m_pair.name)) {
        m_pair.target = Target::kPlain;
    }
    m_pair.addWanted = m_pair.file != nullptr;
    m_pair.removeUnwanted = m_pair.file != nullptr && m_pair.file->whole;
}

void Decider::ChooseWithoutBridgeFile()
{
    const InterfaceFile* file = File(m_pair.name);
    if (file == nullptr) {
        if (IsOurs()) {
            m_pair.target = Target::kPlain; // nothing asks for the bridge any more
        }
        return;
    }
    if (file->use != FileUse::kPlain) {
        return;
    }
    if (!file->bridge.empty()) {
        Say(Severity::kWarning, "ifcfg-" + file->name + " names the bridge " + file->bridge +
                                    ", which has no usable file");
        if (BridgeIsLive()) {
            return;
        }
    }
    m_pair.target = Target::kPlain;
    m_pair.file = file;
}

/** A bridge of that name that somebody else made is used when asked for, but never dissolved. */
void Decider::GiveUpOnForeignBridge()
{
    if (m_pair.target != Target::kPlain || IsOurs() || m_anyBridge == nullptr) {
        return;
    }
    if (m_anyBridge->FindPort(m_pair.name) != nullptr) {
        Say(Severity::kWarning, m_pair.name + " is a port of " + m_pair.bridge +
                                    ", which another program made; it is left as it is");
        m_pair.target = Target::kLeaveAlone;
    }
    m_pair.switchBridge = nullptr;
    m_pair.bridgeLink = nullptr;
}

void Decider::CheckPort()
{
    if (m_pair.target == Target::kLeaveAlone) {
        return;
    }
    const bool asked =
        m_inputs.request.verb == Verb::kStart &&
        (!m_inputs.request.names.empty() || (m_pair.file != nullptr && m_pair.file->onBoot));
    if (m_pair.port == nullptr) {
        Say(asked ? Severity::kError : Severity::kWarning, "there is no interface " + m_pair.name);
        m_pair.target = Target::kLeaveAlone;
    } else if (m_pair.file != nullptr && !m_pair.file->requiredMac.empty() &&
               m_pair.file->requiredMac != m_pair.port->mac) {
        Say(Severity::kError, "ifcfg-" + m_pair.file->name +
                                  ": HWADDR=" + m_pair.file->requiredMac + ", but " + m_pair.name +
                                  " has " + m_pair.port->mac + "; it is left as it is");
        m_pair.target = Target::kLeaveAlone;
    } else {
        CheckMaster();
    }
}

/** An interface that belongs to something else cannot go on our bridge. */
void Decider::CheckMaster()
{
    std::string owner;
    const std::string master = m_inputs.live.NameOf(m_pair.port->master);
    if (!master.empty() && master != kDatapathLink) {
        owner = master;
    }
    for (const SwitchBridge& bridge : m_inputs.switchState.bridges) {
        if (bridge.name != m_pair.bridge && bridge.FindPort(m_pair.name) != nullptr) {
            owner = bridge.name;
        }
    }
    if (!owner.empty()) {
        Say(m_pair.target == Target::kSwitch ? Severity::kError : Severity::kWarning,
            m_pair.name + " is a port of " + owner + "; it is left as it is");
        m_pair.target = Target::kLeaveAlone;
    }
}

/** Without ONBOOT an interface is not brought up, but one that is live keeps what it carries. */
void Decider::RespectOnBoot()
{
    if (m_pair.target == Target::kLeaveAlone || m_pair.file == nullptr || m_pair.file->onBoot ||
        !m_inputs.request.names.empty()) {
        return;
    }
    m_pair.addWanted = false;
    m_pair.removeUnwanted = false;
    if (!m_pair.port->up && m_pair.switchBridge == nullptr) {
        m_pair.target = Target::kLeaveAlone;
    }
}

/** A switch that does not answer is asked for nothing, and what it carries stays on it. */
void Decider::CheckSwitch()
{
    const SwitchState& state = m_inputs.switchState;
    if (m_pair.target == Target::kLeaveAlone || state.running) {
        return;
    }
    const bool isLive = m_pair.bridgeLink != nullptr;
    if (!state.hung) {
        m_pair.waitsForSwitch = isLive || m_pair.target == Target::kSwitch;
    } else if (isLive) {
        Say(Severity::kError, "the switch does not answer; " + m_pair.bridge + " is left as it is");
        m_pair.target = Target::kLeaveAlone;
    } else if (m_pair.target == Target::kSwitch) {
        Say(Severity::kError, "the switch does not answer; the addresses of " + m_pair.name +
                                  " stay on the plain interface");
        m_pair.target = Target::kPlain;
    }
}

Pair Decider::Decide()
{
    if (m_inputs.request.verb == Verb::kStop) {
        ChooseForStop();
    } else {
        ChooseForStart();
    }
    GiveUpOnForeignBridge();
    CheckPort();
    RespectOnBoot();
    CheckSwitch();
    return m_pair;
}

std::set<std::string> NamesToDecide(const Inputs& inputs)
{
    std::set<std::string> names;
    for (const auto& [name, file] : inputs.files) {
        names.insert(PlainOf(name));
    }
    for (const SwitchBridge& bridge : inputs.switchState.bridges) {
        if (PlainOf(bridge.name) != bridge.name) {
            names.insert(PlainOf(bridge.name));
        }
    }
    for (const auto& [name, record] : inputs.runState.interfaces) {
        names.insert(name);
    }
    return names;
}

} // namespace

std::string BridgeOf(const std::string& plainName)
{
    return kBridgePrefix + plainName;
}

std::string PlainOf(const std::string& name)
{
    return name.rfind(kBridgePrefix, 0) == 0 ? name.substr(sizeof kBridgePrefix - 1) : name;
}

std::vector<std::string> Pair::ForeignPorts() const
{
    std::vector<std::string> ports;
    if (switchBridge != nullptr) {
        for (const SwitchPort& each : switchBridge->ports) {
            if (each.name != name && each.name != bridge) {
                ports.push_back(each.name);
            }
        }
    }
    return ports;
}

bool Pair::SourceStays() const
{
    return target == Target::kSwitch || switchBridge == nullptr || !switchBridge->marked ||
           !ForeignPorts().empty();
}

std::vector<Pair> DecidePairs(const Inputs& inputs, std::vector<Remark>& remarks)
{
    const std::set<std::string> known = NamesToDecide(inputs);
    const std::set<std::string>& asked = inputs.request.names;
    std::vector<Pair> pairs;
    for (const std::string& name : asked.empty() ? known : asked) {
        if (!known.contains(name) && inputs.request.verb == Verb::kStart) {
            remarks.push_back({Severity::kError, name + " has no configuration file"});
            continue;
        }
        Pair pair = Decider(inputs, name, remarks).Decide();
        if (pair.target != Target::kLeaveAlone) {
            pairs.push_back(std::move(pair));
        } else if (!asked.empty() && inputs.request.verb == Verb::kStart) {
            remarks.push_back({Severity::kError, name + " was not started"});
        }
    }
    // Interfaces in the order in which they came up, so that routes are made in the order in which
    // they stood.
    std::sort(pairs.begin(), pairs.end(), [](const Pair& one, const Pair& other) {
        return one.port->index < other.port->index;
    });
    return pairs;
}

std::set<std::string> NotOnSwitch(const Inputs& inputs)
{
    std::vector<Remark> remarks;
    std::set<std::string> names;
    for (const Pair& pair : DecidePairs(inputs, remarks)) {
        if (pair.target == Target::kSwitch && !pair.joined) {
            names.insert(pair.name);
        }
    }
    return names;
}

} // namespace vornhost
