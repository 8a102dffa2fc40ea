/**
 * Short texts about the host's parts, the same in every drawing.
 */
#ifndef VORNOVSCTL_SHOW_HOSTWORDS_H
#define VORNOVSCTL_SHOW_HOSTWORDS_H

#include "show/hostmodel.h"

#include <string>
#include <vector>

namespace vornovsctl {

/** "up", "no link" or "down". */
std::string LinkWord(const Device& device);

/** "1000 Mbit/s", "10 Gbit/s"; empty when it is not known. */
std::string SpeedWord(const Device& device);

/** What sort of device it is, such as "interface", "bond" or "VLAN". */
std::string KindWord(const Device& device);

/** "default via 192.0.2.1 metric 100". */
std::string RouteWords(const DefaultRoute& route);

/** "VLAN 10". */
std::string VlanWords(int vlan);

/** "LACP negotiated" and the like; empty for a bond without LACP, and when it is not known. */
std::string LacpWords(const Port& port);
std::string LacpWords(const LinuxBond& bond);

/** The same of one member, where it differs from the bond's. */
std::string LacpWords(const Port& port, const Member& member);

/** The clients' names, or why there are none. */
std::string ClientWords(const HostModel& host);

/** Whether the switch runs, and whether it told what is on it. */
std::string SwitchWords(const HostModel& host);

/** The devices that are drawn by themselves: neither on the switch nor on another device. */
std::vector<const Device*> DevicesOnTheirOwn(const HostModel& host);

/** The devices that belong to one: a bond's and a bridge's members, and VLANs. */
std::vector<const Device*> DevicesOn(const HostModel& host, const std::string& device);

/** Those that were taken off the switch by themselves and are not there. */
std::vector<std::string> TakenOffWithoutDevice(const HostModel& host);

/** Whether the interface was taken off the switch by itself. */
bool IsTakenOff(const HostModel& host, const std::string& device);

} // namespace vornovsctl

#endif
