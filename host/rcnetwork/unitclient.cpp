#include "support/interfacevalues.h"
#include "unitplan.h"

#include <algorithm>
#include <string_view>

#include <linux/if_addr.h>
#include <linux/rtnetlink.h>
#include <sys/socket.h>

namespace vornhost {

/** Where this unit's client may have run; its lease is the latest of them. */
std::vector<std::string> UnitPlanner::ClientNames() const
{
    std::vector<std::string> names;
    for (const std::string& name : {MainSource(), m_unit.name, m_unit.bridge}) {
        if (!name.empty() && name != Carrier() &&
            std::find(names.begin(), names.end(), name) == names.end()) {
            names.push_back(name);
        }
    }
    return names;
}

/** Clients of interfaces that are gone: of a plan that was cut short, if it was the same client. */
std::vector<std::string> UnitPlanner::LostClients(const ClientOptions& wanted) const
{
    std::vector<std::string> names;
    for (const auto& [name, client] : m_inputs.clients) {
        if (m_inputs.live.FindLink(name) == nullptr && name != Carrier() && !wanted.empty() &&
            WithInterface(client.options, Carrier()) == wanted) {
            names.push_back(name);
        }
    }
    return names;
}

/** Clients of what the carrier takes over from, which have no follower. */
std::vector<std::string> UnitPlanner::OtherClients() const
{
    std::set<std::string> names(m_unit.absorbed.begin(), m_unit.absorbed.end());
    for (const Source& source : m_unit.sources) {
        names.insert(source.link->name);
    }
    for (const std::string& name : m_unit.absorbed) {
        names.insert(m_kinship.BridgeFor(name));
    }
    names.erase(Carrier());
    for (const std::string& name : ClientNames()) {
        names.erase(name);
    }
    return {names.begin(), names.end()};
}

/** The card at the bottom: under VLANs, and of bonds and bridges the first one. */
const Link* UnitPlanner::CardOf(const std::string& name) const
{
    std::string base = name;
    const auto handed = m_inputs.handover.bonds.find(base);
    const InterfaceFile* file = m_kinship.UsableFile(base);
    if (file != nullptr && file->vlan) {
        base = file->vlan->parent;
    }
    std::vector<std::string> members = m_kinship.MembersOf(base);
    members = members.empty() ? m_kinship.LiveMembersOf(base) : members;
    if (members.empty() && handed != m_inputs.handover.bonds.end()) {
        members = handed->second.members;
    }
    for (const std::string& member : members) {
        if (const Link* link = m_inputs.live.FindLink(member); link != nullptr) {
            return link;
        }
    }
    return m_inputs.live.FindLink(base);
}

ClientPlace UnitPlanner::PlaceOfClient() const
{
    ClientPlace place;
    place.interface = Carrier();
    const bool foreign = m_unit.switchBridge != nullptr && !m_unit.switchBridge->marked;
    const bool itself = m_unit.carrierLink != nullptr && (!ToSwitch() || foreign);
    place.mac = itself ? m_unit.carrierLink->mac : WantedMac();
    const InterfaceFile* file = m_kinship.UsableFile(m_unit.name);
    if (m_unit.tag) {
        place.vlan = *m_unit.tag;
    } else if (file != nullptr && file->vlan) {
        place.vlan = file->vlan->id;
    }
    const Link* card = CardOf(m_unit.name);
    place.card = card == nullptr ? 0 : static_cast<unsigned>(card->index);
    return place;
}

/** What the file asks for; where it does not say, the one that runs stays what it is. */
ClientOptions UnitPlanner::WantedClient() const
{
    if (m_unit.heldDown || m_unit.takeDown) {
        return {};
    }
    if (m_unit.addWanted && m_unit.file->UsesClient()) {
        return MakeClientOptions(*m_unit.file, PlaceOfClient());
    }
    if (m_unit.removeUnwanted) {
        return {};
    }
    std::vector<std::string> names = ClientNames();
    names.insert(names.begin(), Carrier());
    for (const std::string& name : names) {
        const auto live = m_inputs.clients.find(name);
        if (live != m_inputs.clients.end() && live->second.running) {
            return WithInterface(live->second.options, Carrier());
        }
    }
    return {};
}

/** Whether the client gives the carrier its link-local address, and turns the kernel's way off. */
bool UnitPlanner::ClientHasIpv6() const
{
    const ClientOptions options = WantedClient();
    return !options.empty() &&
           std::find(options.begin(), options.end(), kOnlyIPv4) == options.end();
}

/** What a client of the other family only finds on the interface is somebody else's. */
bool UnitPlanner::HadClientFor(int family) const
{
    const char* const other = family == AF_INET ? kOnlyIPv6 : kOnlyIPv4;
    std::vector<std::string> names = ClientNames();
    names.insert(names.begin(), Carrier());
    for (const std::string& name : names) {
        const auto client = m_inputs.clients.find(name);
        if (client != m_inputs.clients.end()) {
            const ClientOptions& options = client->second.options;
            return std::find(options.begin(), options.end(), other) == options.end();
        }
    }
    return true;
}

/** Its addresses are told by that the kernel makes no route for their prefix. */
bool UnitPlanner::IsLeftByClient(const Address& address) const
{
    if (!m_former.client || (address.flags & IFA_F_NOPREFIXROUTE) == 0 ||
        address.scope != RT_SCOPE_UNIVERSE || !HadClientFor(address.family)) {
        return false;
    }
    if (m_unit.takeDown || m_unit.file == nullptr) {
        return m_unit.takeDown;
    }
    const InterfaceFile& file = *m_unit.file;
    return address.family == AF_INET ? !file.client.dhcp
                                     : !file.ClientHearsRouters() && file.client.dhcp6 != true;
}

void UnitPlanner::CheckMetrics() const
{
    const InterfaceFile& file = *m_unit.file;
    const bool both = file.client.dhcp && file.ClientHearsRouters();
    if (m_unit.addWanted && both && file.metric6 && file.metric6 != file.metric) {
        m_remarks.push_back({Severity::kWarning, "ifcfg-" + file.name +
                                                     ": the DHCP client knows one metric for both "
                                                     "families; IPV6_METRIC is not used"});
    }
}

void UnitPlanner::EndClient(const std::string& name, const char* verb)
{
    const auto live = m_inputs.clients.find(name);
    const bool drop = std::string_view(verb) == "drop";
    if (live != m_inputs.clients.end() && (live->second.running || drop)) {
        m_steps.endClients.push_back(std::string(verb) + " " + name);
    }
}

void UnitPlanner::PlanClient()
{
    const ClientOptions wanted = WantedClient();
    std::vector<std::string> formers = ClientNames();
    for (const std::string& name : LostClients(wanted)) {
        if (std::find(formers.begin(), formers.end(), name) == formers.end()) {
            formers.push_back(name);
        }
    }
    const auto own = m_inputs.clients.find(Carrier());
    const bool stays = !wanted.empty() && own != m_inputs.clients.end() && own->second.running &&
                       own->second.options == wanted && m_unit.carrierLink != nullptr;
    const char* verb = wanted.empty() ? "drop" : "end";
    if (!stays) {
        EndClient(Carrier(), verb);
    }
    for (const std::string& name : formers) {
        EndClient(name, stays ? "drop" : verb);
    }
    for (const std::string& name : OtherClients()) {
        EndClient(name, "drop");
    }
    if (!wanted.empty() && !stays) {
        m_steps.startClients.push_back("start " + Carrier() + " of " + Joined(formers, ",") + ": " +
                                       ClientText(wanted));
    }
    if (m_unit.file != nullptr) {
        CheckMetrics();
    }
    // Who made the link-local address had turned off that the kernel does.
    const std::string mode = Live(kNewInterface, kAddressMode);
    const bool hadOwn =
        std::any_of(m_former.addresses.begin(), m_former.addresses.end(),
                    [](const std::string& address) { return address.rfind("fe80:", 0) == 0; });
    if ((m_former.client || hadOwn) && !HasOwnLinkLocal() && m_unit.removeUnwanted &&
        !mode.empty() && Live(Carrier(), kAddressMode) == kAddressModeNone &&
        mode != kAddressModeNone) {
        Set(m_steps.settingsAfter, Carrier(), kAddressMode, mode);
    }
    m_record.client = !wanted.empty();
}

} // namespace vornhost
