/**
 * Brings the live network to what the files ask for, and looks whether it is there.
 */
#ifndef VORNHOST_RCNETWORK_RECONCILE_H
#define VORNHOST_RCNETWORK_RECONCILE_H

#include "plan.h"

namespace vornhost {

/** The folder of everything that lasts until the next boot. */
constexpr char kRunFolder[] = "/run/vornovs";

/** Prints what would be done. @return  whether the request can be fulfilled. */
bool PrintPlan(const Request& request);

/**
 * Does what the request asks for. The caller holds the lock of the network.
 * @return  whether everything asked for is so now; what is not was said.
 * Blocks: until the switch has done its part, at most some ten seconds a transaction.
 */
bool Reconcile(const Request& request);

} // namespace vornhost

#endif
