#include "unitplan.h"

#include <algorithm>

namespace vornhost {
namespace {

constexpr unsigned kTicksASecond = 100;

} // namespace

/** Ports join with everything that they carry in one batch; those without traffic before it. */
void UnitPlanner::PlanLinuxBridge()
{
    if (m_unit.port == nullptr) {
        MakeLinuxBridge();
    }
    for (const Link* member : m_unit.members) {
        auto& lines = IsIdle(member) ? m_steps.devices.links : m_steps.move.links;
        if (IsMissing(*member)) {
            lines.push_back("link set dev " + member->name + " master " + m_unit.name);
        }
        if (!member->up) {
            lines.push_back("link set dev " + member->name + " up");
            m_steps.records[member->name].broughtUp = true;
        }
    }
}

/** Its address is given, because otherwise it changes with the ports. */
void UnitPlanner::MakeLinuxBridge()
{
    const InterfaceFile& file = m_inputs.files.at(m_unit.name);
    auto& lines = Quiet(m_unit.name) ? m_steps.creation.links : m_steps.devices.links;
    std::string line = "link add dev " + m_unit.name;
    if (!WantedMac().empty()) {
        line += " address " + WantedMac();
    }
    line += " mtu " + std::to_string(WantedMtu()) + " type bridge stp_state ";
    line += file.stp ? "1" : "0";
    if (file.forwardDelay || !file.stp) {
        line += " forward_delay " + std::to_string(file.forwardDelay.value_or(0) * kTicksASecond);
    }
    lines.push_back(line);
    if (BringsLinkLocal()) {
        lines.push_back("link set dev " + m_unit.name + " addrgenmode none");
    }
    m_steps.devices.links.push_back("link set dev " + m_unit.name + " up");
    m_record.made = true;
    m_record.broughtUp = true;
}

/** The switch takes no port of another bridge, so they leave right before it is asked to. */
void UnitPlanner::ReleasePorts(const std::string& bridge)
{
    std::vector<std::string> others;
    for (const std::string& port : m_kinship.LiveMembersOf(bridge)) {
        const bool foreign =
            !m_kinship.HasFile(port) && !m_inputs.runState.interfaces.contains(port);
        if (foreign) {
            others.push_back(port);
            continue;
        }
        m_steps.beside.linksDown.push_back("link set dev " + port + " nomaster");
    }
    const auto record = m_inputs.runState.interfaces.find(bridge);
    if (record == m_inputs.runState.interfaces.end() || !record->second.made) {
        return;
    }
    if (others.empty()) {
        m_steps.tidy.linksDown.push_back("link del dev " + bridge);
    } else {
        m_steps.records[bridge].made = true;
        m_remarks.push_back(
            {Severity::kWarning, bridge +
                                     " stays without addresses, because other programs have "
                                     "ports on it: " +
                                     others.front() + (others.size() > 1 ? "..." : "")});
    }
}

void UnitPlanner::JoinFurtherPorts()
{
    for (const Link* link : m_unit.further) {
        const SwitchPort* port =
            m_unit.switchBridge == nullptr ? nullptr : m_unit.switchBridge->FindPort(link->name);
        if (m_unit.addWanted && !link->up) {
            m_steps.beside.links.push_back("link set dev " + link->name + " up");
            m_steps.records[link->name].broughtUp = true;
        }
        if (port == nullptr) {
            m_steps.join.push_back("--may-exist add-port " + m_unit.bridge + " " + link->name);
            m_steps.join.push_back("set Port " + link->name + " external_ids:" + kSwitchMarkKey +
                                   "=" + kSwitchMarkValue + " external_ids:" + kFurtherPortKey +
                                   "=" + m_unit.name);
        } else if (port->working.empty()) {
            m_remarks.push_back({Severity::kWarning, "the switch does not take " + link->name +
                                                         " as a port of " + m_unit.bridge});
        }
    }
}

void UnitPlanner::LeaveFurtherPorts()
{
    if (m_unit.switchBridge == nullptr || !m_unit.removeUnwanted) {
        return;
    }
    const std::vector<std::string> wanted = m_kinship.FurtherPortsOf(m_unit.name);
    for (const SwitchPort& port : m_unit.switchBridge->ports) {
        if (port.IsFurther() &&
            std::find(wanted.begin(), wanted.end(), port.name) == wanted.end()) {
            m_steps.leave.push_back("--if-exists del-port " + m_unit.bridge + " " + port.name);
        }
    }
}

} // namespace vornhost
