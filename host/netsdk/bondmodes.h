/**
 * Bond modes by number and by the kernel's names.
 */
#ifndef VORNHOST_NETSDK_BONDMODES_H
#define VORNHOST_NETSDK_BONDMODES_H

#include <string>

#include <vornplatform/records.h>

namespace vornhost {

/** @return  the number of the kernel's mode of that name; none for those that have no number. */
VORN_LINK_AGGR_MODE KernelModeNumber(const std::string& name);

/** @return  the kernel's name of the modes 1 to 5, empty for all others. */
std::string KernelModeName(VORN_LINK_AGGR_MODE mode);

/**
 * @return  the kernel's name of the mode in which a bond is asked for that was taken to the switch
 *          and back. The switch has fewer modes, so several come back as one.
 */
std::string ModeAfterSwitch(const std::string& name);

} // namespace vornhost

#endif
