#include "unitplan.h"

namespace vornhost {

/** Whether the carrier is given the link-local address that is in use, and makes none itself. */
bool UnitPlanner::BringsLinkLocal() const
{
    return m_moves && !m_unit.takeDown && !Live(MainSource(), "ipv6.conf.disable_ipv6").empty();
}

void UnitPlanner::MakeVlan(const std::string& device, const std::string& parent, unsigned id)
{
    auto& lines = m_unit.late ? m_steps.move.links : m_steps.devices.links;
    lines.push_back("link add link " + parent + " name " + device + " type vlan id " +
                    std::to_string(id));
    if (m_unit.late && BringsLinkLocal()) {
        lines.push_back("link set dev " + device + " addrgenmode none");
    }
    Build().links.push_back("link set dev " + device + " up");
}

/** A second VLAN of one id on one parent cannot be made before the first one is gone. */
void UnitPlanner::RemoveOldVlans()
{
    for (const Source& source : m_unit.sources) {
        if (source.link->kind == "vlan" && !source.stays) {
            auto& lines = m_unit.late ? m_steps.move.links : m_steps.move.linksDown;
            lines.push_back("link del dev " + source.link->name);
        }
    }
}

void UnitPlanner::PlanDevices()
{
    RemoveOldVlans();
    if (!m_unit.addWanted || m_unit.takeDown) {
        return;
    }
    if (m_unit.kind == UnitKind::kBond) {
        if (m_unit.port == nullptr) {
            MakeBond();
        } else {
            AdjustBondOptions();
        }
        Gather();
    }
    if (m_unit.kind == UnitKind::kLinuxBridge) {
        PlanLinuxBridge();
    }
    if (m_unit.kind == UnitKind::kVlan && (m_unit.port == nullptr || m_unit.rebuilt)) {
        const FileVlan& vlan = *m_inputs.files.at(m_unit.name).vlan;
        MakeVlan(m_unit.name, m_kinship.ParentFor(vlan), vlan.id);
        m_record.made = true;
    } else if (m_unit.tag && !ToSwitch() && m_unit.carrierLink == nullptr) {
        const bool noPort = m_unit.kind == UnitKind::kSwitchBond;
        MakeVlan(m_unit.carrier, noPort ? m_unit.port->name : m_unit.name, *m_unit.tag);
    }
}

} // namespace vornhost
