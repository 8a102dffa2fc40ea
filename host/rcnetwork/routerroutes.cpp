#include "routeplan.h"

#include "ipcommand.h"

#include <algorithm>

#include <linux/rtnetlink.h>
#include <sys/socket.h>

namespace vornhost {
namespace {

constexpr std::uint32_t kUsualMetric = 1024;

std::string SettingOf(const LiveState& live, const std::string& interface, const char* setting)
{
    const auto settings = live.settings.find(interface);
    if (settings == live.settings.end()) {
        return "";
    }
    const auto value = settings->second.find(setting);
    return value == settings->second.end() ? "" : value->second;
}

std::string LineOf(const std::string& interface, std::uint32_t metric, const Route& route)
{
    return interface + " " + std::to_string(metric) + " " + route.nextHops.front().gateway;
}

} // namespace

/** Where it does not, routes to routers are the kernel's or of somebody before us. */
bool RoutePlanner::ClientHeardRouters(const Unit& unit) const
{
    for (const std::string& name : {unit.carrier, unit.name, unit.bridge}) {
        const auto client = m_inputs.clients.find(name);
        if (client != m_inputs.clients.end()) {
            const ClientOptions& options = client->second.options;
            return std::none_of(options.begin(), options.end(), [](const std::string& option) {
                return option == kOnlyIPv4 || option == "noipv6rs";
            });
        }
    }
    return true;
}

/** The metric that the kernel gives to the routes of routers that it hears for the unit. */
std::uint32_t RoutePlanner::RouterMetric(const Unit& unit, const Route& route) const
{
    if (unit.file != nullptr && unit.file->metric6) {
        return *unit.file->metric6;
    }
    const std::string metric =
        SettingOf(m_inputs.live, m_inputs.live.NameOf(route.nextHops.front().index), kRouterMetric);
    return metric.empty() ? kUsualMetric : static_cast<std::uint32_t>(std::stoul(metric));
}

/** Whether the kernel has made the route of what a router said, and is to hear it again. */
bool RoutePlanner::IsOfRouter(const Unit& unit, const Route& route) const
{
    return route.family == AF_INET6 && route.protocol == RTPROT_RA && route.prefixLength == 0 &&
           route.nextHops.size() == 1 && !route.nextHops.front().gateway.empty() &&
           unit.file != nullptr && unit.addWanted && unit.file->ipv6 &&
           unit.file->autoconf != false && !unit.file->ClientHearsRouters() &&
           SettingOf(m_inputs.live, m_inputs.live.NameOf(route.nextHops.front().index),
                     kAcceptRouters) != "0";
}

/**
 * The kernel does not know a route that it did not make itself: it would let it run out, or end it
 * at the router's next word, and only the word after that would make another one. So what is
 * carried has a metric of its own, and goes when the kernel has made one beside it.
 */
void RoutePlanner::CarryRouterRoute(const Unit& unit, const Route& route)
{
    const std::uint32_t metric = RouterMetric(unit, route);
    Route standIn = route;
    standIn.priority = metric + 1;
    const NameOfIndex nameOf = [&](int) { return unit.carrier; };
    Put(PartsOf(unit), standIn,
        (IsAlone(route) ? "route replace " : "route append ") + RouteArguments(standIn, nameOf));
    RemoveRoute(route);
    m_steps.hearRouters.push_back(LineOf(unit.carrier, metric, route));
}

/** An earlier run may have waited for a router in vain that was heard since. */
void RoutePlanner::TidyRouterRoute(const Unit& unit, const Route& route)
{
    if (!IsOfRouter(unit, route)) {
        return;
    }
    const std::uint32_t metric = RouterMetric(unit, route);
    const NextHop& hop = route.nextHops.front();
    const auto& all = m_inputs.live.routes;
    const bool heard = std::any_of(all.begin(), all.end(), [&](const Route& each) {
        return IsOfRouter(unit, each) && each.priority == metric &&
               each.nextHops.front().index == hop.index &&
               each.nextHops.front().gateway == hop.gateway;
    });
    if (route.priority == metric + 1 && heard) {
        m_steps.hearRouters.push_back(LineOf(unit.carrier, metric, route));
    }
}

} // namespace vornhost
