#ifndef VORNOVS_SWITCH_TOPOLOGY_H
#define VORNOVS_SWITCH_TOPOLOGY_H

namespace VORN::OVS {

// The interfaces of the topology in which the appliance bridges its wired and wireless side.
constexpr char kTopologyBridge[] = "br0";
constexpr char kTopologyWired[] = "eth0";
constexpr char kTopologyWireless[] = "wlan0";

/** @return whether the appliance is set to bridge its wired and wireless side. */
bool IsBridgeTopology();

/** Sets a key in an interface's file; a result above 0, and only that, is logged. */
void SetTopologyKey(const char* interface, const char* key, const char* value);

} // namespace VORN::OVS

#endif
