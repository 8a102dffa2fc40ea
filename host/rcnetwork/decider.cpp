#include "decider.h"

#include "sources.h"

#include <algorithm>

#include <linux/rtnetlink.h>

namespace vornhost {
namespace {

constexpr char kUserspaceDatapath[] = "netdev";

} // namespace

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
            SayTaken(Severity::kWarning, name, master);
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

/**
 * So it is at boot, and then there is no reason to leave anything as it is: a bridge that the
 * switch knows from before carries nothing yet.
 */
bool Decider::NothingIsLive() const
{
    const auto record = m_inputs.runState.interfaces.find(m_unit.name);
    if (record != m_inputs.runState.interfaces.end() && !record->second.Empty()) {
        return false;
    }
    const auto& addresses = m_inputs.live.addresses;
    const std::string master =
        m_unit.port == nullptr ? "" : m_inputs.live.NameOf(m_unit.port->master);
    const bool isMember = !master.empty() && master != kDatapathLink;
    return !isMember &&
           std::none_of(addresses.begin(), addresses.end(), [&](const Address& address) {
               const Link* link = m_inputs.live.FindLink(address.index);
               return address.scope == RT_SCOPE_UNIVERSE && link != nullptr &&
                      (PlainOf(link->name) == m_unit.name ||
                       PlainOf(link->name) == PlainOf(m_unit.bridge) ||
                       m_inputs.live.NameOf(link->parent) == m_unit.name);
           });
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
    } else if (file == nullptr || usable || !BridgeIsLive() || NothingIsLive()) {
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
    if (file.fromBridge && NothingIsLive()) {
        Say(Severity::kWarning, "nothing of " + m_unit.name + " is live; ifcfg-" + file.name +
                                    " counts for it all the same");
        m_unit.target = Target::kPlain;
        m_unit.file = &file;
        return;
    }
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
        if (BridgeIsLive() && !NothingIsLive()) {
            return;
        }
    }
    m_unit.target = Target::kPlain;
    m_unit.file = &file;
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

} // namespace vornhost
