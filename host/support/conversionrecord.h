/**
 * The bonds and VLANs that a host had when a conversion began. In between they are in no file, and
 * a client that is killed there, or a power cut, would leave the host without them.
 */
#ifndef VORNHOST_SUPPORT_CONVERSIONRECORD_H
#define VORNHOST_SUPPORT_CONVERSIONRECORD_H

#include "interfacefile.h"

#include <map>
#include <optional>
#include <string>
#include <vector>

namespace vornhost {

/** On disk, since it is for a host that lost its power. */
constexpr char kConversionPath[] = "/usr/vorn/etc/vornnetd/conversion.json";

/** A bond as the kernel has it, or would have it were it not on the switch. */
struct ConvertedBond {
    std::string mode; ///< The kernel's name of it.
    std::vector<std::string> slaves;

    bool operator==(const ConvertedBond&) const = default;
};

/** Everything by its plain name, on the switch or off it. */
struct ConversionRecord {
    std::map<std::string, ConvertedBond> bonds;
    std::vector<FileVlan> vlans;

    bool Empty() const { return bonds.empty() && vlans.empty(); }
    bool operator==(const ConversionRecord&) const = default;

    /** Adds what another record has of which this one knows nothing. */
    void Add(const ConversionRecord& other);

    /** @return  an empty one when there is none; nothing when it cannot be read. */
    static std::optional<ConversionRecord> Load();

    /** Writes it, or removes it when it is empty. @return  false when that failed (errno). */
    bool Save() const;
};

} // namespace vornhost

#endif
