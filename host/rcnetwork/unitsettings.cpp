#include "pairplan.h"

#include <algorithm>
#include <array>
#include <string_view>

#include <sys/socket.h>

namespace vornhost {
namespace {

constexpr char kDisableIpv6[] = "ipv6.conf.disable_ipv6";
constexpr char kAddressMode[] = "ipv6.conf.addr_gen_mode";
constexpr char kAddressModeNone[] = "1";

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

void PairPlanner::Set(std::vector<std::string>& stage, const std::string& interface,
                      const std::string& setting, const std::string& value) const
{
    stage.push_back(interface + " " + setting + " " + value);
}

void PairPlanner::PlanLinks()
{
    const bool wanted = m_pair.addWanted && !m_pair.takeDown;
    if (wanted && WantedMtu() != m_pair.port->mtu) {
        m_steps.beside.links.push_back("link set dev " + m_pair.name + " mtu " +
                                       std::to_string(WantedMtu()));
        m_record.formerMtu = m_former.formerMtu.value_or(m_pair.port->mtu);
    }
    if (wanted && !m_pair.port->up) {
        m_steps.beside.links.push_back("link set dev " + m_pair.name + " up");
        m_record.broughtUp = true;
    }
    if (ToSwitch() && (wanted || m_pair.port->up) &&
        (m_pair.bridgeLink == nullptr || !m_pair.bridgeLink->up)) {
        m_steps.beside.links.push_back("link set dev " + m_pair.bridge + " up");
    }
}

/** A stop leaves the link as the first start found it. */
void PairPlanner::PlanFormerLink()
{
    auto& lines = m_steps.move.linksDown;
    if (m_former.formerMtu && *m_former.formerMtu != m_pair.port->mtu) {
        lines.push_back("link set dev " + m_pair.name + " mtu " +
                        std::to_string(*m_former.formerMtu));
    }
    if (m_former.broughtUp && m_pair.port->up) {
        lines.push_back("link set dev " + m_pair.name + " down");
    }
    for (const auto& [setting, value] : m_former.formerSettings) {
        if (!HasOwnWay(setting) && Live(m_pair.name, setting) != value) {
            Set(m_steps.settingsAfter, m_pair.name, setting, value);
        }
    }
    m_record = InterfaceRecord();
}

/** Whatever an administrator set on the one goes to the other: forwarding, filters, timers. */
void PairPlanner::CarrySettings()
{
    const auto settings = m_inputs.live.settings.find(Source());
    if (m_pair.SourceLink() == nullptr || settings == m_inputs.live.settings.end()) {
        return;
    }
    const std::string former = m_pair.TargetLink() == nullptr ? kNewInterface : Target();
    for (const auto& [setting, value] : settings->second) {
        if (!HasOwnWay(setting) && Live(former, setting) != value) {
            Set(m_steps.settingsBefore, Target(), setting, value);
        }
    }
}

/**
 * A port of the switch must not answer with addresses of its own, so its IPv6 stack is off while
 * it is one. The other stack comes up without making a link-local address, because it is given
 * the one that is in use, without the pause of a check for duplicates.
 */
void PairPlanner::MoveIpv6Stack()
{
    const std::string off = Live(Source(), kDisableIpv6);
    const std::string mode = Live(Source(), kAddressMode);
    if (m_pair.SourceLink() == nullptr || off.empty()) {
        return;
    }
    const std::string former = m_pair.TargetLink() == nullptr ? kNewInterface : Target();
    if (off == "0" && Live(former, kAddressMode) != kAddressModeNone) {
        Set(m_steps.settingsBefore, Target(), kAddressMode, kAddressModeNone);
    }
    if (Live(former, kDisableIpv6) != off) {
        Set(m_steps.settingsBefore, Target(), kDisableIpv6, off);
    }
    if (mode != kAddressModeNone || off != "0") {
        Set(m_steps.settingsAfter, Target(), kAddressMode, mode);
    }
    if (!ToSwitch()) {
        m_record.formerSettings.erase(kDisableIpv6);
        m_record.formerSettings.erase(kAddressMode);
        return;
    }
    m_record.formerSettings.emplace(kDisableIpv6, off);
    m_record.formerSettings.emplace(kAddressMode, mode);
    if (off == "0") {
        Set(m_steps.settingsAfter, m_pair.name, kDisableIpv6, "1");
    }
}

/** Nothing moves; what an earlier run that was cut short left is put right. */
void PairPlanner::KeepIpv6Stack()
{
    if (Live(m_pair.name, kDisableIpv6).empty()) {
        return;
    }
    if (ToSwitch()) {
        const auto mode = m_record.formerSettings.find(kAddressMode);
        if (Live(m_pair.name, kDisableIpv6) == "0") {
            m_record.formerSettings.emplace(kDisableIpv6, "0");
            Set(m_steps.settingsAfter, m_pair.name, kDisableIpv6, "1");
        }
        if (mode != m_record.formerSettings.end() && Live(m_pair.bridge, kAddressMode) == "1" &&
            mode->second != "1") {
            Set(m_steps.settingsAfter, m_pair.bridge, kAddressMode, mode->second);
        }
        return;
    }
    for (const char* setting : {kAddressMode, kDisableIpv6}) {
        const auto former = m_record.formerSettings.find(setting);
        if (former != m_record.formerSettings.end()) {
            if (Live(m_pair.name, setting) != former->second) {
                Set(m_steps.settingsBefore, m_pair.name, setting, former->second);
            }
            m_record.formerSettings.erase(former);
        }
    }
}

void PairPlanner::PlanAutoconf()
{
    if (!m_pair.addWanted || !m_pair.file->autoconf) {
        return;
    }
    const std::string wanted = *m_pair.file->autoconf ? "1" : "0";
    for (const char* setting : {"ipv6.conf.accept_ra", "ipv6.conf.autoconf"}) {
        // While the interface moves, the target is about to have what the source has.
        const bool follows = m_moves && m_pair.SourceLink() != nullptr;
        const std::string live = Live(follows ? Source() : Target(), setting);
        if (live.empty() || live == wanted || (wanted == "1" && live == "2")) {
            continue;
        }
        Set(m_steps.settingsAfter, Target(), setting, wanted);
        m_record.formerSettings.emplace(setting, live);
    }
}

} // namespace vornhost
