/**
 * The calls that both directions of a whole conversion are made of.
 */
#ifndef VORNOVS_TESTS_UNIT_HOSTCALLS_H
#define VORNOVS_TESTS_UNIT_HOSTCALLS_H

#include <vornovs/vornovs.h>

#include "support/bondcalls.h"

namespace unit {

constexpr char kManagerFile[] = "ovsmanager.cpp";
constexpr char kListBridges[] = "VLIBCPopen /usr/bin/ovs-vsctl r list-br";

/** The whole network stopped and started. */
inline const Calls kStopped{"VLIBCExecl /etc/rc.network stop", "sleep 3"};
inline const Calls kStarted{"VLIBCExecl /etc/rc.network start", "VLIBServiceIsRunning vornwifid",
                            "VLIBServiceRestart vornwifid"};

/** The questions whether the host is in bridge topology: answered no at once, or both yes. */
inline const Calls kNoTopology{
    "VLIBCFileCheckKeyValue /etc/vorninfo.conf support_net_topology yes"};
inline const Calls kTopology{"VLIBCFileCheckKeyValue /etc/vorninfo.conf support_net_topology yes",
                             "VLIBCFileCheckKeyValue /etc/vorninfo.conf net_topology bridge"};

/** An interface that discovery takes as it stands. */
Calls PortFound(const std::string& name);

/** Hook and discovery of a host without VLANs and bonds. */
Calls Discovered(const std::vector<std::string>& interfaces);

/** The question for a port's tag. */
std::string GetTag(const std::string& bridge);

/** A bridge that the list of bridges names, and what is asked about it. */
Calls BridgeFound(const std::string& bridge);

/** Hook and list of the switch's bridges, none of which carries a bond. */
Calls Listed(const std::vector<std::string>& bridges);

Calls TagSet(const std::string& bridge, const std::string& tag);
Calls TagCleared(const std::string& bridge);

/** A Linux bond that is taken apart, its first slave up at once. */
Calls LinuxBondRemoved(const std::string& bond, const std::string& slaves,
                       const std::string& first);

/** The tries, and the lines logged, of a wait that never succeeds. */
Calls EightTries(const std::string& name);
LogLines EightLines(int priority, const std::string& name);

/** The line that says that the first bridge is up. */
harness::LogLine SpeedLine();

/** Has the manager read the bonds; what it did for that is forgotten. */
void ReadBonds(harness::RecordingPlatform& platform, VORN::OVS::OVSManager& manager,
               const std::vector<std::string>& bonds);

/** The same for the tags of these bridges, each the number in its name. */
void ReadTags(harness::RecordingPlatform& platform, VORN::OVS::OVSManager& manager,
              const std::vector<std::string>& bridges);

} // namespace unit

#endif
