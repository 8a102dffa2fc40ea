/**
 * Brings the live network to what the files ask for, and looks whether it is there.
 */
#ifndef VORNHOST_RCNETWORK_RECONCILE_H
#define VORNHOST_RCNETWORK_RECONCILE_H

#include "plan.h"

namespace vornhost {

/** The folder of everything that lasts until the next boot. */

/** Prints what would be done. @return  whether the request can be fulfilled. */
bool PrintPlan(const Request& request);

/**
 * Does what the request asks for. The caller holds the lock of the network.
 * @return  whether everything asked for is so now; what is not was said.
 * Blocks: until the switch has done its part, at most some ten seconds a transaction.
 */
bool Reconcile(const Request& request);

/** @return  the interfaces that the request concerns, named or not; none: all of them. */
std::set<std::string> ConcernedBy(const Request& request);

/**
 * Gives the switch the tags back that a conversion is going to give back elsewhere.
 * @return  false when that failed, which was said.
 */
bool KeepTags();

/**
 * Brings the options of a bond on the switch to what its file says, while it goes on to work.
 * @return  whether they are so now; what is not was said.
 */
bool SetSwitchBond(const std::string& bridge);

} // namespace vornhost

#endif
