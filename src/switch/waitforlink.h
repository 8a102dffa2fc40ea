#ifndef VORNOVS_SWITCH_WAITFORLINK_H
#define VORNOVS_SWITCH_WAITFORLINK_H

#include <optional>
#include <string>

namespace VORN::OVS {

/**
 * Waits until an interface's link is up, in up to 8 tries one second apart.
 * @param retryPriority  syslog priority of the line that each failed try logs.
 * @return the link's speed, or nothing when it did not come up.
 */
std::optional<int> WaitForLink(const std::string& name, int retryPriority);

} // namespace VORN::OVS

#endif
