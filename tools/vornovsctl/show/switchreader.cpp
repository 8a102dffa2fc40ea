#include "show/switchreader.h"

#include <nlohmann/json.hpp>
#include <support/databaseclient.h>
#include <support/switchdatabase.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <map>
#include <unistd.h>

namespace vornovsctl {

namespace {

using nlohmann::json;

constexpr char kSocket[] = "/var/run/openvswitch/db.sock";
constexpr std::chrono::seconds kLimit(5);

constexpr char kRequest[] =
    R"({"method":"transact","id":0,"params":["Open_vSwitch",)"
    R"({"op":"select","table":"Bridge","where":[],"columns":["name","ports"]},)"
    R"({"op":"select","table":"Port","where":[],"columns":["_uuid","name","interfaces","tag",)"
    R"("trunks","bond_mode","lacp","bond_active_slave","external_ids"]},)"
    R"({"op":"select","table":"Interface","where":[],"columns":["_uuid","name","mac_in_use",)"
    R"("link_state","lacp_current","error"]}]})";

// A column holds one value, or ["set", [values]].
std::vector<json> Values(const json& column)
{
    if (column.is_array() && column.at(0) == "set") {
        return column.at(1).get<std::vector<json>>();
    }
    return {column};
}

template <typename T>
std::optional<T> Value(const json& row, const char* column)
{
    const std::vector<json> values = Values(row.at(column));
    return values.empty() ? std::nullopt : std::optional<T>(values.front().get<T>());
}

std::string Text(const json& row, const char* column)
{
    return Value<std::string>(row, column).value_or("");
}

// A reference is ["uuid", text].
std::string Identity(const json& reference)
{
    return reference.at(1).get<std::string>();
}

// A column of pairs is ["map", [[key, value]]].
bool IsMarked(const json& row)
{
    const json& pairs = row.at("external_ids").at(1);
    return std::any_of(pairs.begin(), pairs.end(), [](const json& pair) {
        return pair.at(0) == vornhost::kSwitchMarkKey && pair.at(1) == vornhost::kSwitchMarkValue;
    });
}

Member ParseMember(const json& row)
{
    Member member;
    member.name = row.at("name").get<std::string>();
    member.mac = Text(row, "mac_in_use");
    const std::string link = Text(row, "link_state");
    if (!link.empty()) {
        member.link = link == "up";
    }
    member.negotiated = Value<bool>(row, "lacp_current").value_or(false);
    member.error = Text(row, "error");
    return member;
}

Port ParsePort(const json& row, const std::map<std::string, Member>& members)
{
    Port port;
    port.name = row.at("name").get<std::string>();
    port.tag = Value<int>(row, "tag");
    for (const json& vlan : Values(row.at("trunks"))) {
        port.trunks.push_back(vlan.get<int>());
    }
    for (const json& reference : Values(row.at("interfaces"))) {
        port.members.push_back(members.at(Identity(reference)));
    }
    std::sort(port.members.begin(), port.members.end(), [](const Member& one, const Member& other) {
        return ComesBefore(one.name, other.name);
    });

    port.mode = Text(row, "bond_mode");
    port.bond = port.members.size() > 1 || !port.mode.empty();
    port.wire = IsMarked(row);
    if (port.bond) {
        // What the switch does when nothing is said.
        port.mode = port.mode.empty() ? "active-backup" : port.mode;
        port.lacp = Value<std::string>(row, "lacp").value_or("off");
        const std::string active = Text(row, "bond_active_slave");
        for (const Member& member : port.members) {
            if (!active.empty() && member.mac == active && port.mode == "active-backup") {
                port.active = member.name;
            }
        }
    }
    return port;
}

Bridge ParseBridge(const json& row, const std::map<std::string, Port>& ports)
{
    Bridge bridge;
    bridge.name = row.at("name").get<std::string>();
    for (const json& reference : Values(row.at("ports"))) {
        const Port& port = ports.at(Identity(reference));
        if (port.name == bridge.name) {
            bridge.tag = port.tag;
        } else {
            bridge.ports.push_back(port);
        }
    }
    std::sort(bridge.ports.begin(), bridge.ports.end(), [](const Port& one, const Port& other) {
        return one.wire == other.wire ? ComesBefore(one.name, other.name) : one.wire;
    });
    return bridge;
}

std::vector<Bridge> ParseTables(const json& tables)
{
    std::map<std::string, Member> members;
    for (const json& row : tables.at(2).at("rows")) {
        members[Identity(row.at("_uuid"))] = ParseMember(row);
    }
    std::map<std::string, Port> ports;
    for (const json& row : tables.at(1).at("rows")) {
        ports[Identity(row.at("_uuid"))] = ParsePort(row, members);
    }
    std::vector<Bridge> bridges;
    for (const json& row : tables.at(0).at("rows")) {
        bridges.push_back(ParseBridge(row, ports));
    }
    std::sort(bridges.begin(), bridges.end(), [](const Bridge& one, const Bridge& other) {
        return ComesBefore(one.name, other.name);
    });
    return bridges;
}

} // namespace

std::optional<std::vector<Bridge>> ParseSwitch(std::string_view reply)
{
    try {
        return ParseTables(json::parse(reply).at("result"));
    } catch (const json::exception&) {
        return std::nullopt;
    } catch (const std::out_of_range&) { // a reference to a row that is not there
        return std::nullopt;
    }
}

SwitchAnswer AskSwitch()
{
    SwitchAnswer answer;
    if (access(kSocket, R_OK | W_OK) != 0 && errno == EACCES) {
        answer.fault = "the switch can only be asked by root";
        return answer;
    }
    const auto reply = vornhost::AskDatabase(kSocket, kRequest, kLimit);
    if (!reply) {
        answer.fault = "the switch's database does not answer";
        return answer;
    }
    answer.bridges = ParseSwitch(*reply);
    if (!answer.bridges) {
        answer.fault = "the answer of the switch's database cannot be understood";
    }
    return answer;
}

const Bridge* FindBridgeOfPort(const std::vector<Bridge>& bridges, const std::string& port)
{
    const auto found = std::find_if(bridges.begin(), bridges.end(), [&](const Bridge& bridge) {
        return bridge.Find(port) != nullptr;
    });
    return found == bridges.end() ? nullptr : &*found;
}

} // namespace vornovsctl
