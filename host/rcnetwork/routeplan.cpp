#include "routeplan.h"

#include "ipcommand.h"

#include <algorithm>
#include <array>

#include <arpa/inet.h>
#include <linux/rtnetlink.h>

namespace vornhost {
namespace {

constexpr unsigned kIpv6DefaultMetric = 1024;

/** Whether the first bits of two addresses are the same. */
bool SamePrefix(int family, const std::string& one, const std::string& other, unsigned length)
{
    std::array<unsigned char, sizeof(in6_addr)> oneBytes{};
    std::array<unsigned char, sizeof(in6_addr)> otherBytes{};
    if (inet_pton(family, one.c_str(), oneBytes.data()) != 1 ||
        inet_pton(family, other.c_str(), otherBytes.data()) != 1) {
        return false;
    }
    for (unsigned bit = 0; bit < length; ++bit) {
        const unsigned mask = 0x80U >> (bit % 8);
        if (((oneBytes.at(bit / 8) ^ otherBytes.at(bit / 8)) & mask) != 0) {
            return false;
        }
    }
    return true;
}

bool HasHopOn(const Route& route, const Link* link)
{
    return link != nullptr &&
           std::any_of(route.nextHops.begin(), route.nextHops.end(),
                       [&](const NextHop& hop) { return hop.index == link->index; });
}

} // namespace

RoutePlanner::RoutePlanner(const Inputs& inputs, const std::vector<Pair>& pairs, Steps& steps)
    : m_inputs(inputs), m_pairs(pairs), m_steps(steps)
{
    for (const Pair& pair : pairs) {
        m_wanted[pair.name] = WantedRoutes(pair);
    }
}

bool RoutePlanner::IsOnLink(const Pair& pair, int family, const std::string& gateway) const
{
    if (family == AF_INET6 && SamePrefix(AF_INET6, gateway, "fe80::", 10)) {
        return true;
    }
    for (const WantedAddress& wanted : pair.file->addresses) {
        if (wanted.family == family &&
            SamePrefix(family, wanted.local, gateway, wanted.prefixLength)) {
            return true;
        }
    }
    return std::any_of(m_inputs.live.addresses.begin(), m_inputs.live.addresses.end(),
                       [&](const Address& live) {
                           return PairOf(live.index) == &pair && live.family == family &&
                                  SamePrefix(family, live.peer.empty() ? live.local : live.peer,
                                             gateway, live.prefixLength);
                       });
}

void RoutePlanner::AddWantedDefault(const Pair& pair, int family, std::vector<Route>& routes) const
{
    const AddressFamily storeFamily =
        family == AF_INET ? AddressFamily::kIPv4 : AddressFamily::kIPv6;
    std::string gateway = family == AF_INET ? pair.file->gateway : pair.file->gateway6;
    std::optional<unsigned> metric = pair.file->metric;
    for (const GatewayRecord& record : m_inputs.gateways) {
        if (record.interface == pair.TargetName() && record.family == storeFamily) {
            gateway = record.gateway.address;
            metric = record.gateway.metric ? record.gateway.metric : metric;
        }
    }
    if (gateway.empty()) {
        return;
    }
    Route route;
    route.family = family;
    route.table = RT_TABLE_MAIN;
    route.protocol = RTPROT_STATIC;
    route.priority = metric.value_or(family == AF_INET ? 0 : kIpv6DefaultMetric);
    NextHop hop;
    hop.gateway = gateway;
    hop.gatewayFamily = family;
    hop.onLink = !IsOnLink(pair, family, gateway);
    route.nextHops.push_back(std::move(hop));
    routes.push_back(std::move(route));
}

std::vector<Route> RoutePlanner::WantedRoutes(const Pair& pair) const
{
    std::vector<Route> routes;
    if (pair.file != nullptr) {
        AddWantedDefault(pair, AF_INET, routes);
        AddWantedDefault(pair, AF_INET6, routes);
    }
    return routes;
}

const Pair* RoutePlanner::PairOf(int index) const
{
    const auto found = std::find_if(m_pairs.begin(), m_pairs.end(), [&](const Pair& pair) {
        return pair.port->index == index ||
               (pair.bridgeLink != nullptr && pair.bridgeLink->index == index);
    });
    return found == m_pairs.end() ? nullptr : &*found;
}

/** @return  the first pair from whose source the route leaves, null when it needs no move. */
const Pair* RoutePlanner::SourcePairOf(const Route& route) const
{
    const auto found = std::find_if(m_pairs.begin(), m_pairs.end(), [&](const Pair& pair) {
        return HasHopOn(route, pair.SourceLink());
    });
    return found == m_pairs.end() ? nullptr : &*found;
}

/** Made by an earlier run, and nothing asks for it any more. */
bool RoutePlanner::IsUnwanted(const Pair& pair, const Route& route) const
{
    const auto record = m_inputs.runState.interfaces.find(pair.name);
    if (!pair.removeUnwanted || record == m_inputs.runState.interfaces.end() ||
        !record->second.routes.contains(RouteKeyText(route))) {
        return false;
    }
    const auto& wanted = m_wanted.at(pair.name);
    return pair.takeDown || std::none_of(wanted.begin(), wanted.end(), [&](const Route& each) {
               return RouteKeyText(each) == RouteKeyText(route);
           });
}

/** Whether a route that is asked for replaces this one, because only one of them can be in use. */
bool RoutePlanner::GivesWay(const Pair& pair, const Route& route) const
{
    const auto& wanted = m_wanted.at(pair.name);
    return pair.addWanted && std::any_of(wanted.begin(), wanted.end(), [&](const Route& each) {
               return RouteSlot(each) == RouteSlot(route) &&
                      RouteKeyText(each) != RouteKeyText(route);
           });
}

bool RoutePlanner::IsAlreadyCarried(const Pair& pair, const Route& route) const
{
    const auto& all = m_inputs.live.routes;
    return std::any_of(all.begin(), all.end(), [&](const Route& each) {
        return RouteKeyText(each) == RouteKeyText(route) && HasHopOn(each, pair.TargetLink());
    });
}

bool RoutePlanner::IsAlone(const Route& route) const
{
    const auto& all = m_inputs.live.routes;
    return std::count_if(all.begin(), all.end(), [&](const Route& each) {
               return RouteSlot(each) == RouteSlot(route);
           }) == 1;
}

/** Onto the switch routes follow their port; back they are there before it leaves. */
BatchParts& RoutePlanner::PartsOf(const Pair& pair) const
{
    return pair.target == Target::kSwitch ? m_steps.move : m_steps.beside;
}

/** The default routes come last, when everything that leads to their gateways stands. */
void RoutePlanner::Put(BatchParts& parts, const Route& route, const std::string& line) const
{
    (route.prefixLength == 0 ? parts.defaultRoutes : parts.routes).push_back(line);
}

void RoutePlanner::RemoveRoute(const Route& route)
{
    const Pair* source = SourcePairOf(route);
    if (source != nullptr && !source->SourceStays()) {
        return; // it goes with its interface
    }
    const NameOfIndex nameOf = [&](int index) { return m_inputs.live.NameOf(index); };
    m_steps.move.removedRoutes.push_back("route del " + RouteArguments(route, nameOf));
}

void RoutePlanner::CarryRoute(const Pair& pair, const Route& route)
{
    const NameOfIndex nameOf = [&](int index) {
        const Pair* owner = PairOf(index);
        return owner == nullptr ? m_inputs.live.NameOf(index) : owner->TargetName();
    };
    if (IsAlreadyCarried(pair, route)) {
        RemoveRoute(route);
        return;
    }
    // A replacement never leaves a moment without the route, but takes the first one of its slot.
    const bool alone = IsAlone(route);
    Put(PartsOf(pair), route,
        (alone ? "route replace " : "route append ") + RouteArguments(route, nameOf));
    if (!alone) {
        RemoveRoute(route);
    }
}

void RoutePlanner::PlanLiveRoute(const Route& route)
{
    const Pair* source = SourcePairOf(route);
    const Pair* pair = source;
    if (pair == nullptr && route.nextHops.size() == 1) {
        pair = PairOf(route.nextHops[0].index);
    }
    if (pair == nullptr || GivesWay(*pair, route)) {
        return;
    }
    if (IsUnwanted(*pair, route)) {
        RemoveRoute(route);
    } else if (source != nullptr) {
        CarryRoute(*source, route);
    }
}

void RoutePlanner::MakeWantedRoute(const Pair& pair, const Route& wanted)
{
    const auto& all = m_inputs.live.routes;
    bool slotIsElsewhere = false;
    for (const Route& live : all) {
        const bool here = HasHopOn(live, pair.TargetLink()) || HasHopOn(live, pair.SourceLink());
        if (here && RouteKeyText(live) == RouteKeyText(wanted)) {
            return;
        }
        slotIsElsewhere = slotIsElsewhere || (!here && RouteSlot(live) == RouteSlot(wanted));
    }
    const NameOfIndex nameOf = [&](int) { return pair.TargetName(); };
    Put(PartsOf(pair), wanted,
        (slotIsElsewhere ? "route append " : "route replace ") + RouteArguments(wanted, nameOf));
    m_steps.records[pair.name].routes.insert(RouteKeyText(wanted));
}

void RoutePlanner::Run()
{
    for (const Pair& pair : m_pairs) {
        if (pair.removeUnwanted) {
            std::erase_if(m_steps.records[pair.name].routes, [&](const std::string& key) {
                const auto& wanted = m_wanted.at(pair.name);
                return std::none_of(wanted.begin(), wanted.end(),
                                    [&](const Route& each) { return RouteKeyText(each) == key; });
            });
        }
    }
    for (const Route& route : m_inputs.live.routes) {
        PlanLiveRoute(route);
    }
    for (const Pair& pair : m_pairs) {
        for (const Route& wanted : m_wanted.at(pair.name)) {
            if (pair.addWanted) {
                MakeWantedRoute(pair, wanted);
            }
        }
    }
}

} // namespace vornhost
