/**
 * What takes a host out of its half states: a file that was on its way to another name comes back,
 * the network program makes the live network what the files say, a whole conversion by the library
 * finishes the files of one that was cut short, and bonds and VLANs that it took apart are built.
 */
#ifndef VORNOVSCTL_CHECK_REPAIR_H
#define VORNOVSCTL_CHECK_REPAIR_H

#include "halfstates.h"

#include <string>
#include <vector>

namespace vornovsctl {

struct RepairStep {
    enum class Kind {
        kRestoreFile,  /**< that of "subject", which only stands under the name in "source" */
        kStartNetwork, /**< the network program takes the files for what is meant */
        kUnregister,   /**< a client, whose name is in "subject" */
        kBuildBond,    /**< as it was before the conversion that took it apart */
        kMakeVlan,     /**< the same, on the interface in "subject" */
        kRegister,     /**< as kUnregister */
        kRemoveFile,   /**< a stray one, or a copy that was not edited yet */
    };
    Kind kind;
    std::string subject;
    std::string source{};
    vornhost::ConvertedBond bond{}; /**< that is built */
    unsigned vlan = 0;              /**< the id of the VLAN that is made */

    bool operator==(const RepairStep&) const = default;
};

/**
 * Plans the way to the nearest whole state: on the switch while somebody is registered, off it
 * otherwise. Clients that were registered are registered at its end. Bonds and VLANs are built
 * while nothing is on the switch.
 */
std::vector<RepairStep> PlanRepair(const HostTruths& truths, const std::vector<HalfState>& found);

/** The step in words. */
std::string TextOf(const RepairStep& step);

/**
 * Takes a step; whether it helped is to be looked at. Waits some seconds for files of writers, and
 * for the configuration lock when it builds a bond or makes a VLAN.
 */
void TakeStep(const RepairStep& step);

} // namespace vornovsctl

#endif
