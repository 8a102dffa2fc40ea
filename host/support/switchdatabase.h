/**
 * What the switch's database says about its bridges.
 */
#ifndef VORNHOST_SUPPORT_SWITCHDATABASE_H
#define VORNHOST_SUPPORT_SWITCHDATABASE_H

#include <chrono>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace vornhost {

/** Where the database server listens. */
constexpr char kSwitchSocket[] = "/var/run/openvswitch/db.sock";

/** The key and the value that the network program leaves with what it makes on the switch. */
constexpr char kSwitchMarkKey[] = "vornovs-network";
constexpr char kSwitchMarkValue[] = "rc.network";

/** The external id of a port that shares the bridge with the one that the bridge stands for. */
constexpr char kFurtherPortKey[] = "vornovs-further";

/** Columns of text and numbers, or the pairs of one column, by name. */
using SwitchValues = std::map<std::string, std::string>;

/** How the switch finds an interface of one of its ports. */
struct SwitchInterface {
    std::string name;
    std::string mac{};          ///< In use; empty: not known.
    std::optional<bool> link{}; ///< Whether it has a link; nothing: not known.
    bool negotiated = false;    ///< Its partner speaks LACP.
    std::string error{};        ///< Why the switch cannot use it.

    bool operator==(const SwitchInterface&) const = default;
};

struct SwitchPort {
    std::string name;
    std::vector<std::string> interfaces; ///< Sorted.
    bool bond = false;                   ///< Several interfaces, or a bond's mode.
    bool marked = false;                 ///< Made by the network program.
    std::optional<unsigned> tag{};
    std::vector<std::string> working{};   ///< Those of the interfaces that the switch has opened.
    std::optional<unsigned> mtuRequest{}; ///< Of its first interface.
    bool negotiated = false;              ///< The partner of one of the interfaces speaks LACP.
    SwitchValues columns{};               ///< bond_mode, lacp... without those that are empty.
    SwitchValues otherConfig{};
    SwitchValues externalIds{};
    std::vector<unsigned> trunks{};       ///< VLANs that it carries tagged; none: all.
    std::vector<SwitchInterface> state{}; ///< Of its interfaces, sorted.

    bool operator==(const SwitchPort&) const = default;
    /** Whether the network program put it beside the port that the bridge stands for. */
    bool IsFurther() const { return marked && externalIds.contains(kFurtherPortKey); }
};

struct SwitchBridge {
    std::string name;
    std::vector<SwitchPort> ports; ///< Sorted; the one of the bridge's own name is among them.
    bool marked = false;           ///< Made by the network program.
    std::string hwaddr{};          ///< The link address that it was given.
    std::string datapathType{};    ///< Empty or "system" for the kernel's.

    bool operator==(const SwitchBridge&) const = default;
    const SwitchPort* FindPort(const std::string& port) const;
    /** @return  the bond that the network program made there, null when there is none. */
    const SwitchPort* FindBond() const;
};

/**
 * Takes the bridges, sorted, from the database server's reply to ReadSwitch().
 * @return  nothing when it is not that.
 */
std::optional<std::vector<SwitchBridge>> ParseSwitchReply(std::string_view reply);

/**
 * Asks the database server at its socket. No process is started, as this runs in client programs
 * of any size that may treat their children as they like.
 * @return  nothing when the server does not answer in time.
 */
std::optional<std::vector<SwitchBridge>>
ReadSwitch(std::chrono::milliseconds limit = std::chrono::seconds(10));

/**
 * Finds the port through which a bridge reaches the wire: the one of that name, else one that the
 * network program made. The bridge's own port, further ones and those of other programs are none.
 * @param primary  the interface that the bridge stands for; may be empty.
 */
const SwitchPort* FindUplink(const SwitchBridge& bridge, const std::string& primary);

} // namespace vornhost

#endif
