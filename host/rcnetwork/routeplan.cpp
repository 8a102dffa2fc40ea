#include "routeplan.h"

#include "ipcommand.h"

#include <algorithm>
#include <array>

#include <arpa/inet.h>
#include <linux/rtnetlink.h>

namespace vornhost {
namespace {

constexpr unsigned kIpv6DefaultMetric = 1024;
constexpr char kBridgeKind[] = "openvswitch";

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

bool HasHopOnSource(const Route& route, const Unit& unit)
{
    return std::any_of(unit.sources.begin(), unit.sources.end(),
                       [&](const Source& source) { return HasHopOn(route, source.link); });
}

} // namespace

RoutePlanner::RoutePlanner(const Inputs& inputs, const std::vector<Unit>& units, Steps& steps)
    : m_inputs(inputs), m_units(units), m_steps(steps)
{
    for (const Unit& unit : units) {
        m_wanted[unit.name] = WantedRoutes(unit);
    }
}

bool RoutePlanner::IsOnLink(const Unit& unit, int family, const std::string& gateway) const
{
    if (family == AF_INET6 && SamePrefix(AF_INET6, gateway, "fe80::", 10)) {
        return true;
    }
    for (const WantedAddress& wanted : unit.file->addresses) {
        if (wanted.family == family &&
            SamePrefix(family, wanted.local, gateway, wanted.prefixLength)) {
            return true;
        }
    }
    return std::any_of(m_inputs.live.addresses.begin(), m_inputs.live.addresses.end(),
                       [&](const Address& live) {
                           return UnitOf(live.index) == &unit && live.family == family &&
                                  SamePrefix(family, live.peer.empty() ? live.local : live.peer,
                                             gateway, live.prefixLength);
                       });
}

void RoutePlanner::AddWantedDefault(const Unit& unit, int family, std::vector<Route>& routes) const
{
    const AddressFamily storeFamily =
        family == AF_INET ? AddressFamily::kIPv4 : AddressFamily::kIPv6;
    const InterfaceFile& file = *unit.file;
    std::string gateway = family == AF_INET ? file.gateway : file.gateway6;
    std::optional<unsigned> metric =
        family == AF_INET6 && file.metric6 ? file.metric6 : file.metric;
    const std::string& holder = unit.target == Target::kSwitch ? unit.bridge : unit.name;
    for (const GatewayRecord& record : m_inputs.gateways) {
        if (record.interface == holder && record.family == storeFamily) {
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
    hop.onLink = !IsOnLink(unit, family, gateway);
    route.nextHops.push_back(std::move(hop));
    routes.push_back(std::move(route));
}

/** Whether the unit has the address, now or as its file asks. */
bool RoutePlanner::HasAddress(const Unit& unit, const std::string& local) const
{
    const auto& wanted = unit.file->addresses;
    const auto& live = m_inputs.live.addresses;
    return std::any_of(wanted.begin(), wanted.end(),
                       [&](const WantedAddress& each) { return each.local == local; }) ||
           std::any_of(live.begin(), live.end(), [&](const Address& each) {
               return UnitOf(each.index) == &unit && each.local == local;
           });
}

/** A route from an address that is not there yet has to wait for it. */
void RoutePlanner::AddStaticRoutes(const Unit& unit, std::vector<Route>& routes) const
{
    for (Route route : unit.file->routes) {
        if (!route.source.empty() && !HasAddress(unit, route.source)) {
            continue;
        }
        for (NextHop& hop : route.nextHops) {
            hop.onLink = hop.onLink ||
                         (!hop.gateway.empty() && !IsOnLink(unit, hop.gatewayFamily, hop.gateway));
        }
        routes.push_back(route);
    }
}

std::vector<Route> RoutePlanner::WantedRoutes(const Unit& unit) const
{
    std::vector<Route> routes;
    if (unit.file != nullptr) {
        AddWantedDefault(unit, AF_INET, routes);
        AddWantedDefault(unit, AF_INET6, routes);
        AddStaticRoutes(unit, routes);
    }
    return routes;
}

const Unit* RoutePlanner::UnitOf(int index) const
{
    const auto found = std::find_if(m_units.begin(), m_units.end(), [&](const Unit& unit) {
        return (unit.port != nullptr && unit.port->index == index) ||
               (unit.bridgeLink != nullptr && unit.bridgeLink->index == index) ||
               (unit.carrierLink != nullptr && unit.carrierLink->index == index) ||
               unit.SourceOf(index) != nullptr;
    });
    return found == m_units.end() ? nullptr : &*found;
}

/** @return  the first unit from whose source the route leaves, null when it needs no move. */
const Unit* RoutePlanner::SourceUnitOf(const Route& route) const
{
    const auto found = std::find_if(m_units.begin(), m_units.end(),
                                    [&](const Unit& unit) { return HasHopOnSource(route, unit); });
    return found == m_units.end() ? nullptr : &*found;
}

/** Whether an earlier run made the route for this unit or one that it takes over. */
bool RoutePlanner::IsRecorded(const Unit& unit, const Route& route) const
{
    const auto has = [&](const std::string& name) {
        const auto record = m_inputs.runState.interfaces.find(name);
        return record != m_inputs.runState.interfaces.end() &&
               record->second.routes.contains(RouteKeyText(route));
    };
    return has(unit.name) || std::any_of(unit.absorbed.begin(), unit.absorbed.end(), has);
}

/** Whether a client of this unit made the route that is not to run any more. */
bool RoutePlanner::IsLeftByClient(const Unit& unit, const Route& route) const
{
    const auto had = [&](const std::string& name) {
        const auto record = m_inputs.runState.interfaces.find(name);
        return record != m_inputs.runState.interfaces.end() && record->second.client;
    };
    if (!had(unit.name) && std::none_of(unit.absorbed.begin(), unit.absorbed.end(), had)) {
        return false;
    }
    const bool served = route.protocol == RTPROT_DHCP && route.family == AF_INET;
    const bool heard = route.family == AF_INET6 &&
                       (route.protocol == RTPROT_RA || route.protocol == RTPROT_DHCP) &&
                       ClientHeardRouters(unit);
    const bool serves = !unit.takeDown && unit.file != nullptr && unit.file->client.dhcp;
    const bool hears = !unit.takeDown && unit.file != nullptr && unit.file->ClientHearsRouters();
    return (served && !serves) || (heard && !hears);
}

/** Made by an earlier run, and nothing asks for it any more. */
bool RoutePlanner::IsUnwanted(const Unit& unit, const Route& route) const
{
    if (unit.removeUnwanted && IsLeftByClient(unit, route)) {
        return true;
    }
    if (!unit.removeUnwanted || !IsRecorded(unit, route)) {
        return false;
    }
    const auto& wanted = m_wanted.at(unit.name);
    return unit.takeDown || std::none_of(wanted.begin(), wanted.end(), [&](const Route& each) {
               return RouteKeyText(each) == RouteKeyText(route);
           });
}

/** Whether a route that is asked for replaces this one, because only one of them can be in use. */
bool RoutePlanner::GivesWay(const Unit& unit, const Route& route) const
{
    const auto& wanted = m_wanted.at(unit.name);
    return unit.addWanted && std::any_of(wanted.begin(), wanted.end(), [&](const Route& each) {
               return RouteSlot(each) == RouteSlot(route) &&
                      RouteKeyText(each) != RouteKeyText(route);
           });
}

bool RoutePlanner::IsAlreadyCarried(const Unit& unit, const Route& route) const
{
    const auto& all = m_inputs.live.routes;
    return std::any_of(all.begin(), all.end(), [&](const Route& each) {
        return RouteKeyText(each) == RouteKeyText(route) && HasHopOn(each, unit.carrierLink);
    });
}

bool RoutePlanner::IsAlone(const Route& route) const
{
    const auto& all = m_inputs.live.routes;
    return std::count_if(all.begin(), all.end(), [&](const Route& each) {
               return RouteSlot(each) == RouteSlot(route);
           }) == 1;
}

/**
 * Onto the switch routes follow their port; back they are there before it leaves, and before a
 * bridge that goes as a whole has gone.
 */
BatchParts& RoutePlanner::PartsOf(const Unit& unit) const
{
    const bool follows =
        unit.target == Target::kSwitch &&
        std::none_of(unit.sources.begin(), unit.sources.end(), [](const Source& source) {
            return !source.stays && source.link->kind == kBridgeKind;
        });
    return follows || unit.late ? m_steps.move : m_steps.beside;
}

/** The default routes come last, when everything that leads to their gateways stands. */
void RoutePlanner::Put(BatchParts& parts, const Route& route, const std::string& line) const
{
    (route.prefixLength == 0 ? parts.defaultRoutes : parts.routes).push_back(line);
}

void RoutePlanner::RemoveRoute(const Route& route)
{
    const Unit* source = SourceUnitOf(route);
    if (source != nullptr &&
        std::none_of(route.nextHops.begin(), route.nextHops.end(), [&](const NextHop& hop) {
            const Source* from = source->SourceOf(hop.index);
            return from == nullptr || from->stays;
        })) {
        return; // it goes with its interface
    }
    const NameOfIndex nameOf = [&](int index) { return m_inputs.live.NameOf(index); };
    m_steps.move.removedRoutes.push_back("route del " + RouteArguments(route, nameOf));
}

void RoutePlanner::CarryRoute(const Unit& unit, const Route& route)
{
    const NameOfIndex nameOf = [&](int index) {
        const Unit* owner = UnitOf(index);
        return owner == nullptr ? m_inputs.live.NameOf(index) : owner->carrier;
    };
    if (IsAlreadyCarried(unit, route)) {
        RemoveRoute(route);
        return;
    }
    if (IsOfRouter(unit, route)) {
        CarryRouterRoute(unit, route);
        return;
    }
    // A replacement never leaves a moment without the route, but takes the first one of its slot.
    const bool alone = IsAlone(route);
    Put(PartsOf(unit), route,
        (alone ? "route replace " : "route append ") + RouteArguments(route, nameOf));
    if (!alone) {
        RemoveRoute(route);
    }
}

void RoutePlanner::PlanLiveRoute(const Route& route)
{
    const Unit* source = SourceUnitOf(route);
    const Unit* unit = source;
    if (unit == nullptr && route.nextHops.size() == 1) {
        unit = UnitOf(route.nextHops[0].index);
    }
    if (route.nextHops.empty()) {
        if (std::any_of(m_units.begin(), m_units.end(),
                        [&](const Unit& each) { return IsUnwanted(each, route); })) {
            RemoveRoute(route);
        }
        return;
    }
    if (unit == nullptr) {
        RestoreRoute(route);
        return;
    }
    if (GivesWay(*unit, route)) {
        return;
    }
    if (IsUnwanted(*unit, route)) {
        RemoveRoute(route);
    } else if (source != nullptr) {
        CarryRoute(*source, route);
    } else {
        TidyRouterRoute(*unit, route);
        RestoreRoute(route);
    }
}

void RoutePlanner::RestoreRoute(const Route& route)
{
    if (IsFlushed(route)) {
        const NameOfIndex nameOf = [&](int index) { return m_inputs.live.NameOf(index); };
        Put(m_steps.beside, route,
            (IsAlone(route) ? "route replace " : "route append ") + RouteArguments(route, nameOf));
    }
}

/** Whether the kernel forgets the route because its interface is down for a moment. */
bool RoutePlanner::IsFlushed(const Route& route) const
{
    return std::any_of(m_units.begin(), m_units.end(), [&](const Unit& unit) {
        if (!unit.changesMode) {
            return false;
        }
        const auto names = m_inputs.live.WithVlans(*unit.port);
        return std::any_of(route.nextHops.begin(), route.nextHops.end(), [&](const NextHop& hop) {
            return std::find(names.begin(), names.end(), m_inputs.live.NameOf(hop.index)) !=
                   names.end();
        });
    });
}

void RoutePlanner::MakeWantedRoute(const Unit& unit, const Route& wanted)
{
    const auto& all = m_inputs.live.routes;
    bool slotIsElsewhere = false;
    for (const Route& live : all) {
        const bool here = HasHopOn(live, unit.carrierLink) || HasHopOnSource(live, unit) ||
                          (live.nextHops.empty() && wanted.nextHops.empty());
        if (here && RouteKeyText(live) == RouteKeyText(wanted)) {
            return;
        }
        slotIsElsewhere = slotIsElsewhere || (!here && RouteSlot(live) == RouteSlot(wanted));
    }
    const NameOfIndex nameOf = [&](int) { return unit.carrier; };
    Put(PartsOf(unit), wanted,
        (slotIsElsewhere ? "route append " : "route replace ") + RouteArguments(wanted, nameOf));
    m_steps.records[unit.name].routes.insert(RouteKeyText(wanted));
}

void RoutePlanner::Run()
{
    for (const Unit& unit : m_units) {
        if (unit.removeUnwanted) {
            std::erase_if(m_steps.records[unit.name].routes, [&](const std::string& key) {
                const auto& wanted = m_wanted.at(unit.name);
                return std::none_of(wanted.begin(), wanted.end(),
                                    [&](const Route& each) { return RouteKeyText(each) == key; });
            });
        }
    }
    for (const Route& route : m_inputs.live.routes) {
        PlanLiveRoute(route);
    }
    for (const Unit& unit : m_units) {
        for (const Route& wanted : m_wanted.at(unit.name)) {
            if (unit.addWanted) {
                MakeWantedRoute(unit, wanted);
            }
        }
    }
}

} // namespace vornhost
