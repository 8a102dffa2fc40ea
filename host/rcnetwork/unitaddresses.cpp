#include "unitplan.h"

#include "ipcommand.h"

#include <algorithm>
#include <iterator>

#include <linux/if_addr.h>
#include <linux/rtnetlink.h>
#include <sys/socket.h>

namespace vornhost {
namespace {

constexpr char kPromoteSecondaries[] = "ipv4.conf.promote_secondaries";

bool IsLinkLocal(const Address& address)
{
    return address.family == AF_INET6 && address.scope == RT_SCOPE_LINK;
}

/** Whether the kernel has made it of another one, with which it goes. */
bool IsTemporary(const Address& address)
{
    return address.family == AF_INET6 && (address.flags & IFA_F_TEMPORARY) != 0;
}

/**
 * The kernel makes a new temporary address on the target and takes none from outside, so the former
 * one is carried for those that use it, and for nobody else.
 */
Address AsAddressOfItsOwn(Address address)
{
    if (IsTemporary(address)) {
        address.flags &= ~std::uint32_t{IFA_F_TEMPORARY};
        address.preferredSeconds = 0;
    }
    return address;
}

/** Whether both cannot stand on one interface: IPv6 knows an address once, whatever its length. */
bool SameOnOneInterface(const Address& one, const Address& other)
{
    return one.family == other.family && one.local == other.local &&
           (one.family == AF_INET6 ||
            (one.prefixLength == other.prefixLength && one.peer == other.peer));
}

std::string WantedText(const WantedAddress& wanted)
{
    return wanted.local + "/" + std::to_string(wanted.prefixLength);
}

} // namespace

const Address* UnitPlanner::FindOn(const Link* link, const Address& like) const
{
    if (link == nullptr) {
        return nullptr;
    }
    const auto& all = m_inputs.live.addresses;
    const auto found = std::find_if(all.begin(), all.end(), [&](const Address& address) {
        return address.index == link->index && SameOnOneInterface(address, like);
    });
    return found == all.end() ? nullptr : &*found;
}

bool UnitPlanner::IsWanted(const Address& address) const
{
    const auto wanted = WantedAddresses();
    return std::any_of(wanted.begin(), wanted.end(), [&](const WantedAddress& each) {
        return each.family == address.family && WantedText(each) == AddressText(address);
    });
}

/** Made by an earlier run, and nothing asks for it any more. */
bool UnitPlanner::IsUnwanted(const Address& address) const
{
    return m_unit.removeUnwanted &&
           (m_former.addresses.contains(AddressText(address)) || IsLeftByClient(address)) &&
           (m_unit.takeDown || !IsWanted(address));
}

bool UnitPlanner::IsCarried(const Address& address) const
{
    if (IsUnwanted(address) || FindOn(m_unit.carrierLink, address) != nullptr) {
        return false;
    }
    if (!IsLinkLocal(address)) {
        return true;
    }
    // A stop takes the member out of its bond last, and until then the kernel refuses it one.
    if (m_unit.takeDown && m_unit.carrierLink != nullptr && IsReleased(*m_unit.carrierLink)) {
        return false;
    }
    // The kernel makes the link-local address of a port as soon as that has a carrier.
    if (!ToSwitch() && !WireHasCarrier()) {
        return false;
    }
    const auto& all = m_inputs.live.addresses;
    const Link* target = m_unit.carrierLink;
    return m_moves &&
           (target == nullptr || std::none_of(all.begin(), all.end(), [&](const Address& each) {
                return each.index == target->index && IsLinkLocal(each);
            }));
}

void UnitPlanner::CarryAddress(const Address& address, const Source& source)
{
    const std::string& from = source.link->name;
    // A port without carrier checks for duplicates once it has one, as it would have done.
    const bool settled = ToSwitch() || WireHasCarrier();
    Build().addresses.push_back("addr add " + AddressArguments(address, Carrier(), from, settled));
    if (address.family != AF_INET6 || !settled) {
        return;
    }
    // The check is left out once; from then on the address is like any other.
    Address plain = address;
    if (m_former.unchecked.contains(AddressText(address))) {
        plain.flags &= ~std::uint32_t{IFA_F_NODAD};
    }
    if ((plain.flags & IFA_F_NODAD) == 0) {
        m_steps.move.addresses.push_back("addr change " +
                                         AddressArguments(plain, Carrier(), from, false));
        m_record.unchecked.insert(AddressText(address));
    }
}

/** Finishes what an earlier run that was cut short had moved. */
void UnitPlanner::SettleAddresses()
{
    for (const Address& address : m_inputs.live.addresses) {
        if (m_unit.carrierLink != nullptr && address.index == m_unit.carrierLink->index &&
            (address.flags & IFA_F_NODAD) != 0 &&
            m_former.unchecked.contains(AddressText(address)) && !IsUnwanted(address)) {
            Address plain = address;
            plain.flags &= ~std::uint32_t{IFA_F_NODAD};
            m_steps.move.addresses.push_back("addr change " +
                                             AddressArguments(plain, Carrier(), Carrier(), false));
        }
    }
}

void UnitPlanner::RemoveAddress(const Address& address, const std::string& interface)
{
    const std::string peer = address.peer.empty() ? AddressText(address)
                                                  : address.local + " peer " + address.peer + "/" +
                                                        std::to_string(address.prefixLength);
    m_steps.move.removedAddresses.push_back("addr del " + peer + " dev " + interface);
}

/** Later ones first: with its subnet's first address the kernel removes the others. */
void UnitPlanner::RemoveAddresses()
{
    const auto& all = m_inputs.live.addresses;
    // What stands on an interface that goes needs no command of its own.
    const bool goes = m_unit.takeDown && m_former.made;
    const Link* carrier = goes ? nullptr : m_unit.carrierLink;
    bool removesFromCarrier = false;
    for (const Address& address : std::vector<Address>(all.rbegin(), all.rend())) {
        const Source* source = m_unit.SourceOf(address.index);
        if (source != nullptr && source->stays && !IsGathered(*source->link)) {
            // A port's link-local address goes with its IPv6 stack.
            if (!IsLinkLocal(address) && !IsTemporary(address)) {
                RemoveAddress(address, source->link->name);
            }
        } else if (carrier != nullptr && address.index == carrier->index && IsUnwanted(address) &&
                   !IsTemporary(address)) {
            RemoveAddress(address, Carrier());
            removesFromCarrier = removesFromCarrier || address.family == AF_INET;
        }
    }
    // The other addresses of a subnet stay when its first one goes.
    if (removesFromCarrier && Live(Carrier(), kPromoteSecondaries) == "0") {
        Set(m_steps.settingsBefore, Carrier(), kPromoteSecondaries, "1");
        Set(m_steps.settingsAfter, Carrier(), kPromoteSecondaries, "0");
    }
}

/** Whether an address that a file asks for is one of a server, and would go with its lease. */
bool UnitPlanner::IsLent(const Address& address) const
{
    const InterfaceFile& file = *m_unit.file;
    const bool served = address.family == AF_INET ? file.client.dhcp : ClientHasIpv6();
    const bool ends = address.validSeconds != UINT32_MAX ||
                      (m_former.client && (address.flags & IFA_F_NOPREFIXROUTE) != 0);
    return !served && ends && m_unit.carrierLink != nullptr &&
           address.index == m_unit.carrierLink->index;
}

/** IPv4 addresses are made anew, because whether they have a route for their prefix stays. */
void UnitPlanner::KeepForGood(const Address& address)
{
    auto& lines = Build().addresses;
    if (address.family == AF_INET6) {
        lines.push_back("addr change " + AddressText(address) + " dev " + Carrier() +
                        " valid_lft forever preferred_lft forever");
    } else {
        lines.push_back("addr del " + AddressText(address) + " dev " + Carrier());
        lines.push_back("addr add " + AddressText(address) +
                        (address.prefixLength <= 30 ? " brd +" : "") + " dev " + Carrier());
    }
    m_record.addresses.insert(AddressText(address));
}

void UnitPlanner::AddWantedAddress(const WantedAddress& wanted)
{
    Address like;
    like.family = wanted.family;
    like.local = wanted.local;
    like.prefixLength = wanted.prefixLength;
    const Address* present = FindOn(m_unit.carrierLink, like);
    for (const Source& source : m_unit.sources) {
        present = present == nullptr ? FindOn(source.link, like) : present;
    }
    if (present != nullptr && present->prefixLength == wanted.prefixLength) {
        if (IsLent(*present)) {
            KeepForGood(*present);
        }
        return;
    }
    if (present != nullptr && m_unit.carrierLink != nullptr &&
        present->index == m_unit.carrierLink->index) {
        Build().addresses.push_back("addr del " + AddressText(*present) + " dev " + Carrier());
    }
    const bool broadcast = wanted.family == AF_INET && wanted.prefixLength <= 30;
    Build().addresses.push_back("addr add " + WantedText(wanted) + (broadcast ? " brd +" : "") +
                                " dev " + Carrier());
    m_record.addresses.insert(WantedText(wanted));
}

/** The kernel lists IPv4 addresses in the order in which they were made, IPv6 ones against it. */
void UnitPlanner::CarryAddressesOf(const Source& source)
{
    const auto& all = m_inputs.live.addresses;
    std::vector<Address> inOrder;
    for (const Address& address : all) {
        if (address.family == AF_INET) {
            inOrder.push_back(address);
        }
    }
    std::copy_if(all.rbegin(), all.rend(), std::back_inserter(inOrder),
                 [](const Address& address) { return address.family == AF_INET6; });
    for (const Address& address : inOrder) {
        if (address.index == source.link->index && IsCarried(address) &&
            m_carried.insert(IsLinkLocal(address) ? "link" : AddressText(address)).second) {
            CarryAddress(AsAddressOfItsOwn(address), source);
        }
    }
}

/** What is on several sources is the same address once. */
void UnitPlanner::CarryAddresses()
{
    for (const Source& source : m_unit.sources) {
        CarryAddressesOf(source);
    }
}

void UnitPlanner::PlanAddresses()
{
    CarryAddresses();
    if (m_unit.removeUnwanted && m_unit.file != nullptr) {
        const auto wanted = WantedAddresses();
        std::erase_if(m_record.addresses, [&](const std::string& text) {
            return std::none_of(wanted.begin(), wanted.end(), [&](const WantedAddress& each) {
                return WantedText(each) == text;
            });
        });
    }
    if (m_unit.addWanted && m_unit.file != nullptr) {
        for (const WantedAddress& wanted : WantedAddresses()) {
            AddWantedAddress(wanted);
        }
    }
    SettleAddresses();
    RemoveAddresses();
}

/**
 * Neighbours are known on the target from the first packet on. Otherwise an answer to the first
 * question could still arrive at the source and be lost, and the next question is a second away.
 */
void UnitPlanner::CarryNeighbours()
{
    const Link* carrier = m_unit.carrierLink;
    const auto& all = m_inputs.live.neighbours;
    for (const Neighbour& neighbour : all) {
        const Source* source = m_unit.SourceOf(neighbour.index);
        const bool known =
            carrier != nullptr && std::any_of(all.begin(), all.end(), [&](const Neighbour& each) {
                return each.index == carrier->index && each.address == neighbour.address &&
                       each.mac == neighbour.mac;
            });
        if (source == nullptr || known) {
            continue;
        }
        Build().neighbours.push_back("neigh replace " + neighbour.address + " lladdr " +
                                     neighbour.mac + " dev " + Carrier() +
                                     (neighbour.permanent ? " nud permanent" : " nud stale") +
                                     (neighbour.router ? " router" : ""));
        if (neighbour.permanent && source->stays && !IsGathered(*source->link)) {
            m_steps.move.removedNeighbours.push_back("neigh del " + neighbour.address + " dev " +
                                                     source->link->name);
        }
    }
}

} // namespace vornhost
