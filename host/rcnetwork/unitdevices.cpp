#include "unitplan.h"

namespace vornhost {

/** Whether the carrier is given the link-local address that is in use, and makes none itself. */
bool UnitPlanner::BringsLinkLocal() const
{
    return m_moves && !m_unit.takeDown && !Live(MainSource(), kDisableIpv6).empty();
}

/** Whether a device is made in the place of another one, and has settings before it is used. */
bool UnitPlanner::IsReplaced() const
{
    return m_unit.late && m_unit.carrierLink == nullptr && (!m_unit.IsGroup() || m_unit.tag) &&
           BringsLinkLocal();
}

/**
 * A device that is made for addresses of another one does not hear routers before it has them: of
 * what they say the kernel would make the same addresses, and find that somebody else has them.
 * @return  whether it must be told so before it is up.
 */
bool UnitPlanner::Quiet(const std::string& device)
{
    const std::string hears = Live(kNewInterface, kAcceptRouters);
    if (!BringsLinkLocal() || hears.empty() || hears == "0") {
        return false;
    }
    m_quiet = true;
    if (device == m_unit.name && m_unit.IsGroup()) {
        Set(m_steps.creationSettings, device, kAcceptRouters, "0");
    } else {
        Set(Settings(), device, kAcceptRouters, "0");
    }
    return true;
}

void UnitPlanner::MakeVlan(const std::string& device, const std::string& parent, unsigned id)
{
    auto& lines = !m_unit.late   ? m_steps.devices.links
                  : IsReplaced() ? m_steps.replacement.links
                                 : m_steps.move.links;
    lines.push_back("link add link " + parent + " name " + device + " type vlan id " +
                    std::to_string(id));
    if (m_unit.late && BringsLinkLocal()) {
        lines.push_back("link set dev " + device + " addrgenmode none");
    }
    (void)Quiet(device);
    Build().links.push_back("link set dev " + device + " up");
}

/** A second VLAN of one id on one parent cannot be made before the first one is gone. */
void UnitPlanner::RemoveOldVlans()
{
    for (const Source& source : m_unit.sources) {
        if (source.link->kind == "vlan" && !source.stays) {
            auto& lines = !m_unit.late   ? m_steps.move.linksDown
                          : IsReplaced() ? m_steps.replacement.links
                                         : m_steps.move.links;
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
    }
    if (m_unit.tag && !ToSwitch() && m_unit.carrierLink == nullptr) {
        const bool noPort = m_unit.kind == UnitKind::kSwitchBond;
        MakeVlan(m_unit.carrier, noPort ? m_unit.port->name : m_unit.name, *m_unit.tag);
    }
}

} // namespace vornhost
