#include "runstate.h"

#include <nlohmann/json.hpp>

namespace vornhost {
namespace {

using Json = nlohmann::json;

constexpr int kVersion = 1;

std::optional<unsigned> ReadNumber(const Json& object, const char* key)
{
    return object.contains(key) ? std::optional(object.at(key).get<unsigned>()) : std::nullopt;
}

InterfaceRecord ReadRecord(const Json& object)
{
    InterfaceRecord record;
    record.addresses = object.at("addresses").get<std::set<std::string>>();
    record.routes = object.at("routes").get<std::set<std::string>>();
    record.unchecked = object.at("unchecked").get<std::set<std::string>>();
    record.broughtUp = object.at("broughtUp").get<bool>();
    record.made = object.value("made", false);
    record.client = object.value("client", false);
    record.ownSettings = object.value("ownSettings", record.ownSettings);
    record.resolver = object.value("resolver", "");
    record.linkCommands = object.value("linkCommands", "");
    record.ownMac = object.value("ownMac", "");
    record.formerMtu = ReadNumber(object, "formerMtu");
    record.tag = ReadNumber(object, "tag");
    record.formerSettings = object.at("formerSettings").get<std::map<std::string, std::string>>();
    return record;
}

Json WriteRecord(const InterfaceRecord& record)
{
    Json object = {{"addresses", record.addresses},
                   {"routes", record.routes},
                   {"unchecked", record.unchecked},
                   {"broughtUp", record.broughtUp},
                   {"formerSettings", record.formerSettings}};
    if (record.made) {
        object["made"] = true;
    }
    if (record.client) {
        object["client"] = true;
    }
    if (!record.ownSettings.empty()) {
        object["ownSettings"] = record.ownSettings;
    }
    if (!record.resolver.empty()) {
        object["resolver"] = record.resolver;
    }
    if (!record.linkCommands.empty()) {
        object["linkCommands"] = record.linkCommands;
    }
    if (!record.ownMac.empty()) {
        object["ownMac"] = record.ownMac;
    }
    if (record.formerMtu) {
        object["formerMtu"] = *record.formerMtu;
    }
    if (record.tag) {
        object["tag"] = *record.tag;
    }
    return object;
}

} // namespace

bool InterfaceRecord::Empty() const
{
    return addresses.empty() && routes.empty() && unchecked.empty() && !broughtUp && !made &&
           !client && resolver.empty() && linkCommands.empty() && ownMac.empty() && !formerMtu &&
           !tag && formerSettings.empty() && ownSettings.empty();
}

RunState ParseRunState(const std::string& text)
{
    RunState state;
    try {
        const Json json = Json::parse(text);
        if (json.at("version").get<int>() != kVersion) {
            return {};
        }
        for (const auto& [name, record] : json.at("interfaces").items()) {
            state.interfaces[name] = ReadRecord(record);
        }
    } catch (const std::exception&) {
        return {};
    }
    return state;
}

std::string RunStateText(const RunState& state)
{
    Json interfaces = Json::object();
    for (const auto& [name, record] : state.interfaces) {
        if (!record.Empty()) {
            interfaces[name] = WriteRecord(record);
        }
    }
    return Json{{"version", kVersion}, {"interfaces", interfaces}}.dump(1) + "\n";
}

} // namespace vornhost
