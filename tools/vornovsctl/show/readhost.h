/**
 * Reads the whole host, once.
 */
#ifndef VORNOVSCTL_SHOW_READHOST_H
#define VORNOVSCTL_SHOW_READHOST_H

#include "hostmodel.h"

namespace vornovsctl {

/** Reads what can be read; starts nothing, and tells what could not be read. */
HostModel ReadHost();

} // namespace vornovsctl

#endif
