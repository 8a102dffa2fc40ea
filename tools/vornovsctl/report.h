/**
 * The texts that tell a host's state.
 */
#ifndef VORNOVSCTL_REPORT_H
#define VORNOVSCTL_REPORT_H

#include "hoststate.h"

#include <string>

namespace vornovsctl {

/** The names with commas between them. */
std::string List(const Names& names);

/** The state as lines of text. */
std::string StatusText(const HostState& state);

/** The state as a JSON object. */
std::string StatusJson(const HostState& state);

} // namespace vornovsctl

#endif
