/**
 * A process that makes a call of the library and is killed on the way.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_VICTIM_H
#define VORNOVS_TESTS_RELIABILITY_VICTIM_H

#include "support/sharedhost.h"

#include <functional>
#include <string>

namespace reliability {

/** How a victim ended. */
struct Death {
    bool killed = false;
    std::string point; ///< Where: "before CALL" or "after CALL".
};

/**
 * Makes the call in a child that is killed by SIGKILL when it has come that far.
 * @param nth  the point: before a call of the platform or an operation that changes files, or
 *             after it, counted from 1. Behind the last one the child lives on to its end.
 */
Death Kill(SharedHost& shared, const std::function<int()>& call, long nth);

} // namespace reliability

#endif
