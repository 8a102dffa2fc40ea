#include "possiblehost.h"

#include "text.h"

#include "rcnetwork/decider.h"
#include "support/contains.h"
#include "support/interfacename.h"
#include "support/interfacevalues.h"
#include "support/remembered.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <functional>
#include <string_view>
#include <tuple>

#include <arpa/inet.h>
#include <linux/rtnetlink.h>

namespace fuzz {
namespace {

using namespace vornhost;

constexpr int kMostVlan = 4094;
constexpr char kBond[] = "bond";
constexpr char kVlan[] = "vlan";
constexpr char kDatapath[] = "openvswitch";
constexpr char kSomeLinkAddress[] = "02:00:00:00:00:0a";

bool IsWord(const std::string& text)
{
    return Words(text).size() == 1 && Words(text).front() == text && !HasControls(text);
}

/** Of options of bonds: each is a word, as is what it is set to. */
void KeepWords(std::map<std::string, std::string>& options)
{
    std::erase_if(options, [](const auto& option) {
        return !IsWord(option.first) || !IsWord(option.second);
    });
}

/** Writes an address as the kernel does, or nothing where it is none. */
void Normalise(int family, std::string& address)
{
    address = NormalAddress(family, address);
}

void KeepLinkAddress(std::string& mac)
{
    mac = IsLinkAddress(mac) ? Lower(mac) : std::string();
}

unsigned LongestPrefix(int family)
{
    return family == AF_INET ? 32 : 128;
}

/** The kernel's links: which there are, and what stands on what. */
class Links {
public:
    explicit Links(LiveState& live) : m_live(live) {}

    void MakePossible()
    {
        KeepThoseWithNames();
        for (Link& link : m_live.links) {
            // There is no Ethernet without one.
            link.mac = IsLinkAddress(link.mac) ? Lower(link.mac) : kSomeLinkAddress;
            Normalise(AF_INET6, link.token);
            link.kind = link.name == kDatapathLink ? kDatapath : link.kind;
            link.kind = IsWord(link.kind) ? link.kind : std::string();
        }
        for (Link& link : m_live.links) {
            MakeVlanPossible(link);
        }
        JoinListedMembers();
        for (Link& link : m_live.links) {
            const Link* master = m_live.FindLink(link.master);
            if (master == nullptr || !HoldsPorts(*master) || !Stack(link.index, link.master)) {
                link.master = 0;
            }
        }
        MakeBondsPossible();
    }

private:
    /** Each has a name and a number of its own. */
    void KeepThoseWithNames()
    {
        std::set<std::string> names;
        std::set<int> indexes;
        std::erase_if(m_live.links, [&](const Link& link) {
            return !IsInterfaceName(link.name) || link.index <= 0 || names.contains(link.name) ||
                   !indexes.insert(link.index).second || !names.insert(link.name).second;
        });
    }

    static bool HoldsPorts(const Link& link)
    {
        constexpr std::array<std::string_view, 4> kHolders{kBond, "bridge", "team", "vrf"};
        return link.name == kDatapathLink ||
               std::find(kHolders.begin(), kHolders.end(), link.kind) != kHolders.end();
    }

    /** One of each number stands on another interface; what is none of them has no number. */
    void MakeVlanPossible(Link& link)
    {
        if (link.kind == kVlan && link.vlanId >= 0 && link.vlanId <= kMostVlan &&
            m_live.FindLink(link.parent) != nullptr &&
            !m_vlans.contains({link.parent, link.vlanId}) && Stack(link.parent, link.index)) {
            m_vlans.insert({link.parent, link.vlanId});
            return;
        }
        link.kind = link.kind == kVlan ? std::string() : link.kind;
        link.vlanId = -1;
        link.parent = 0;
    }

    /** Puts one link over another. @return  false: it would stand on itself. */
    bool Stack(int lower, int upper)
    {
        if (Stands(lower, upper)) {
            return false;
        }
        m_stacked.insert({lower, upper});
        return true;
    }

    bool Stands(int upper, int lower) const
    {
        return upper == lower ||
               std::any_of(m_stacked.begin(), m_stacked.end(), [&](const auto& each) {
                   return each.first == lower && Stands(upper, each.second);
               });
    }

    /** Members are those whose master the bond is, and the other way round. */
    void JoinListedMembers()
    {
        for (Link& link : m_live.links) {
            for (const auto& [name, bond] : m_live.bonds) {
                const Link* master = m_live.FindLink(name);
                if (link.master == 0 && master != nullptr && Contains(bond.members, link.name)) {
                    link.master = master->index;
                }
            }
        }
    }

