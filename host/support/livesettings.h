/**
 * What is live on an interface, written as its configuration file would say it.
 */
#ifndef VORNHOST_SUPPORT_LIVESETTINGS_H
#define VORNHOST_SUPPORT_LIVESETTINGS_H

#include "keyvaluefile.h"
#include "netlink.h"

#include <string>
#include <vector>

namespace vornhost {

/** The kernel's network at one moment. */
struct LiveNetwork {
    std::vector<Link> links;
    std::vector<Address> addresses;
    std::vector<Route> routes;

    /** @return  an empty network when the kernel cannot be asked. */
    static LiveNetwork Read();

    /** @return  null when there is no such interface. */
    const Link* Find(const std::string& name) const;

    /** Whether the interface has an address that reaches beyond its own link. */
    bool HasGlobalAddress(const Link& link) const;
};

/**
 * Describes an interface's addresses, default gateways and MTU: those that somebody set, not those
 * that a router or a server assigns.
 * @return  a file without any key when there is no such interface.
 */
KeyValueFile LiveAddressing(const LiveNetwork& network, const std::string& interface);

} // namespace vornhost

#endif
