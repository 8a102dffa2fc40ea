#include "settings.h"
#include "contains.h"

#include <algorithm>
#include <array>

namespace vornhost {
namespace {

constexpr char kMtu[] = "MTU";

/** "IPADDR", "IPADDR0" and "IPADDR255", but not "IPADDRESSES". */
bool IsNumbered(std::string_view key, std::string_view name)
{
    return key.starts_with(name) &&
           key.find_first_not_of("0123456789", name.size()) == std::string_view::npos;
}

} // namespace

bool IsAddressingKey(std::string_view key)
{
    constexpr std::array<std::string_view, 14> kNames{
        "BOOTPROTO", "DEFROUTE",   "DOMAIN", "GATEWAYDEV", "METRIC",  kMtu,       "PEERDNS",
        "PEERNTP",   "PEERROUTES", "SCOPE",  "SEARCH",     "SRCADDR", "ARPCHECK", "DNSSEC"};
    constexpr std::array<std::string_view, 8> kNumbered{
        "IPADDR", "PREFIX", "NETMASK", "NETWORK", "BROADCAST", "GATEWAY", "DNS", "ROUTE"};
    constexpr std::array<std::string_view, 3> kBeginnings{"IPV4_", "IPV6", "DHCP"};
    return Contains(kNames, key) ||
           std::any_of(kNumbered.begin(), kNumbered.end(),
                       [&](std::string_view name) { return IsNumbered(key, name); }) ||
           std::any_of(kBeginnings.begin(), kBeginnings.end(),
                       [&](std::string_view beginning) { return key.starts_with(beginning); });
}

bool IsPlaceKey(std::string_view key)
{
    constexpr std::array<std::string_view, 9> kNames{"BOND_MODE", "BONDING_OPTS", "BRIDGE",
                                                     "DEVICE",    "MASTER",       "PRIMARY",
                                                     "SLAVE",     "SLAVE_LIST",   "TYPE"};
    return Contains(kNames, key);
}

bool IsCardKey(std::string_view key)
{
    return key == "HWADDR" || key == "MACADDR" || key == "ETHTOOL_OPTS";
}

void RemoveAddressing(KeyValueFile& file)
{
    constexpr std::array<std::string_view, 3> kKept{"BOOTPROTO", "IPV6INIT", kMtu};
    for (const std::string& key : file.Keys()) {
        const bool refuses = key == "IPV6_AUTOCONF" && file.Get(key) == "no";
        if (IsAddressingKey(key) && !Contains(kKept, key) && !refuses) {
            (void)file.Remove(key);
        }
    }
    const auto protocol = file.Get("BOOTPROTO");
    if (protocol && *protocol != "static" && *protocol != "none") {
        (void)file.Set("BOOTPROTO", "none");
    }
}

void ReplaceAddressing(const KeyValueFile& from, KeyValueFile& to)
{
    for (const std::string& key : to.Keys()) {
        if (IsAddressingKey(key) && key != kMtu && !from.Get(key)) {
            (void)to.Remove(key);
        }
    }
    for (const std::string& key : from.Keys()) {
        if (IsAddressingKey(key)) {
            (void)to.Set(key, *from.GetWritten(key));
        }
    }
}

std::vector<WantedAddress> ConfiguredAddresses(KeyValueFile file)
{
    for (const std::string& key : file.Keys()) {
        if (IsPlaceKey(key)) {
            (void)file.Remove(key);
        }
    }
    return ParseInterfaceFile("any", file.Text()).file.addresses;
}

bool SameSettings(const KeyValueFile& one, const KeyValueFile& other)
{
    KeyValueFile unused;
    const auto anyKey = [](const std::string& /*key*/) { return true; };
    KeyValueFile left = KeyValueFile::Parse(one.Text());
    return !CarryChanges(one, other, anyKey, left);
}

bool CarryChanges(const KeyValueFile& base, const KeyValueFile& changed, const KeyFilter& filter,
                  KeyValueFile& target)
{
    // Looked up in the files themselves, each key would be searched for from line to line.
    const auto before = base.WrittenValues();
    const auto now = changed.WrittenValues();
    bool carried = false;
    const auto concerns = [&](const std::string& key) {
        const auto former = before.find(key);
        const auto present = now.find(key);
        return !IsPlaceKey(key) && filter(key) &&
               (former == before.end() || present == now.end() ||
                former->second != present->second);
    };
    for (const std::string& key : base.Keys()) {
        if (concerns(key) && !now.contains(key)) {
            carried = target.Remove(key) || carried;
        }
    }
    for (const std::string& key : changed.Keys()) {
        if (concerns(key)) {
            carried = target.Set(key, now.at(key)) || carried;
        }
    }
    return carried;
}

} // namespace vornhost
