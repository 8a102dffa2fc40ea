/**
 * What can stand on a command line. Each check answers what is wrong with a value, such as "holds a
 * slash", and nothing when it is right.
 */
#ifndef VORNOVSCTL_CHECKS_H
#define VORNOVSCTL_CHECKS_H

#include <string>
#include <vector>
#include <vornplatform/records.h>

namespace vornovsctl {

std::string ClientFault(const std::string& name);

/** For the name of any interface, port or bridge. */
std::string InterfaceFault(const std::string& name);

/** For the name of an interface that has, or is to have, a bridge of its own. */
std::string PlainInterfaceFault(const std::string& name);

/** For the name of a mode that a bond on the switch can have. */
std::string SwitchModeFault(const std::string& mode);

/** For the id of a VLAN in decimal digits. */
std::string VlanFault(const std::string& id);

/** For the interfaces of a bond. */
std::string SlavesFault(const std::vector<std::string>& slaves);

/** @return the mode of that name, or VORN_LINK_AGGR_NONE. */
VORN_LINK_AGGR_MODE ModeOf(const std::string& name);

/** @return the mode's name; empty when it has none. */
std::string NameOf(VORN_LINK_AGGR_MODE mode);

/** The modes of bonds on the switch, or of Linux. */
std::vector<VORN_LINK_AGGR_MODE> Modes(bool ofTheSwitch);

} // namespace vornovsctl

#endif
