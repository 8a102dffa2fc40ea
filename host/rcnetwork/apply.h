/**
 * Carries out a plan: one program a stage, however many interfaces there are.
 */
#ifndef VORNHOST_RCNETWORK_APPLY_H
#define VORNHOST_RCNETWORK_APPLY_H

#include "plan.h"

#include <vector>

namespace vornhost {

/**
 * Carries out the stages in order and stops at one that failed, because later ones take away what
 * earlier ones were to put elsewhere.
 * @param remarks  Receives what failed and why, as warnings: whether the outcome is right is
 *                 seen by reading the host again.
 * @return  whether every stage was carried out.
 */
bool ApplyPlan(const Plan& plan, std::vector<Remark>& remarks);

/**
 * Does the same for a plan of which a part fails however often it is tried: an address, route or
 * device that the kernel refuses does not keep the rest from the network. After it nothing is taken
 * away any more, and nothing is asked of the switch.
 */
bool ApplyWhatCanBe(const Plan& plan, std::vector<Remark>& remarks);

/** Carries out one stage by itself, waiting for the switch. */
bool ApplyStage(const Stage& stage, std::vector<Remark>& remarks);

} // namespace vornhost

#endif
