/**
 * The routes of the host: those that follow interfaces, those that files ask for, those that go.
 */
#ifndef VORNHOST_RCNETWORK_ROUTEPLAN_H
#define VORNHOST_RCNETWORK_ROUTEPLAN_H

#include "pairplan.h"

#include <map>
#include <set>
#include <string>
#include <vector>

namespace vornhost {

class RoutePlanner {
public:
    RoutePlanner(const Inputs& inputs, const std::vector<Pair>& pairs, Steps& steps);

    /** Adds the steps, and to the pairs' records the routes that they make. */
    void Run();

private:
    std::vector<Route> WantedRoutes(const Pair& pair) const;
    void AddWantedDefault(const Pair& pair, int family, std::vector<Route>& routes) const;
    bool IsOnLink(const Pair& pair, int family, const std::string& gateway) const;
    const Pair* PairOf(int index) const;
    const Pair* SourcePairOf(const Route& route) const;
    bool IsUnwanted(const Pair& pair, const Route& route) const;
    bool GivesWay(const Pair& pair, const Route& route) const;
    bool IsAlreadyCarried(const Pair& pair, const Route& route) const;
    bool IsAlone(const Route& route) const;
    BatchParts& PartsOf(const Pair& pair) const;
    void PlanLiveRoute(const Route& route);
    void CarryRoute(const Pair& pair, const Route& route);
    void RemoveRoute(const Route& route);
    void MakeWantedRoute(const Pair& pair, const Route& wanted);
    void Put(BatchParts& parts, const Route& route, const std::string& line) const;

    const Inputs& m_inputs;
    const std::vector<Pair>& m_pairs;
    Steps& m_steps;
    std::map<std::string, std::vector<Route>> m_wanted; ///< By the pair's name.
};

} // namespace vornhost

#endif
