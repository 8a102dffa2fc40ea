/**
 * What a host can be. Texts make hosts up that no kernel lets come about, and of those a plan
 * promises nothing.
 */
#ifndef VORNOVS_TESTS_FUZZ_POSSIBLEHOST_H
#define VORNOVS_TESTS_FUZZ_POSSIBLEHOST_H

#include "rcnetwork/plan.h"

namespace fuzz {

/** Brings what was read of a made-up host to the nearest that a run can find; the rest stays. */
void MakePossible(vornhost::Inputs& inputs);

} // namespace fuzz

#endif
