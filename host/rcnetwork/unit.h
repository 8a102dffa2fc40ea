/**
 * One interface that the host's addressing may be on, with everything that stands for it: as it is
 * and as it shall be.
 */
#ifndef VORNHOST_RCNETWORK_UNIT_H
#define VORNHOST_RCNETWORK_UNIT_H

#include "plan.h"

namespace vornhost {

enum class Target { kLeaveAlone, kPlain, kSwitch };

enum class UnitKind {
    kSingle,      ///< An interface by itself.
    kVlan,        ///< A VLAN's interface, made when it is not there.
    kBond,        ///< A bond of the kernel.
    kLinuxBridge, ///< A bridge of the kernel; its members are its ports.
    kSwitchBond   ///< A bond of the switch: there is no interface but its bridge.
};

/** An interface from which addressing goes to the unit's carrier. */
struct Source {
    const Link* link = nullptr;
    bool stays = true; ///< It is still there afterwards; what it has must be taken away.
};

struct Unit {
    std::string name; ///< "eth0", "bond0", "eth0.10"; also of what earlier runs made.
    UnitKind kind = UnitKind::kSingle;
    std::string bridge;
    const Link* port = nullptr; ///< Its own interface; of a switch bond the first member.
    const Link* bridgeLink = nullptr;
    const SwitchBridge* switchBridge = nullptr; ///< Only a bridge that is ours to change.
    bool joined = false;                        ///< Traffic of the port goes through the bridge.
    Target target = Target::kLeaveAlone;
    const InterfaceFile* file = nullptr; ///< What is asked for; null: nothing is known of it.
    bool addWanted = false;              ///< What the file asks for and is missing is made.
    bool removeUnwanted = false;         ///< What earlier runs made and nothing asks for goes.
    bool waitsForSwitch = false;         ///< Nothing can be planned until the switch was asked.
    bool takeDown = false;               ///< A stop: the link goes back to what it was, too.
    bool heldDown = false;               ///< Waits for its bond without traffic of its own.

    std::vector<const Link*> members;  ///< Of a bond that is asked for: those that exist.
    std::vector<const Link*> further;  ///< What shares the switch bridge with the port.
    std::vector<const Link*> idle;     ///< Those of them that can join before any traffic moves.
    std::optional<unsigned> tag;       ///< The VLAN in which the carrier's traffic shall be.
    std::string carrier;               ///< The interface that shall carry addresses and routes...
    const Link* carrierLink = nullptr; ///< ...null when there is none of that name yet...
    bool late = false;                 ///< ...and whether it can be used only once others let go.
    bool rebuilt = false;              ///< A VLAN's interface that stands on the wrong one.
    bool changesMode = false;          ///< A bond that is there works in another mode.
    std::vector<Source> sources;       ///< The most important one first.
    std::vector<std::string> absorbed; ///< Units of which it takes everything over.

    /** Ports of other programs on the bridge. */
    std::vector<std::string> ForeignPorts() const;
    /** Whether the bridge is still there afterwards: one of ours goes as a whole. */
    bool BridgeStays() const;
    /** Whether it is an interface of the kernel that holds others. */
    bool IsGroup() const { return kind == UnitKind::kBond || kind == UnitKind::kLinuxBridge; }
    const Source* SourceOf(int index) const;
    const Link* MainSource() const { return sources.empty() ? nullptr : sources.front().link; }
    /** The links through which it reaches the wire. */
    std::vector<const Link*> Ports() const;
    std::string BondPort() const;
};

} // namespace vornhost

#endif
