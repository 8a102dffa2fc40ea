/**
 * Whether interfaces have everything that they had before they changed hands.
 */
#ifndef VORNOVSCTL_ADOPT_LIVECHECK_H
#define VORNOVSCTL_ADOPT_LIVECHECK_H

#include "adopt/hostview.h"

#include <set>
#include <string>

namespace vornovsctl {

/** What users of the network would miss, in words: addresses, routes, name servers. */
using Belongings = std::set<std::string>;

Belongings BelongingsOf(const HostView& host, const std::set<std::string>& names);

/** @return what was there and is not. */
Belongings Missing(const Belongings& before, const Belongings& now);

} // namespace vornovsctl

#endif
