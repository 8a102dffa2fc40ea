/**
 * The options of a Linux bond under the kernel's own names, and what the switch has for them.
 */
#ifndef VORNHOST_SUPPORT_BONDOPTIONS_H
#define VORNHOST_SUPPORT_BONDOPTIONS_H

#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace vornhost {

/** The kernel's name of link aggregation that is negotiated. */
constexpr char kLacpMode[] = "802.3ad";

/** Where the kernel shows its interfaces; a bond's options are in "NAME/bonding" below it. */
constexpr char kInterfaceFolder[] = "/sys/class/net";

/**
 * Options of a bond: "mode" -> "active-backup", "miimon" -> "100". Values that have a name in the
 * kernel stand as that name, lists as "one,two".
 */
struct BondOptions {
    std::map<std::string, std::string> values;

    bool operator==(const BondOptions&) const = default;

    /**
     * Takes the options from a text of "name=value" words, as BONDING_OPTS holds it. Modes and
     * other named values may be numbers there. Words without "=" are passed over; of an option that
     * is given twice the last one counts, except that addresses of arp_ip_target are collected.
     */
    static BondOptions Parse(std::string_view text);

    /** Reads a live bond. @return  nothing when the kernel has no bond of that name. */
    static std::optional<BondOptions> ReadLive(const std::string& bond);

    /** @return  the option's value, empty when it is not set. */
    std::string Get(const std::string& name) const;

    /** @return  the options as BONDING_OPTS holds them: mode first, the others by name. */
    std::string Text() const;

    /** @return  these options and the other's; where both have one, the other's. */
    BondOptions OverlaidWith(const BondOptions& other) const;

    /**
     * @return  the same options under another mode: without those that the kernel refuses or
     *          ignores there, and with link monitoring if none is left.
     */
    BondOptions WithMode(const std::string& mode) const;

    /**
     * @return  those that are not what a new bond has anyway and that the kernel takes in their
     *          mode, and all that the other names.
     */
    BondOptions Chosen(const BondOptions& named) const;
};

/**
 * @return  what is wrong with the value, which the kernel's tools would not even read; empty when
 *          nothing is or when the option is not known here.
 */
std::string BondOptionProblem(const std::string& name, const std::string& value);

/**
 * The interfaces that are in a live bond, in the order in which they came.
 * @return  nothing when the kernel has no bond of that name or does not list all of them.
 */
std::optional<std::vector<std::string>> ReadLiveSlaves(const std::string& bond);

/**
 * What the switch's database is to say in the bond's Port row for the options that have a twin
 * there, by column: "bond_updelay" -> "200", "other_config:lacp-time" -> "fast". Its mode and
 * whether it speaks LACP are not among them: these are the bridge file's.
 */
std::map<std::string, std::string> SwitchColumns(const BondOptions& options);

/**
 * The options, as "name=value", that have no twin on the switch and are not what the kernel begins
 * with: while the bond is on the switch they have no effect.
 */
std::vector<std::string> WithoutTwin(const BondOptions& options);

} // namespace vornhost

#endif
