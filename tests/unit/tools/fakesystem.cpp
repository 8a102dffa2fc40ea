#include "fakelibrary.h"

#include <nlohmann/json.hpp>
#include <support/databaseclient.h>
#include <support/netlink.h>

#include <chrono>

namespace {

using nlohmann::json;

json Set(const std::vector<json>& values)
{
    return values.size() == 1 ? values.front() : json{"set", values};
}

json PortRow(const std::string& name, bool wire)
{
    const json mark = json::array({"vornovs-network", "rc.network"});
    return {{"_uuid", {"uuid", "port " + name}},
            {"name", name},
            {"interfaces", {"uuid", "interface " + name}},
            {"tag", {"set", json::array()}},
            {"trunks", {"set", json::array()}},
            {"bond_mode", {"set", json::array()}},
            {"lacp", {"set", json::array()}},
            {"bond_active_slave", {"set", json::array()}},
            {"external_ids", {"map", wire ? json::array({mark}) : json::array()}}};
}

json InterfaceRow(const std::string& name)
{
    return {{"_uuid", {"uuid", "interface " + name}}, {"name", name},
            {"mac_in_use", {"set", json::array()}},   {"link_state", "up"},
            {"lacp_current", {"set", json::array()}}, {"error", {"set", json::array()}}};
}

} // namespace

namespace vornhost {

std::optional<std::string> AskDatabase(const std::string& /*socketPath*/,
                                       std::string_view /*request*/,
                                       std::chrono::milliseconds /*limit*/)
{
    const unit::FakeHost& host = unit::Host();
    if (host.answer || !host.ports) {
        return host.answer;
    }
    json bridges = json::array();
    json ports = json::array();
    json interfaces = json::array();
    for (const auto& [bridge, names] : *host.ports) {
        std::vector<json> references;
        for (const std::string& name : names) {
            ports.push_back(PortRow(name, host.wires.contains(name)));
            interfaces.push_back(InterfaceRow(name));
            references.push_back({"uuid", "port " + name});
        }
        bridges.push_back({{"name", bridge}, {"ports", Set(references)}});
    }
    const json reply{{"id", 0},
                     {"error", nullptr},
                     {"result", {{{"rows", bridges}}, {{"rows", ports}}, {{"rows", interfaces}}}}};
    return reply.dump();
}

std::vector<Link> ReadLinks()
{
    return unit::Host().links;
}

std::optional<std::vector<Address>> ReadAddresses()
{
    return unit::Host().addresses;
}

std::optional<std::vector<Route>> ReadRoutes()
{
    return unit::Host().routes;
}

} // namespace vornhost
