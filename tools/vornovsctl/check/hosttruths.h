/**
 * The four places that say how the host's network is: the library's lists, the interfaces' files,
 * the switch and the kernel; and what a conversion that was cut short has left behind.
 */
#ifndef VORNOVSCTL_CHECK_HOSTTRUTHS_H
#define VORNOVSCTL_CHECK_HOSTTRUTHS_H

#include "show/hostmodel.h"

#include <support/conversionrecord.h>
#include <support/interfacefile.h>
#include <support/keyvaluefile.h>

#include <string>
#include <vector>

namespace vornovsctl {

/** A file "ifcfg-NAME": what its keys say, and what the network program makes of them. */
struct FileTruth {
    vornhost::InterfaceFile content;
    std::string device; /**< its DEVICE; empty: none */
    std::string type;   /**< its TYPE; empty: none */
    std::string tag;    /**< its OVS_VLAN_ID; empty: none */

    const std::string& Name() const { return content.name; }
    bool IsBridges() const { return content.use == vornhost::FileUse::kBridge; }
};

struct HostTruths {
    HostModel host; /**< the lists, the switch and the kernel */
    std::vector<FileTruth> files;
    std::vector<std::string> strays;       /**< paths of what a writer left that was killed */
    vornhost::ConversionRecord converted;  /**< by a conversion that has not ended */
    vornhost::ConversionRecord remembered; /**< what is on the switch, as long as it is */

    const FileTruth* FindFile(const std::string& name) const;
};

/** What the file of an interface says. */
FileTruth FileTruthOf(const std::string& interface, const vornhost::KeyValueFile& file);

/** Reads all of them; starts nothing. What could not be read is in the host's list of that. */
HostTruths ReadTruths();

} // namespace vornovsctl

#endif
