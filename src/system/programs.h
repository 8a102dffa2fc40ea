#ifndef VORNOVS_SYSTEM_PROGRAMS_H
#define VORNOVS_SYSTEM_PROGRAMS_H

namespace VORN::OVS {

constexpr char kCopyProgram[] = "/bin/cp";
constexpr char kNetworkScript[] = "/etc/rc.network";
constexpr char kSwitchTool[] = "/usr/bin/ovs-vsctl";

} // namespace VORN::OVS

#endif
