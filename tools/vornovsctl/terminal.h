/**
 * What the place that the output goes to can show.
 */
#ifndef VORNOVSCTL_TERMINAL_H
#define VORNOVSCTL_TERMINAL_H

#include <cstddef>

namespace vornovsctl {

struct Terminal {
    bool unicode = false; /**< box characters, and letters beyond ASCII */
    bool colour = false;
    std::size_t width = 0; /**< in columns; 0: no limit */
};

/** Looks at standard output, the locale and the environment. */
Terminal StandardOutput();

} // namespace vornovsctl

#endif
