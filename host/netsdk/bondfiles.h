/**
 * What the configuration files of a bond and its slaves say after the bond was taken apart, and
 * after it was built. Functions of what the files say now; nothing is read or written here.
 */
#ifndef VORNHOST_NETSDK_BONDFILES_H
#define VORNHOST_NETSDK_BONDFILES_H

#include "support/keyvaluefile.h"
#include "support/remembered.h"

#include <optional>
#include <string>
#include <vector>

namespace vornhost {

/** A bond as it is to be taken apart or built. */
struct BondPlan {
    std::string name;
    std::vector<std::string> slaves; ///< The first one carries the addressing while there is none.
    std::string mode;                ///< The kernel's name; when it is built.
    KeyValueFile live; ///< Addressing of whatever carries it now, for want of a file that says it.
};

/**
 * Takes a bond apart: the first slave's file becomes the bond's, but for what is the card's own,
 * the others lose their membership and whatever would give them an address of their own, and the
 * bond's file goes. A slave without a file gets one, since only such interfaces are converted.
 */
FileStates TakenApart(const BondPlan& plan, const FileStates& before);

/** The files of a bond that is built. */
struct BuiltBond {
    FileStates build; ///< While the network program builds it: with all that must be in effect.
    FileStates final; ///< To be left behind; differs where the administrator had less in files.
};

/**
 * Builds a bond. What is remembered of it comes back as it was, with the changes that were made
 * meanwhile; without memory the first slave's addressing becomes the bond's. Of a bond that stands
 * already the mode and the slaves are set.
 */
BuiltBond Built(const BondPlan& plan, const FileStates& current,
                const std::optional<RememberedBond>& memory);

/** @return  the mode in which the bond is built: the remembered one where that is what is meant. */
std::string ModeOf(const BondPlan& plan, const std::optional<RememberedBond>& memory);

/**
 * Whether the files are what a step that was cut short left behind of those remembered: some as
 * they were and some as they were to be.
 */
bool IsHalfTakenApart(const RememberedState& memory, const FileStates& current);

} // namespace vornhost

#endif
