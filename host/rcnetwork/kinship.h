/**
 * Which interfaces belong together: bonds and their members, VLANs and what they stand on, as the
 * files ask for it and as it is.
 */
#ifndef VORNHOST_RCNETWORK_KINSHIP_H
#define VORNHOST_RCNETWORK_KINSHIP_H

#include "plan.h"

#include "support/tagdevice.h"

namespace vornhost {

/**
 * Everything here is called by its plain name: "bond0" is the kernel's bond of that name, the
 * switch's bond on the bridge "ovs_bond0", or both.
 */
class Kinship {
public:
    explicit Kinship(const Inputs& inputs);

    /** @return  the usable file of that name, null when there is none. */
    const InterfaceFile* UsableFile(const std::string& name) const;
    bool HasFile(const std::string& name) const { return m_inputs.files.contains(name); }
    /** @return  the bridge that stands for an interface. */
    std::string BridgeFor(const std::string& name) const;

    /** Whether a bond of that name is asked for, on the switch or of the kernel. */
    bool IsWantedBond(const std::string& name) const { return m_members.contains(name); }
    /** Whether the file is one of a bond that no other file belongs to: one being moved. */
    bool IsBondWithoutMembers(const std::string& name) const;
    /** Whether it is one of the kernel's bridges; the members are its ports. */
    bool IsWantedLinuxBridge(const std::string& name) const;
    bool IsWantedOnSwitch(const std::string& name) const { return m_switchBonds.contains(name); }
    /** @return  the members that are asked for, in their order, whether they exist or not. */
    std::vector<std::string> MembersOf(const std::string& bond) const;
    /** @return  the bond that an interface shall be a member of; empty when there is none. */
    std::string MasterOf(const std::string& name) const;
    /** @return  the unit whose switch bridge an interface shares as a further port, or nothing. */
    std::string HostOf(const std::string& furtherPort) const;
    std::vector<std::string> FurtherPortsOf(const std::string& unit) const;
    /** Whether the file of an interface names a bond whose own file is being written. */
    bool HasUnclearMaster(const std::string& name) const;

    /** @return  what is a member now, in the order in which it joined. */
    std::vector<std::string> LiveMembersOf(const std::string& bond) const;
    std::string LiveMasterOf(const std::string& name) const;
    /** @return  the unit that gets what a bond carries that nothing asks for any more. */
    std::string HeirOf(const std::string& bond) const;
    /** @return  the bonds whose heir the unit is. */
    std::vector<std::string> LegaciesOf(const std::string& unit) const;

    /** @return  what a VLAN's interface stands on, wherever that is now. */
    std::string ParentFor(const FileVlan& vlan) const;

    /** @return  the interfaces that must be looked at together with those named. */
    std::set<std::string> Closure(std::set<std::string> names) const;

private:
    void ReadWanted();
    void ReadWantedBridges();
    void ReadLive();
    void ReadLiveBridges();
    void ChooseHeirs();
    std::string HeirAmong(const std::vector<std::string>& members) const;
    bool IsSingleUnit(const std::string& name) const;
    bool IsOurs(const std::string& bond) const;
    bool IsMade(const std::string& name) const;
    bool IsLinuxBridge(const std::string& name) const;
    bool IsAsked(const std::string& bond) const;
    bool IsLeftByAll(const std::string& bridge) const;
    std::set<std::string> RelativesOf(const std::string& name) const;

    const Inputs& m_inputs;
    std::map<std::string, std::vector<std::string>> m_members;
    std::set<std::string> m_switchBonds;
    std::set<std::string> m_linuxBridges;
    std::map<std::string, std::vector<std::string>> m_furtherPorts;
    std::map<std::string, std::vector<std::string>> m_liveMembers;
    std::map<std::string, std::string> m_heirs;
};

/** @return  the external id of a port under which the order of a bond's members is kept. */
constexpr char kMembersKey[] = "vornovs-members";

} // namespace vornhost

#endif
