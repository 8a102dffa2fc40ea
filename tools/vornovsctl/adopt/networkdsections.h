/**
 * The sections of a .network file, one function each.
 */
#ifndef VORNOVSCTL_ADOPT_NETWORKDSECTIONS_H
#define VORNOVSCTL_ADOPT_NETWORKDSECTIONS_H

#include "adopt/inifile.h"
#include "adopt/wish.h"

#include <string>

namespace vornovsctl {

/** Takes over what a section says; what cannot be carried over becomes an obstacle. */
void TakeNetworkdSection(const IniSection& section, const std::string& path, Wish& wish);

} // namespace vornovsctl

#endif
