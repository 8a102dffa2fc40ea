#include "decision.h"

#include "sources.h"

#include <algorithm>

namespace vornhost {
namespace {

constexpr char kDatapathLink[] = "ovs-system";
constexpr char kUserspaceDatapath[] = "netdev";
constexpr int kAfterAllLinks = 1 << 30;

/** Decides one unit. */
class Decider {
public:
    Decider(const Inputs& inputs, const Kinship& kinship, const std::string& name,
            std::vector<Remark>& remarks);
    Unit Decide();

private:
    void Say(Severity severity, const std::string& text) { m_remarks.push_back({severity, text}); }
    void ReadKind();
    void ReadMembers();
    void ReadFurtherPorts();
    bool IsWorkingPort(const Link& link, const SwitchPort& port) const;
    bool IsJoined() const;
    bool IsOurs() const;
    bool BridgeIsLive() const;
    bool IsPartOfABond() const;
    void ChooseForStop();
    void ChooseForStart();
    void ChooseWithoutBridgeFile();
    void ChooseForIdleBridge(const InterfaceFile& file);
    bool NamesUnknownBridge(const InterfaceFile& file) const;
    void GiveUpOnForeignBridge();
    void CheckPort();
    bool IsAsked() const;
    bool HasRequiredMac() const;
    void CheckMaster();
    bool IsOwnMaster(const std::string& master) const;
    void RespectOnBoot();
    void CheckSwitch();
    void ChooseTag();

