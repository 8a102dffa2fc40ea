/**
 * The DHCP client that ifupdown runs: what its files tell of a lease and of how it presents itself.
 */
#ifndef VORNOVSCTL_ADOPT_DHCLIENT_H
#define VORNOVSCTL_ADOPT_DHCLIENT_H

#include "adopt/lease.h"
#include "adopt/wish.h"

#include <optional>
#include <string>

namespace vornovsctl {

struct DhclientState {
    std::optional<Lease> lease; /**< the last one of the interface */
    std::string duid;           /**< hex with colons; empty: none is kept */
    std::string iaid;           /**< eight hex digits; empty: no IPv6 address was asked for */
};

/** Reads a file of leases. */
DhclientState ParseDhclientLeases(const std::string& text, const std::string& interface);

/**
 * How the client presents itself to servers.
 * @param words          its command line.
 * @param configuration  the text of dhclient.conf.
 * @param mac            the interface's link address.
 */
DhcpIdentity DhclientIdentity(const std::vector<std::string>& words,
                              const std::string& configuration, const std::string& duid,
                              const std::string& mac);

} // namespace vornovsctl

#endif
