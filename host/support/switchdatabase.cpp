#include "switchdatabase.h"

#include "databaseclient.h"

#include <algorithm>
#include <chrono>
#include <map>
#include <nlohmann/json.hpp>

namespace vornhost {

namespace {

using nlohmann::json;

constexpr char kSocket[] = "/var/run/openvswitch/db.sock";
constexpr std::chrono::seconds kLimit(10);

constexpr char kRequest[] =
    R"({"method":"transact","id":0,"params":["Open_vSwitch",)"
    R"({"op":"select","table":"Bridge","where":[],)"
    R"("columns":["name","ports"]},)"
    R"({"op":"select","table":"Port","where":[],)"
    R"("columns":["_uuid","name","interfaces","bond_mode","external_ids"]},)"
    R"({"op":"select","table":"Interface","where":[],)"
    R"("columns":["_uuid","name"]}]})";

// A reference is ["uuid", text]; a column of several values ["set", [values]].
std::string Reference(const json& value)
{
    return value.at(1).get<std::string>();
}

std::vector<std::string> References(const json& column)
{
    if (column.at(0) != "set") {
        return {Reference(column)};
    }
    std::vector<std::string> references;
    for (const json& element : column.at(1)) {
        references.push_back(Reference(element));
    }
    return references;
}

// A column of pairs is ["map", [[key, value]]].
bool HoldsMark(const json& column)
{
    const json& pairs = column.at(1);
    return std::any_of(pairs.begin(), pairs.end(), [](const json& pair) {
        return pair.at(0) == kSwitchMarkKey && pair.at(1) == kSwitchMarkValue;
    });
}

bool ByName(const SwitchPort& one, const SwitchPort& other)
{
    return one.name < other.name;
}

using Ports = std::map<std::string, SwitchPort>;

Ports ParsePorts(const json& portRows, const json& interfaceRows)
{
    std::map<std::string, std::string> interfaceNames;
    for (const json& row : interfaceRows) {
        interfaceNames[Reference(row.at("_uuid"))] = row.at("name").get<std::string>();
    }

    Ports ports;
    for (const json& row : portRows) {
        SwitchPort port;
        port.name = row.at("name").get<std::string>();
        for (const std::string& interface : References(row.at("interfaces"))) {
            port.interfaces.push_back(interfaceNames.at(interface));
        }
        std::sort(port.interfaces.begin(), port.interfaces.end());
        port.bond = port.interfaces.size() > 1 || row.at("bond_mode").is_string();
        port.marked = HoldsMark(row.at("external_ids"));
        ports[Reference(row.at("_uuid"))] = port;
    }
    return ports;
}

std::vector<SwitchBridge> ParseBridges(const json& rows, const Ports& ports)
{
    std::vector<SwitchBridge> bridges;
    for (const json& row : rows) {
        SwitchBridge bridge;
        bridge.name = row.at("name").get<std::string>();
        for (const std::string& port : References(row.at("ports"))) {
            bridge.ports.push_back(ports.at(port));
        }
        std::sort(bridge.ports.begin(), bridge.ports.end(), ByName);
        bridges.push_back(bridge);
    }
    std::sort(
        bridges.begin(), bridges.end(),
        [](const SwitchBridge& one, const SwitchBridge& other) { return one.name < other.name; });
    return bridges;
}

} // namespace

std::optional<std::vector<SwitchBridge>> ParseSwitchReply(std::string_view reply)
{
    try {
        const json tables = json::parse(reply).at("result");
        const json& bridges = tables.at(0).at("rows");
        const json& ports = tables.at(1).at("rows");
        const json& interfaces = tables.at(2).at("rows");
        return ParseBridges(bridges, ParsePorts(ports, interfaces));
    } catch (const json::exception&) {
        return std::nullopt;
    } catch (const std::out_of_range&) { // a reference to a row that is not there
        return std::nullopt;
    }
}

std::optional<std::vector<SwitchBridge>> ReadSwitch()
{
    const auto reply = AskDatabase(kSocket, kRequest, kLimit);
    return reply ? ParseSwitchReply(*reply) : std::nullopt;
}

const SwitchPort* FindUplink(const SwitchBridge& bridge, const std::string& primary)
{
    const SwitchPort* marked = nullptr;
    for (const SwitchPort& port : bridge.ports) {
        if (port.name == bridge.name) {
            continue;
        }
        if (port.name == primary) {
            return &port;
        }
        if (port.marked && marked == nullptr) {
            marked = &port;
        }
    }
    return marked;
}

} // namespace vornhost
