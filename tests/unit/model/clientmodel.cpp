#include "model/clientmodel.h"

#include <vornovs/vornovs.h>

#include <algorithm>

namespace unit {

namespace {

using VORN::OVS::BondManager;

int Converted(int mode)
{
    return BondManager::DefaultModeConvert(static_cast<VORN_LINK_AGGR_MODE>(mode));
}

std::string Plain(const std::string& bridge)
{
    return bridge.substr(std::string("ovs_").size());
}

/** The file that holds the names; there is none for no name. */
std::optional<std::string> ListOf(const Names& names)
{
    std::string text;
    for (const std::string& name : names) {
        text += name + "\n";
    }
    return names.empty() ? std::nullopt : std::optional(text);
}

} // namespace

std::string ClientModel::BondOf(const std::string& interface) const
{
    for (const auto& [name, bond] : bonds) {
        if (std::count(bond.slaves.begin(), bond.slaves.end(), interface) > 0) {
            return name;
        }
    }
    return {};
}

std::vector<std::string> ClientModel::Bridged() const
{
    std::vector<std::string> names;
    for (const std::string& interface : onSwitch) {
        if (BondOf(interface).empty()) {
            names.push_back(interface);
        }
    }
    return names;
}

std::vector<std::string> ClientModel::Bridges() const
{
    std::vector<std::string> names;
    for (const std::string& interface : Bridged()) {
        names.push_back("ovs_" + interface);
    }
    for (const auto& [name, bond] : bonds) {
        names.push_back(name);
    }
    return names;
}

void ClientModel::ConvertAll()
{
    onSwitch = interfaces;
    for (const auto& [name, bond] : linuxBonds) {
        bonds["ovs_" + name] = {Converted(bond.mode), bond.slaves};
    }
    for (const auto& [name, vlan] : linuxVlans) {
        const bool ofBond = linuxBonds.contains(vlan.parent);
        tags[(ofBond ? "ovs_" : "") + vlan.parent] = std::to_string(vlan.id);
    }
    linuxBonds.clear();
    linuxVlans.clear();
}

void ClientModel::ConvertAllBack()
{
    const auto makeVlan = [this](const std::string& owner, const std::string& parent) {
        const auto tag = tags.find(owner);
        if (tag != tags.end()) {
            linuxVlans[parent + "." + tag->second] = {parent, std::stoi(tag->second)};
            tags.erase(tag);
        }
    };
    for (const std::string& interface : Bridged()) {
        makeVlan(interface, interface);
    }
    for (const auto& [name, bond] : bonds) {
        linuxBonds[Plain(name)] = {Converted(bond.mode), bond.slaves};
        makeVlan(name, Plain(name));
    }
    onSwitch.clear();
    bonds.clear();
    ports.clear();
}

void ClientModel::MakeBond(const std::string& name, int mode,
                           const std::vector<std::string>& slaves)
{
    bonds[name] = {mode, slaves};
    for (const std::string& slave : slaves) {
        ports.erase("ovs_" + slave);
    }
}

void ClientModel::DropBond(const std::string& name)
{
    if (tags.contains(name)) {
        tags[bonds[name].slaves.front()] = tags[name];
    }
    tags.erase(name);
    bonds.erase(name);
    ports.erase(name);
}

void ClientModel::TakeOff(const std::string& interface)
{
    onSwitch.erase(interface);
    ports.erase("ovs_" + interface);
    ignored.insert(interface);
}

void ClientModel::PutOn(const std::string& interface)
{
    onSwitch.insert(interface);
    ignored.erase(interface);
}

void ClientModel::ExpectAgreement(const SimulatedHost& host) const
{
    std::map<std::string, SimulatedHost::Bridge> live;
    for (const std::string& bridge : Bridges()) {
        const auto tag = tags.find(bonds.contains(bridge) ? bridge : Plain(bridge));
        const auto plugged = ports.find(bridge);
        live[bridge] = {tag == tags.end() ? "" : tag->second,
                        plugged == ports.end() ? Names() : plugged->second};
    }
    EXPECT_EQ(host.bridges, live);
    EXPECT_EQ(host.linuxBonds, linuxBonds);
    EXPECT_EQ(host.linuxVlans, linuxVlans);
    ExpectLists();
    ExpectFiles();
}

void ClientModel::ExpectLists() const
{
    EXPECT_EQ(ReadFile(kRegistry), ListOf(clients));
    EXPECT_EQ(ReadFile(kInterfaceList), ListOf(onSwitch));
    EXPECT_EQ(ReadFile(kIgnoreList), ListOf(ignored));
}

void ClientModel::ExpectFiles() const
{
    using Key = std::optional<std::string>;
    const auto keyIf = [](bool there, const std::string& value) {
        return there ? Key(value) : std::nullopt;
    };
    for (const std::string& interface : interfaces) {
        const bool there = onSwitch.contains(interface);
        const std::string bridge = "ovs_" + interface;
        const std::string bond = BondOf(interface);
        EXPECT_EQ(ReadFile(FileOf(bridge)).has_value(), there) << interface;
        EXPECT_EQ(KeyOf(interface, "BRIDGE"), keyIf(there, bridge));
        EXPECT_EQ(KeyOf(bridge, "PRIMARY"), keyIf(there, interface));
        EXPECT_EQ(KeyOf(bridge, "DEVICE"), keyIf(there, bridge));
        EXPECT_EQ(KeyOf(bridge, "SLAVE"), keyIf(!bond.empty(), "yes"));
        EXPECT_EQ(KeyOf(interface, "DEVICE"), interface);
        if (!clients.empty()) {
            EXPECT_EQ(KeyOf(interface, "MASTER"), keyIf(!bond.empty(), bond));
            EXPECT_EQ(KeyOf(interface, "SLAVE"), keyIf(!bond.empty(), "yes"));
            EXPECT_EQ(KeyOf(interface, "TYPE"), std::nullopt);
        }
    }
    for (const auto& [name, bond] : bonds) {
        std::string slaves;
        for (const std::string& slave : bond.slaves) {
            slaves += slave + " ";
        }
        EXPECT_EQ(KeyOf(name, "SLAVE_LIST"), "\"" + slaves + "\"");
        EXPECT_EQ(KeyOf(name, "BOND_MODE"), SwitchModeName(bond.mode));
        EXPECT_EQ(KeyOf(name, "DEVICE"), name);
    }
}

} // namespace unit
