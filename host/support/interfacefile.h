/**
 * The configuration files of interfaces, "ifcfg-" and the interface's name, as the platform's
 * libraries look at them.
 */
#ifndef VORNHOST_SUPPORT_INTERFACEFILE_H
#define VORNHOST_SUPPORT_INTERFACEFILE_H

#include "keyvaluefile.h"

#include <optional>
#include <string>

namespace vornhost {

/**
 * Reads the configuration file of an interface.
 * @return  nothing when there is none, it cannot be read, or its DEVICE says that it is another
 *          interface's; a copy of the interface's own bridge's file counts as the interface's.
 */
std::optional<KeyValueFile> LoadInterfaceFile(const std::string& interface);

} // namespace vornhost

#endif
