#include "interfacefile.h"

#include "interfacename.h"
#include "interfacevalues.h"

#include <algorithm>
#include <array>
#include <sstream>
#include <string_view>

#include <arpa/inet.h>

namespace vornhost {
namespace {

constexpr char kFilePrefix[] = "ifcfg-";
constexpr char kBridgePrefix[] = "ovs_";
constexpr unsigned kMostNumberedAddresses = 256;
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

/** Reads the keys of one file and keeps what there is to say about them. */
class Parser {
public:
    Parser(const std::string& name, const std::string& text) : m_values(KeyValueFile::Parse(text))
    {
        m_parsed.file.name = name;
        // A file without its last line break may be one that is being written.
        m_parsed.file.whole = !text.empty() && text.back() == '\n';
    }

    ParsedFile Parse();

private:
    std::string Value(const std::string& key) const;
    std::string FileName() const { return kFilePrefix + m_parsed.file.name; }
    void Leave(const std::string& reason);
    void Refuse(const std::string& key, const std::string& reason);
    std::optional<bool> YesOrNo(const std::string& key);
    std::optional<unsigned> Number(const std::string& key, unsigned least, unsigned most);
    bool IsOwnFile();
    void ReadStructure();
    void ReadBondOptions();
    void ReadVlan();
    std::string ProtocolProblem() const;
    void DecideUse();
    void ReadLinkKeys();
    void ReadIpv4();
    void ReadIpv4Address(const std::string& number);
    void ReadIpv6();
    void ReadIpv6Address(const std::string& key, const std::string& text);
    std::string ReadGateway(const std::string& key, int family);

