/**
 * The routes of the host: those that follow interfaces, those that files ask for, those that go.
 */
#ifndef VORNHOST_RCNETWORK_ROUTEPLAN_H
#define VORNHOST_RCNETWORK_ROUTEPLAN_H

#include "unitplan.h"

#include <map>
#include <set>
#include <string>
#include <vector>

namespace vornhost {

class RoutePlanner {
public:
    RoutePlanner(const Inputs& inputs, const std::vector<Unit>& units, Steps& steps);

    /** Adds the steps, and to the units' records the routes that they make. */
    void Run();

private:
    std::vector<Route> WantedRoutes(const Unit& unit) const;
    void AddWantedDefault(const Unit& unit, int family, std::vector<Route>& routes) const;
    void AddStaticRoutes(const Unit& unit, std::vector<Route>& routes) const;
    bool HasAddress(const Unit& unit, const std::string& local) const;
    bool IsOnLink(const Unit& unit, int family, const std::string& gateway) const;
    const Unit* UnitOf(int index) const;
    const Unit* SourceUnitOf(const Route& route) const;
    bool ClientHeardRouters(const Unit& unit) const;
    bool IsLeftByClient(const Unit& unit, const Route& route) const;
    bool IsRecorded(const Unit& unit, const Route& route) const;
    bool IsUnwanted(const Unit& unit, const Route& route) const;
    bool GivesWay(const Unit& unit, const Route& route) const;
    bool IsAlreadyCarried(const Unit& unit, const Route& route) const;
    bool IsAlone(const Route& route) const;
    BatchParts& PartsOf(const Unit& unit) const;
    void PlanLiveRoute(const Route& route);
    void CarryRoute(const Unit& unit, const Route& route);
    std::uint32_t RouterMetric(const Unit& unit, const Route& route) const;
    bool IsOfRouter(const Unit& unit, const Route& route) const;
    void CarryRouterRoute(const Unit& unit, const Route& route);
    void TidyRouterRoute(const Unit& unit, const Route& route);
    void RemoveRoute(const Route& route);
    void RestoreRoute(const Route& route);
    bool IsFlushed(const Route& route) const;
    void MakeWantedRoute(const Unit& unit, const Route& wanted);
    void Put(BatchParts& parts, const Route& route, const std::string& line) const;

    const Inputs& m_inputs;
    const std::vector<Unit>& m_units;
    Steps& m_steps;
    std::map<std::string, std::vector<Route>> m_wanted; ///< By the unit's name.
};

} // namespace vornhost

#endif
