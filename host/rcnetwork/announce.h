/**
 * What an interface says to the network outside once it stands there.
 */
#ifndef VORNHOST_RCNETWORK_ANNOUNCE_H
#define VORNHOST_RCNETWORK_ANNOUNCE_H

#include <string>

namespace vornhost {

/**
 * Sends frames from the interface to everybody on its segment: switches learn from their sender
 * where to send what is for it, whatever protocol its traffic is of, and neighbours learn the link
 * address of each address in use, which may be another one than before.
 * @return  false when that was not possible; errno says why.
 */
bool Announce(const std::string& interface);

/**
 * Asks the routers on the interface's segment to tell of themselves at once.
 * @return  as above.
 */
bool SolicitRouters(const std::string& interface);

} // namespace vornhost

#endif
