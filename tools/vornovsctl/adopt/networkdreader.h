/**
 * What systemd-networkd does for an interface, as a wish. netplan writes files for it, too.
 */
#ifndef VORNOVSCTL_ADOPT_NETWORKDREADER_H
#define VORNOVSCTL_ADOPT_NETWORKDREADER_H

#include "adopt/hostview.h"
#include "adopt/wish.h"

#include <map>
#include <string>
#include <vector>

namespace vornovsctl {

/** How far it is with an interface, and the file that says what to do. */
struct NetworkdLink {
    std::string file;
    bool settled = false;
};

/** The interfaces that it manages. */
std::map<std::string, NetworkdLink> ReadNetworkdLinks(const HostView& host);

/** @return the file and what is dropped in beside it, in the order in which they count. */
std::vector<std::string> FilesOfNetwork(const HostView& host, const std::string& networkFile);

/** @return the wish for one interface, with obstacles where it cannot be carried over. */
Wish ReadNetworkd(const HostView& host, const std::string& name, const std::string& networkFile);

} // namespace vornovsctl

#endif
