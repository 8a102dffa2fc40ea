#include "livestate.h"

#include "support/bondoptions.h"

#include <algorithm>
#include <array>
#include <filesystem>
#include <fstream>
#include <string_view>

namespace vornhost {
namespace {

constexpr char kSettingsFolder[] = "/proc/sys/net/";
constexpr char kBondFolder[] = "/proc/net/bonding/";
constexpr std::array kSettingGroups{"ipv4.conf", "ipv4.neigh", "ipv6.conf", "ipv6.neigh"};

std::string GroupFolder(const std::string& interface, std::string group)
{
    std::replace(group.begin(), group.end(), '.', '/');
    return kSettingsFolder + group + "/" + interface;
}

/** The kernel tells nowhere else what a member's link address was. */
std::map<std::string, std::string> ReadOwnMacs(const std::string& bond)
{
    constexpr std::string_view kMember = "Slave Interface: ";
    constexpr std::string_view kAddress = "Permanent HW addr: ";
    std::map<std::string, std::string> macs;
    std::ifstream file(kBondFolder + bond);
    std::string member;
    for (std::string line; std::getline(file, line);) {
        if (line.rfind(kMember, 0) == 0) {
            member = line.substr(kMember.size());
        } else if (line.rfind(kAddress, 0) == 0) {
            macs[member] = line.substr(kAddress.size());
        }
    }
    return macs;
}

LiveBond ReadBond(const Link& bond, const std::vector<Link>& links)
{
    LiveBond read;
    if (const auto members = ReadLiveSlaves(bond.name)) {
        read.members = *members;
    } else {
        for (const Link& link : links) {
            if (link.master == bond.index) {
                read.members.push_back(link.name);
            }
        }
    }
    read.ownMacs = ReadOwnMacs(bond.name);
    if (const auto options = BondOptions::ReadLive(bond.name)) {
        read.options = options->values;
    }
    return read;
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

bool IsOfMadeKind(const Link& link)
{
    return link.kind == "bond" || link.kind == "vlan" || link.kind == "bridge";
}

std::vector<std::string> LiveState::WithVlans(const Link& link) const
{
    std::vector<std::string> names{link.name};
    for (const Link& each : links) {
        if (each.kind == "vlan" && each.parent == link.index) {
            names.push_back(each.name);
        }
    }
    return names;
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
    for (const Link& link : live.links) {
        if (link.kind == "bond") {
            live.bonds[link.name] = ReadBond(link, live.links);
        }
    }
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
