#include "unitplan.h"

#include <algorithm>
#include <array>
#include <set>
#include <string_view>

#include <sys/socket.h>

namespace vornhost {
namespace {

// Moved with the IPv6 stack, following the MTU, or not for writing.
constexpr std::array<std::string_view, 6> kSettingsOfTheirOwn{kDisableIpv6,
                                                              kAddressMode,
                                                              "ipv6.conf.mtu",
                                                              "ipv6.conf.stable_secret",
                                                              "ipv4.conf.mc_forwarding",
                                                              "ipv6.conf.mc_forwarding"};

bool HasOwnWay(const std::string& setting)
{
    return std::find(kSettingsOfTheirOwn.begin(), kSettingsOfTheirOwn.end(), setting) !=
           kSettingsOfTheirOwn.end();
}

} // namespace

/** What could not be read from the one interface is not known, and left as it is on the other. */
void UnitPlanner::Set(std::vector<std::string>& stage, const std::string& interface,
                      const std::string& setting, const std::string& value) const
{
    if (!value.empty()) {
        stage.push_back(interface + " " + setting + " " + value);
    }
}

void UnitPlanner::PlanLinks()
{
    for (const Link* port : m_unit.Ports()) {
        if (!m_unit.IsGroup() || m_unit.port != nullptr) {
            PlanLink(*port);
        }
    }
    const auto ports = m_unit.Ports();
    const bool wanted = m_unit.addWanted && !m_unit.takeDown;
    const bool up =
        std::any_of(ports.begin(), ports.end(), [](const Link* port) { return port->up; });
    if (ToSwitch() && (wanted || up) && !m_unit.heldDown &&
        (m_unit.bridgeLink == nullptr || !m_unit.bridgeLink->up)) {
        m_steps.beside.links.push_back("link set dev " + m_unit.bridge + " up");
    }
}

void UnitPlanner::PlanLink(const Link& link)
{
    const bool wanted = m_unit.addWanted && !m_unit.takeDown;
    InterfaceRecord& record = link.name == m_unit.name ? m_record : m_steps.records[link.name];
    if (wanted && WantedMtu() != link.mtu) {
        // A VLAN device takes its parent's MTU when it is made: the parent has it by then.
        const bool raised = WantedMtu() > link.mtu;
        auto& lines = raised ? m_steps.devices.links : m_steps.beside.links;
        lines.push_back("link set dev " + link.name + " mtu " + std::to_string(WantedMtu()));
        record.formerMtu = record.formerMtu.value_or(link.mtu);
    }
    if (m_unit.heldDown) {
        if (link.up && !IsReleased(link)) {
            m_steps.beside.links.push_back("link set dev " + link.name + " down");
        }
        return;
    }
    if (wanted && !link.up) {
        m_steps.beside.links.push_back("link set dev " + link.name + " up");
        record.broughtUp = true;
    }
}

/** A stop leaves the link as the first start found it. */
void UnitPlanner::PlanFormerLink()
{
    PlanFormerLink(m_unit.name);
    m_record = InterfaceRecord();
    for (const std::string& name : m_unit.absorbed) {
        m_steps.records[name] = InterfaceRecord();
    }
}

void UnitPlanner::PlanFormerLink(const std::string& name)
{
    auto& lines = m_steps.move.linksDown;
    const Link* link = m_inputs.live.FindLink(name);
    if (link == nullptr) {
        return;
    }
    if (m_former.made) {
        lines.push_back("link del dev " + name);
        return;
    }
    if (m_former.formerMtu && *m_former.formerMtu != link->mtu) {
        lines.push_back("link set dev " + name + " mtu " + std::to_string(*m_former.formerMtu));
    }
    if (m_former.broughtUp && link->up && !IsReleased(*link)) {
        lines.push_back("link set dev " + name + " down");
    }
    for (const auto& [setting, value] : m_former.formerSettings) {
        if (!HasOwnWay(setting) && Live(name, setting) != value) {
            Set(m_steps.settingsAfter, name, setting, value);
        }
    }
}

/** Whether the link leaves a bond in this plan, which takes it down. */
bool UnitPlanner::IsReleased(const Link& link) const
{
    const std::string bond = m_inputs.live.NameOf(link.master);
    return m_inputs.live.bonds.contains(bond) &&
           (!m_kinship.HeirOf(bond).empty() || m_kinship.IsWantedOnSwitch(bond));
}

/** Settings can be written once the interface exists. */
std::vector<std::string>& UnitPlanner::Settings() const
{
    const bool madeLate =
        m_unit.late && m_unit.carrierLink == nullptr && (!m_unit.IsGroup() || m_unit.tag);
    if (IsReplaced()) {
        return m_steps.replacementSettings;
    }
    return madeLate ? m_steps.settingsAfter : m_steps.settingsBefore;
}

/** A member that carries the addressing for its bond is to be a mere member again. */
void UnitPlanner::KeepOwnSetting(const std::string& setting)
{
    const std::string own = Live(Carrier(), setting);
    const bool client = setting == kAddressMode && HasOwnLinkLocal();
    if (!ToSwitch() && Carrier() == m_unit.name && m_unit.carrierLink != nullptr &&
        !m_unit.IsGroup() && !own.empty() && (client || !HasOwnWay(setting)) &&
        own != Live(MainSource(), setting)) {
        m_record.ownSettings.emplace(setting, own);
    }
}

void UnitPlanner::ReturnSettings()
{
    // A run that was cut short has left the device that it made deaf to routers.
    const auto hears = m_record.ownSettings.find(kAcceptRouters);
    const bool made = m_unit.IsGroup() || m_unit.kind == UnitKind::kVlan;
    if (!m_quiet && made && Carrier() == m_unit.name && hears != m_record.ownSettings.end()) {
        if (Live(Carrier(), kAcceptRouters) != hears->second && !m_unit.takeDown) {
            Set(m_steps.settingsAfter, Carrier(), kAcceptRouters, hears->second);
        }
        m_record.ownSettings.erase(hears);
    }
    for (const Link* member : m_unit.members) {
        InterfaceRecord& record = m_steps.records[member->name];
        for (const auto& [setting, own] : record.ownSettings) {
            // Changing this one makes the kernel add routes, which it takes away as it joins.
            auto& stage = setting == kAddressMode ? m_steps.settingsBefore : m_steps.settingsAfter;
            if (Live(member->name, setting) != own) {
                Set(stage, member->name, setting, own);
            }
        }
        record.ownSettings.clear();
    }
}

/** Whatever an administrator set on the one goes to the other: forwarding, filters, timers. */
void UnitPlanner::CarrySettings()
{
    const auto settings = m_inputs.live.settings.find(MainSource());
    if (m_unit.MainSource() == nullptr || settings == m_inputs.live.settings.end()) {
        return;
    }
    const std::string former = m_unit.carrierLink == nullptr ? kNewInterface : Carrier();
    for (const auto& [setting, value] : settings->second) {
        KeepOwnSetting(setting);
        if (m_quiet && setting == kAcceptRouters) {
            if (value != "0") {
                Set(m_steps.settingsAfter, Carrier(), setting, value);
                m_record.ownSettings[kAcceptRouters] = value;
            }
        } else if (!HasOwnWay(setting) && Live(former, setting) != value) {
            Set(Settings(), Carrier(), setting, value);
        }
    }
}

/**
 * The other stack comes up without making a link-local address, because it is given the one that is
 * in use, without the pause of a check for duplicates.
 */
void UnitPlanner::MoveIpv6Stack()
{
    const std::string source = MainSource();
    const bool silenced = m_record.formerSettings.contains(kDisableIpv6) && source == m_unit.name;
    std::string off =
        silenced ? m_record.formerSettings.at(kDisableIpv6) : Live(source, kDisableIpv6);
    const std::string former = m_unit.carrierLink == nullptr ? kNewInterface : Carrier();
    std::string mode = Live(source, kAddressMode);
    mode = mode.empty() ? Live(former, kAddressMode) : mode;
    if (m_unit.MainSource() == nullptr || off.empty()) {
        return;
    }
    if (GoesWithoutIpv6()) {
        off = "1";
    }
    const bool madeLate = &Settings() != &m_steps.settingsBefore;
    if (off == "0" && Live(former, kAddressMode) != kAddressModeNone && !madeLate) {
        Set(m_steps.settingsBefore, Carrier(), kAddressMode, kAddressModeNone);
    }
    if (Live(former, kDisableIpv6) != off) {
        Set(Settings(), Carrier(), kDisableIpv6, off);
    }
    const bool goes = m_unit.takeDown && m_former.made;
    if ((mode != kAddressModeNone || off != "0") && !HasOwnLinkLocal() && !goes) {
        Set(m_steps.settingsAfter, Carrier(), kAddressMode, mode);
    }
    if (Carrier() == m_unit.name) {
        m_record.formerSettings.erase(kDisableIpv6);
        m_record.formerSettings.erase(kAddressMode);
    }
}

/**
 * A port of the switch must not answer with addresses of its own, so its IPv6 stack is off while
 * it is one; the members of a bond would even find each other.
 */
void UnitPlanner::SilencePorts()
{
    if (ToSwitch()) {
        for (const Link* port : m_unit.Ports()) {
            SilencePort(*port);
        }
        for (const Link* port : m_unit.further) {
            SilenceMember(*port);
        }
        return;
    }
    if (m_unit.kind == UnitKind::kLinuxBridge) {
        for (const Link* member : m_unit.members) {
            SilenceMember(*member);
        }
        RestorePort(m_unit.name);
        return;
    }
    std::set<std::string> names{m_unit.name};
    names.insert(m_unit.absorbed.begin(), m_unit.absorbed.end());
    for (const std::string& name : names) {
        RestorePort(name);
    }
}

void UnitPlanner::SilencePort(const Link& port)
{
    InterfaceRecord& record = port.name == m_unit.name ? m_record : m_steps.records[port.name];
    const std::string off = Live(port.name, kDisableIpv6);
    const bool moves = m_moves && !m_unit.joined;
    if (off.empty()) {
        return;
    }
    if (moves) {
        record.formerSettings.emplace(kDisableIpv6, off);
        record.formerSettings.emplace(kAddressMode, Live(port.name, kAddressMode));
    }
    if (off == "0") {
        record.formerSettings.emplace(kDisableIpv6, "0");
        Set(m_steps.settingsAfter, port.name, kDisableIpv6, "1");
    }
    const auto mode = record.formerSettings.find(kAddressMode);
    if (!moves && mode != record.formerSettings.end() && !HasOwnLinkLocal() &&
        Live(m_unit.bridge, kAddressMode) == kAddressModeNone && mode->second != kAddressModeNone &&
        port.name == m_unit.port->name) {
        Set(m_steps.settingsAfter, m_unit.bridge, kAddressMode, mode->second);
    }
}

void UnitPlanner::SilenceMember(const Link& member)
{
    if (Live(member.name, kDisableIpv6) == "0") {
        m_steps.records[member.name].formerSettings.emplace(kDisableIpv6, "0");
        Set(m_steps.settingsAfter, member.name, kDisableIpv6, "1");
    }
}

/** What an earlier run left is put right. */
void UnitPlanner::RestorePort(const std::string& name)
{
    if (Live(name, kDisableIpv6).empty()) {
        return;
    }
    InterfaceRecord& record = name == m_unit.name ? m_record : m_steps.records[name];
    for (const char* setting : {kAddressMode, kDisableIpv6}) {
        const auto former = record.formerSettings.find(setting);
        if (former != record.formerSettings.end()) {
            const bool stays =
                setting == std::string_view(kDisableIpv6) && name == Carrier() && GoesWithoutIpv6();
            if (Live(name, setting) != former->second && !stays) {
                Set(m_steps.settingsBefore, name, setting, former->second);
            }
            record.formerSettings.erase(former);
        }
    }
}

} // namespace vornhost
