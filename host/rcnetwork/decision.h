/**
 * Where the addressing of one interface belongs: on itself, on its switch bridge, or wherever it
 * is now because nothing sound says otherwise.
 */
#ifndef VORNHOST_RCNETWORK_DECISION_H
#define VORNHOST_RCNETWORK_DECISION_H

#include "plan.h"

namespace vornhost {

enum class Target { kLeaveAlone, kPlain, kSwitch };

/** An interface with its bridge, as they are and as they shall be. */
struct Pair {
    std::string name;
    std::string bridge;
    const Link* port = nullptr;
    const Link* bridgeLink = nullptr;
    const SwitchBridge* switchBridge = nullptr; ///< Only a bridge that is ours to change.
    bool joined = false;                        ///< Traffic of the port goes through the bridge.
    Target target = Target::kLeaveAlone;
    const InterfaceFile* file = nullptr; ///< What is asked for; null: nothing is known of it.
    bool addWanted = false;              ///< What the file asks for and is missing is made.
    bool removeUnwanted = false;         ///< What earlier runs made and nothing asks for goes.
    bool waitsForSwitch = false;         ///< Nothing can be planned until the switch was asked.
    bool takeDown = false;               ///< A stop: the link goes back to what it was, too.

    /** The interface that shall carry addresses and routes... */
    const std::string& TargetName() const { return target == Target::kSwitch ? bridge : name; }
    /** ...and the one that must not. */
    const std::string& SourceName() const { return target == Target::kSwitch ? name : bridge; }
    const Link* TargetLink() const { return target == Target::kSwitch ? bridgeLink : port; }
    const Link* SourceLink() const { return target == Target::kSwitch ? port : bridgeLink; }
    /** Ports of other programs on the bridge. */
    std::vector<std::string> ForeignPorts() const;
    /** Whether the source is still there afterwards: a bridge of ours goes as a whole. */
    bool SourceStays() const;
};

/** Decides for every interface that the request concerns; those to be left alone are left out. */
std::vector<Pair> DecidePairs(const Inputs& inputs, std::vector<Remark>& remarks);

/** @return  the interfaces that shall be carried by the switch and are not. */
std::set<std::string> NotOnSwitch(const Inputs& inputs);

} // namespace vornhost

#endif
