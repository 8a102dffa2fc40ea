#include "livestate.h"

#include <algorithm>
#include <array>
#include <filesystem>
#include <fstream>
#include <string_view>

namespace vornhost {
namespace {

constexpr char kSettingsFolder[] = "/proc/sys/net/";
constexpr std::array kSettingGroups{"ipv4.conf", "ipv4.neigh", "ipv6.conf", "ipv6.neigh"};

std::string GroupFolder(const std::string& interface, std::string group)
{
    std::replace(group.begin(), group.end(), '.', '/');
    return kSettingsFolder + group + "/" + interface;
}

} // namespace

const Link* LiveState::FindLink(const std::string& name) const
{
    const auto found =
        std::find_if(links.begin(), links.end(), [&](const Link& l) { return l.name == name; });
    return found == links.end() ? nullptr : &*found;
}

const Link* LiveState::FindLink(int index) const
{
    const auto found =
        std::find_if(links.begin(), links.end(), [&](const Link& l) { return l.index == index; });
    return found == links.end() ? nullptr : &*found;
}

std::string LiveState::NameOf(int index) const
{
    const Link* link = FindLink(index);
    return link == nullptr ? std::string() : link->name;
}

std::string LiveState::Setting(const std::string& interface, const std::string& name) const
{
    const auto found = settings.find(interface);
    if (found == settings.end()) {
        return {};
    }
    const auto setting = found->second.find(name);
    return setting == found->second.end() ? std::string() : setting->second;
}

std::optional<LiveState> ReadLiveState()
{
    LiveState live;
    live.links = ReadLinks();
    auto addresses = ReadAddresses();
    auto routes = ReadRoutes();
    auto neighbours = ReadNeighbours();
    if (live.links.empty() || !addresses || !routes || !neighbours) {
        return std::nullopt;
    }
    live.addresses = std::move(*addresses);
    live.routes = std::move(*routes);
    live.neighbours = std::move(*neighbours);
    return live;
}

void ReadSettings(const std::string& interface, LiveState& live)
{
    Settings& settings = live.settings[interface];
    for (const std::string group : kSettingGroups) {
        std::error_code error;
        for (const auto& entry :
             std::filesystem::directory_iterator(GroupFolder(interface, group), error)) {
            std::ifstream file(entry.path());
            std::string value;
            if (std::getline(file, value)) {
                settings[group + "." + entry.path().filename().string()] = value;
            }
        }
    }
}

std::string SettingPath(const std::string& interface, const std::string& name)
{
    const auto dot = name.rfind('.');
    return GroupFolder(interface, name.substr(0, dot)) + "/" + name.substr(dot + 1);
}

} // namespace vornhost
