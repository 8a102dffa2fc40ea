/**
 * The port of a switch bridge that its configuration file stands for.
 */
#ifndef VORNHOST_SUPPORT_UPLINK_H
#define VORNHOST_SUPPORT_UPLINK_H

#include "switchdatabase.h"

#include <string>
#include <vector>

namespace vornhost {

/** @return  the members of the bond that a bridge's file asks for, in its order. */
std::vector<std::string> ListedSlaves(const std::string& bridge);

/**
 * Finds the port through which a bridge reaches the wire: the bond of the members that its file
 * lists, the interface that its file names, or what the network program made. What clients plugged
 * into it is none, even a bond.
 * @return  null when there is none.
 */
const SwitchPort* FindUplinkByFile(const SwitchBridge& bridge);

} // namespace vornhost

#endif
