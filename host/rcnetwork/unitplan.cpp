#include "unitplan.h"

#include <algorithm>

#include <linux/rtnetlink.h>

namespace vornhost {
namespace {

void Append(std::vector<std::string>& lines, const std::vector<std::string>& more)
{
    lines.insert(lines.end(), more.begin(), more.end());
}

} // namespace

std::vector<std::string> BatchParts::Lines() const
{
    std::vector<std::string> lines;
    for (const auto* part : {&links, &addresses, &neighbours, &routes, &defaultRoutes,
                             &removedRoutes, &removedNeighbours, &removedAddresses, &linksDown}) {
        Append(lines, *part);
    }
    return lines;
}

UnitPlanner::UnitPlanner(const Inputs& inputs, const Kinship& kinship, const Unit& unit,
                         Steps& steps, std::vector<Remark>& remarks)
    : m_inputs(inputs), m_kinship(kinship), m_unit(unit), m_steps(steps), m_remarks(remarks)
{
    m_former = FormerRecord(unit.name);
    // A card may have come under the name of a device that was made once.
    const Link* link = inputs.live.FindLink(unit.name);
    m_former.made = m_former.made && (link == nullptr || IsOfMadeKind(*link));
    AbsorbRecords();
    m_record = m_former;
}

InterfaceRecord UnitPlanner::FormerRecord(const std::string& name) const
{
    const auto planned = m_steps.records.find(name);
    if (planned != m_steps.records.end()) {
        return planned->second;
    }
    const auto former = m_inputs.runState.interfaces.find(name);
    return former == m_inputs.runState.interfaces.end() ? InterfaceRecord() : former->second;
}

/** What was made for the units that this one takes over was made for this one. */
void UnitPlanner::AbsorbRecords()
{
    for (const std::string& name : m_unit.absorbed) {
        const InterfaceRecord other = FormerRecord(name);
        m_former.addresses.insert(other.addresses.begin(), other.addresses.end());
        m_former.routes.insert(other.routes.begin(), other.routes.end());
        m_former.unchecked.insert(other.unchecked.begin(), other.unchecked.end());
        m_former.client = m_former.client || other.client;
        m_former.resolver = m_former.resolver.empty() ? other.resolver : m_former.resolver;
    }
}

/** A member keeps what was done to its link, a bond that is gone nothing. */
void UnitPlanner::KeepRecordsOfOthers()
{
    const std::vector<std::string> members = m_kinship.MembersOf(m_unit.name);
    for (const std::string& name : m_unit.absorbed) {
        InterfaceRecord record = FormerRecord(name);
        record.addresses.clear();
        record.routes.clear();
        record.unchecked.clear();
        record.client = false;
        record.resolver.clear();
        const bool gone = std::find(members.begin(), members.end(), name) == members.end();
        m_steps.records[name] = gone ? InterfaceRecord() : record;
    }
}

std::string UnitPlanner::Live(const std::string& interface, const std::string& setting) const
{
    return m_inputs.live.Setting(interface, setting);
}

std::string UnitPlanner::MainSource() const
{
    return m_unit.MainSource() == nullptr ? std::string() : m_unit.MainSource()->name;
}

bool UnitPlanner::WireHasCarrier() const
{
    const auto ports = m_unit.Ports();
    const auto carries = [](const Link* port) { return port->carrier; };
    return std::any_of(ports.begin(), ports.end(), carries) ||
           (ports.empty() && m_unit.MainSource() != nullptr && carries(m_unit.MainSource()));
}

bool UnitPlanner::HasGlobalAddress(const Link* link) const
{
    const auto& addresses = m_inputs.live.addresses;
    return link != nullptr &&
           std::any_of(addresses.begin(), addresses.end(), [&](const Address& address) {
               return address.index == link->index && address.scope == RT_SCOPE_UNIVERSE;
           });
}

void UnitPlanner::Run()
{
    if (m_unit.waitsForSwitch) {
        m_steps.needsSwitch = true;
    }
    KeepRecordsOfOthers();
    m_moves = std::any_of(m_unit.sources.begin(), m_unit.sources.end(), [&](const Source& source) {
        return !source.stays || (!ToSwitch() && HasGlobalAddress(source.link));
    });
    DissolveBonds();
    PlanBridge();
    PlanDevices();
    PlanLinks();
    if (m_moves) {
        CarrySettings();
        MoveIpv6Stack();
    }
    SilencePorts();
    ReturnSettings();
    PlanAutoconf();
    PlanAddresses();
    PlanCards();
    PlanResolver();
    PlanClient();
    if (m_moves) {
        CarryNeighbours();
        // Another wire leads to the host than before, and switches outside have to know.
        if (!m_unit.absorbed.empty() && HasGlobalAddress(m_unit.MainSource()) && !m_unit.takeDown) {
            m_steps.announce.push_back(Carrier());
        }
    }
    if (m_unit.takeDown) {
        PlanFormerLink();
    }
    m_steps.records[m_unit.name] = m_record;
}

} // namespace vornhost