    const Inputs& m_inputs;
    const Kinship& m_kinship;
    std::vector<Remark>& m_remarks;
    Unit m_unit;
    const SwitchBridge* m_anyBridge = nullptr;
};

Decider::Decider(const Inputs& inputs, const Kinship& kinship, const std::string& name,
                 std::vector<Remark>& remarks)
    : m_inputs(inputs), m_kinship(kinship), m_remarks(remarks)
{
    m_unit.name = name;
    m_unit.bridge = kinship.BridgeFor(name);
    m_unit.port = m_unit.bridge == name ? nullptr : inputs.live.FindLink(name);
    m_unit.bridgeLink = inputs.live.FindLink(m_unit.bridge);
    m_anyBridge = inputs.switchState.Find(m_unit.bridge);
    m_unit.switchBridge = m_anyBridge;
    m_unit.heldDown = inputs.handover.IsSilent(name);
    ReadKind();
    m_unit.joined = IsJoined();
}

void Decider::ReadKind()
{
    const InterfaceFile* file = m_kinship.UsableFile(m_unit.name);
    if (m_kinship.IsWantedOnSwitch(m_unit.name)) {
        m_unit.kind = UnitKind::kSwitchBond;
    } else if (m_kinship.IsWantedLinuxBridge(m_unit.name)) {
        m_unit.kind = UnitKind::kLinuxBridge;
    } else if (m_kinship.IsWantedBond(m_unit.name)) {
        m_unit.kind = UnitKind::kBond;
    } else if (file != nullptr && file->vlan) {
        m_unit.kind = UnitKind::kVlan;
    }
    ReadMembers();
    ReadFurtherPorts();
    if (m_unit.kind == UnitKind::kSwitchBond) {
        m_unit.port = m_unit.members.empty() ? nullptr : m_unit.members.front();
    }
}

void Decider::ReadMembers()
{
    for (const std::string& member : m_kinship.MembersOf(m_unit.name)) {
        if (const Link* link = m_inputs.live.FindLink(member); link != nullptr) {
            m_unit.members.push_back(link);
        } else {
            Say(Severity::kWarning, "there is no interface " + member + " for " + m_unit.name);
        }
    }
}

/** What belongs to something else, or is not there, does not come on the bridge. */
void Decider::ReadFurtherPorts()
{
    for (const std::string& name : m_kinship.FurtherPortsOf(m_unit.name)) {
        const Link* link = m_inputs.live.FindLink(name);
        const std::string master = link == nullptr ? "" : m_inputs.live.NameOf(link->master);
        if (link == nullptr) {
            Say(Severity::kWarning, "there is no interface " + name + " for " + m_unit.bridge);
        } else if (master.empty() || master == kDatapathLink || IsOwnMaster(master)) {
            m_unit.further.push_back(link);
        } else {
            Say(Severity::kWarning, name + " is a port of " + master + "; it is left as it is");
        }
    }
}

bool Decider::IsWorkingPort(const Link& link, const SwitchPort& port) const
{
    return std::find(port.working.begin(), port.working.end(), link.name) != port.working.end() &&
           (m_anyBridge->datapathType == kUserspaceDatapath ||
            m_inputs.live.NameOf(link.master) == kDatapathLink);
}

bool Decider::IsJoined() const
{
    if (m_anyBridge == nullptr || m_unit.port == nullptr || m_unit.bridgeLink == nullptr) {
        return false;
    }
    const bool bond = m_unit.kind == UnitKind::kSwitchBond;
    const SwitchPort* port = m_anyBridge->FindPort(bond ? m_unit.BondPort() : m_unit.name);
    if (port == nullptr) {
        return false;
    }
    const std::vector<const Link*> links = m_unit.Ports();
    return port->interfaces.size() == links.size() &&
           std::all_of(links.begin(), links.end(),
                       [&](const Link* link) { return IsWorkingPort(*link, *port); });
}

/** Whether this program made the bridge or at least put the port on it. */
bool Decider::IsOurs() const
{
    if (m_anyBridge == nullptr) {
        return false;
    }
    const SwitchPort* port = m_anyBridge->FindPort(m_unit.name);
    return m_anyBridge->marked || (port != nullptr && port->marked);
}

bool Decider::BridgeIsLive() const
{
    return m_unit.bridgeLink != nullptr || m_anyBridge != nullptr;
}

/** Such an interface is no unit of its own: its bond is. */
bool Decider::IsPartOfABond() const
{
    return m_inputs.request.verb == Verb::kStart &&
           !(m_kinship.MasterOf(m_unit.name) + m_kinship.HostOf(m_unit.name)).empty();
}

void Decider::ChooseForStop()
{
    const auto record = m_inputs.runState.interfaces.find(m_unit.name);
    const bool recorded = record != m_inputs.runState.interfaces.end() && !record->second.Empty();
    const bool inherits = !m_kinship.LegaciesOf(m_unit.name).empty();
    if ((!recorded && !inherits && !IsOurs()) || !m_kinship.HeirOf(m_unit.name).empty()) {
        return;
    }
    m_unit.target = Target::kPlain;
    m_unit.removeUnwanted = true;
    m_unit.takeDown = true;
}

void Decider::ChooseForStart()
{
    const auto found = m_inputs.files.find(m_unit.bridge);
    const InterfaceFile* file = found == m_inputs.files.end() ? nullptr : &found->second;
    const bool usable = file != nullptr && file->use == FileUse::kBridge;
    if (usable && !file->slave) {
        m_unit.target = Target::kSwitch;
        m_unit.file = file;
    } else if (file == nullptr || usable || !BridgeIsLive()) {
        ChooseWithoutBridgeFile();
    }
    if (m_unit.target == Target::kSwitch && m_inputs.request.withoutSwitch.contains(m_unit.name)) {
        m_unit.target = Target::kPlain;
    }
    m_unit.addWanted = m_unit.file != nullptr;
    m_unit.removeUnwanted = m_unit.takeDown || (m_unit.file != nullptr && m_unit.file->whole);
}

/** Without a port, or not to be brought up. One that we made is not left behind. */
void Decider::ChooseForIdleBridge(const InterfaceFile& file)
{
    const auto record = m_inputs.runState.interfaces.find(m_unit.name);
    const bool made = record != m_inputs.runState.interfaces.end() && record->second.made;
    if (file.onBoot) {
        Say(Severity::kWarning,
            "no file names " + m_unit.name + " as its BRIDGE; the bridge is left as it is");
    } else if (made && m_unit.port != nullptr && m_kinship.LiveMembersOf(m_unit.name).empty()) {
        m_unit.target = Target::kPlain;
        m_unit.takeDown = true;
    }
}

/** Whether the file of a plain interface makes it a port of something that nobody knows. */
bool Decider::NamesUnknownBridge(const InterfaceFile& file) const
{
    if (file.bridge.empty() || file.slave || file.bridge == m_unit.bridge) {
        return false;
    }
    const InterfaceFile* bridge = m_kinship.UsableFile(file.bridge);
    return bridge == nullptr || !bridge->linuxBridge || bridge->onBoot;
}

void Decider::ChooseWithoutBridgeFile()
{
    const auto found = m_inputs.files.find(m_unit.name);
    if (found == m_inputs.files.end()) {
        if (IsOurs() && m_kinship.LiveMembersOf(m_unit.name).empty()) {
            m_unit.target = Target::kPlain; // nothing asks for the bridge any more
        }
        return;
    }
    const InterfaceFile& file = found->second;
    if (file.use != FileUse::kPlain || m_kinship.HasUnclearMaster(m_unit.name)) {
        return;
    }
    if (m_kinship.IsBondWithoutMembers(m_unit.name)) {
        Say(Severity::kWarning, "no file names " + m_unit.name +
                                    " as the bond that it belongs to; the bond is left as it is");
        return;
    }
    if (file.linuxBridge && m_unit.kind != UnitKind::kLinuxBridge) {
        ChooseForIdleBridge(file);
        return;
    }
    if (NamesUnknownBridge(file)) {
        Say(Severity::kWarning, "ifcfg-" + file.name + " names the bridge " + file.bridge +
                                    ", which has no usable file; " + m_unit.name +
                                    " is left as it is");
        return;
    }
    if (!file.onlyAsMember.empty()) {
        Say(Severity::kWarning,
            "ifcfg-" + file.name + ": " + file.onlyAsMember + "; the interface is left as it is");
        return;
    }
    if (file.bridge == m_unit.bridge && !file.slave && !m_inputs.files.contains(m_unit.bridge)) {
        Say(Severity::kWarning, "ifcfg-" + file.name + " names the bridge " + file.bridge +
                                    ", which has no usable file");
        if (BridgeIsLive()) {
            return;
        }
    }
    m_unit.target = Target::kPlain;
    m_unit.file = &file;
}

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
            Say(m_unit.target == Target::kSwitch ? Severity::kError : Severity::kWarning,
                port->name + " is a port of " + owner + "; it is left as it is");
            m_unit.target = Target::kLeaveAlone;
        }
    }
}

