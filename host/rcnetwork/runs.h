/**
 * Whole runs of the network program: one at a time changes the network.
 */
#ifndef VORNHOST_RCNETWORK_RUNS_H
#define VORNHOST_RCNETWORK_RUNS_H

#include "plan.h"

#include "support/descriptor.h"

namespace vornhost {

/**
 * Lets one run at a time change the network; free again when its owner dies.
 * @return  none when others do not end in time, which was said.
 */
Descriptor TakeNetworkLock();

/**
 * Brings the network to its files and ends the hold of what that concerns. The caller holds the
 * lock of the network.
 * @return  whether all of it is so now; what is not was said.
 */
bool Start(const Request& request);

/** Takes down what the request names, or only holds it when the library asks. As Start(). */
bool Stop(const Request& request);

/**
 * Lets go of interfaces that somebody else is about to manage: their clients end and what was made
 * for them is forgotten, but all of it stays as it is. As Start().
 */
bool Leave(const Request& request);

} // namespace vornhost

#endif
