/**
 * What the switch's database holds: bridges, their ports, and which of them this program made.
 */
#ifndef VORNHOST_RCNETWORK_SWITCHSTATE_H
#define VORNHOST_RCNETWORK_SWITCHSTATE_H

#include <map>
#include <optional>
#include <string>
#include <vector>

namespace vornhost {

/** How bridges and ports that this program made are marked in their external_ids. */
constexpr char kMarkKey[] = "vornovs-network";
constexpr char kMarkValue[] = "rc.network";

struct SwitchPort {
    std::string name;
    bool ours = false;
    std::optional<unsigned> tag;
    bool working = false; ///< The switch daemon has it in the datapath.
    std::optional<unsigned> mtuRequest;
};

struct SwitchBridge {
    std::string name;
    bool ours = false;
    std::string hwaddr;            ///< other-config:hwaddr
    std::string datapathType;      ///< Empty or "system" for the kernel's.
    std::vector<SwitchPort> ports; ///< The bridge's own port among them.

    const SwitchPort* FindPort(const std::string& port) const;
};

struct SwitchState {
    bool running = false; ///< Both daemons run and the database answered.
    bool hung = false;    ///< Both daemons run and the database did not answer.
    std::map<std::string, SwitchBridge> bridges;

    const SwitchBridge* Find(const std::string& bridge) const;
};

/** The arguments of ovs-vsctl that make it print what ParseSwitchTables() reads. */
std::vector<std::string> SwitchTablesArguments();

/**
 * Reads the tables Bridge, Port and Interface as ovs-vsctl prints them in JSON.
 * @return  nullopt when the text is anything else.
 */
std::optional<SwitchState> ParseSwitchTables(const std::string& text);

} // namespace vornhost

#endif