/** Without ONBOOT an interface is not brought up, but one that is live keeps what it carries. */
void Decider::RespectOnBoot()
{
    if (m_unit.target == Target::kLeaveAlone || m_unit.file == nullptr || m_unit.file->onBoot ||
        !m_inputs.request.names.empty()) {
        return;
    }
    m_unit.addWanted = false;
    m_unit.removeUnwanted = false;
    const bool live = m_unit.port != nullptr && m_unit.port->up;
    if (!live && m_unit.switchBridge == nullptr) {
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

/** While a conversion is under way the tag of the VLAN stands in no file. */
void Decider::ChooseTag()
{
    if (m_unit.addWanted && m_unit.file->vlanId && *m_unit.file->vlanId != 0) {
        m_unit.tag = m_unit.file->vlanId;
    }
    const auto owed = m_inputs.handover.tags.find(m_unit.name);
    if (m_unit.tag || !m_unit.addWanted || owed == m_inputs.handover.tags.end()) {
        return;
    }
    const FileVlan settled{m_unit.name, owed->second};
    if (std::none_of(m_inputs.files.begin(), m_inputs.files.end(), [&](const auto& entry) {
            return entry.second.use == FileUse::kPlain && entry.second.vlan == settled;
        })) {
        m_unit.tag = owed->second;
    }
}

Unit Decider::Decide()
{
    if (IsPartOfABond()) {
        return m_unit;
    }
    if (m_inputs.request.verb == Verb::kStop) {
        ChooseForStop();
    } else {
        ChooseForStart();
    }
    GiveUpOnForeignBridge();
    CheckPort();
    RespectOnBoot();
    CheckSwitch();
    ChooseTag();
    if (m_unit.target != Target::kLeaveAlone) {
        FindSources(m_inputs, m_kinship, m_unit);
    }
    return m_unit;
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

bool IsExcused(const Inputs& inputs, const Kinship& kinship, const std::string& name)
{
    const Link* link = inputs.live.FindLink(name);
    const bool made =
        link != nullptr && (link->kind == "bond" || link->kind == "vlan" || link->kind == "bridge");
    return made || inputs.request.known.contains(name) || !kinship.HeirOf(name).empty() ||
           !kinship.MasterOf(name).empty() || !kinship.HostOf(name).empty();
}

/** In the order in which they came up, so that routes are made in the order in which they stood. */
int Rank(const Unit& unit)
{
    if (unit.port != nullptr) {
        return unit.port->index;
    }
    return unit.members.empty() ? kAfterAllLinks : unit.members.front()->index;
}

} // namespace

std::set<std::string> Concerned(const Inputs& inputs)
{
    return Kinship(inputs).Closure(inputs.request.names);
}

std::vector<Unit> DecideUnits(const Inputs& inputs, const Kinship& kinship,
                              std::vector<Remark>& remarks)
{
    const std::set<std::string> known = NamesToDecide(inputs);
    const std::set<std::string>& asked = inputs.request.names;
    const bool starts = inputs.request.verb == Verb::kStart;
    std::vector<Unit> units;
    for (const std::string& name : asked.empty() ? known : kinship.Closure(asked)) {
        const bool named = asked.contains(name);
        if (!known.contains(name)) {
            if (starts && named && !IsExcused(inputs, kinship, name)) {
                remarks.push_back({Severity::kError, name + " has no configuration file"});
            }
            continue;
        }
        Unit unit = Decider(inputs, kinship, name, remarks).Decide();
        if (unit.target != Target::kLeaveAlone) {
            units.push_back(std::move(unit));
        } else if (named && starts && !IsExcused(inputs, kinship, name)) {
            remarks.push_back({Severity::kError, name + " was not started"});
        }
    }
    std::stable_sort(units.begin(), units.end(),
                     [](const Unit& one, const Unit& other) { return Rank(one) < Rank(other); });
    return units;
}

std::set<std::string> NotOnSwitch(const Inputs& inputs)
{
    std::vector<Remark> remarks;
    std::set<std::string> names;
    for (const Unit& unit : DecideUnits(inputs, Kinship(inputs), remarks)) {
        if (unit.target == Target::kSwitch && !unit.joined) {
            names.insert(unit.name);
        }
    }
    return names;
}

} // namespace vornhost
