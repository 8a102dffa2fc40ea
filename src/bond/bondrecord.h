#ifndef VORNOVS_BOND_BONDRECORD_H
#define VORNOVS_BOND_BONDRECORD_H

#include "state/ifcfg.h"

#include <vornplatform/records.h>

#include <string>
#include <vector>

namespace VORN::OVS {

/** @return the bond's slave names in slot order; a count beyond the slots is not believed. */
inline std::vector<std::string> SlavesOf(const VORNLINKAGGROPT& bond)
{
    std::vector<std::string> slaves;
    for (int slot = 0; slot < bond.nSlave && slot < VORN_LINK_AGGR_SLAVES; ++slot) {
        slaves.push_back(NameOf(bond.rgszSlave[slot]));
    }
    return slaves;
}

} // namespace VORN::OVS

#endif
