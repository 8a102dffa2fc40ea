/**
 * From where a unit's carrier gets what it is to carry.
 */
#ifndef VORNHOST_RCNETWORK_SOURCES_H
#define VORNHOST_RCNETWORK_SOURCES_H

#include "kinship.h"
#include "unit.h"

namespace vornhost {

/** Names the unit's carrier, and finds everything else that carries its addressing now. */
void FindSources(const Inputs& inputs, const Kinship& kinship, Unit& unit);

} // namespace vornhost

#endif
