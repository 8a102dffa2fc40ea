/**
 * A bond as the library tells it.
 */
#ifndef VORNOVSCTL_BONDRECORD_H
#define VORNOVSCTL_BONDRECORD_H

#include "answer.h"

#include <optional>
#include <string>
#include <vector>
#include <vornplatform/records.h>

namespace vornovsctl {

struct Bond {
    std::string name;
    VORN_LINK_AGGR_MODE mode = VORN_LINK_AGGR_NONE;
    std::vector<std::string> slaves;
};

Bond BondOf(const VORNLINKAGGROPT& record);

/** @return the bond; nothing: it cannot be read. */
std::optional<Bond> ReadBond(const std::string& name);

/** The mode's name, or its number where it has none. */
std::string ModeText(VORN_LINK_AGGR_MODE mode);

/** The bond as members of an object; the mode and the slaves are null when nothing is known. */
Json BondFields(const std::string& name, const std::optional<Bond>& bond);

} // namespace vornovsctl

#endif
