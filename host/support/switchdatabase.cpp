#include "switchdatabase.h"

#include "databaseclient.h"

#include <algorithm>
#include <nlohmann/json.hpp>

namespace vornhost {

namespace {

using nlohmann::json;

constexpr char kRequest[] =
    R"({"method":"transact","id":0,"params":["Open_vSwitch",)"
    R"({"op":"select","table":"Bridge","where":[],"columns":)"
    R"(["name","ports","external_ids","other_config","datapath_type"]},)"
    R"({"op":"select","table":"Port","where":[]},)"
    R"({"op":"select","table":"Interface","where":[],"columns":)"
    R"(["_uuid","name","ofport","error","mtu_request","lacp_current","mac_in_use",)"
    R"("link_state"]}]})";

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
SwitchValues Pairs(const json& row, const char* column)
{
    SwitchValues values;
    if (row.contains(column)) {
        for (const json& pair : row.at(column).at(1)) {
            values[pair.at(0).get<std::string>()] = pair.at(1).get<std::string>();
        }
    }
    return values;
}

bool HoldsMark(const SwitchValues& externalIds)
{
    const auto mark = externalIds.find(kSwitchMarkKey);
    return mark != externalIds.end() && mark->second == kSwitchMarkValue;
}

std::optional<unsigned> Number(const json& row, const char* column)
{
    const auto found = row.find(column);
    if (found == row.end() || !found->is_number_unsigned()) {
        return std::nullopt;
    }
    return found->get<unsigned>();
}

std::string Text(const json& row, const char* column)
{
    const auto found = row.find(column);
    return found != row.end() && found->is_string() ? found->get<std::string>() : "";
}

// What a column holds, when that is one value and says something.
SwitchValues SingleValues(const json& row)
{
    SwitchValues values;
    for (const auto& [column, value] : row.items()) {
        if (column == "name") {
            continue;
        }
        if (value.is_string() && !value.get<std::string>().empty()) {
            values[column] = value.get<std::string>();
        } else if (value.is_number() || value.is_boolean()) {
            values[column] = value.dump();
        }
    }
    return values;
}

bool ByName(const auto& one, const auto& other)
{
    return one.name < other.name;
}

using InterfaceRows = std::map<std::string, json>;
using Ports = std::map<std::string, SwitchPort>;

SwitchInterface ParseState(const json& row)
{
    SwitchInterface state;
    state.name = row.at("name").get<std::string>();
    state.mac = Text(row, "mac_in_use");
    const std::string link = Text(row, "link_state");
    if (!link.empty()) {
        state.link = link == "up";
    }
    state.negotiated = row.value("lacp_current", json()) == json(true);
    state.error = Text(row, "error");
    return state;
}

void ParseInterface(const json& row, SwitchPort& port)
{
    const SwitchInterface state = ParseState(row);
    if (port.interfaces.empty()) {
        port.mtuRequest = Number(row, "mtu_request");
    }
    port.interfaces.push_back(state.name);
    if (Number(row, "ofport") && state.error.empty()) {
        port.working.push_back(state.name);
    }
    port.negotiated = port.negotiated || state.negotiated;
    port.state.push_back(state);
}

// A column of one VLAN is a number; of several, or none, ["set", [numbers]].
std::vector<unsigned> Vlans(const json& row, const char* column)
{
    if (const auto single = Number(row, column)) {
        return {*single};
    }
    const auto found = row.find(column);
    return found == row.end() ? std::vector<unsigned>() : found->at(1).get<std::vector<unsigned>>();
}

SwitchPort ParsePort(const json& row, const InterfaceRows& interfaces)
{
    SwitchPort port;
    port.name = row.at("name").get<std::string>();
    for (const std::string& interface : References(row.at("interfaces"))) {
        ParseInterface(interfaces.at(interface), port);
    }
    std::sort(port.interfaces.begin(), port.interfaces.end());
    std::sort(port.working.begin(), port.working.end());
    std::sort(port.state.begin(), port.state.end(), ByName<SwitchInterface, SwitchInterface>);
    port.columns = SingleValues(row);
    port.otherConfig = Pairs(row, "other_config");
    port.externalIds = Pairs(row, "external_ids");
    port.bond = port.interfaces.size() > 1 || port.columns.contains("bond_mode");
    port.marked = HoldsMark(port.externalIds);
    port.tag = Number(row, "tag");
    port.trunks = Vlans(row, "trunks");
    return port;
}

Ports ParsePorts(const json& portRows, const json& interfaceRows)
{
    InterfaceRows interfaces;
    for (const json& row : interfaceRows) {
        interfaces[Reference(row.at("_uuid"))] = row;
    }
    Ports ports;
    for (const json& row : portRows) {
        ports[Reference(row.at("_uuid"))] = ParsePort(row, interfaces);
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
        std::sort(bridge.ports.begin(), bridge.ports.end(), ByName<SwitchPort, SwitchPort>);
        bridge.marked = HoldsMark(Pairs(row, "external_ids"));
        bridge.hwaddr = Pairs(row, "other_config")["hwaddr"];
        bridge.datapathType = Text(row, "datapath_type");
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

std::optional<std::vector<SwitchBridge>> ReadSwitch(std::chrono::milliseconds limit)
{
    const auto reply = AskDatabase(kSwitchSocket, kRequest, limit);
    return reply ? ParseSwitchReply(*reply) : std::nullopt;
}

const SwitchPort* SwitchBridge::FindPort(const std::string& port) const
{
    const auto found = std::find_if(ports.begin(), ports.end(),
                                    [&](const SwitchPort& each) { return each.name == port; });
    return found == ports.end() ? nullptr : &*found;
}

const SwitchPort* SwitchBridge::FindBond() const
{
    const auto found = std::find_if(ports.begin(), ports.end(), [](const SwitchPort& port) {
        return port.bond && port.marked;
    });
    return found == ports.end() ? nullptr : &*found;
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
        if (port.marked && !port.IsFurther() && marked == nullptr) {
            marked = &port;
        }
    }
    return marked;
}

} // namespace vornhost
