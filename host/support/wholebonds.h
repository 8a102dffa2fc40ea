/**
 * Linux bonds that are a port of the switch as they are. Whoever puts one there deletes its options
 * from the bridge's file, and that file becomes the bond's again on the way back; so the bond's own
 * file is remembered while the bond is a port.
 */
#ifndef VORNHOST_SUPPORT_WHOLEBONDS_H
#define VORNHOST_SUPPORT_WHOLEBONDS_H

#include "remark.h"

#include <vector>

namespace vornhost {

/**
 * Remembers the files of bonds that are to be ports, and gives those that are to be ports no more
 * back what their files have lost. Other changes made to a file meanwhile stay.
 */
void MindWholeBonds(std::vector<Remark>& remarks);

} // namespace vornhost

#endif
