/**
 * Which of the host's VLAN interfaces the tag of a switch port can stand for.
 */
#ifndef VORNHOST_SUPPORT_VLANRULES_H
#define VORNHOST_SUPPORT_VLANRULES_H

#include "livesettings.h"

#include <string>

namespace vornhost {

/** @return  null when there is no VLAN interface of that name, or it is one made for a tag. */
const Link* FindVlan(const LiveNetwork& network, const std::string& name);

/** @return  the interface that a VLAN stands on, null when it is out of sight. */
const Link* ParentOf(const LiveNetwork& network, const Link& vlan);

/**
 * Tells what keeps a VLAN interface from becoming the tag of the port that its parent becomes. The
 * tag puts everything that the parent's bridge carries into the VLAN, so there may be nothing else
 * on the parent.
 * @param parentsOwn  the parent's file gives it addresses outside of that VLAN.
 * @return  the reason, empty when there is none.
 */
std::string ObstacleToTag(const LiveNetwork& network, const Link& vlan, bool parentsOwn);

/** The same, with what the parent's file says. */
std::string ObstacleToTag(const LiveNetwork& network, const Link& vlan);

/** @return  a VLAN on that interface that cannot be its tag; null when there is none. */
const Link* FindVlanWithObstacle(const LiveNetwork& network, const std::string& parent);

} // namespace vornhost

#endif
