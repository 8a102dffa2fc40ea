#include "switchstate.h"

#include <algorithm>
#include <sstream>

#include <nlohmann/json.hpp>

namespace vornhost {
namespace {

using Json = nlohmann::json;
using Rows = std::map<std::string, Json>; // by UUID, each an object of columns

constexpr std::size_t kTables = 3;

/** The database writes a set of one element as the element itself. */
std::vector<Json> Elements(const Json& value)
{
    if (value.is_array() && value.size() == 2 && value[0] == "set") {
        return value[1].get<std::vector<Json>>();
    }
    return {value};
}

std::map<std::string, std::string> Map(const Json& value)
{
    std::map<std::string, std::string> map;
    for (const Json& pair : value.at(1)) {
        map[pair.at(0).get<std::string>()] = pair.at(1).get<std::string>();
    }
    return map;
}

std::optional<unsigned> Number(const Json& value)
{
    const auto elements = Elements(value);
    if (elements.empty() || !elements[0].is_number_integer()) {
        return std::nullopt;
    }
    const auto number = elements[0].get<std::int64_t>();
    return number < 0 ? std::nullopt : std::optional(static_cast<unsigned>(number));
}

std::string Text(const Json& value)
{
    const auto elements = Elements(value);
    return elements.empty() || !elements[0].is_string() ? "" : elements[0].get<std::string>();
}

bool IsOurs(const Json& externalIds)
{
    const auto map = Map(externalIds);
    const auto mark = map.find(kMarkKey);
    return mark != map.end() && mark->second == kMarkValue;
}

Rows ReadTable(const Json& table)
{
    Rows rows;
    const auto headings = table.at("headings").get<std::vector<std::string>>();
    for (const Json& line : table.at("data")) {
        Json row = Json::object();
        for (std::size_t i = 0; i < headings.size(); ++i) {
            row[headings[i]] = line.at(i);
        }
        const std::string uuid = row.at("_uuid").at(1).get<std::string>();
        rows[uuid] = std::move(row);
    }
    return rows;
}

SwitchPort ReadPort(const Json& row, const Rows& interfaces)
{
    SwitchPort port;
    port.name = row.at("name").get<std::string>();
    port.ours = IsOurs(row.at("external_ids"));
    port.tag = Number(row.at("tag"));
    for (const Json& reference : Elements(row.at("interfaces"))) {
        const Json& interface = interfaces.at(reference.at(1).get<std::string>());
        port.working =
            Number(interface.at("ofport")).has_value() && Text(interface.at("error")).empty();
        port.mtuRequest = Number(interface.at("mtu_request"));
    }
    return port;
}

SwitchBridge ReadBridge(const Json& row, const Rows& ports, const Rows& interfaces)
{
    SwitchBridge bridge;
    bridge.name = row.at("name").get<std::string>();
    bridge.ours = IsOurs(row.at("external_ids"));
    bridge.hwaddr = Map(row.at("other_config"))["hwaddr"];
    bridge.datapathType = Text(row.at("datapath_type"));
    for (const Json& reference : Elements(row.at("ports"))) {
        const Json& port = ports.at(reference.at(1).get<std::string>());
        bridge.ports.push_back(ReadPort(port, interfaces));
    }
    std::sort(bridge.ports.begin(), bridge.ports.end(),
              [](const auto& one, const auto& other) { return one.name < other.name; });
    return bridge;
}

} // namespace

const SwitchPort* SwitchBridge::FindPort(const std::string& port) const
{
    const auto found = std::find_if(ports.begin(), ports.end(),
                                    [&](const SwitchPort& each) { return each.name == port; });
    return found == ports.end() ? nullptr : &*found;
}

const SwitchBridge* SwitchState::Find(const std::string& bridge) const
{
    const auto found = bridges.find(bridge);
    return found == bridges.end() ? nullptr : &found->second;
}

std::vector<std::string> SwitchTablesArguments()
{
    return {"--format=json",
            "--",
            "--columns=_uuid,name,ports,external_ids,other_config,datapath_type",
            "list",
            "Bridge",
            "--",
            "--columns=_uuid,name,interfaces,external_ids,tag",
            "list",
            "Port",
            "--",
            "--columns=_uuid,name,ofport,error,mtu_request",
            "list",
            "Interface"};
}

std::optional<SwitchState> ParseSwitchTables(const std::string& text)
{
    std::vector<Rows> tables;
    SwitchState state;
    try {
        std::istringstream stream(text);
        while (tables.size() < kTables) {
            Json table;
            stream >> table;
            tables.push_back(ReadTable(table));
        }
        for (const auto& [uuid, row] : tables[0]) {
            SwitchBridge bridge = ReadBridge(row, tables[1], tables[2]);
            state.bridges[bridge.name] = std::move(bridge);
        }
    } catch (const std::exception&) {
        return std::nullopt;
    }
    state.running = true;
    return state;
}

} // namespace vornhost
