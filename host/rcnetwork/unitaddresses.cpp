#include "pairplan.h"

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

const Address* PairPlanner::FindOn(const Link* link, const Address& like) const
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

bool PairPlanner::IsWanted(const Address& address) const
{
    if (m_pair.file == nullptr) {
        return false;
    }
    const auto& wanted = m_pair.file->addresses;
    return std::any_of(wanted.begin(), wanted.end(), [&](const WantedAddress& each) {
        return each.family == address.family && WantedText(each) == AddressText(address);
    });
}

/** Made by an earlier run, and nothing asks for it any more. */
bool PairPlanner::IsUnwanted(const Address& address) const
{
    return m_pair.removeUnwanted && m_former.addresses.contains(AddressText(address)) &&
           (m_pair.takeDown || !IsWanted(address));
}

bool PairPlanner::IsCarried(const Address& address) const
{
    if (IsUnwanted(address) || FindOn(m_pair.TargetLink(), address) != nullptr) {
        return false;
    }
    if (!IsLinkLocal(address)) {
        return true;
    }
    // The kernel makes the link-local address of a port as soon as that has a carrier.
    if (!ToSwitch() && !m_pair.port->carrier) {
        return false;
    }
    const auto& all = m_inputs.live.addresses;
    const Link* target = m_pair.TargetLink();
    return m_moves &&
           (target == nullptr || std::none_of(all.begin(), all.end(), [&](const Address& each) {
                return each.index == target->index && IsLinkLocal(each);
            }));
}

void PairPlanner::CarryAddress(const Address& address)
{
    // A port without carrier checks for duplicates once it has one, as it would have done.
    const bool settled = ToSwitch() || m_pair.port->carrier;
    m_steps.beside.addresses.push_back("addr add " +
                                       AddressArguments(address, Target(), Source(), settled));
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
                                         AddressArguments(plain, Target(), Source(), false));
        m_record.unchecked.insert(AddressText(address));
    }
}

/** Finishes what an earlier run that was cut short had moved. */
void PairPlanner::SettleAddresses()
{
    for (const Address& address : m_inputs.live.addresses) {
        if (m_pair.TargetLink() != nullptr && address.index == m_pair.TargetLink()->index &&
            (address.flags & IFA_F_NODAD) != 0 &&
            m_former.unchecked.contains(AddressText(address)) && !IsUnwanted(address)) {
            Address plain = address;
            plain.flags &= ~std::uint32_t{IFA_F_NODAD};
            m_steps.move.addresses.push_back("addr change " +
                                             AddressArguments(plain, Target(), Target(), false));
        }
    }
}

void PairPlanner::RemoveAddress(const Address& address, const std::string& interface)
{
    const std::string peer = address.peer.empty() ? AddressText(address)
                                                  : address.local + " peer " + address.peer + "/" +
                                                        std::to_string(address.prefixLength);
    m_steps.move.removedAddresses.push_back("addr del " + peer + " dev " + interface);
}

/** Later ones first: with its subnet's first address the kernel removes the others. */
void PairPlanner::RemoveAddresses()
{
    const auto& all = m_inputs.live.addresses;
    const Link* source = m_pair.SourceLink();
    const Link* target = m_pair.TargetLink();
    bool removesFromTarget = false;
    for (const Address& address : std::vector<Address>(all.rbegin(), all.rend())) {
        if (source != nullptr && address.index == source->index && m_pair.SourceStays()) {
            // A port's link-local address goes with its IPv6 stack.
            if (!IsLinkLocal(address)) {
                RemoveAddress(address, Source());
            }
        } else if (target != nullptr && address.index == target->index && IsUnwanted(address)) {
            RemoveAddress(address, Target());
            removesFromTarget = removesFromTarget || address.family == AF_INET;
        }
    }
    // The other addresses of a subnet stay when its first one goes.
    if (removesFromTarget && Live(Target(), kPromoteSecondaries) == "0") {
        Set(m_steps.settingsBefore, Target(), kPromoteSecondaries, "1");
        Set(m_steps.settingsAfter, Target(), kPromoteSecondaries, "0");
    }
}

void PairPlanner::AddWantedAddress(const WantedAddress& wanted)
{
    Address like;
    like.family = wanted.family;
    like.local = wanted.local;
    like.prefixLength = wanted.prefixLength;
    const Address* present = FindOn(m_pair.TargetLink(), like);
    if (present == nullptr) {
        present = FindOn(m_pair.SourceLink(), like);
    }
    if (present != nullptr && present->prefixLength == wanted.prefixLength) {
        return;
    }
    if (present != nullptr && m_pair.TargetLink() != nullptr &&
        present->index == m_pair.TargetLink()->index) {
        m_steps.beside.addresses.push_back("addr del " + AddressText(*present) + " dev " +
                                           Target());
    }
    const bool broadcast = wanted.family == AF_INET && wanted.prefixLength <= 30;
    m_steps.beside.addresses.push_back("addr add " + WantedText(wanted) +
                                       (broadcast ? " brd +" : "") + " dev " + Target());
    m_record.addresses.insert(WantedText(wanted));
}

/** The kernel lists IPv4 addresses in the order in which they were made, IPv6 ones against it. */
void PairPlanner::CarryAddresses()
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
    const Link* source = m_pair.SourceLink();
    for (const Address& address : inOrder) {
        if (source != nullptr && address.index == source->index && IsCarried(address)) {
            CarryAddress(address);
        }
    }
}

void PairPlanner::PlanAddresses()
{
    CarryAddresses();
    if (m_pair.removeUnwanted && m_pair.file != nullptr) {
        const auto& wanted = m_pair.file->addresses;
        std::erase_if(m_record.addresses, [&](const std::string& text) {
            return std::none_of(wanted.begin(), wanted.end(), [&](const WantedAddress& each) {
                return WantedText(each) == text;
            });
        });
    }
    if (m_pair.addWanted) {
        for (const WantedAddress& wanted : m_pair.file->addresses) {
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
void PairPlanner::CarryNeighbours()
{
    const Link* source = m_pair.SourceLink();
    const Link* target = m_pair.TargetLink();
    const auto& all = m_inputs.live.neighbours;
    for (const Neighbour& neighbour : all) {
        const bool known =
            target != nullptr && std::any_of(all.begin(), all.end(), [&](const Neighbour& each) {
                return each.index == target->index && each.address == neighbour.address &&
                       each.mac == neighbour.mac;
            });
        if (source == nullptr || neighbour.index != source->index || known) {
            continue;
        }
        m_steps.beside.neighbours.push_back(
            "neigh replace " + neighbour.address + " lladdr " + neighbour.mac + " dev " + Target() +
            (neighbour.permanent ? " nud permanent" : " nud stale") +
            (neighbour.router ? " router" : ""));
        if (neighbour.permanent && m_pair.SourceStays()) {
            m_steps.move.removedNeighbours.push_back("neigh del " + neighbour.address + " dev " +
                                                     Source());
        }
    }
}

} // namespace vornhost
