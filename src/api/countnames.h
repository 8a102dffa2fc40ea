#ifndef VORNOVS_API_COUNTNAMES_H
#define VORNOVS_API_COUNTNAMES_H

#include <vornovs/vornovs.h>

namespace VORN::OVS {

/** @return number of names in a loaded registry; negative: memory ran out. */
inline int CountNames(OVSRegConf& registry)
{
    std::set<std::string> names;
    return registry.GetRegNames(names);
}

} // namespace VORN::OVS

#endif
