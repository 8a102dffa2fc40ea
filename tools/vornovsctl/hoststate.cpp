#include "hoststate.h"

#include <vornovs/vornovs.h>

#include <string_view>

namespace vornovsctl {

namespace {

constexpr std::string_view kBridgePrefix = "ovs_";

std::optional<Names> ReadInterfaces()
{
    Names bridges;
    if (VORN::OVS::OVSManager().GetSwitchList(bridges) < 0) {
        return std::nullopt;
    }
    Names interfaces;
    for (const std::string& bridge : bridges) {
        // The switch may have bridges of other programs.
        if (bridge.size() > kBridgePrefix.size() && bridge.starts_with(kBridgePrefix)) {
            interfaces.insert(bridge.substr(kBridgePrefix.size()));
        }
    }
    return interfaces;
}

} // namespace

std::optional<Names> ReadClients()
{
    VORN::OVS::OVSRegConf registrations;
    Names names;
    if (registrations.LoadFromConfig() < 0 || registrations.GetRegNames(names) < 0) {
        return std::nullopt;
    }
    return names;
}

HostState ReadHostState()
{
    HostState state;
    state.clients = ReadClients();
    // Asked first: reading the list would start the services.
    state.switchRuns = VORN::OVS::IsDaemonAlive();
    if (state.switchRuns) {
        state.interfaces = ReadInterfaces();
    }
    return state;
}

std::string BridgeOf(const std::string& interface)
{
    return std::string(kBridgePrefix) + interface;
}

} // namespace vornovsctl
