#include "show/hostjson.h"

namespace vornovsctl {

namespace {

template <typename T>
Json OrNull(const std::optional<T>& value)
{
    return value ? Json(*value) : Json(nullptr);
}

Json OrNull(const std::string& text)
{
    return text.empty() ? Json(nullptr) : Json(text);
}

Json Of(const DefaultRoute& route)
{
    return {{"family", route.ipv6 ? "ipv6" : "ipv4"},
            {"gateway", OrNull(route.gateway)},
            {"metric", route.metric},
            {"table", route.table == 0 ? Json("main") : Json(route.table)}};
}

Json Of(const LinuxBond& bond)
{
    return {{"mode", bond.mode},
            {"active", OrNull(bond.active)},
            {"lacpNegotiated", OrNull(bond.negotiated)}};
}

Json Of(const Device& device)
{
    Json object{{"name", device.name},
                {"kind", OrNull(device.kind)},
                {"mac", OrNull(device.mac)},
                {"mtu", device.mtu},
                {"up", device.up},
                {"carrier", device.carrier},
                {"speed", OrNull(device.speed)},
                {"addresses", device.addresses}};
    object["defaultRoutes"] = Json::array();
    for (const DefaultRoute& route : device.routes) {
        object["defaultRoutes"].push_back(Of(route));
    }
    object["master"] = OrNull(device.master);
    object["parent"] = OrNull(device.parent);
    object["vlan"] = OrNull(device.vlan);
    object["bond"] = device.bond ? Of(*device.bond) : Json(nullptr);
    object["onTheSwitch"] = device.onTheSwitch;
    return object;
}

Json Of(const Member& member)
{
    return {{"name", member.name},
            {"mac", OrNull(member.mac)},
            {"link", OrNull(member.link)},
            {"lacpNegotiated", member.negotiated},
            {"error", OrNull(member.error)}};
}

Json Of(const Port& port)
{
    Json object{{"name", port.name},
                {"tag", OrNull(port.tag)},
                {"trunks", port.trunks},
                {"wire", port.wire},
                {"bond", nullptr}};
    if (port.bond) {
        object["bond"] = {{"mode", port.mode},
                          {"lacp", port.lacp},
                          {"lacpNegotiated", port.IsNegotiated()},
                          {"active", OrNull(port.active)}};
    }
    object["members"] = Json::array();
    for (const Member& member : port.members) {
        object["members"].push_back(Of(member));
    }
    return object;
}

Json Of(const Bridge& bridge)
{
    Json object{{"name", bridge.name}, {"tag", OrNull(bridge.tag)}};
    object["ports"] = Json::array();
    for (const Port& port : bridge.ports) {
        object["ports"].push_back(Of(port));
    }
    return object;
}

} // namespace

Json FieldsOf(const HostModel& host)
{
    Json fields;
    fields["host"] = host.name;
    fields["clients"] = NamesOrNull(host.clients);
    fields["takenOff"] = NamesOrNull(host.takenOff);
    fields["switchRunning"] = host.switchRuns;
    fields["bridges"] = nullptr;
    if (host.bridges) {
        fields["bridges"] = Json::array();
        for (const Bridge& bridge : *host.bridges) {
            fields["bridges"].push_back(Of(bridge));
        }
    }
    fields["devices"] = Json::array();
    for (const Device& device : host.devices) {
        fields["devices"].push_back(Of(device));
    }
    fields["unread"] = host.unread;
    return fields;
}

} // namespace vornovsctl
