/**
 * The steps of one interface and its bridge, sorted by the stage in which the whole host takes
 * them.
 */
#ifndef VORNHOST_RCNETWORK_PAIRPLAN_H
#define VORNHOST_RCNETWORK_PAIRPLAN_H

#include "decision.h"

#include <string>
#include <vector>

namespace vornhost {

/** One "ip -batch", in the order in which its parts run. */
struct BatchParts {
    std::vector<std::string> links;
    std::vector<std::string> addresses;
    std::vector<std::string> neighbours;
    std::vector<std::string> routes;
    std::vector<std::string> defaultRoutes;
    std::vector<std::string> removedRoutes;
    std::vector<std::string> removedNeighbours;
    std::vector<std::string> removedAddresses;
    std::vector<std::string> linksDown;

    std::vector<std::string> Lines() const;
};

/** What every interface contributes to the stages of the host's plan. */
struct Steps {
    bool needsSwitch = false;
    std::vector<std::string> makeBridges;
    std::vector<std::string> waitFor;
    std::vector<std::string> settingsBefore;
    BatchParts beside; ///< Made while traffic still takes its former way.
    std::vector<std::string> joinAndLeave;
    BatchParts move; ///< Follows the ports.
    std::vector<std::string> settingsAfter;
    std::vector<std::string> forgetGateways;
    std::map<std::string, InterfaceRecord> records; ///< What is made once they are done.
};

/** Plans one pair. */
class PairPlanner {
public:
    PairPlanner(const Inputs& inputs, const Pair& pair, Steps& steps, std::vector<Remark>& remarks);

    /** Adds the steps of everything but the routes. */
    void Run();

private:
    const std::string& Target() const { return m_pair.TargetName(); }
    const std::string& Source() const { return m_pair.SourceName(); }
    bool ToSwitch() const { return m_pair.target == vornhost::Target::kSwitch; }
    std::string Live(const std::string& interface, const std::string& setting) const;

    // pairswitch.cpp: bridges and ports
    void PlanBridge();
    void MakeBridge();
    void AdjustBridge();
    void LeaveBridge();
    unsigned WantedMtu() const;

    // pairsettings.cpp: links and the kernel's settings of an interface
    void PlanLinks();
    void PlanFormerLink();
    void CarrySettings();
    void MoveIpv6Stack();
    void KeepIpv6Stack();
    void PlanAutoconf();
    void Set(std::vector<std::string>& stage, const std::string& interface,
             const std::string& setting, const std::string& value) const;

    // pairaddresses.cpp: addresses and neighbours
    void PlanAddresses();
    void CarryAddresses();
    void CarryAddress(const Address& address);
    void SettleAddresses();
    bool IsCarried(const Address& address) const;
    void AddWantedAddress(const WantedAddress& wanted);
    void RemoveAddresses();
    void RemoveAddress(const Address& address, const std::string& interface);
    bool IsWanted(const Address& address) const;
    bool IsUnwanted(const Address& address) const;
    const Address* FindOn(const Link* link, const Address& like) const;
    void CarryNeighbours();

    const Inputs& m_inputs;
    const Pair& m_pair;
    Steps& m_steps;
    std::vector<Remark>& m_remarks;
    InterfaceRecord m_former;
    InterfaceRecord m_record;
    bool m_moves = false; ///< What the source carries goes to the target.
};

} // namespace vornhost

#endif
