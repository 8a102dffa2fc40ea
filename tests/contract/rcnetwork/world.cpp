#include "world.h"

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <stdexcept>

#include <linux/rtnetlink.h>
#include <nlohmann/json.hpp>
#include <sys/socket.h>

namespace contract {
namespace {

using namespace vornhost;
using Json = nlohmann::json;

constexpr unsigned kEthernet = 1;

int Family(const std::string& address)
{
    return address.find(':') == std::string::npos ? AF_INET : AF_INET6;
}

/** "192.0.2.1/24" as address and length. */
std::pair<std::string, unsigned> Split(const std::string& text)
{
    const auto slash = text.find('/');
    return {text.substr(0, slash), static_cast<unsigned>(std::stoul(text.substr(slash + 1)))};
}

Link ReadLink(const Json& json)
{
    Link link;
    link.index = json.at("index");
    link.name = json.at("name");
    link.mac = json.value("mac", "");
    link.mtu = json.value("mtu", 1500U);
    link.up = json.value("up", true);
    link.carrier = json.value("carrier", link.up);
    link.kind = json.value("kind", "");
    link.master = json.value("master", 0);
    link.parent = json.value("parent", 0);
    link.vlanId = json.value("vlan", -1);
    link.token = json.value("token", "");
    link.type = kEthernet;
    return link;
}

int IndexOf(const LiveState& live, const std::string& name)
{
    const Link* link = live.FindLink(name);
    if (link == nullptr) {
        throw std::runtime_error("the world has no link " + name);
    }
    return link->index;
}

Address ReadAddress(const Json& json, const LiveState& live)
{
    Address address;
    address.index = IndexOf(live, json.at("dev"));
    std::tie(address.local, address.prefixLength) = Split(json.at("address"));
    address.family = Family(address.local);
    address.peer = json.value("peer", "");
    address.broadcast = json.value("broadcast", "");
    address.label = json.value("label", "");
    address.flags = json.value("flags", 0x80U);
    address.metric = json.value("metric", 0U);
    address.validSeconds = json.value("valid", UINT32_MAX);
    address.preferredSeconds = json.value("preferred", address.validSeconds);
    address.scope = address.local.rfind("fe80:", 0) == 0 ? RT_SCOPE_LINK : RT_SCOPE_UNIVERSE;
    return address;
}

NextHop ReadHop(const Json& json, const LiveState& live, int family)
{
    NextHop hop;
    hop.index = IndexOf(live, json.at("dev"));
    hop.gateway = json.value("via", "");
    hop.gatewayFamily = hop.gateway.empty() ? family : Family(hop.gateway);
    hop.weight = json.value("weight", 1U);
    return hop;
}

Route ReadRoute(const Json& json, const LiveState& live)
{
    Route route;
    const std::string to = json.at("to");
    if (to == "default" || to == "default6") {
        route.family = to == "default" ? AF_INET : AF_INET6;
    } else {
        std::tie(route.destination, route.prefixLength) = Split(to);
        route.family = Family(route.destination);
    }
    route.type = json.value("type", static_cast<unsigned>(RTN_UNICAST));
    route.table = json.value("table", static_cast<unsigned>(RT_TABLE_MAIN));
    route.protocol = json.value("proto", static_cast<unsigned>(RTPROT_BOOT));
    route.priority = json.value("metric", 0U);
    route.source = json.value("src", "");
    route.expiresSeconds = json.value("expires", 0U);
    if (json.contains("mtu")) {
        route.metrics.push_back({RTAX_MTU, json.at("mtu"), false});
    }
    if (json.contains("hops")) {
        for (const Json& hop : json.at("hops")) {
            route.nextHops.push_back(ReadHop(hop, live, route.family));
        }
    } else if (route.type == RTN_UNICAST) {
        route.nextHops.push_back(ReadHop(json, live, route.family));
    }
    const bool direct =
        route.family == AF_INET && !route.nextHops.empty() && route.nextHops[0].gateway.empty();
    route.scope = direct ? RT_SCOPE_LINK : RT_SCOPE_UNIVERSE;
    return route;
}

Neighbour ReadNeighbour(const Json& json, const LiveState& live)
{
    Neighbour neighbour;
    neighbour.index = IndexOf(live, json.at("dev"));
    neighbour.address = json.at("address");
    neighbour.family = Family(neighbour.address);
    neighbour.mac = json.at("mac");
    neighbour.permanent = json.value("permanent", false);
    neighbour.router = json.value("router", false);
    return neighbour;
}

LiveState ReadLive(const Json& json)
{
    LiveState live;
    for (const Json& each : json.at("links")) {
        live.links.push_back(ReadLink(each));
    }
    for (const Json& each : json.value("addresses", Json::array())) {
        live.addresses.push_back(ReadAddress(each, live));
    }
    for (const Json& each : json.value("routes", Json::array())) {
        live.routes.push_back(ReadRoute(each, live));
    }
    for (const Json& each : json.value("neighbours", Json::array())) {
        live.neighbours.push_back(ReadNeighbour(each, live));
    }
    const Json bonds = json.value("bonds", Json::object());
    for (const auto& [name, bond] : bonds.items()) {
        live.bonds[name] = {bond.at("members"),
                            bond.value("ownMacs", std::map<std::string, std::string>()),
                            bond.value("options", std::map<std::string, std::string>())};
    }
    const Json settingsOf = json.value("settings", Json::object());
    for (const auto& [name, settings] : settingsOf.items()) {
        live.settings[name] = settings.get<Settings>();
    }
    return live;
}

SwitchPort ReadPort(const std::string& name, const Json& json)
{
    SwitchPort port;
    port.name = name;
    port.marked = json.value("ours", true);
    port.interfaces = json.value("interfaces", std::vector<std::string>{name});
    port.working = json.value("working", true) ? port.interfaces : std::vector<std::string>();
    port.bond = port.interfaces.size() > 1 || json.value("bond", false);
    port.columns = json.value("columns", SwitchValues());
    port.otherConfig = json.value("otherConfig", SwitchValues());
    port.externalIds = json.value("externalIds", SwitchValues());
    if (json.contains("tag")) {
        port.tag = json.at("tag").get<unsigned>();
    }
    if (json.contains("mtu")) {
        port.mtuRequest = json.at("mtu").get<unsigned>();
    }
    return port;
}

SwitchState ReadSwitch(const Json& json)
{
    SwitchState state;
    state.running = json.value("running", true);
    state.hung = json.value("hung", false);
    const Json bridges = json.value("bridges", Json::object());
    for (const auto& [name, bridge] : bridges.items()) {
        SwitchBridge& made = state.bridges.emplace_back();
        made.name = name;
        made.marked = bridge.value("ours", true);
        made.hwaddr = bridge.value("hwaddr", "");
        for (const auto& [portName, port] : bridge.at("ports").items()) {
            made.ports.push_back(ReadPort(portName, port));
        }
    }
    return state;
}

Request ReadRequest(const Json& json)
{
    Request request;
    request.verb = json.value("verb", "start") == "stop" ? Verb::kStop : Verb::kStart;
    request.names = json.value("names", std::set<std::string>());
    request.withoutSwitch = json.value("withoutSwitch", std::set<std::string>());
    return request;
}

/** The texts of a folder's configuration files, by interface. */
std::map<std::string, std::string> ReadTexts(const std::string& folder)
{
    std::map<std::string, std::string> texts;
    for (const auto& entry : std::filesystem::directory_iterator(folder)) {
        const std::string name = InterfaceOfFileName(entry.path().filename());
        if (!name.empty()) {
            texts[name] = ReadText(entry.path());
        }
    }
    return texts;
}

const char* Word(Severity severity)
{
    switch (severity) {
    case Severity::kError:
        return "error";
    case Severity::kWarning:
        return "warning";
    case Severity::kNotice:
        break;
    }
    return "notice";
}

} // namespace

std::string ReadText(const std::string& path)
{
    std::ifstream file(path);
    if (!file) {
        throw std::runtime_error("cannot read " + path);
    }
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

World ReadWorld(const std::string& folder)
{
    return ReadWorld(Json::parse(ReadText(folder + "/world.json")), ReadTexts(folder));
}

World ReadWorld(const nlohmann::json& json, const std::map<std::string, std::string>& files)
{
    World world;
    for (const auto& [name, text] : files) {
        ParsedFile parsed = ParseInterfaceFile(name, text);
        world.remarks.insert(world.remarks.end(), parsed.remarks.begin(), parsed.remarks.end());
        world.inputs.files[name] = parsed.file;
    }
    world.inputs.request = ReadRequest(json.value("request", Json::object()));
    world.inputs.live = ReadLive(json);
    world.inputs.switchState = ReadSwitch(json.value("switch", Json{{"running", false}}));
    world.inputs.gateways = GatewayStore::Parse(json.value("gateways", "")).Records();
    const Json formerBonds = json.value("formerBonds", Json::object());
    for (const auto& [name, bond] : formerBonds.items()) {
        FormerBond& former = world.inputs.formerBonds[name];
        former.bond.slaves = bond.at("members").get<std::vector<std::string>>();
        former.bond.mac = bond.at("mac").get<std::string>();
        former.columns = bond.value("columns", SwitchValues());
    }
    const Json clients = json.value("clients", Json::object());
    for (const auto& [name, client] : clients.items()) {
        world.inputs.clients[name] = {client.value("running", true),
                                      ParseClientText(client.at("options"))};
    }
    if (json.contains("handover")) {
        world.inputs.handover = ParseHandover(json.at("handover").dump(), 0);
    }
    if (json.contains("record")) {
        world.inputs.runState = ParseRunState(json.at("record").dump());
    }
    return world;
}

std::string Describe(const Plan& plan, const std::vector<Remark>& remarks)
{
    std::string text = plan.Text();
    for (const auto* part : {&remarks, &plan.remarks}) {
        for (const Remark& remark : *part) {
            text += std::string(Word(remark.severity)) + ": " + remark.text + "\n";
        }
    }
    return text.empty() ? "nothing\n" : text;
}

} // namespace contract
