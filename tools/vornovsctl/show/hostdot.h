/**
 * The host as a graph for Graphviz.
 */
#ifndef VORNOVSCTL_SHOW_HOSTDOT_H
#define VORNOVSCTL_SHOW_HOSTDOT_H

#include "show/hostmodel.h"

#include <string>

namespace vornovsctl {

std::string DotOf(const HostModel& host);

} // namespace vornovsctl

#endif
