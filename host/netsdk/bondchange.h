/**
 * Taking bonds apart and building them.
 *
 * Files change in an order in which a host that is restarted in between stays reachable: a bond
 * whose file names no slaves any more is none, so whichever of the bond and its first slave has the
 * other's part left carries the addressing. What was before is on the disk before the first change,
 * so that a step that was cut short can be made again.
 */
#ifndef VORNHOST_NETSDK_BONDCHANGE_H
#define VORNHOST_NETSDK_BONDCHANGE_H

#include "bondfiles.h"

#include <string>
#include <vector>

namespace vornhost {

/** @return  0 the bond is apart; -1 it is as it was, and the system log says why. */
int TakeBondApart(BondPlan plan);

/** @return  0 the bond stands as it shall; -1 failed, and the system log says why. */
int BuildBond(BondPlan plan);

/** @return  the bond and its slaves in their order: in which a bond is built. */
std::vector<std::string> NamesOf(const BondPlan& plan);

/** @return  from the last slave to the first and then the bond: in which it is taken apart. */
std::vector<std::string> OrderApart(const BondPlan& plan);

/** Logs why something could not be done with a bond. @return  -1 */
int Fail(const BondPlan& plan, const char* reason);

/** The same, with the reason that errno gives. @return  -1 */
int FailWithReason(const BondPlan& plan, const char* what);

} // namespace vornhost

#endif
