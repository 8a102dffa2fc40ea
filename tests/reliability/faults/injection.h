/**
 * One run of a scenario, with one thing failing in it or none.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_INJECTION_H
#define VORNOVS_TESTS_RELIABILITY_INJECTION_H

#include "faults/scene.h"

#include <optional>

namespace reliability {

/** What fails in a run: a call or a file operation by its number, or an allocation. */
struct Fault {
    std::size_t point = 0;
    Way way;
    /** Those of the same function that follow fail, too. */
    bool andAlike = false;
    /** Instead of all that: the number of the allocation that fails, counted from 1. */
    long allocation = 0;
};

/** What a run did. */
struct Run {
    int result = 0;
    int fired = 0;
    bool threw = false;
    std::vector<Point> points;
    unit::LogLines log;
    unit::Calls calls;
    unit::Calls openHandles;
    /** The log's and the calls' length when it failed. */
    std::size_t logBefore = 0;
    std::size_t callsBefore = 0;
    std::vector<std::string> leftDescriptors;
    bool leftChild = false;
};

/** Runs a scenario on a host that has just been put into its situation. */
Run RunScenario(const Scenario& scenario, const Scene& scene, const std::optional<Fault>& fault);

} // namespace reliability

#endif
