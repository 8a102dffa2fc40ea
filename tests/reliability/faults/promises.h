/**
 * What holds after every run, whatever failed in it.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_PROMISES_H
#define VORNOVS_TESTS_RELIABILITY_PROMISES_H

#include "faults/injection.h"

namespace reliability {

/** Nothing left open, locked, stopped, half written or lost. */
void ExpectNothingLost(const Scenario& scenario, const Scene& scene, const Run& run);

/** The documented result, and the log's own words for what failed. */
void ExpectWordsAndResult(const Scenario& scenario, const Run& clean, const Run& run,
                          const Fault& fault);

} // namespace reliability

#endif
