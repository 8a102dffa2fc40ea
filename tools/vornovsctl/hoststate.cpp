#include "hoststate.h"

#include <support/keyvaluefile.h>
#include <vornovs/vornovs.h>

#include <cerrno>
#include <fstream>
#include <string_view>
#include <support/interfacename.h>
#include <unistd.h>

namespace vornovsctl {

namespace {

constexpr char kTakenOffPath[] = "/usr/vorn/etc/vornovs/ovs_ignore.conf";
constexpr char kInterfaceFilePrefix[] = "/etc/sysconfig/network-scripts/ifcfg-";

std::optional<Names> ReadInterfaces()
{
    Names bridges;
    if (VORN::OVS::OVSManager().GetSwitchList(bridges) < 0) {
        return std::nullopt;
    }
    Names interfaces;
    for (const std::string& bridge : bridges) {
        // The switch may have bridges of other programs.
        const std::string interface = InterfaceOf(bridge);
        if (!interface.empty()) {
            interfaces.insert(interface);
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

// The library's class for this list cannot be asked what is in it.
std::optional<Names> ReadTakenOff()
{
    if (access(kTakenOffPath, F_OK) != 0 && (errno == ENOENT || errno == ENOTDIR)) {
        return Names();
    }
    std::ifstream file(kTakenOffPath);
    if (!file) {
        return std::nullopt;
    }
    Names names;
    for (std::string line; std::getline(file, line);) {
        if (!line.empty()) {
            names.insert(line);
        }
    }
    return file.bad() ? std::nullopt : std::optional<Names>(names);
}

void ForgetTakenOff(const std::string& interface)
{
    (void)VORN::OVS::OVSIfsConf(kTakenOffPath).Remove(interface);
}

std::string ReadRecordedTag(const std::string& port)
{
    const auto file = vornhost::KeyValueFile::Load(kInterfaceFilePrefix + port);
    return file ? file->Get("OVS_VLAN_ID").value_or("") : "";
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
    state.takenOff = ReadTakenOff();
    if (state.takenOff) {
        for (const std::string& interface : state.interfaces.value_or(Names())) {
            state.takenOff->erase(interface);
        }
    }
    return state;
}

Json StateFields(const HostState& state)
{
    Json fields;
    fields["clients"] = NamesOrNull(state.clients);
    fields["switchRunning"] = state.switchRuns;
    fields["interfaces"] = nullptr;
    if (state.interfaces) {
        fields["interfaces"] = Json::array();
        for (const std::string& interface : *state.interfaces) {
            fields["interfaces"].push_back({{"name", interface}, {"bridge", BridgeOf(interface)}});
        }
    }
    fields["takenOff"] = NamesOrNull(state.takenOff);
    fields["consistent"] = state.IsConsistent();
    return fields;
}

std::string BridgeOf(const std::string& interface)
{
    return vornhost::kBridgePrefix + interface;
}

std::string InterfaceOf(const std::string& bridge)
{
    const bool ours =
        bridge.size() > vornhost::kBridgePrefixSize && bridge.starts_with(vornhost::kBridgePrefix);
    return ours ? bridge.substr(vornhost::kBridgePrefixSize) : "";
}

Json NamesOrNull(const std::optional<Names>& names)
{
    return names ? Json(*names) : Json(nullptr);
}

} // namespace vornovsctl
