/**
 * What NetworkManager does for an interface, as a wish. netplan writes profiles for it, too.
 */
#ifndef VORNOVSCTL_ADOPT_NETWORKMANAGERREADER_H
#define VORNOVSCTL_ADOPT_NETWORKMANAGERREADER_H

#include "adopt/hostview.h"
#include "adopt/wish.h"

#include <map>
#include <string>

namespace vornovsctl {

/** How far it is with an interface, and the UUID of the profile that says what to do. */
struct NetworkManagerDevice {
    std::string profile;
    bool settled = false;
};

/** The interfaces that it manages. */
std::map<std::string, NetworkManagerDevice> ReadNetworkManagerDevices(const HostView& host);

/** @return the wish for one interface, with obstacles where it cannot be carried over. */
Wish ReadNetworkManager(const HostView& host, const std::string& name, const std::string& uuid);

} // namespace vornovsctl

#endif
