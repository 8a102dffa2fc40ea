/**
 * What the switch's database says about its bridges.
 */
#ifndef VORNHOST_SUPPORT_SWITCHDATABASE_H
#define VORNHOST_SUPPORT_SWITCHDATABASE_H

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace vornhost {

/** The key and the value that the network program leaves with what it makes on the switch. */
constexpr char kSwitchMarkKey[] = "vornovs-network";
constexpr char kSwitchMarkValue[] = "rc.network";

struct SwitchPort {
    std::string name;
    std::vector<std::string> interfaces; /**< sorted */
    bool bond = false;                   /**< several interfaces, or a bond's mode */
    bool marked = false;                 /**< made by the network program */

    bool operator==(const SwitchPort&) const = default;
};

struct SwitchBridge {
    std::string name;
    std::vector<SwitchPort> ports; /**< sorted; the one of the bridge's own name is among them */

    bool operator==(const SwitchBridge&) const = default;
};

/**
 * Takes the bridges, sorted, from the database server's reply to ReadSwitch().
 * @return  nothing when it is not that.
 */
std::optional<std::vector<SwitchBridge>> ParseSwitchReply(std::string_view reply);

/**
 * Asks the database server at its socket. No process is started, as this runs in client programs
 * of any size that may treat their children as they like.
 * @return  nothing when the server does not answer within some seconds.
 */
std::optional<std::vector<SwitchBridge>> ReadSwitch();

/**
 * Finds the port through which a bridge reaches the wire: the one of that name, else one that the
 * network program made. The bridge's own port and those of other programs are none.
 * @param primary  the interface that the bridge stands for; may be empty.
 */
const SwitchPort* FindUplink(const SwitchBridge& bridge, const std::string& primary);

} // namespace vornhost

#endif
