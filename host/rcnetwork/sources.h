/**
 * From where a unit's carrier gets what it is to carry.
 */
#ifndef VORNHOST_RCNETWORK_SOURCES_H
#define VORNHOST_RCNETWORK_SOURCES_H

#include "kinship.h"
#include "unit.h"

#include "support/bondoptions.h"

namespace vornhost {

/** @return  the options that the file of a bond of the kernel asks for. */
BondOptions BondOptionsOf(const InterfaceFile& file);

/** Names the unit's carrier, and finds everything else that carries its addressing now. */
void FindSources(const Inputs& inputs, const Kinship& kinship, Unit& unit);

} // namespace vornhost

#endif
