#ifndef VORNOVS_STATE_IFCFG_H
#define VORNOVS_STATE_IFCFG_H

#include <cstddef>
#include <string>
#include <string_view>

namespace VORN::OVS {

// Sizes of the buffers that names and paths are built in, terminator included: what does not fit is
// cut.
constexpr std::size_t kNameBuffer = 1024;
constexpr std::size_t kPathBuffer = 4096;

constexpr char kIfcfgPrefix[] = "/etc/sysconfig/network-scripts/ifcfg-";
// The line format of every edit of an interface configuration file.
constexpr char kLineFormat[] = "%s=%s\n";

constexpr char kKeyAddress[] = "IPADDR";
constexpr char kKeyBondingOpts[] = "BONDING_OPTS";
constexpr char kKeyBondMode[] = "BOND_MODE";
constexpr char kKeyBootProtocol[] = "BOOTPROTO";
constexpr char kKeyBridge[] = "BRIDGE";
constexpr char kKeyDevice[] = "DEVICE";
constexpr char kKeyMaster[] = "MASTER";
constexpr char kKeyNetmask[] = "NETMASK";
constexpr char kKeyOnBoot[] = "ONBOOT";
constexpr char kKeyPrimary[] = "PRIMARY";
constexpr char kKeySlave[] = "SLAVE";
constexpr char kKeySlaveList[] = "SLAVE_LIST";
constexpr char kKeyType[] = "TYPE";
constexpr char kKeyVlanId[] = "OVS_VLAN_ID";

/** @return the name as the platform reads it: a byte string that ends at its first NUL. */
inline std::string_view TextOf(const std::string& name)
{
    return name.c_str();
}

/** @return as much of the text as a buffer of that many bytes holds beside its terminator. */
std::string Fit(std::string text, std::size_t buffer);

/** @return the bridge that carries an interface: "ovs_eth0" for "eth0". */
std::string BridgeName(const std::string& name, std::size_t buffer = kNameBuffer);

/**
 * The way back, as a scan with "ovs_%s" reads it.
 * @return "eth0" for "ovs_eth0"; only the first word; empty for a name without the prefix.
 */
std::string PlainName(const std::string& bridge, std::size_t buffer = kNameBuffer);

/** @return the text's first word between white space; empty when it has none. */
std::string FirstWord(std::string_view text);

/** @return path of the interface's configuration file. */
std::string IfcfgPath(const std::string& name, std::size_t buffer = kPathBuffer);

/** @return the text of a record's name field, also when its terminator is missing. */
template <std::size_t size>
std::string NameOf(const char (&field)[size])
{
    std::size_t length = 0;
    while (length < size && field[length] != '\0') {
        ++length;
    }
    return {field, length};
}

/** Fills a record's name field: cut to the field, terminated, the rest zero. */
template <std::size_t size>
void CopyName(char (&field)[size], const std::string& text)
{
    const std::string name = Fit(text, size);
    for (std::size_t at = 0; at < size; ++at) {
        field[at] = at < name.size() ? name[at] : '\0';
    }
}

} // namespace VORN::OVS

#endif
