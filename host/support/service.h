/**
 * Starting and stopping services as it is done on this host.
 */
#ifndef VORNHOST_SUPPORT_SERVICE_H
#define VORNHOST_SUPPORT_SERVICE_H

#include <chrono>
#include <string>

namespace vornhost {

/** Where services have their scripts. */
constexpr char kServiceScripts[] = "/etc/init.d/";

/** In the environment of a script that shall do the work itself and not pass it on to systemd. */
constexpr char kScriptMark[] = "VORNOVS_SCRIPT=alone";

/**
 * Starts, stops or restarts a service: has systemd do it where it runs and knows a unit of that
 * name, and runs the service's script elsewhere. A daemon that was started past its unit is
 * stopped by the script.
 * @param name   such as "vornovs-db"; no path.
 * @param verb   "start", "stop" or "restart".
 * @param error  receives why it failed.
 * @return  whether it was done before the deadline.
 */
bool RunService(const std::string& name, const std::string& verb,
                std::chrono::milliseconds deadline, std::string& error);

} // namespace vornhost

#endif