    KeyValueFile m_values;
    ParsedFile m_parsed;
};

std::string Parser::Value(const std::string& key) const
{
    std::string value = Trimmed(m_values.Get(key).value_or(""));
    if (value.size() >= 2 && value.front() == value.back() &&
        (value.front() == '"' || value.front() == '\'')) {
        value = Trimmed(value.substr(1, value.size() - 2));
    }
    return value;
}

void Parser::Leave(const std::string& reason)
{
    m_parsed.file.use = FileUse::kLeaveAlone;
    m_parsed.remarks.push_back(
        {Severity::kWarning, FileName() + ": " + reason + "; the interface is left as it is"});
}

void Parser::Refuse(const std::string& key, const std::string& reason)
{
    m_parsed.file.whole = false;
    m_parsed.remarks.push_back(
        {Severity::kError, FileName() + ": " + key + "=" + Value(key) + ": " + reason});
}

std::optional<bool> Parser::YesOrNo(const std::string& key)
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

std::optional<unsigned> Parser::Number(const std::string& key, unsigned least, unsigned most)
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

bool Parser::IsOwnFile()
{
    if (m_values.Text().find('=') == std::string::npos) {
        Leave("ignored, because it is empty");
        return false;
    }
    const std::string device = Value("DEVICE");
    if (!device.empty() && device != m_parsed.file.name) {
        Leave("ignored, because its DEVICE is " + device);
        return false;
    }
    return true;
}

void Parser::ReadStructure()
{
    InterfaceFile& file = m_parsed.file;
    file.primary = Value("PRIMARY");
    file.bridge = Value("BRIDGE");
    file.slave = Lower(Value("SLAVE")) == "yes";
    file.master = file.slave ? Value("MASTER") : "";
    std::istringstream slaves(Value("SLAVE_LIST"));
    for (std::string slave; slaves >> slave;) {
        file.slaveList.push_back(slave);
    }
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

void Parser::ReadBondOptions()
{
    std::istringstream options(Value("BONDING_OPTS"));
    for (std::string option; options >> option;) {
        const auto equals = option.find('=');
        if (equals == std::string::npos || equals == 0) {
            Refuse("BONDING_OPTS", "\"" + option + "\" is not NAME=VALUE");
            continue;
        }
        m_parsed.file.bondOptions.emplace_back(option.substr(0, equals), option.substr(equals + 1));
    }
}

/** A VLAN's interface is called PARENT.ID, or its file says what its parent and its id are. */
void Parser::ReadVlan()
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
    if (!parent.empty() && number && file.name.rfind(kBridgePrefix, 0) != 0) {
        file.vlan = FileVlan{parent, *number};
    }
}

/** @return  why the addresses cannot be had; empty when the file itself says them. */
std::string Parser::ProtocolProblem() const
{
    const std::string protocol = Lower(Value("BOOTPROTO"));
    if (protocol == "dhcp" || protocol == "bootp") {
        return "BOOTPROTO=" + protocol + " is not supported yet";
    }
    const bool known = protocol.empty() || protocol == "none" || protocol == "static";
    return known ? "" : "BOOTPROTO=" + protocol + " is unknown";
}

void Parser::DecideUse()
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

void Parser::ReadLinkKeys()
{
    InterfaceFile& file = m_parsed.file;
    file.onBoot = YesOrNo("ONBOOT").value_or(true);
    file.mtu = Number("MTU", 68, 65535);
    file.metric = Number("METRIC", 0, UINT32_MAX);
    file.vlanId = Number("OVS_VLAN_ID", 0, kMostVlan);
    file.requiredMac = Lower(Value("HWADDR"));
    if (!Value("MACADDR").empty()) {
        Refuse("MACADDR", "changing the link address is not supported yet");
    }
}

void Parser::ReadIpv4Address(const std::string& number)
{
    const std::string key = "IPADDR" + number;
    std::string text = Value(key);
    if (text.empty()) {
        return;
    }
    std::optional<unsigned> length;
    if (const auto slash = text.find('/'); slash != std::string::npos) {
        length = ToNumber(text.substr(slash + 1), 0, 32);
        text.resize(slash);
    } else if (!Value("PREFIX" + number).empty()) {
        length = Number("PREFIX" + number, 0, 32);
    } else if (!Value("NETMASK" + number).empty()) {
        length = MaskLength(Value("NETMASK" + number));
        if (!length) {
            Refuse("NETMASK" + number, "not a netmask");
        }
    }
    const std::string local = NormalAddress(AF_INET, text);
    if (local.empty()) {
        Refuse(key, "not an IPv4 address");
    } else if (!length) {
        Refuse(key, "no length: neither PREFIX" + number + " nor NETMASK" + number + " is usable");
    } else {
        m_parsed.file.addresses.push_back({AF_INET, local, *length});
    }
}

std::string Parser::ReadGateway(const std::string& key, int family)
{
    std::string text = Value(key);
    // A zone says through which interface, and that is this one.
    text.resize(std::min(text.size(), text.find('%')));
    if (text.empty()) {
        return {};
    }
    std::string gateway = NormalAddress(family, text);
    if (gateway.empty()) {
        Refuse(key, family == AF_INET ? "not an IPv4 address" : "not an IPv6 address");
    }
    return gateway;
}

void Parser::ReadIpv4()
{
    ReadIpv4Address("");
    for (unsigned i = 0; i < kMostNumberedAddresses; ++i) {
        ReadIpv4Address(std::to_string(i));
    }
    m_parsed.file.gateway = ReadGateway("GATEWAY", AF_INET);
}

void Parser::ReadIpv6Address(const std::string& key, const std::string& text)
{
    const auto slash = text.find('/');
    const auto length =
        slash == std::string::npos ? std::optional(64U) : ToNumber(text.substr(slash + 1), 0, 128);
    const std::string local = NormalAddress(AF_INET6, text.substr(0, slash));
    if (local.empty() || !length) {
        Refuse(key, "not an IPv6 address with its length");
        return;
    }
    m_parsed.file.addresses.push_back({AF_INET6, local, *length});
}

void Parser::ReadIpv6()
{
    if (YesOrNo("IPV6INIT") == false) {
        return;
    }
    m_parsed.file.autoconf = YesOrNo("IPV6_AUTOCONF");
    if (const std::string address = Value("IPV6ADDR"); !address.empty()) {
        ReadIpv6Address("IPV6ADDR", address);
    }
    std::istringstream secondaries(Value("IPV6ADDR_SECONDARIES"));
    for (std::string address; secondaries >> address;) {
        ReadIpv6Address("IPV6ADDR_SECONDARIES", address);
    }
    m_parsed.file.gateway6 = ReadGateway("IPV6_DEFAULTGW", AF_INET6);
}

ParsedFile Parser::Parse()
{
    if (!IsOwnFile()) {
        return m_parsed;
    }
    ReadStructure();
    DecideUse();
    if (m_parsed.file.use != FileUse::kLeaveAlone) {
        ReadLinkKeys();
        ReadIpv4();
        ReadIpv6();
    }
    return m_parsed;
}

} // namespace

std::optional<KeyValueFile> LoadInterfaceFile(const std::string& interface)
{
    if (!IsInterfaceName(interface)) {
        return std::nullopt;
    }
    auto file =
        KeyValueFile::Load(std::string(kConfigurationFolder) + "/" + kFilePrefix + interface);
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
    if (fileName.rfind(kFilePrefix, 0) != 0) {
        return {};
    }
    const std::string name = fileName.substr(sizeof kFilePrefix - 1);
    const bool foreign = std::any_of(
        kForeignEndings.begin(), kForeignEndings.end(), [&](const std::string_view ending) {
            return name.size() > ending.size() &&
                   name.compare(name.size() - ending.size(), ending.size(), ending) == 0;
        });
    return !foreign && IsInterfaceName(name) ? name : std::string();
}

ParsedFile ParseInterfaceFile(const std::string& name, const std::string& text)
{
    return Parser(name, text).Parse();
}

} // namespace vornhost
