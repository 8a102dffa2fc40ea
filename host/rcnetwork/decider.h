/**
 * Decides one unit: first what its files ask for, then whether what is live allows that.
 */
#ifndef VORNHOST_RCNETWORK_DECIDER_H
#define VORNHOST_RCNETWORK_DECIDER_H

#include "kinship.h"
#include "unit.h"

namespace vornhost {

/** The kernel's interface that every port of the switch has for its master. */
constexpr char kDatapathLink[] = "ovs-system";

/** Decides one unit. */
class Decider {
public:
    Decider(const Inputs& inputs, const Kinship& kinship, const std::string& name,
            std::vector<Remark>& remarks);
    Unit Decide();

private:
    // decider.cpp: what is asked for
    void Say(Severity severity, const std::string& text) { m_remarks.push_back({severity, text}); }
    void ReadKind();
    void ReadMembers();
    void ReadFurtherPorts();
    bool IsWorkingPort(const Link& link, const SwitchPort& port) const;
    bool IsJoined() const;
    bool IsOurs() const;
    bool BridgeIsLive() const;
    bool NothingIsLive() const;
    bool IsPartOfABond() const;
    void ChooseForStop();
    void ChooseForStart();
    void ChooseWithoutBridgeFile();
    void ChooseForIdleBridge(const InterfaceFile& file);
    bool NamesUnknownBridge(const InterfaceFile& file) const;
    void ChooseTag();

    // deciderchecks.cpp: what is possible
    void SayTaken(Severity severity, const std::string& port, const std::string& owner);
    void GiveUpOnForeignBridge();
    void CheckPort();
    bool IsAsked() const;
    bool HasRequiredMac() const;
    void CheckMaster();
    bool IsOwnMaster(const std::string& master) const;
    void RespectOnBoot();
    void CheckSwitch();

    const Inputs& m_inputs;
    const Kinship& m_kinship;
    std::vector<Remark>& m_remarks;
    Unit m_unit;
    const SwitchBridge* m_anyBridge = nullptr;
};

} // namespace vornhost

#endif