    void MakeBondsPossible()
    {
        std::erase_if(m_live.bonds, [&](const auto& entry) {
            const Link* link = m_live.FindLink(entry.first);
            return link == nullptr || link->kind != kBond;
        });
        for (const Link& link : m_live.links) {
            if (link.kind == kBond) {
                MakeBondPossible(link, m_live.bonds[link.name]);
            }
        }
    }

    void MakeBondPossible(const Link& link, LiveBond& bond) const
    {
        std::vector<std::string> members;
        for (const std::string& name : bond.members) {
            const Link* member = m_live.FindLink(name);
            if (member != nullptr && member->master == link.index && !Contains(members, name)) {
                members.push_back(name);
            }
        }
        for (const Link& each : m_live.links) {
            if (each.master == link.index && !Contains(members, each.name)) {
                members.push_back(each.name);
            }
        }
        bond.members = members;
        std::erase_if(bond.ownMacs, [&](const auto& own) {
            return !Contains(members, own.first) || !IsLinkAddress(own.second);
        });
        KeepWords(bond.options);
    }

    LiveState& m_live;
    std::set<std::pair<int, int>> m_vlans;
    std::set<std::pair<int, int>> m_stacked; ///< What stands below, and what above.
};

/** Texts that are none are not what an address can be; of one there is one on an interface. */
void MakeAddressesPossible(LiveState& live)
{
    std::set<std::tuple<int, std::string, unsigned, std::string>> known;
    std::erase_if(live.addresses, [&](Address& address) {
        Normalise(address.family, address.local);
        Normalise(address.family, address.peer);
        Normalise(address.family, address.broadcast);
        const bool four = address.family == AF_INET;
        // IPv6 knows an address once, whatever its length.
        const unsigned length = four ? address.prefixLength : 0;
        address.label = four && IsInterfaceName(address.label) ? address.label : std::string();
        address.scope = address.local.starts_with("fe80:") ? RT_SCOPE_LINK : RT_SCOPE_UNIVERSE;
        address.preferredSeconds = std::min(address.preferredSeconds, address.validSeconds);
        return live.FindLink(address.index) == nullptr || address.local.empty() ||
               address.prefixLength > LongestPrefix(address.family) ||
               !known.insert({address.index, address.local, length, address.peer}).second;
    });
}

/** Whether no bit is set behind the prefix: the kernel has no other routes. */
bool IsPrefix(const Route& route)
{
    std::array<unsigned char, sizeof(in6_addr)> bytes{};
    (void)inet_pton(route.family, route.destination.c_str(), bytes.data());
    for (unsigned bit = route.prefixLength; bit < LongestPrefix(route.family); ++bit) {
        if ((bytes.at(bit / 8) & (0x80U >> (bit % 8))) != 0) {
            return false;
        }
    }
    return true;
}

bool IsPossible(const LiveState& live, const Route& route)
{
    constexpr std::array<unsigned, 4> kTypes{RTN_UNICAST, RTN_BLACKHOLE, RTN_UNREACHABLE,
                                             RTN_PROHIBIT};
    const bool somewhere = route.type == RTN_UNICAST;
    return std::find(kTypes.begin(), kTypes.end(), route.type) != kTypes.end() &&
           route.nextHops.empty() != somewhere &&
           route.destination.empty() == (route.prefixLength == 0) &&
           route.prefixLength <= LongestPrefix(route.family) && IsPrefix(route) &&
           std::all_of(route.nextHops.begin(), route.nextHops.end(),
                       [&](const NextHop& hop) { return live.FindLink(hop.index) != nullptr; });
}

void MakeRoutesPossible(LiveState& live)
{
    std::erase_if(live.routes, [&](Route& route) {
        Normalise(route.family, route.destination);
        Normalise(route.family, route.source);
        route.destination = route.prefixLength == 0 ? std::string() : route.destination;
        for (NextHop& hop : route.nextHops) {
            Normalise(hop.gatewayFamily, hop.gateway);
        }
        return !IsPossible(live, route);
    });
}

void MakeNeighboursPossible(LiveState& live)
{
    std::erase_if(live.neighbours, [&](Neighbour& neighbour) {
        Normalise(neighbour.family, neighbour.address);
        KeepLinkAddress(neighbour.mac);
        return live.FindLink(neighbour.index) == nullptr || neighbour.address.empty() ||
               neighbour.mac.empty();
    });
}

/** Names of files below /proc/sys/net, in each of which there is a number. */
bool IsPossible(const std::string& name, const std::string& value)
{
    constexpr std::array<std::string_view, 4> kGroups{"ipv4.conf.", "ipv4.neigh.", "ipv6.conf.",
                                                      "ipv6.neigh."};
    const bool grouped =
        std::any_of(kGroups.begin(), kGroups.end(), [&](const std::string_view group) {
            return name.starts_with(group) && name.size() > group.size();
        });
    std::int64_t number = 0;
    const char* end = value.data() + value.size();
    const auto [stop, error] = std::from_chars(value.data(), end, number);
    return IsWord(name) && grouped && error == std::errc() && stop == end && number >= INT32_MIN &&
           number <= UINT32_MAX;
}

void MakePossible(Settings& settings)
{
    std::erase_if(settings,
                  [](const auto& setting) { return !IsPossible(setting.first, setting.second); });
}

void MakeSettingsPossible(LiveState& live)
{
    std::erase_if(live.settings, [&](const auto& entry) {
        return entry.first != kNewInterface && live.FindLink(entry.first) == nullptr;
    });
    for (auto& [name, settings] : live.settings) {
        MakePossible(settings);
    }
}

/**
 * The switch opens bridges, ports and interfaces under the names of interfaces only, each of them
 * once, and every bridge has a port of its own name.
 */
void MakeSwitchPossible(SwitchState& state)
{
    std::set<std::string> bridges;
    std::set<std::string> ports;
    std::set<std::string> interfaces;
    std::erase_if(state.bridges, [&](const SwitchBridge& bridge) {
        return !IsInterfaceName(bridge.name) || !bridges.insert(bridge.name).second;
    });
    for (SwitchBridge& bridge : state.bridges) {
        std::erase_if(bridge.ports, [&](SwitchPort& port) {
            std::erase_if(port.interfaces, [&](const std::string& name) {
                return !IsInterfaceName(name) || !interfaces.insert(name).second;
            });
            std::erase_if(port.working, [&](const std::string& name) {
                return !Contains(port.interfaces, name);
            });
            const bool own = port.name == bridge.name || !bridges.contains(port.name);
            return !own || !IsInterfaceName(port.name) || port.interfaces.empty() ||
                   !ports.insert(port.name).second;
        });
        if (bridge.FindPort(bridge.name) == nullptr) {
            bridge.ports.push_back({bridge.name, {bridge.name}});
        }
    }
}

/** What this program itself has written down of what it had read and done. */
void MakeRecordPossible(InterfaceRecord& record)
{
    MakePossible(record.formerSettings);
    MakePossible(record.ownSettings);
    KeepLinkAddress(record.ownMac);
    record.resolver = HasControls(record.resolver) ? std::string() : record.resolver;
}

void MakeRecordsPossible(Inputs& inputs)
{
    const auto isNamed = [](const auto& entry) { return IsInterfaceName(entry.first); };
    std::erase_if(inputs.runState.interfaces, std::not_fn(isNamed));
    std::erase_if(inputs.clients, std::not_fn(isNamed));
    std::erase_if(inputs.formerBonds, std::not_fn(isNamed));
    for (auto& [name, record] : inputs.runState.interfaces) {
        MakeRecordPossible(record);
    }
    for (auto& [name, client] : inputs.clients) {
        std::erase_if(client.options, HasControls); // each is a line of a file
    }
    for (auto& [name, former] : inputs.formerBonds) {
        KeepLinkAddress(former.bond.mac);
        KeepWords(former.columns);
    }
    std::erase_if(inputs.handover.tags,
                  [](const auto& tag) { return tag.second > unsigned{kMostVlan}; });
    for (auto& [name, bond] : inputs.handover.bonds) {
        KeepLinkAddress(bond.mac);
    }
}

/** The command line takes names of interfaces only, and makes plain ones of them. */
void MakeRequestPossible(Request& request)
{
    std::set<std::string> names;
    for (const std::string& name : request.names) {
        if (IsInterfaceName(name)) {
            names.insert(PlainOf(name));
        }
    }
    request.names = names;
}

} // namespace

void MakePossible(Inputs& inputs)
{
    std::erase_if(inputs.files, [](const auto& entry) {
        return InterfaceOfFileName("ifcfg-" + entry.first) != entry.first;
    });
    Links(inputs.live).MakePossible();
    MakeAddressesPossible(inputs.live);
    MakeRoutesPossible(inputs.live);
    MakeNeighboursPossible(inputs.live);
    MakeSettingsPossible(inputs.live);
    MakeSwitchPossible(inputs.switchState);
    MakeRecordsPossible(inputs);
    MakeRequestPossible(inputs.request);
}

} // namespace fuzz
