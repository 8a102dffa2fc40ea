/**
 * What does not fit together in a host's network: states that no conversion ends in, but a client
 * that was killed, a power cut or an edit by hand leaves.
 */
#ifndef VORNOVSCTL_CHECK_HALFSTATES_H
#define VORNOVSCTL_CHECK_HALFSTATES_H

#include "hosttruths.h"

#include <string>
#include <vector>

namespace vornovsctl {

/** The client as which a repair goes to the switch and back when nobody else is registered. */
constexpr char kRepairClient[] = "vornovsctl-repair";

/** Classes of half states; those that cost the most come first. */
enum class HalfStateClass {
    kAddressBelowBridge,      /**< a port of the switch has addresses, which do not answer */
    kBridgeFileWithoutBridge, /**< a bridge's file, and no such bridge in the switch */
    kUnfinishedFile,          /**< a file that was copied from another interface's, not edited */
    kBridgeWithoutFile,       /**< a bridge in the switch that goes with the next start */
    kRegisteredButPlain,      /**< clients are registered, and nothing is on the switch */
    kOnSwitchButUnregistered, /**< nobody is registered, and something is on the switch */
    kBondOfOne,               /**< a bond with a single member, or with none */
    kLostTag,                 /**< a tag that is in the file and not in the switch */
    kUnfinishedBond,          /**< a bond that was taken apart, or built again only half */
    kUnfinishedVlan,          /**< the same for a VLAN */
    kStrayFile,               /**< what a writer left that was killed */
};

struct HalfState {
    HalfStateClass kind;
    std::string subject; /**< an interface, a client list or a path */
    std::string text;    /**< what is wrong with it, to follow its name */

    bool operator==(const HalfState&) const = default;
};

/** The exit status that tells of the class: 10 to 20. */
int ExitStatusOf(HalfStateClass kind);

/** The class as one word. */
const char* WordOf(HalfStateClass kind);

/** Finds all half states, the costliest first. What could not be read is not judged. */
std::vector<HalfState> FindHalfStates(const HostTruths& truths);

} // namespace vornovsctl

#endif
