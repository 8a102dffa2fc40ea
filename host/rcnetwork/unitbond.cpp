#include "unitplan.h"

#include "sources.h"

#include "support/bondoptions.h"

#include <algorithm>
#include <array>
#include <set>

namespace vornhost {
namespace {

/** The kernel takes the others only once these are set. */
constexpr char kJoinDelay[] = "updelay";
constexpr char kKeepAddresses[] = "ipv6.conf.keep_addr_on_down";
constexpr std::array kFirstOptions{"mode", "miimon", "arp_interval"};

std::string OptionLine(const std::string& bond, const std::string& name, const std::string& value)
{
    return "link set dev " + bond + " type bond " + name + " " + value;
}

/** The options that the tool has no word for or that stand under another name already. */
bool IsForTheTool(const std::string& name)
{
    return name != "mode" && name != "num_unsol_na";
}

std::vector<std::string> InOrder(const BondOptions& options)
{
    std::vector<std::string> names(kFirstOptions.begin() + 1, kFirstOptions.end());
    for (const auto& [name, value] : options.values) {
        if (IsForTheTool(name) && std::find(names.begin(), names.end(), name) == names.end()) {
            names.push_back(name);
        }
    }
    std::erase_if(names, [&](const std::string& name) { return options.Get(name).empty(); });
    return names;
}

} // namespace

/** Whether the interface is to become a member of the bond. */
bool UnitPlanner::IsMissing(const Link& member) const
{
    return m_unit.port == nullptr || member.master != m_unit.port->index;
}

/** Whether everything is taken from the interface because it joins a bond at once. */
bool UnitPlanner::IsGathered(const Link& link) const
{
    return m_unit.kind == UnitKind::kBond && m_unit.late && m_unit.addWanted &&
           IsMember(link.name) && IsMissing(link);
}

void UnitPlanner::MakeBond()
{
    const BondOptions options = BondOptionsOf(m_inputs.files.at(m_unit.name));
    auto& lines = Quiet(m_unit.name) ? m_steps.creation.links : m_steps.devices.links;
    std::string line = "link add dev " + m_unit.name;
    if (!WantedMac().empty()) {
        line += " address " + WantedMac();
    }
    const unsigned mtu = WantedMtu();
    line += " mtu " + std::to_string(mtu) + " type bond";
    line += options.Get("mode").empty() ? "" : " mode " + options.Get("mode");
    lines.push_back(line);
    for (const std::string& name : InOrder(options)) {
        // Only members that come later wait for that long.
        auto& stage = name == kJoinDelay ? m_steps.tidy.links : lines;
        stage.push_back(OptionLine(m_unit.name, name, options.Get(name)));
    }
    if (Carrier() == m_unit.name && BringsLinkLocal()) {
        lines.push_back("link set dev " + m_unit.name + " addrgenmode none");
    }
    m_steps.devices.links.push_back("link set dev " + m_unit.name + " up");
    m_record.made = true;
    m_record.broughtUp = true;
}

/** What the file does not mention stays as somebody may have set it. */
void UnitPlanner::AdjustBondOptions()
{
    const auto live = m_inputs.live.bonds.find(m_unit.name);
    const InterfaceFile& file = m_inputs.files.at(m_unit.name);
    if (live == m_inputs.live.bonds.end() || live->second.options.empty()) {
        return;
    }
    const BondOptions options = BondOptionsOf(file);
    // The kernel's module makes an empty one when it is loaded; with the first member it is ours.
    m_record.made = m_record.made || live->second.members.empty();
    if (m_unit.changesMode) {
        ChangeMode(live->second, options);
        return;
    }
    for (const auto& [name, value] : options.values) {
        const auto has = live->second.options.find(name);
        if (has != live->second.options.end() && has->second == value) {
            continue;
        }
        if (IsForTheTool(name) && has != live->second.options.end()) {
            m_steps.beside.links.push_back(OptionLine(m_unit.name, name, value));
        }
    }
}

/**
 * The kernel changes the mode of a bond that is down and has no members. All of it is one batch;
 * addresses survive that, and routes are made again.
 */
void UnitPlanner::ChangeMode(const LiveBond& live, const BondOptions& options)
{
    const std::string& bond = m_unit.name;
    std::vector<std::string> members = live.members;
    for (const Link* member : m_unit.idle) {
        if (std::find(members.begin(), members.end(), member->name) == members.end()) {
            members.push_back(member->name);
        }
    }
    for (const std::string& name : m_inputs.live.WithVlans(*m_unit.port)) {
        if (const std::string kept = Live(name, kKeepAddresses); !kept.empty() && kept != "1") {
            Set(m_steps.settingsBefore, name, kKeepAddresses, "1");
            Set(m_steps.settingsAfter, name, kKeepAddresses, kept);
        }
    }
    auto& lines = m_steps.beside.links;
    for (const std::string& member : members) {
        lines.push_back("link set dev " + member + " nomaster");
    }
    lines.push_back("link set dev " + bond + " down");
    lines.push_back(OptionLine(bond, "mode", options.Get("mode")));
    for (const std::string& name : InOrder(options)) {
        const auto has = live.options.find(name);
        if (has != live.options.end() && has->second != options.Get(name)) {
            lines.push_back(OptionLine(bond, name, options.Get(name)));
        }
    }
    // Without members it has lost the address, or has never had one that means anything.
    const bool idle = live.members.empty() && !m_unit.members.empty();
    const std::string& mac = idle ? m_unit.members.front()->mac : m_unit.port->mac;
    lines.push_back("link set dev " + bond + " address " + mac);
    lines.push_back("link set dev " + bond + " up");
    for (const std::string& member : members) {
        const std::string link = "link set dev " + member;
        lines.push_back(link + " down");
        lines.push_back(std::string(link).append(" master ").append(bond));
    }
    m_remarks.push_back({Severity::kNotice, bond + " changes its mode to " + options.Get("mode")});
}

bool UnitPlanner::IsIdle(const Link* member) const
{
    return std::find(m_unit.idle.begin(), m_unit.idle.end(), member) != m_unit.idle.end();
}

/**
 * Members without traffic join before anything moves, the one with the traffic when the others have
 * taken that over.
 */
void UnitPlanner::Gather()
{
    auto& last = m_unit.late ? m_steps.move.links : m_steps.tidy.links;
    const bool late = m_unit.late;
    bool joins = false;
    bool gathered = false;
    for (const Link* member : m_unit.members) {
        if (IsMissing(*member)) {
            const bool early = !late && IsIdle(member);
            GatherMember(*member, early ? m_steps.devices.links : last);
            joins = joins || early;
            gathered = true;
        }
    }
    const auto& sources = m_unit.sources;
    const bool moves = std::any_of(sources.begin(), sources.end(), [&](const Source& source) {
        return HasGlobalAddress(source.link);
    });
    if (joins && moves && m_unit.port == nullptr) {
        m_steps.readyBefore.push_back("link " + m_unit.name);
    }
    if (!late && m_unit.port == nullptr) {
        PutInOrder();
    }
    if (gathered && moves) {
        AnnounceAgain();
    }
}

/**
 * The bond may take another member into use when the one with the traffic joins or the others do so
 * anew. The kernel then tells switches outside, but not when it is busy with something else at that
 * moment; without that they would send to a member that is not in use, until the host speaks.
 */
void UnitPlanner::AnnounceAgain()
{
    for (const Link* member : m_unit.members) {
        const std::string wait = "member " + member->name;
        auto& ready = m_steps.readyAfter;
        if (!IsIdle(member) && IsMissing(*member) && member->carrier &&
            std::find(ready.begin(), ready.end(), wait) == ready.end()) {
            ready.push_back(wait);
        }
    }
    m_steps.announceAgain.push_back(Carrier());
}

/** The kernel keeps the order in which members join, and the first one has a meaning. */
void UnitPlanner::PutInOrder()
{
    const auto& members = m_unit.members;
    const auto isIdle = [&](const Link* member) { return IsIdle(member); };
    const auto busy = std::find_if_not(members.begin(), members.end(), isIdle);
    if (std::none_of(busy, members.end(), isIdle)) {
        return;
    }
    m_steps.readyAfter.push_back("member " + (*busy)->name);
    for (auto member = busy; member != members.end(); ++member) {
        if (IsIdle(*member)) {
            m_steps.order.links.push_back("link set dev " + (*member)->name + " nomaster");
            m_steps.order.links.push_back("link set dev " + (*member)->name + " master " +
                                          m_unit.name);
        }
    }
}

/** Only an interface that is down can become a member; the bond brings it up again. */
void UnitPlanner::GatherMember(const Link& member, std::vector<std::string>& lines)
{
    InterfaceRecord& record = m_steps.records[member.name];
    const auto& addresses = m_inputs.live.addresses;
    if (std::any_of(addresses.begin(), addresses.end(),
                    [&](const Address& address) { return address.index == member.index; })) {
        lines.push_back("addr flush dev " + member.name);
    }
    if (member.up) {
        lines.push_back("link set dev " + member.name + " down");
    } else {
        record.broughtUp = true;
    }
    const std::string own = record.ownMac;
    if (!own.empty() && own != member.mac) {
        lines.push_back("link set dev " + member.name + " address " + own);
    }
    record.ownMac.clear();
    lines.push_back("link set dev " + member.name + " master " + m_unit.name);
}

void UnitPlanner::DissolveBonds()
{
    for (const std::string& bond : m_kinship.LegaciesOf(m_unit.name)) {
        const Link* link = m_inputs.live.FindLink(bond);
        if (m_inputs.live.bonds.contains(bond)) {
            DissolveBond(bond);
        } else if (link != nullptr && link->kind == "bridge") {
            ReleasePorts(bond);
        }
    }
    if (m_unit.kind == UnitKind::kSwitchBond && m_inputs.live.bonds.contains(m_unit.name)) {
        DissolveBond(m_unit.name);
    }
}

/**
 * The heir leaves first and takes the traffic over; as long as it does not, the bond has the other
 * members. A bond that becomes one of the switch goes as a whole.
 */
void UnitPlanner::DissolveBond(const std::string& bond)
{
    const LiveBond& live = m_inputs.live.bonds.at(bond);
    const bool whole = m_unit.kind == UnitKind::kSwitchBond;
    for (const std::string& member : live.members) {
        if (member == m_unit.name && !m_unit.takeDown) {
            ReleaseMember(bond, member, m_steps.devices.links);
            m_steps.readyBefore.push_back("link " + member);
            const auto mode = live.options.find("mode");
            if (mode != live.options.end() && mode->second == "802.3ad" &&
                live.members.size() > 1) {
                m_steps.readyBefore.push_back("alone " + member);
            }
        } else if (whole || !IsMember(member)) {
            ReleaseMember(bond, member, whole ? m_steps.beside.links : m_steps.tidy.links);
        }
    }
    m_steps.tidy.linksDown.push_back("link del dev " + bond);
}

bool UnitPlanner::IsMember(const std::string& name) const
{
    return std::any_of(m_unit.members.begin(), m_unit.members.end(),
                       [&](const Link* member) { return member->name == name; });
}

void UnitPlanner::ReleaseMember(const std::string& bond, const std::string& member,
                                std::vector<std::string>& lines)
{
    const LiveBond& live = m_inputs.live.bonds.at(bond);
    const Link* bondLink = m_inputs.live.FindLink(bond);
    const HandedBond* handed = m_inputs.handover.FirstOf(member);
    const auto own = live.ownMacs.find(member);
    InterfaceRecord record = member == m_unit.name ? m_record : FormerRecord(member);
    lines.push_back("link set dev " + member + " nomaster");
    if (handed != nullptr && bondLink != nullptr && own != live.ownMacs.end() &&
        own->second != bondLink->mac) {
        // Its neighbours go on to find the host where they know it.
        lines.push_back("link set dev " + member + " address " + bondLink->mac);
        record.ownMac = own->second;
    }
    if (member == Carrier() && BringsLinkLocal()) {
        lines.push_back("link set dev " + member + " addrgenmode none");
    }
    const bool stopped = m_unit.takeDown && record.broughtUp;
    if (!stopped && !m_inputs.handover.IsSilent(member)) {
        lines.push_back("link set dev " + member + " up");
    }
    if (member == m_unit.name) {
        m_record = record;
    } else {
        m_steps.records[member] = record;
    }
}

} // namespace vornhost
