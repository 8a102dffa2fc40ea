/**
 * Which of the host's interfaces can be converted to the switch.
 */
#ifndef VORNHOST_SDK_SELECTION_H
#define VORNHOST_SDK_SELECTION_H

#include "support/netlink.h"

#include <string>
#include <vector>

namespace vornhost {

/** An interface and what else decides whether it can be converted. */
struct Candidate {
    Link link;
    bool hardware = false; /**< a device stands behind it */
    bool wireless = false;
    bool ownFile = false; /**< it has a configuration file of its own */
    bool tag = false;     /**< a VLAN that becomes the tag of its parent's port */
};

/** The interfaces worth listing, each group in the order in which the kernel got to know them. */
struct Selection {
    std::vector<std::string> convertible;
    std::vector<std::string> passedOver;  /**< listed last: no caller converts them */
    std::vector<std::string> tooLong;     /**< no room for the bridge's prefix: not listed */
    std::vector<std::string> notEthernet; /**< configured, but can be no port: not listed */

    bool operator==(const Selection&) const = default;
};

/**
 * Sorts the interfaces. Convertible are Ethernet devices that hardware stands behind, bonds, VLANs
 * on these, and whatever else has a configuration file; not the ports of a Linux bridge or bond
 * (their master counts), nor wireless devices, which carry no other addresses than their own, nor
 * what the network program made for a tag.
 */
Selection SelectInterfaces(std::vector<Candidate> candidates);

} // namespace vornhost

#endif
