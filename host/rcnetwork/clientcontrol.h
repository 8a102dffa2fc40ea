/**
 * Starting and ending DHCP clients: through systemd where that runs, as processes of nobody
 * elsewhere.
 */
#ifndef VORNHOST_RCNETWORK_CLIENTCONTROL_H
#define VORNHOST_RCNETWORK_CLIENTCONTROL_H

#include "clientoptions.h"

#include <map>
#include <string>
#include <vector>

namespace vornhost {

/** @return  the clients that were started in this boot, by interface, whether they run or not. */
std::map<std::string, LiveClient> ReadClients();

/**
 * Starts a client that goes on with the lease of an earlier one.
 * @param formers  Interfaces on which that may have run; the latest lease counts.
 * @param error    Receives why it failed.
 * @return  whether it runs; an address is had later.
 */
bool StartClient(const std::string& interface, const std::vector<std::string>& formers,
                 const ClientOptions& options, std::string& error);

/** Ends a client; addresses, routes and the lease stay as they are. @return  whether it ended. */
bool EndClient(const std::string& interface, std::string& error);

/** Ends a client that has no follower: name servers that it told of are forgotten. */
bool DropClient(const std::string& interface, std::string& error);

/** Who resolves names, and in which domains they are looked for. */
struct NameServers {
    std::vector<std::string> servers;
    std::vector<std::string> domains;
};

/** Tells what a file says of an interface the way clients tell it; nothing at all is forgotten. */
bool TellNameServers(const std::string& interface, const NameServers& told);

} // namespace vornhost

#endif
