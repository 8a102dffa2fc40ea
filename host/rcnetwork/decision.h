/**
 * Where the addressing of each interface belongs: on itself, on a bond, in a VLAN, on its switch
 * bridge, or wherever it is now because nothing sound says otherwise.
 */
#ifndef VORNHOST_RCNETWORK_DECISION_H
#define VORNHOST_RCNETWORK_DECISION_H

#include "kinship.h"
#include "unit.h"

namespace vornhost {

/** Decides for every interface that the request concerns; those to be left alone are left out. */
std::vector<Unit> DecideUnits(const Inputs& inputs, const Kinship& kinship,
                              std::vector<Remark>& remarks);

/** @return  the interfaces whose files ask for the switch, whatever can be had. */
std::set<std::string> WantedOnSwitch(const Inputs& inputs);

/** @return  the interfaces that shall be carried by the switch and are not. */
std::set<std::string> NotOnSwitch(const Inputs& inputs);

/** @return  the interfaces that a request concerns; none: all of them. */
std::set<std::string> Concerned(const Inputs& inputs);

} // namespace vornhost

#endif
