#ifndef VORNOVS_SWITCH_NETWORK_H
#define VORNOVS_SWITCH_NETWORK_H

namespace VORN::OVS {

/** Stops the whole host's network and leaves it alone for a while; a failure is only logged. */
void StopWholeNetwork();

/** Starts the whole host's network, and with it the wireless service if that runs. */
void StartWholeNetwork();

} // namespace VORN::OVS

#endif
