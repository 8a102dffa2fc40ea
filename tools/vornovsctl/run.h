/**
 * vornovsctl as a function, for main() and for tests.
 */
#ifndef VORNOVSCTL_RUN_H
#define VORNOVSCTL_RUN_H

#include <iosfwd>

namespace vornovsctl {

enum ExitStatus : int {
    kHolds = 0,       /**< done: what was asked for holds now */
    kDoesNotHold = 1, /**< it does not */
    kWrongUsage = 2,
    kNotRoot = 3,
    kOutOfStep = 4,   /**< clients and network do not fit together */
    kNothingToDo = 5, /**< it held before, perhaps by somebody else's doing */
};

/** @return the exit status. */
int Run(int argc, const char* const argv[], std::ostream& output, std::ostream& errors);

} // namespace vornovsctl

#endif
