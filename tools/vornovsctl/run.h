/**
 * vornovsctl as a function, for main() and for tests.
 */
#ifndef VORNOVSCTL_RUN_H
#define VORNOVSCTL_RUN_H

#include "terminal.h"

#include <iosfwd>

namespace vornovsctl {

/**
 * @param terminal  what the place that the output goes to can show.
 * @return  the exit status.
 */
int Run(int argc, const char* const argv[], std::ostream& output, std::ostream& errors,
        const Terminal& terminal = {});

} // namespace vornovsctl

#endif
