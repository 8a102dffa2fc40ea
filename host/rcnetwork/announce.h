/**
 * Tells the network outside where a link address is to be found from now on.
 */
#ifndef VORNHOST_RCNETWORK_ANNOUNCE_H
#define VORNHOST_RCNETWORK_ANNOUNCE_H

#include <string>

namespace vornhost {

/**
 * Sends one frame from the interface to everybody on its segment: switches learn from its sender
 * where to send what is for it, whatever protocol its traffic is of.
 * @return  false when that was not possible; errno says why.
 */
bool Announce(const std::string& interface);

} // namespace vornhost

#endif
