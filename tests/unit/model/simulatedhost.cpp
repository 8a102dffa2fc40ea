#include "model/simulatedhost.h"

#include <algorithm>
#include <filesystem>
#include <sstream>

namespace unit {

namespace fs = std::filesystem;

namespace {

std::vector<std::string> Lines(const std::string& text)
{
    std::istringstream stream(text);
    std::vector<std::string> lines;
    for (std::string line; std::getline(stream, line);) {
        lines.push_back(line);
    }
    return lines;
}

/** The text without the lines of these keys. */
std::string Without(const std::string& text, const std::vector<std::string>& keys)
{
    std::string rest;
    for (const std::string& line : Lines(text)) {
        const bool left = std::any_of(keys.begin(), keys.end(), [&](const std::string& key) {
            return line.starts_with(key + "=");
        });
        rest += left ? "" : line + "\n";
    }
    return rest;
}

std::string ContentOf(const std::string& interface)
{
    return ReadFile(FileOf(interface)).value_or("");
}

Files FilesOf(const std::vector<std::string>& interfaces)
{
    Files files;
    for (const std::string& interface : interfaces) {
        files["ifcfg-" + interface] = ContentOf(interface);
    }
    return files;
}

void WriteFiles(const Files& files)
{
    for (const auto& [name, text] : files) {
        WriteFile(std::string(kScripts) + "/" + name, text);
    }
}

/** What bonds of the switch list as theirs, marked or not: the bond's file rules. */
Names MembersOfBonds()
{
    Names members;
    for (const std::string& file : ListFolder(kScripts)) {
        const std::string name = file.substr(std::string("ifcfg-").size());
        const std::string list = KeyOf(name, "SLAVE_LIST").value_or("");
        if (list.size() > 1) {
            const std::vector<std::string> slaves = Words(list.substr(1, list.size() - 2));
            members.insert(slaves.begin(), slaves.end());
        }
    }
    return members;
}

} // namespace

Files ReadFiles()
{
    Files files;
    for (const std::string& name : ListFolder(kScripts)) {
        files[name] = ReadFile(std::string(kScripts) + "/" + name).value_or("");
    }
    return files;
}

std::optional<std::string> KeyOf(const std::string& interface, const std::string& key)
{
    for (const std::string& line : Lines(ContentOf(interface))) {
        if (line.starts_with(key + "=")) {
            return line.substr(key.size() + 1);
        }
    }
    return std::nullopt;
}

SimulatedHost::SimulatedHost(harness::RecordingPlatform& platform)
    : SimulatedHost(platform, SimulatedState())
{
}

SimulatedHost::SimulatedHost(harness::RecordingPlatform& platform, const SimulatedState& state)
    : SimulatedState(state), m_platform(platform)
{
    platform.CarryOutFileEdits();
    platform.React([this](const std::string& call) { return React(call); });
    TellPlatform();
}

void SimulatedHost::Become(const SimulatedState& state)
{
    static_cast<SimulatedState&>(*this) = state;
    TellPlatform();
}

void SimulatedHost::AddPort(const std::string& name, const std::string& text)
{
    cards.insert(name);
    WriteFile(FileOf(name), "DEVICE=" + name + "\n" + text);
    TellPlatform();
}

void SimulatedHost::AddBond(const std::string& name, int mode,
                            const std::vector<std::string>& slaves, const std::string& text)
{
    for (const std::string& slave : slaves) {
        AddPort(slave, "MASTER=" + name + "\nSLAVE=yes\n");
    }
    WriteFile(FileOf(name), "DEVICE=" + name + "\n" + text +
                                "BONDING_OPTS=\"mode=" + std::to_string(mode) + " miimon=100\"\n");
    linuxBonds[name] = {mode, slaves};
    TellPlatform();
}

void SimulatedHost::AddVlan(const std::string& parent, int id, const std::string& text)
{
    const std::string name = parent + "." + std::to_string(id);
    WriteFile(FileOf(name), "DEVICE=" + name + "\nVLAN=yes\n" + text);
    linuxVlans[name] = {parent, id};
    TellPlatform();
}

void SimulatedHost::TellPlatform()
{
    std::vector<std::string> interfaces(cards.begin(), cards.end());
    std::string list;
    m_platform.NoVlansAndBonds();
    for (const auto& [name, bond] : linuxBonds) {
        for (const std::string& slave : bond.slaves) {
            std::erase(interfaces, slave);
        }
        interfaces.push_back(name);
        m_platform.Bond(name, bond.mode, bond.slaves);
    }
    for (const auto& [name, vlan] : linuxVlans) {
        interfaces.push_back(name);
        m_platform.Vlan(name, vlan.parent, vlan.id);
    }
    for (const auto& [name, bridge] : bridges) {
        interfaces.push_back(name);
        list += name + "\n";
        m_platform.Output("VLIBCPopen /usr/bin/ovs-vsctl rB get port " + name + " tag",
                          bridge.tag.empty() ? "[]\n" : bridge.tag + "\n");
        const std::string slaves = KeyOf(name, "SLAVE_LIST").value_or("");
        if (!slaves.empty()) {
            const std::string mode = KeyOf(name, "BOND_MODE").value_or("");
            int number = 6;
            while (number < 8 && SwitchModeName(number) != mode) {
                ++number;
            }
            m_platform.Bond(name, number, Words(slaves.substr(1, slaves.size() - 2)));
        }
    }
    m_platform.Interfaces(interfaces);
    m_platform.Output("VLIBCPopen /usr/bin/ovs-vsctl r list-br", list);
}

std::optional<int> SimulatedHost::React(const std::string& call)
{
    const std::vector<std::string> words = Words(call);
    if (words[0] == "VLIBCFileExist") {
        return Exists(words[1]);
    }
    if (words[0] == "VLIBNetOVSIfIsMaster") {
        return !bridges.contains(words[1]) ? -1 : KeyOf(words[1], "SLAVE_LIST") ? 2 : 1;
    }
    // What is asked next is told beforehand; only these calls change it.
    const std::optional<int> answer = Act(words);
    if (answer || (words.size() > 2 && words[1] == "/etc/rc.network")) {
        TellPlatform();
    }
    return answer;
}

std::optional<int> SimulatedHost::Exists(const std::string& path) const
{
    if (!path.starts_with("/sys/class/net/")) {
        return std::nullopt;
    }
    const std::string name = fs::path(path).parent_path().filename();
    return bridges.contains(name) || cards.contains(name) || linuxBonds.contains(name) ||
           linuxVlans.contains(name);
}

std::optional<int> SimulatedHost::Act(const std::vector<std::string>& words)
{
    if (words.size() > 2 && words[1] == "/usr/bin/ovs-vsctl") {
        return RunSwitchTool(words);
    }
    if (words.size() > 2 && words[1] == "/etc/rc.network") {
        RunNetwork(words);
    }
    if (words[0] == "VORNNetLinkAggrSet") {
        return SetBond(words);
    }
    if (words[0] == "VLIBNetVlanRemove") {
        return RemoveVlan(words[1]);
    }
    if (words[0] == "VLIBNetVlanCreate") {
        return CreateVlan(words[1], std::stoi(words[2]));
    }
    return std::nullopt;
}

std::optional<int> SimulatedHost::RunSwitchTool(const std::vector<std::string>& words)
{
    const std::string& verb = words[2];
    if (verb == "add-port" || verb == "del-port") {
        const auto bridge = bridges.find(words[3]);
        if (bridge == bridges.end()) {
            return 1;
        }
        Names& ports = bridge->second.ports;
        const bool changed =
            verb == "add-port" ? ports.insert(words[4]).second : ports.erase(words[4]) == 1;
        return changed ? 0 : 1;
    }
    if (verb == "set" || verb == "clear") {
        const auto bridge = bridges.find(words[4]);
        if (bridge == bridges.end()) {
            return 1;
        }
        bridge->second.tag = verb == "set" ? words[5].substr(std::string("tag=").size()) : "";
        return 0;
    }
    return std::nullopt;
}

// What is stopped comes back with the start that follows, so only the start is carried out.
void SimulatedHost::RunNetwork(const std::vector<std::string>& words)
{
    if (words[2] != "start") {
        return;
    }
    std::map<std::string, Bridge> live;
    const Names members = MembersOfBonds();
    for (const std::string& file : ListFolder(kScripts)) {
        const std::string name = file.substr(std::string("ifcfg-").size());
        const std::string device = KeyOf(name, "DEVICE").value_or("");
        if (device == "ovs_" + name && !ReadFile(FileOf(device)) && bridges.contains(device)) {
            live[device] = bridges[device]; // on its way off the switch: it is left as it is
        }
        if (KeyOf(name, "TYPE") != "OVS" || device != name || KeyOf(name, "SLAVE") == "yes" ||
            (!KeyOf(name, "SLAVE_LIST") && members.contains(KeyOf(name, "PRIMARY").value_or("")))) {
            continue;
        }
        live[name] = bridges.contains(name) ? bridges[name] : Bridge();
        live[name].tag = KeyOf(name, "OVS_VLAN_ID").value_or("");
    }
    bridges = live;
}

int SimulatedHost::SetBond(const std::vector<std::string>& words)
{
    const std::string& name = words[1];
    const int mode = std::stoi(words[2].substr(std::string("mode=").size()));
    const std::vector<std::string> slaves(words.begin() + 3, words.end());
    if (mode == 0) {
        const auto bond = linuxBonds.find(name);
        return bond == linuxBonds.end() ? -1 : TakeBondApart(name, bond->second);
    }

    if (slaves.empty()) {
        return -1;
    }
    linuxBonds[name] = {mode, slaves};
    if (m_allowsChanges) {
        BuildNewBond(name, linuxBonds[name]);
        return 0;
    }
    const auto memory = memories.find(name);
    if (memory == memories.end()) {
        return -1;
    }
    // A tag that was the way of a VLAN's addressing has been taken off by now.
    for (const auto& [file, text] : memory->second.left) {
        EXPECT_EQ(ReadFile(std::string(kScripts) + "/" + file), Without(text, {"OVS_VLAN_ID"}));
    }
    EXPECT_EQ(mode, memory->second.mode) << name;
    WriteFiles(memory->second.before);
    memories.erase(memory);
    return 0;
}

void SimulatedHost::BuildNewBond(const std::string& name, const LinuxBond& bond)
{
    WriteFile(FileOf(name), "DEVICE=" + name + "\n" +
                                Without(ContentOf(bond.slaves.front()), {"DEVICE"}) +
                                "BONDING_OPTS=\"mode=" + std::to_string(bond.mode) + "\"\n");
    for (const std::string& slave : bond.slaves) {
        WriteFile(FileOf(slave), "DEVICE=" + slave + "\nMASTER=" + name + "\nSLAVE=yes\n");
    }
}

int SimulatedHost::TakeBondApart(const std::string& name, const LinuxBond& bond)
{
    std::vector<std::string> all = bond.slaves;
    all.push_back(name);
    Memory memory{bond.mode, FilesOf(all), {}};

    const std::string addressing = Without(ContentOf(name), {"DEVICE", "BONDING_OPTS"});
    for (const std::string& slave : bond.slaves) {
        const std::string own = Without(ContentOf(slave), {"MASTER", "SLAVE"});
        WriteFile(FileOf(slave), own + (slave == bond.slaves.front() ? addressing : ""));
    }
    fs::remove(FileOf(name));
    memory.left = FilesOf(bond.slaves);
    memories[name] = memory;
    linuxBonds.erase(name);
    return 0;
}

int SimulatedHost::RemoveVlan(const std::string& name)
{
    const auto vlan = linuxVlans.find(name);
    if (vlan == linuxVlans.end()) {
        return -1;
    }
    const std::string parent = vlan->second.parent;
    Memory memory{0, FilesOf({name, parent}), {}};
    WriteFile(FileOf(parent), ContentOf(parent) + Without(ContentOf(name), {"DEVICE", "VLAN"}) +
                                  "OVS_VLAN_ID=" + std::to_string(vlan->second.id) + "\n");
    fs::remove(FileOf(name));
    memory.left = FilesOf({parent});
    memories[name] = memory;
    linuxVlans.erase(vlan);
    return 0;
}

int SimulatedHost::CreateVlan(const std::string& parent, int id)
{
    const std::string name = parent + "." + std::to_string(id);
    linuxVlans[name] = {parent, id};
    if (m_allowsChanges) {
        WriteFile(FileOf(name), "DEVICE=" + name + "\nVLAN=yes\n");
        return 0;
    }
    const auto memory = memories.find(name);
    if (memory == memories.end()) {
        return -1;
    }
    for (const auto& [file, text] : memory->second.left) {
        EXPECT_EQ(
            Without(ReadFile(std::string(kScripts) + "/" + file).value_or(""), {"OVS_VLAN_ID"}),
            Without(text, {"OVS_VLAN_ID"}));
    }
    WriteFiles(memory->second.before);
    memories.erase(memory);
    return 0;
}

} // namespace unit
