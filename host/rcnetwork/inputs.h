/**
 * Reads all that a plan depends on.
 */
#ifndef VORNHOST_RCNETWORK_INPUTS_H
#define VORNHOST_RCNETWORK_INPUTS_H

#include "plan.h"

#include <map>
#include <optional>
#include <string>
#include <vector>

namespace vornhost {

constexpr char kSwitchTool[] = "/usr/bin/ovs-vsctl";
constexpr char kDatabaseService[] = "/etc/init.d/vornovs-db";
constexpr char kSwitchService[] = "/etc/init.d/vornovs-vswitch";

/** The environment of the programs that are run; a switch that hangs ends their wait. */
std::vector<std::string> ToolEnvironment();

/** @return  which processes the switch's daemons are; empty while not both of them run. */
std::string SwitchProcesses();

/**
 * Reads the files of all interfaces.
 * @param remarks  Receives what there is to say about them.
 * @return  nullopt when their folder could not be read.
 */
std::optional<std::map<std::string, InterfaceFile>>
ReadInterfaceFiles(std::vector<Remark>& remarks);

/**
 * Reads files, gateways, the kernel, the switch and what earlier runs made.
 * @param remarks  Receives what there is to say about the files and about what could not be read.
 * @return  nullopt when the files or the kernel could not be read: then nothing may be changed.
 */
std::optional<Inputs> ReadInputs(const Request& request, std::vector<Remark>& remarks);

} // namespace vornhost

#endif
