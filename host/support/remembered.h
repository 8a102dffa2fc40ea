/**
 * What a Linux bond or VLAN was before it went on to the switch. The switch has no place for all of
 * it, and the host may be restarted meanwhile, so it is kept in files of its own.
 */
#ifndef VORNHOST_SUPPORT_REMEMBERED_H
#define VORNHOST_SUPPORT_REMEMBERED_H

#include "bondoptions.h"
#include "gatewaystore.h"

#include <map>
#include <optional>
#include <string>
#include <vector>

namespace vornhost {

/** Where the records are kept; below it "bonds/NAME.json" and "vlans/NAME.json". */
constexpr char kRememberedFolder[] = "/usr/vorn/etc/vornnetd/remembered";

/** The configuration file of an interface at some moment. */
struct FileState {
    std::optional<std::string> text; ///< Nothing: there was no file.
    unsigned mode = 0644;            ///< Its permissions.

    bool operator==(const FileState&) const = default;
};

/** Files by the interface that they are of. */
using FileStates = std::map<std::string, FileState>;

/** The gateway record of an interface at some moment. */
struct GatewayState {
    std::string interface;
    AddressFamily family = AddressFamily::kIPv4;
    std::optional<Gateway> gateway; ///< Nothing: there was no record.

    bool operator==(const GatewayState&) const = default;
};

/** What both kinds of records hold. */
struct RememberedState {
    FileStates before; ///< Of all interfaces concerned, as the administrator wrote them.
    FileStates moved;  ///< The same files as they were left when the addressing was moved.
    std::vector<GatewayState> gateways; ///< Those that were changed for the move, before it.

    bool operator==(const RememberedState&) const = default;
};

/** Whether a text is an address of Ethernet as the kernel writes it: six pairs of hex digits. */
bool IsLinkAddress(const std::string& text);

/** A Linux bond that was taken apart. */
struct RememberedBond {
    std::string name; ///< Of the Linux bond, such as "bond0".
    std::string mac;  ///< The bond's link address; empty when it was not up.
    unsigned mtu = 0; ///< 0: not known.
    BondOptions options;
    std::vector<std::string> slaves; ///< In the bond's order.
    RememberedState state;

    bool operator==(const RememberedBond&) const = default;

    /**
     * Tells whether a bond of these slaves is the one that is remembered, whatever their order:
     * one of the same name with others is not.
     */
    bool HasSlaves(std::vector<std::string> others) const;

    /** @return  nothing when nothing is remembered or it cannot be read. */
    static std::optional<RememberedBond> Load(const std::string& name);

    /** @return  every bond that is remembered, sorted by name. */
    static std::vector<RememberedBond> LoadAll();

    /** Replaces what is remembered. @return  false: it could not be written (errno says why). */
    bool Save() const;

    /** @return  false: it is still remembered (errno says why). */
    static bool Forget(const std::string& name);
};

/** A Linux VLAN interface that was taken apart. */
struct RememberedVlan {
    std::string name;   ///< Of the VLAN interface, such as "eth0.10".
    std::string parent; ///< The interface that carried it.
    int id = 0;
    RememberedState state;

    bool operator==(const RememberedVlan&) const = default;

    /** @return  nothing when nothing is remembered or it cannot be read. */
    static std::optional<RememberedVlan> Load(const std::string& name);

    /** @return  every VLAN that is remembered, sorted by name. */
    static std::vector<RememberedVlan> LoadAll();

    /** @return  those of a parent. */
    static std::vector<RememberedVlan> LoadOfParent(const std::string& parent);

    /** Replaces what is remembered. @return  false: it could not be written (errno says why). */
    bool Save() const;

    /** @return  false: it is still remembered (errno says why). */
    static bool Forget(const std::string& name);
};

} // namespace vornhost

#endif
