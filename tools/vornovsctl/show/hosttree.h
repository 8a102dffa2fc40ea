/**
 * The host as a tree for a terminal.
 */
#ifndef VORNOVSCTL_SHOW_HOSTTREE_H
#define VORNOVSCTL_SHOW_HOSTTREE_H

#include "show/hostmodel.h"
#include "show/tree.h"

namespace vornovsctl {

TreeNode TreeOf(const HostModel& host);

} // namespace vornovsctl

#endif
