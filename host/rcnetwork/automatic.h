/**
 * Runs that nobody asks for: at boot, and when an interface appears later.
 */
#ifndef VORNHOST_RCNETWORK_AUTOMATIC_H
#define VORNHOST_RCNETWORK_AUTOMATIC_H

#include "plan.h"

#include <set>
#include <string>

namespace vornhost {

/** The verb of the unit that udev has started for an interface. */
constexpr char kAppearedVerb[] = "appeared";

/** @return  whether a client holds the lock under which the library changes things. */
bool ConfigurationIsLocked();

/** @return  whether somebody edits the files: what they say now need not be what is meant. */
bool ConversionRuns();

/**
 * @return  the interfaces that have to be there before the files can be fulfilled: those that no
 *          program makes, and the members of those that are made.
 */
std::set<std::string> NeededInterfaces(const std::map<std::string, InterfaceFile>& files);

/**
 * Brings the network up at boot. Interfaces that take their time to appear are waited for, within
 * a limit of the host's settings; one that comes later is for StartAppeared().
 * @return  whether all of it is so now; what is not was said.
 */
bool StartAtBoot(const Request& request);

/** Brings an interface up that has appeared, if its file asks for that. As StartAtBoot(). */
bool StartAppeared(const std::string& interface);

} // namespace vornhost

#endif
