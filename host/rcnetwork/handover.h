/**
 * What a conversion has taken away and is going to give back elsewhere, while it is under way. The
 * files do not say it in between, and without it the host would leave its VLAN or its bond.
 */
#ifndef VORNHOST_RCNETWORK_HANDOVER_H
#define VORNHOST_RCNETWORK_HANDOVER_H

#include <map>
#include <string>
#include <vector>

namespace vornhost {

constexpr char kHandoverPath[] = "/run/vornovs/handover.json";

/** A bond that has been taken apart and is going to be built again. */
struct HandedBond {
    std::vector<std::string> members; ///< The first one carries the traffic meanwhile...
    std::string mac;                  ///< ...under the bond's link address...
    bool lacp = false;                ///< ...to a partner that speaks LACP.

    bool operator==(const HandedBond&) const = default;
};

struct Handover {
    std::map<std::string, unsigned> tags; ///< VLANs by the plain name of what has the addressing.
    std::map<std::string, HandedBond> bonds; ///< By plain name.

    bool Empty() const { return tags.empty() && bonds.empty(); }
    bool operator==(const Handover&) const = default;
    /** @return  the bond as whose first member the interface stands; null when there is none. */
    const HandedBond* FirstOf(const std::string& name) const;
    /** Whether the interface is another member, which is to be silent. */
    bool IsSilent(const std::string& name) const;
};

/** Whether this run is one of the steps of a conversion. */
bool IsPartOfConversion();

/** @return  an empty one when there is none, it is too old, or this run is no part of it. */
Handover LoadHandover();

/** Writes it, or removes it when it is empty. @return  false when that failed; errno says why. */
bool SaveHandover(const Handover& handover);

/** For the tests: as it is on disk, with the second of the boot's clock at which it was written. */
std::string HandoverText(const Handover& handover, unsigned long second);
Handover ParseHandover(const std::string& text, unsigned long second);

} // namespace vornhost

#endif
