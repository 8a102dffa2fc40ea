/**
 * The steps of one unit, sorted by the stage in which the whole host takes them.
 */
#ifndef VORNHOST_RCNETWORK_UNITPLAN_H
#define VORNHOST_RCNETWORK_UNITPLAN_H

#include "decision.h"

#include "support/bondoptions.h"

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
    BatchParts creation; ///< Devices that have settings before they are up.
    std::vector<std::string> creationSettings;
    bool needsSwitch = false;
    std::vector<std::string> makeBridges;
    std::vector<std::string> waitFor;
    BatchParts devices; ///< Bonds and VLANs that are missing, members that leave or join early.
    std::vector<std::string> readyBefore;
    std::vector<std::string> endClients;
    std::vector<std::string> settingsBefore;
    std::vector<std::string> cards;
    BatchParts beside;      ///< Made while traffic still takes its former way.
    BatchParts replacement; ///< Devices that have settings and can be made late only.
    std::vector<std::string> replacementSettings;
    std::vector<std::string> leave;
    std::vector<std::string> join;
    BatchParts move; ///< Follows the ports.
    std::vector<std::string> announce;
    std::vector<std::string> hearRouters;
    std::vector<std::string> removeBridges;
    BatchParts tidy; ///< What no traffic waits for.
    std::vector<std::string> readyAfter;
    BatchParts order; ///< Members that join anew, because of their order.
    std::vector<std::string> announceAgain;
    std::vector<std::string> settingsAfter;
    BatchParts finish; ///< What needs those settings.
    std::vector<std::string> resolver;
    std::vector<std::string> negotiate;
    std::vector<std::string> startClients;
    std::vector<std::string> forgetGateways;
    std::map<std::string, InterfaceRecord> records; ///< What is made once they are done.
};

class PortColumns;

/** Plans one unit. */
class UnitPlanner {
public:
    UnitPlanner(const Inputs& inputs, const Kinship& kinship, const Unit& unit, Steps& steps,
                std::vector<Remark>& remarks);

    /** Adds the steps of everything but the routes. */
    void Run();

private:
    const std::string& Carrier() const { return m_unit.carrier; }
    bool ToSwitch() const { return m_unit.target == Target::kSwitch; }
    /** Where what the carrier is to carry is put on it: beside traffic, or when it can do so. */
    BatchParts& Build() const { return m_unit.late ? m_steps.move : m_steps.beside; }
    std::string MainSource() const;
    bool WireHasCarrier() const;
    bool HasGlobalAddress(const Link* link) const;
    InterfaceRecord FormerRecord(const std::string& name) const;
    void AbsorbRecords();
    void KeepRecordsOfOthers();
    std::string Live(const std::string& interface, const std::string& setting) const;

    // unitswitch.cpp: bridges and ports
    void PlanBridge();
    void MakeBridge();
    void AdjustBridge();
    void LeaveBridges();
    void LeaveBridge(const SwitchBridge& bridge, const Unit& owner);
    void JoinPort();
    void JoinBond();
    void RemarkOn(const PortColumns& columns);
    void AdjustMembers(const SwitchPort& live, const std::vector<std::string>& members);
    void ForgetGateways(const std::string& bridge);
    const FormerBond* Remembered() const;
    std::string WantedMac() const;
    unsigned WantedMtu() const;

    // unitdevices.cpp: VLANs of the kernel
    void PlanDevices();
    bool BringsLinkLocal() const;
    bool IsReplaced() const;
    bool Quiet(const std::string& device);
    void MakeVlan(const std::string& device, const std::string& parent, unsigned id);
    void RemoveOldVlans();

    // unitbond.cpp: bonds of the kernel
    void MakeBond();
    bool IsMissing(const Link& member) const;
    void Gather();
    void GatherMember(const Link& member, std::vector<std::string>& lines);
    void PutInOrder();
    void AnnounceAgain();
    void AdjustBondOptions();
    void ChangeMode(const LiveBond& live, const BondOptions& options);
    void DissolveBonds();
    void DissolveBond(const std::string& bond);
    bool IsMember(const std::string& name) const;
    bool IsIdle(const Link* member) const;
    void ReleaseMember(const std::string& bond, const std::string& member,
                       std::vector<std::string>& lines);

    // unitbridge.cpp: bridges of the kernel, and what shares a bridge of the switch
    void PlanLinuxBridge();
    void MakeLinuxBridge();
    void ReleasePorts(const std::string& bridge);
    void JoinFurtherPorts();
    void LeaveFurtherPorts();

    // unitsettings.cpp: links and the kernel's settings of an interface
    void PlanLinks();
    void PlanLink(const Link& link);
    void PlanFormerLink();
    void PlanFormerLink(const std::string& name);
    bool IsReleased(const Link& link) const;
    std::vector<std::string>& Settings() const;
    void CarrySettings();
    void KeepOwnSetting(const std::string& setting);
    void ReturnSettings();
    void MoveIpv6Stack();
    void SilencePorts();
    void SilencePort(const Link& port);
    void SilenceMember(const Link& member);
    void RestorePort(const std::string& name);
    void Set(std::vector<std::string>& stage, const std::string& interface,
             const std::string& setting, const std::string& value) const;

    // unitidentity.cpp: how addresses are made of what routers say
    bool GoesWithoutIpv6() const;
    void PlanAutoconf();
    void PlanLinkLocal();
    void WantSetting(const std::string& setting, const std::string& wanted);
    std::vector<WantedAddress> WantedAddresses() const;
    bool HasOwnLinkLocal() const;

    // unitcard.cpp, unitresolver.cpp: what stays with a card, and who resolves names
    void PlanCards();
    void PlanCard(const Link& link);
    void PlanResolver();

    // unitaddresses.cpp: addresses and neighbours
    void PlanAddresses();
    void CarryAddresses();
    bool IsGathered(const Link& link) const;
    void CarryAddressesOf(const Source& source);
    void CarryAddress(const Address& address, const Source& source);
    void SettleAddresses();
    bool IsCarried(const Address& address) const;
    bool IsLent(const Address& address) const;
    void KeepForGood(const Address& address);
    void AddWantedAddress(const WantedAddress& wanted);
    void RemoveAddresses();
    void RemoveAddress(const Address& address, const std::string& interface);
    bool IsWanted(const Address& address) const;
    bool IsUnwanted(const Address& address) const;
    const Address* FindOn(const Link* link, const Address& like) const;
    void CarryNeighbours();

    // unitclient.cpp: the DHCP client
    void PlanClient();
    void EndClient(const std::string& name, const char* verb);
    std::vector<std::string> ClientNames() const;
    std::vector<std::string> LostClients(const ClientOptions& wanted) const;
    std::vector<std::string> OtherClients() const;
    ClientOptions WantedClient() const;
    ClientPlace PlaceOfClient() const;
    const Link* CardOf(const std::string& name) const;
    bool ClientHasIpv6() const;
    bool HadClientFor(int family) const;
    bool IsLeftByClient(const Address& address) const;
    void CheckMetrics() const;

    const Inputs& m_inputs;
    const Kinship& m_kinship;
    const Unit& m_unit;
    Steps& m_steps;
    std::vector<Remark>& m_remarks;
    InterfaceRecord m_former;
    InterfaceRecord m_record;
    std::set<std::string> m_carried; ///< Addresses that are on their way to the carrier.
    bool m_quiet = false;            ///< The carrier hears routers only in the end.
    bool m_moves = false;            ///< What the source carries goes to the target.
};

} // namespace vornhost

#endif
