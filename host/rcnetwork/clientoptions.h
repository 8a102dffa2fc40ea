/**
 * What the DHCP client of an interface is told.
 */
#ifndef VORNHOST_RCNETWORK_CLIENTOPTIONS_H
#define VORNHOST_RCNETWORK_CLIENTOPTIONS_H

#include "support/interfacefile.h"

#include <string>
#include <vector>

namespace vornhost {

/** Lines of the client's configuration, in their order. */
using ClientOptions = std::vector<std::string>;

/** The option of a client that leaves IPv6 alone. */
constexpr char kOnlyIPv4[] = "ipv4only";
constexpr char kOnlyIPv6[] = "ipv6only";

/** A client as an earlier run left it. */
struct LiveClient {
    bool running = false;
    ClientOptions options;
};

/** Where the client is to run, in terms that the way to the switch and back does not change. */
struct ClientPlace {
    std::string interface;
    std::string mac;
    unsigned vlan = 0; ///< 0: none.
    unsigned card = 0; ///< The index of the card that is at the bottom of the interface.
};

/**
 * Writes everything out that would otherwise follow from the interface: its name and index are
 * others on the switch, and servers must not notice.
 */
ClientOptions MakeClientOptions(const InterfaceFile& file, const ClientPlace& place);

/** @return  the same options for another interface. */
ClientOptions WithInterface(ClientOptions options, const std::string& interface);

/** The options on one line of a plan, and back. */
std::string ClientText(const ClientOptions& options);
ClientOptions ParseClientText(const std::string& text);

} // namespace vornhost

#endif
