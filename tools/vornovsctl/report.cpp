#include "report.h"

#include <nlohmann/json.hpp>

namespace vornovsctl {

namespace {

using nlohmann::ordered_json;

std::string Clients(const HostState& state)
{
    if (!state.clients) {
        return "cannot be read";
    }
    return state.clients->empty() ? "none" : List(*state.clients);
}

std::string Interfaces(const HostState& state)
{
    if (!state.interfaces) {
        return state.switchRuns ? "cannot be read" : "not known while the switch does not run";
    }
    Names texts;
    for (const std::string& interface : *state.interfaces) {
        texts.insert(interface + " (" + BridgeOf(interface) + ")");
    }
    return texts.empty() ? "none" : List(texts);
}

// Says what an operator would not see at once.
std::string Remark(const HostState& state)
{
    if (state.IsConsistent() || !state.clients) {
        return "";
    }
    if (!state.HasClients()) {
        return "No client is registered, but interfaces are on the switch: run\n"
               "'/etc/rc.network start', then register a client and unregister it again.\n";
    }
    return "Clients are registered, but no interface is known to be on the switch: run\n"
           "'/etc/rc.network start'.\n";
}

} // namespace

std::string List(const Names& names)
{
    std::string text;
    for (const std::string& name : names) {
        text += (text.empty() ? "" : ", ") + name;
    }
    return text;
}

std::string StatusText(const HostState& state)
{
    return "Clients:     " + Clients(state) +
           "\nSwitch:      " + (state.switchRuns ? "running" : "not running") +
           "\nInterfaces:  " + Interfaces(state) + '\n' + Remark(state);
}

std::string StatusJson(const HostState& state)
{
    ordered_json object;
    object["clients"] = state.clients ? ordered_json(*state.clients) : ordered_json(nullptr);
    object["switchRunning"] = state.switchRuns;
    object["interfaces"] = nullptr;
    if (state.interfaces) {
        object["interfaces"] = ordered_json::array();
        for (const std::string& interface : *state.interfaces) {
            object["interfaces"].push_back({{"name", interface}, {"bridge", BridgeOf(interface)}});
        }
    }
    object["consistent"] = state.IsConsistent();
    // A client may have any bytes in its name.
    return object.dump(2, ' ', false, ordered_json::error_handler_t::replace) + '\n';
}

} // namespace vornovsctl
