#include "interfacefile.h"

#include "bondoptions.h"
#include "interfacename.h"
#include "interfaceparser.h"
#include "interfacevalues.h"

#include <algorithm>
#include <array>
#include <string_view>

namespace vornhost {
namespace {

constexpr unsigned kMostVlan = 4095;
constexpr unsigned kLongestForwardDelay = 30;

bool IsFileOf(const KeyValueFile& file, const std::string& interface)
{
    const std::string device = file.Get("DEVICE").value_or(interface);
    if (device == interface) {
        return true;
    }
    // A conversion back that was cut short has copied the bridge's file over the interface's and
    // not edited it yet; were it not the interface's, nothing could finish the way home.
    return device == kBridgePrefix + interface && file.Get("PRIMARY") == interface;
}

/** Such a text cannot be a word of a command. */
bool HasControlCharacter(const std::string& text)
{
    return std::any_of(text.begin(), text.end(),
                       [](unsigned char byte) { return byte < ' ' || byte == 0x7f; });
}

} // namespace

std::string InterfaceParser::Value(const std::string& key) const
{
    const auto found = m_values.find(key);
    std::string value = found == m_values.end() ? std::string() : Trimmed(found->second);
    if (value.size() >= 2 && value.front() == value.back() &&
        (value.front() == '"' || value.front() == '\'')) {
        value = Trimmed(value.substr(1, value.size() - 2));
    }
    return value;
}

void InterfaceParser::Leave(const std::string& reason)
{
    m_parsed.file.use = FileUse::kLeaveAlone;
    m_parsed.remarks.push_back(
        {Severity::kWarning, FileName() + ": " + reason + "; the interface is left as it is"});
}

void InterfaceParser::Refuse(const std::string& key, const std::string& reason)
{
    m_parsed.file.whole = false;
    m_parsed.remarks.push_back(
        {Severity::kError, FileName() + ": " + key + "=" + Value(key) + ": " + reason});
}

std::optional<bool> InterfaceParser::YesOrNo(const std::string& key)
{
    const std::string value = Lower(Value(key));
    if (value == "yes" || value == "true" || value == "on" || value == "1") {
        return true;
    }
    if (value == "no" || value == "false" || value == "off" || value == "0") {
        return false;
    }
    if (!value.empty()) {
        Refuse(key, "neither yes nor no");
    }
    return std::nullopt;
}

std::optional<unsigned> InterfaceParser::Number(const std::string& key, unsigned least,
                                                unsigned most)
{
    const std::string value = Value(key);
    if (value.empty()) {
        return std::nullopt;
    }
    const auto number = ToNumber(value, least, most);
    if (!number) {
        Refuse(key, "not a number from " + std::to_string(least) + " to " + std::to_string(most));
    }
    return number;
}

bool InterfaceParser::IsOwnFile()
{
    if (m_file.Text().find('=') == std::string::npos) {
        Leave("ignored, because it is empty");
        return false;
    }
    const std::string device = Value("DEVICE");
    if (!device.empty() && device != m_parsed.file.name) {
        Leave("ignored, because its DEVICE is " + device);
        m_parsed.file.fromBridge = IsFileOf(m_file, m_parsed.file.name);
        return m_parsed.file.fromBridge;
    }
    return true;
}

void InterfaceParser::ReadStructure()
{
    InterfaceFile& file = m_parsed.file;
    file.primary = Value("PRIMARY");
    file.bridge = Value("BRIDGE");
    file.slave = Lower(Value("SLAVE")) == "yes";
    file.master = file.slave ? Value("MASTER") : "";
    ReadSlaves();
    ReadBondOptions();
    const std::string type = Lower(Value("TYPE"));
    const std::string bonding = Lower(Value("BONDING_MASTER"));
    const auto& options = file.bondOptions;
    file.bond = type == "bond" || bonding == "yes" ||
                std::any_of(options.begin(), options.end(),
                            [](const auto& option) { return option.first == "mode"; });
    file.linuxBridge = type == "bridge";
    if (file.linuxBridge) {
        file.stp = YesOrNo("STP").value_or(false);
        file.forwardDelay = Number("DELAY", 0, kLongestForwardDelay);
    }
    ReadVlan();
}

void InterfaceParser::ReadSlaves()
{
    for (const std::string& slave : Words(Value("SLAVE_LIST"))) {
        if (IsInterfaceName(slave)) {
            m_parsed.file.slaveList.push_back(slave);
        } else {
            Refuse("SLAVE_LIST", "\"" + slave + "\" is no interface name");
        }
    }
}

/** An option without a value is left at what it is. */
void InterfaceParser::ReadBondOptions()
{
    for (const std::string& option : Words(Value("BONDING_OPTS"))) {
        const auto equals = option.find('=');
        if (equals == std::string::npos || equals == 0 || HasControlCharacter(option)) {
            Refuse("BONDING_OPTS", "\"" + option + "\" is not NAME=VALUE");
            continue;
        }
        const std::string name = option.substr(0, equals);
        const std::string value = option.substr(equals + 1);
        const std::string problem = value.empty() ? "" : BondOptionProblem(name, value);
        if (!problem.empty()) {
            Refuse("BONDING_OPTS", std::string("\"").append(option).append("\" ") + problem);
        } else if (!value.empty()) {
            m_parsed.file.bondOptions.emplace_back(name, value);
        }
    }
}

/** A VLAN's interface is called PARENT.ID, or its file says what its parent and its id are. */
void InterfaceParser::ReadVlan()
{
    InterfaceFile& file = m_parsed.file;
    const auto dot = file.name.rfind('.');
    const bool named = dot != std::string::npos && dot > 0;
    std::string parent = Value("PHYSDEV");
    std::string id = Value("VLAN_ID");
    if (named) {
        parent = parent.empty() ? file.name.substr(0, dot) : parent;
        id = id.empty() ? file.name.substr(dot + 1) : id;
    }
    const auto number = ToNumber(id, 0, kMostVlan);
    if (!parent.empty() && !IsInterfaceName(parent)) {
        Refuse("PHYSDEV", "no interface name");
    } else if (!parent.empty() && number && file.name.rfind(kBridgePrefix, 0) != 0) {
        file.vlan = FileVlan{parent, *number};
    }
}

/** @return  why the addresses cannot be had; empty when the file itself says them. */
std::string InterfaceParser::ProtocolProblem() const
{
    const std::string protocol = Lower(Value("BOOTPROTO"));
    const bool known =
        protocol.empty() || protocol == "none" || protocol == "static" || protocol == "dhcp";
    return known ? "" : "BOOTPROTO=" + protocol + " is unknown";
}

void InterfaceParser::DecideUse()
{
    InterfaceFile& file = m_parsed.file;
    const bool bridgeName = file.name.rfind(kBridgePrefix, 0) == 0;
    const bool bridgeType = Value("TYPE") == "OVS";
    const bool ofBond = !file.slaveList.empty(); // may have any name
    const bool joinsBridge = !file.bridge.empty() && file.bridge != kBridgePrefix + file.name;
    const std::string protocolProblem = ProtocolProblem();

    if (bridgeName && !bridgeType) {
        Leave("ignored, because its TYPE is not OVS");
    } else if (bridgeType && !bridgeName && !ofBond) {
        Leave("ignored, because a plain interface cannot have TYPE=OVS");
    } else if (bridgeType && !ofBond && kBridgePrefix + file.primary != file.name) {
        Leave("ignored, because its PRIMARY is \"" + file.primary + "\"");
    } else if (!protocolProblem.empty() && !file.slave && !joinsBridge) {
        Leave(protocolProblem);
    } else {
        file.use = bridgeType ? FileUse::kBridge : FileUse::kPlain;
        file.onlyAsMember = protocolProblem;
    }
}

void InterfaceParser::ReadLinkKeys()
{
    InterfaceFile& file = m_parsed.file;
    file.onBoot = YesOrNo("ONBOOT").value_or(true);
    file.mtu = Number("MTU", 68, 65535);
    file.metric = Number("METRIC", 0, UINT32_MAX);
    file.metric6 = Number("IPV6_METRIC", 0, UINT32_MAX);
    file.vlanId = Number("OVS_VLAN_ID", 0, kMostVlan);
    file.requiredMac = Lower(Value("HWADDR"));
    if (!Value("MACADDR").empty()) {
        Refuse("MACADDR", "changing the link address is not supported yet");
    }
}

void InterfaceParser::ReadLinkCommands()
{
    const auto commands = ParseLinkCommands(Value("ETHTOOL_OPTS"));
    if (commands) {
        m_parsed.file.linkCommands = *commands;
    } else {
        Refuse("ETHTOOL_OPTS", "not settings of a link");
    }
}

ParsedFile InterfaceParser::Parse()
{
    if (!IsOwnFile()) {
        return m_parsed;
    }
    if (!m_parsed.file.fromBridge) {
        ReadStructure();
        DecideUse();
    }
    if (m_parsed.file.use != FileUse::kLeaveAlone || m_parsed.file.fromBridge) {
        ReadLinkKeys();
        ReadLinkCommands();
        ReadAddressing();
    }
    return m_parsed;
}

std::optional<KeyValueFile> LoadInterfaceFile(const std::string& interface)
{
    if (!IsInterfaceName(interface)) {
        return std::nullopt;
    }
    auto file = KeyValueFile::Load(std::string(kConfigurationFolder) + "/" + kInterfaceFilePrefix +
                                   interface);
    if (file && !IsFileOf(*file, interface)) {
        return std::nullopt;
    }
    return file;
}

std::string InterfaceOfFileName(const std::string& fileName)
{
    constexpr std::array kForeignEndings{"~",        ".bak",      ".orig",     ".old",
                                         ".rpmsave", ".rpmnew",   ".rpmorig",  ".swp",
                                         ".tmp",     ".dpkg-old", ".dpkg-new", ".dpkg-dist"};
    if (fileName.rfind(kInterfaceFilePrefix, 0) != 0) {
        return {};
    }
    const std::string name = fileName.substr(sizeof kInterfaceFilePrefix - 1);
    const bool foreign = std::any_of(
        kForeignEndings.begin(), kForeignEndings.end(), [&](const std::string_view ending) {
            return name.size() > ending.size() &&
                   name.compare(name.size() - ending.size(), ending.size(), ending) == 0;
        });
    return !foreign && IsInterfaceName(name) ? name : std::string();
}

ParsedFile ParseInterfaceFile(const std::string& name, const std::string& text)
{
    return InterfaceParser(name, text).Parse();
}

} // namespace vornhost
