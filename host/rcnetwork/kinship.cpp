#include "kinship.h"

#include <algorithm>
#include <sstream>

namespace vornhost {
namespace {

constexpr char kTagPrefix[] = "tag";

std::vector<std::string> SplitAtCommas(const std::string& text)
{
    std::istringstream stream(text);
    std::vector<std::string> parts;
    for (std::string part; std::getline(stream, part, ',');) {
        parts.push_back(part);
    }
    return parts;
}

bool Contains(const std::vector<std::string>& list, const std::string& name)
{
    return std::find(list.begin(), list.end(), name) != list.end();
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

bool IsTagDevice(const Link& link)
{
    const auto digits = link.name.find_first_not_of("0123456789", sizeof kTagPrefix - 1);
    return link.kind == "vlan" && link.name.rfind(kTagPrefix, 0) == 0 &&
           digits != std::string::npos && link.name[digits] == '.';
}

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
            order = remembered->second.members;
        }
        if (!m_switchBonds.contains(bond)) {
            std::stable_sort(members.begin(), members.end(), [&](const auto& one, const auto& two) {
                return std::find(order.begin(), order.end(), one) <
                       std::find(order.begin(), order.end(), two);
            });
        }
    }
}

void Kinship::ReadLive()
{
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
    const auto record = m_inputs.runState.interfaces.find(name);
    const bool madeBefore = record != m_inputs.runState.interfaces.end() && record->second.made &&
                            m_inputs.live.bonds.contains(name);
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

/** A bond that somebody else made is not taken apart because it has no file. */
bool Kinship::IsOurs(const std::string& bond) const
{
    const auto record = m_inputs.runState.interfaces.find(bond);
    const SwitchBridge* bridge = m_inputs.switchState.Find(BridgeFor(bond));
    return (record != m_inputs.runState.interfaces.end() && record->second.made) ||
           m_inputs.formerBonds.contains(bond) || (bridge != nullptr && bridge->marked);
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
        if (m_inputs.request.verb == Verb::kStop) {
            return name;
        }
        // The first one is to inherit; while its files are being written nobody does.
        return IsSingleUnit(name) ? name : std::string();
    }
    return {};
}

void Kinship::ChooseHeirs()
{
    for (const auto& [bond, members] : m_liveMembers) {
        const bool asked = m_inputs.request.verb == Verb::kStart &&
                           (HasFile(bond) || HasFile(BridgeFor(bond)) || HasFile(BridgeOf(bond)));
        if (asked || !IsOurs(bond)) {
            continue;
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
    std::set<std::string> relatives{MasterOf(name), LiveMasterOf(name)};
    for (const auto& members : {MembersOf(name), LiveMembersOf(name)}) {
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
