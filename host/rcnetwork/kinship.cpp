#include "kinship.h"

#include <algorithm>
#include <sstream>
#include <support/contains.h>

namespace vornhost {
namespace {

std::vector<std::string> SplitAtCommas(const std::string& text)
{
    std::istringstream stream(text);
    std::vector<std::string> parts;
    for (std::string part; std::getline(stream, part, ',');) {
        parts.push_back(part);
    }
    return parts;
}

/** The members in the order in which they were given, while they are still those. */
std::vector<std::string> InGivenOrder(const SwitchPort& port)
{
    const auto given = port.externalIds.find(kMembersKey);
    std::vector<std::string> members;
    if (given != port.externalIds.end()) {
        for (const std::string& name : SplitAtCommas(given->second)) {
            if (Contains(port.interfaces, name)) {
                members.push_back(name);
            }
        }
    }
    for (const std::string& name : port.interfaces) {
        if (!Contains(members, name)) {
            members.push_back(name);
        }
    }
    return members;
}

} // namespace

Kinship::Kinship(const Inputs& inputs) : m_inputs(inputs)
{
    ReadWanted();
    ReadLive();
    ChooseHeirs();
}

const InterfaceFile* Kinship::UsableFile(const std::string& name) const
{
    const auto found = m_inputs.files.find(name);
    const bool usable = found != m_inputs.files.end() && (found->second.use == FileUse::kPlain ||
                                                          found->second.use == FileUse::kBridge);
    return usable ? &found->second : nullptr;
}

std::string Kinship::BridgeFor(const std::string& name) const
{
    const InterfaceFile* file = UsableFile(name);
    const SwitchBridge* live = m_inputs.switchState.Find(name);
    const bool ownName = (file != nullptr && file->use == FileUse::kBridge) ||
                         (file == nullptr && live != nullptr && live->marked);
    return ownName ? name : BridgeOf(name);
}

void Kinship::ReadWanted()
{
    if (m_inputs.request.verb == Verb::kStop) {
        return; // nothing is
    }
    for (const auto& [name, file] : m_inputs.files) {
        if (file.use == FileUse::kBridge && !file.slaveList.empty()) {
            m_members[PlainOf(name)] = file.slaveList;
            m_switchBonds.insert(PlainOf(name));
        } else if (file.use == FileUse::kPlain && file.bond) {
            m_members.try_emplace(name);
        }
    }
    for (const auto& [name, file] : m_inputs.files) {
        const InterfaceFile* master = UsableFile(file.master);
        if (file.use == FileUse::kPlain && master != nullptr && master->use == FileUse::kPlain &&
            file.master != name && !m_switchBonds.contains(file.master)) {
            m_members[file.master].push_back(name);
        }
    }
    ReadWantedBridges();
    // While the files of a bond are moved to its first member or back there are two of everything.
    std::erase_if(m_members, [&](const auto& entry) {
        return entry.second.empty() && !m_switchBonds.contains(entry.first);
    });
    // Whoever is a member already keeps its place.
    for (auto& [bond, members] : m_members) {
        const auto live = m_inputs.live.bonds.find(bond);
        const auto remembered = m_inputs.formerBonds.find(bond);
        std::vector<std::string> order =
            live != m_inputs.live.bonds.end() ? live->second.members : std::vector<std::string>();
        if (order.empty() && remembered != m_inputs.formerBonds.end()) {
            order = remembered->second.bond.slaves;
        }
        if (!m_switchBonds.contains(bond)) {
            std::stable_sort(members.begin(), members.end(), [&](const auto& one, const auto& two) {
                return std::find(order.begin(), order.end(), one) <
                       std::find(order.begin(), order.end(), two);
            });
        }
    }
}

void Kinship::ReadWantedBridges()
{
    for (const auto& [name, file] : m_inputs.files) {
        const InterfaceFile* bridge = UsableFile(file.bridge);
        if (file.use != FileUse::kPlain || file.slave || bridge == nullptr ||
            file.bridge == BridgeOf(name) || file.bridge == name) {
            continue;
        }
        if (bridge->use == FileUse::kBridge && !bridge->slave) {
            m_furtherPorts[PlainOf(file.bridge)].push_back(name);
        } else if (bridge->linuxBridge && bridge->onBoot) {
            m_linuxBridges.insert(file.bridge);
            m_members[file.bridge].push_back(name);
        }
    }
}

bool Kinship::IsWantedLinuxBridge(const std::string& name) const
{
    return m_linuxBridges.contains(name);
}

std::string Kinship::HostOf(const std::string& furtherPort) const
{
    for (const auto& [unit, ports] : m_furtherPorts) {
        if (Contains(ports, furtherPort)) {
            return unit;
        }
    }
    return {};
}

std::vector<std::string> Kinship::FurtherPortsOf(const std::string& unit) const
{
    const auto found = m_furtherPorts.find(unit);
    return found == m_furtherPorts.end() ? std::vector<std::string>() : found->second;
}

bool Kinship::IsLinuxBridge(const std::string& name) const
{
    const Link* link = m_inputs.live.FindLink(name);
    return link != nullptr && link->kind == "bridge";
}

/** Bridges that no file and no earlier run knows of are other programs'. */
void Kinship::ReadLiveBridges()
{
    for (const Link& bridge : m_inputs.live.links) {
        const InterfaceFile* file = UsableFile(bridge.name);
        const bool known = (file != nullptr && file->linuxBridge) || IsMade(bridge.name);
        if (bridge.kind != "bridge" || !known) {
            continue;
        }
        for (const Link& port : m_inputs.live.links) {
            if (port.master == bridge.index) {
                m_liveMembers[bridge.name].push_back(port.name);
            }
        }
    }
}

void Kinship::ReadLive()
{
    ReadLiveBridges();
    for (const auto& [name, bond] : m_inputs.live.bonds) {
        m_liveMembers[name] = bond.members;
    }
    for (const SwitchBridge& bridge : m_inputs.switchState.bridges) {
        for (const SwitchPort& port : bridge.ports) {
            if (port.bond && port.marked) {
                m_liveMembers[PlainOf(bridge.name)] = InGivenOrder(port);
            }
        }
    }
}

std::vector<std::string> Kinship::MembersOf(const std::string& bond) const
{
    const auto found = m_members.find(bond);
    return found == m_members.end() ? std::vector<std::string>() : found->second;
}

std::string Kinship::MasterOf(const std::string& name) const
{
    const auto found = std::find_if(m_members.begin(), m_members.end(), [&](const auto& entry) {
        return entry.first != name && Contains(entry.second, name);
    });
    return found == m_members.end() ? std::string() : found->first;
}

bool Kinship::IsBondWithoutMembers(const std::string& name) const
{
    const InterfaceFile* file = UsableFile(name);
    const bool madeBefore = IsMade(name) && m_inputs.live.bonds.contains(name);
    return file != nullptr && file->use == FileUse::kPlain && (file->bond || madeBefore) &&
           m_inputs.request.verb == Verb::kStart && !IsWantedBond(name);
}

bool Kinship::HasUnclearMaster(const std::string& name) const
{
    const InterfaceFile* file = UsableFile(name);
    return file != nullptr && !file->master.empty() && HasFile(file->master) &&
           UsableFile(file->master) == nullptr;
}

std::vector<std::string> Kinship::LiveMembersOf(const std::string& bond) const
{
    const auto found = m_liveMembers.find(bond);
    return found == m_liveMembers.end() ? std::vector<std::string>() : found->second;
}

std::string Kinship::LiveMasterOf(const std::string& name) const
{
    for (const auto& [bond, members] : m_liveMembers) {
        if (Contains(members, name)) {
            return bond;
        }
    }
    return {};
}

bool Kinship::IsMade(const std::string& name) const
{
    const auto record = m_inputs.runState.interfaces.find(name);
    return record != m_inputs.runState.interfaces.end() && record->second.made;
}

/** Whether the file of none of its ports asks for a bridge any more. */
bool Kinship::IsLeftByAll(const std::string& bridge) const
{
    const auto members = LiveMembersOf(bridge);
    return std::none_of(members.begin(), members.end(), [&](const std::string& name) {
        const InterfaceFile* file = UsableFile(name);
        return file != nullptr && file->bridge == bridge;
    });
}

/** A bond that somebody else made is not taken apart because it has no file. */
bool Kinship::IsOurs(const std::string& bond) const
{
    if (IsLinuxBridge(bond)) {
        return IsMade(bond) ||
               (m_inputs.request.verb == Verb::kStart && HasFile(bond) && IsLeftByAll(bond));
    }
    const SwitchBridge* bridge = m_inputs.switchState.Find(BridgeFor(bond));
    const auto former = m_inputs.formerBonds.find(bond);
    const bool remembered =
        former != m_inputs.formerBonds.end() && former->second.bond.HasSlaves(LiveMembersOf(bond));
    return IsMade(bond) || remembered || (bridge != nullptr && bridge->marked);
}

/** Whether an interface's own files say soundly how it shall be. */
bool Kinship::IsSingleUnit(const std::string& name) const
{
    const InterfaceFile* bridge = UsableFile(BridgeOf(name));
    if (HasFile(BridgeOf(name)) && bridge == nullptr) {
        return false;
    }
    const InterfaceFile* file = UsableFile(name);
    return (bridge != nullptr && !bridge->slave) ||
           (file != nullptr && file->onlyAsMember.empty() && !HasUnclearMaster(name));
}

std::string Kinship::HeirAmong(const std::vector<std::string>& members) const
{
    for (const std::string& name : members) {
        if (!MasterOf(name).empty()) {
            return MasterOf(name);
        }
        if (!HostOf(name).empty()) {
            return HostOf(name);
        }
        if (m_inputs.request.verb == Verb::kStop) {
            return name;
        }
        // The first one is to inherit; while its files are being written nobody does.
        return IsSingleUnit(name) ? name : std::string();
    }
    return {};
}

/** Whether a file is there, sound or not, that the bond or bridge may be there for. */
bool Kinship::IsAsked(const std::string& bond) const
{
    const InterfaceFile* file = UsableFile(bond);
    const bool dropped = IsLinuxBridge(bond) && file != nullptr && !file->onBoot;
    return m_inputs.request.verb == Verb::kStart && !dropped &&
           (HasFile(bond) || HasFile(BridgeFor(bond)) || HasFile(BridgeOf(bond)));
}

void Kinship::ChooseHeirs()
{
    for (const auto& [bond, all] : m_liveMembers) {
        if (IsAsked(bond) || !IsOurs(bond)) {
            continue;
        }
        std::vector<std::string> members = all;
        // Other programs plug what they like into a bridge.
        if (IsLinuxBridge(bond)) {
            std::erase_if(members, [&](const std::string& name) {
                return !HasFile(name) && !HasFile(BridgeOf(name));
            });
        }
        const std::string heir = HeirAmong(members);
        if (!heir.empty()) {
            m_heirs[bond] = heir;
        }
    }
}

std::string Kinship::HeirOf(const std::string& bond) const
{
    const auto found = m_heirs.find(bond);
    return found == m_heirs.end() ? std::string() : found->second;
}

std::vector<std::string> Kinship::LegaciesOf(const std::string& unit) const
{
    std::vector<std::string> legacies;
    for (const auto& [bond, heir] : m_heirs) {
        if (heir == unit) {
            legacies.push_back(bond);
        }
    }
    return legacies;
}

std::string Kinship::ParentFor(const FileVlan& vlan) const
{
    const std::string bridge = BridgeFor(vlan.parent);
    const auto handed = m_inputs.handover.bonds.find(vlan.parent);
    const bool onSwitch = IsWantedOnSwitch(vlan.parent);
    if (!onSwitch &&
        (m_inputs.live.FindLink(vlan.parent) != nullptr || IsWantedBond(vlan.parent))) {
        const std::string heir = HeirOf(vlan.parent);
        return heir.empty() ? vlan.parent : heir;
    }
    if (onSwitch || m_inputs.live.FindLink(bridge) != nullptr) {
        const std::string heir = HeirOf(vlan.parent);
        return heir.empty() ? bridge : heir;
    }
    return handed == m_inputs.handover.bonds.end() ? vlan.parent : handed->second.members.front();
}

std::set<std::string> Kinship::RelativesOf(const std::string& name) const
{
    std::set<std::string> relatives{MasterOf(name), LiveMasterOf(name), HostOf(name)};
    for (const auto& members : {MembersOf(name), LiveMembersOf(name), FurtherPortsOf(name)}) {
        relatives.insert(members.begin(), members.end());
    }
    const bool starts = m_inputs.request.verb == Verb::kStart;
    for (const auto& [other, file] : m_inputs.files) {
        if (file.use != FileUse::kPlain || !file.vlan) {
            continue;
        }
        if (file.vlan->parent == name) {
            relatives.insert(other);
        } else if (other == name && starts) {
            relatives.insert(file.vlan->parent);
        }
    }
    relatives.erase("");
    return relatives;
}

std::set<std::string> Kinship::Closure(std::set<std::string> names) const
{
    std::vector<std::string> open(names.begin(), names.end());
    while (!open.empty()) {
        const std::string name = open.back();
        open.pop_back();
        for (const std::string& relative : RelativesOf(name)) {
            if (names.insert(relative).second) {
                open.push_back(relative);
            }
        }
    }
    return names;
}

} // namespace vornhost
