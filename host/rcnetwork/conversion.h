/**
 * What the network program does around a conversion of the host to the switch or back.
 */
#ifndef VORNHOST_RCNETWORK_CONVERSION_H
#define VORNHOST_RCNETWORK_CONVERSION_H

#include "plan.h"

#include "support/conversionrecord.h"
#include "support/remembered.h"

#include <map>
#include <optional>
#include <string>
#include <vector>

namespace vornhost {

enum class ConversionStage {
    kToSwitch, ///< A conversion to the switch begins: "create".
    kToPlain,  ///< One to plain networking begins: "delete".
    kDone      ///< It has ended as it should: "end".
};

/** @return  nothing when there is no stage of that name. */
std::optional<ConversionStage> FindStage(const std::string& name);

/**
 * Writes down at the beginning what a conversion is going to take apart: for its own programs what
 * the switch holds, and for whoever mends the host if it is cut short its bonds and VLANs. Of these
 * only what the host has lost is left at the end. The caller holds the lock of the network.
 * @return  false when that failed, which was said.
 */
bool MindConversion(ConversionStage stage);

/**
 * Leaves in the record of a conversion that was cut short only what the host has lost. Does nothing
 * while a conversion is under way.
 */
void SettleConversion(const Inputs& inputs);

/**
 * What a conversion that was cut short, by a loss of power for example, still owes: the VLANs whose
 * addressing their parents have, or the first members of bonds that were taken apart. Without them
 * the addresses would be asked for on the wrong network.
 */
Handover OwedSinceCut(const std::map<std::string, InterfaceFile>& files);

/** The same by what was written down and what is remembered of the VLANs. */
Handover OwedSince(const ConversionRecord& record, const std::vector<RememberedVlan>& remembered,
                   const std::map<std::string, InterfaceFile>& files);

/** @return  the bonds and VLANs that the host has now, on the switch or off it. */
ConversionRecord BondsAndVlansOf(const Inputs& inputs);

/**
 * Tells what is to be on disk at a stage: at the beginning all that the host has, with what an
 * earlier conversion that was cut short took apart and nobody has built again; at the end only what
 * the host has lost.
 */
ConversionRecord RecordAt(ConversionStage stage, ConversionRecord now,
                          const ConversionRecord& former);

} // namespace vornhost

#endif
