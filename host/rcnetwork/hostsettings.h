/**
 * The host's own settings of this program.
 */
#ifndef VORNHOST_RCNETWORK_HOSTSETTINGS_H
#define VORNHOST_RCNETWORK_HOSTSETTINGS_H

#include <chrono>
#include <string>

namespace vornhost {

constexpr char kHostSettingsPath[] = "/etc/vornovs-host.conf";

/**
 * @return  a time limit of the host's settings in whole seconds, at most an hour.
 * @param usual  what holds when it is not set, or not to a number from the least one on.
 */
std::chrono::seconds HostSeconds(const std::string& key, unsigned usual, unsigned least);

} // namespace vornhost

#endif
