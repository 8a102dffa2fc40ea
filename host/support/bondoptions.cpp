#include "bondoptions.h"

#include "interfacevalues.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <fstream>
#include <iterator>
#include <limits>
#include <sstream>
#include <sys/socket.h>

namespace vornhost {
namespace {

constexpr char kMode[] = "mode";
constexpr char kArpTargets[] = "arp_ip_target";

/** What an option takes: one of names, which count from 0, a number, addresses, or any text. */
struct Values {
    std::string_view names;
    std::uint32_t most = 0; ///< The highest number.
    int family = AF_UNSPEC; ///< Of addresses with commas between them.
};

/** What decides how an option is read and where it counts. */
struct Option {
    std::string_view name;
    std::string_view initial; ///< What a new bond has.
    Values takes;
    std::string_view modes; ///< Where it counts; none: everywhere.
    bool twin = false;      ///< The switch has the like.
    bool refused = false;   ///< The kernel refuses it where it does not count.
};

constexpr Values kModeNames{
    "balance-rr active-backup balance-xor broadcast 802.3ad balance-tlb balance-alb"};
constexpr Values kText{};
constexpr Values kByte{"", std::numeric_limits<std::uint8_t>::max()};
constexpr Values kShort{"", std::numeric_limits<std::uint16_t>::max()};
constexpr Values kNumber{"", std::numeric_limits<std::uint32_t>::max()};
constexpr Values kAddresses{"", 0, AF_INET};
constexpr Values kIpv6Addresses{"", 0, AF_INET6};
constexpr std::string_view kAllModes{};
constexpr std::string_view kWithPrimary = "active-backup balance-tlb balance-alb";
constexpr std::string_view kWithLacp = "802.3ad";
constexpr std::string_view kWithHash = "balance-xor 802.3ad balance-tlb";
constexpr std::string_view kWithArp = "balance-rr active-backup balance-xor broadcast";
constexpr std::string_view kLearning = "balance-tlb balance-alb";
constexpr std::string_view kRoundRobin = "balance-rr";
constexpr Values kNoYes{"off on"};
constexpr Values kMacPolicies{"none active follow"};
constexpr Values kValidations{"none active backup all filter filter_active filter_backup"};
constexpr Values kAnyAll{"any all"};
constexpr Values kSelections{"stable bandwidth count"};
constexpr Values kRates{"slow fast"};
constexpr Values kReselections{"always better failure"};
constexpr Values kHashes{"layer2 layer3+4 layer2+3 encap2+3 encap3+4 vlan+srcmac"};

constexpr std::array kOptions{
    Option{"mode", "balance-rr", kModeNames, kAllModes, true},
    Option{"ad_actor_sys_prio", "65535", kShort, kWithLacp, true, true},
    Option{"ad_actor_system", "00:00:00:00:00:00", kText, kWithLacp, true, true},
    Option{"ad_select", "stable", kSelections, kWithLacp},
    Option{"ad_user_port_key", "0", kShort, kWithLacp, false, true},
    Option{"all_slaves_active", "0", kByte, kAllModes},
    Option{"arp_all_targets", "any", kAnyAll, kWithArp},
    Option{"arp_interval", "0", kNumber, kWithArp, false, true},
    Option{"arp_ip_target", "", kAddresses, kWithArp},
    Option{"arp_missed_max", "2", kByte, kWithArp},
    Option{"arp_validate", "none", kValidations, kWithArp, false, true},
    Option{"downdelay", "0", kNumber, kAllModes, true},
    Option{"fail_over_mac", "none", kMacPolicies, kAllModes},
    Option{"lacp_active", "on", kNoYes, kWithLacp, false, true},
    Option{"lacp_rate", "slow", kRates, kWithLacp, true, true},
    Option{"lp_interval", "1", kNumber, kAllModes},
    Option{"miimon", "0", kNumber, kAllModes, true},
    Option{"min_links", "0", kNumber, kAllModes},
    Option{"ns_ip6_target", "", kIpv6Addresses, kWithArp},
    Option{"num_grat_arp", "1", kByte, kAllModes},
    Option{"num_unsol_na", "1", kByte, kAllModes},
    Option{"packets_per_slave", "1", kNumber, kRoundRobin, false, true},
    Option{"peer_notif_delay", "0", kNumber, kAllModes},
    Option{"primary", "", kText, kWithPrimary, true, true},
    Option{"primary_reselect", "always", kReselections, kWithPrimary},
    Option{"resend_igmp", "1", kNumber, kAllModes},
    Option{"tlb_dynamic_lb", "1", kByte, kLearning, false, true},
    Option{"updelay", "0", kNumber, kAllModes, true},
    Option{"use_carrier", "1", kByte, kAllModes, true},
    Option{"xmit_hash_policy", "layer2", kHashes, kWithHash},
};

const Option* FindOption(std::string_view name)
{
    const auto* const found = std::find_if(kOptions.begin(), kOptions.end(),
                                           [&](const Option& each) { return each.name == name; });
    return found == kOptions.end() ? nullptr : found;
}

/** Both, with the separator between them where there are two. */
std::string Appended(std::string list, const char* separator, const std::string& next)
{
    if (!list.empty()) {
        list += separator;
    }
    return list.append(next);
}

std::string Assignment(std::string name, const std::string& value)
{
    name += '=';
    return name.append(value);
}

bool CountsIn(const Option& option, const std::string& mode)
{
    const auto modes = Words(std::string(option.modes));
    return modes.empty() || std::find(modes.begin(), modes.end(), mode) != modes.end();
}

/** Takes the kernel's number of a named value for the name; all else stays. */
std::string NamedValue(const std::string& option, const std::string& value)
{
    const Option* const known = FindOption(option);
    const auto names = Words(known == nullptr ? "" : std::string(known->takes.names));
    std::size_t number = 0;
    const char* const end = value.data() + value.size();
    const auto [stop, error] = std::from_chars(value.data(), end, number);
    const bool isNumber = error == std::errc() && stop == end;
    return isNumber && number < names.size() ? names[number] : value;
}

bool AreAddresses(int family, const std::string& list)
{
    std::istringstream stream(list);
    bool all = !list.empty();
    for (std::string address; std::getline(stream, address, ',');) {
        all = all && !NormalAddress(family, address).empty();
    }
    return all;
}

/** Without the sign by which the kernel is told to add an address to its list. */
std::string WithoutSigns(std::string list)
{
    std::erase(list, '+');
    return list;
}

std::string FirstLine(const std::string& path)
{
    std::ifstream file(path);
    std::string line;
    std::getline(file, line);
    return line;
}

std::string LiveFolder(const std::string& bond)
{
    return std::string(kInterfaceFolder) + '/' + bond + "/bonding/";
}

/** The kernel shows a named value as "fast 1" and a list as "one two". */
std::string LiveValue(const Option& option, const std::string& line)
{
    const auto words = Words(line);
    if (words.empty() || !option.takes.names.empty()) {
        return words.empty() ? "" : words[0];
    }
    std::string list;
    for (const std::string& word : words) {
        list = Appended(list, ",", word);
    }
    return list;
}

bool IsInitial(const std::string& name, const std::string& value)
{
    const Option* const option = FindOption(name);
    return option != nullptr && value == option->initial;
}

} // namespace

std::string BondOptionProblem(const std::string& name, const std::string& value)
{
    const Option* const option = FindOption(name);
    if (option == nullptr) {
        return {};
    }
    const Values& takes = option->takes;
    const auto names = Words(std::string(takes.names));
    const bool isName =
        std::find(names.begin(), names.end(), NamedValue(name, value)) != names.end();
    if (!names.empty() && !isName) {
        return "is none of " + Joined(names, ", ");
    }
    if (takes.most != 0 && !ToNumber(value, 0, takes.most)) {
        return "is not a number from 0 to " + std::to_string(takes.most);
    }
    if (takes.family != AF_UNSPEC && !AreAddresses(takes.family, WithoutSigns(value))) {
        return std::string("is no list of IPv") + (takes.family == AF_INET ? "4" : "6") +
               " addresses";
    }
    return {};
}

BondOptions BondOptions::Parse(std::string_view text)
{
    BondOptions options;
    for (const std::string& word : Words(std::string(text))) {
        const auto equals = word.find('=');
        if (equals == 0 || equals == std::string::npos) {
            continue;
        }
        const std::string name = word.substr(0, equals);
        std::string value = word.substr(equals + 1);
        if (name == kArpTargets) {
            const std::string former = options.Get(name);
            value = Appended(former, ",", WithoutSigns(value));
        }
        options.values[name] = NamedValue(name, value);
    }
    return options;
}

std::optional<BondOptions> BondOptions::ReadLive(const std::string& bond)
{
    BondOptions options;
    for (const Option& option : kOptions) {
        const std::string name(option.name);
        const std::string value = LiveValue(option, FirstLine(LiveFolder(bond) + name));
        if (!value.empty()) {
            options.values[name] = value;
        }
    }
    return options.Get(kMode).empty() ? std::nullopt : std::optional<BondOptions>(options);
}

std::string BondOptions::Get(const std::string& name) const
{
    const auto found = values.find(name);
    return found == values.end() ? "" : found->second;
}

std::string BondOptions::Text() const
{
    // The mode comes first: it decides which others the kernel takes.
    std::string text = values.contains(kMode) ? Assignment(kMode, Get(kMode)) : "";
    for (const auto& [name, value] : values) {
        if (name != kMode) {
            text = Appended(text, " ", Assignment(name, value));
        }
    }
    return text;
}

BondOptions BondOptions::OverlaidWith(const BondOptions& other) const
{
    BondOptions both = other;
    both.values.insert(values.begin(), values.end());
    return both;
}

BondOptions BondOptions::WithMode(const std::string& mode) const
{
    BondOptions changed = *this;
    std::erase_if(changed.values, [&](const auto& entry) {
        const Option* const option = FindOption(entry.first);
        return option != nullptr && !CountsIn(*option, mode);
    });
    changed.values[kMode] = mode;
    const auto isOff = [&](const char* name) {
        return changed.Get(name).empty() || changed.Get(name) == "0";
    };
    if (isOff("miimon") && isOff("arp_interval")) {
        changed.values["miimon"] = "100";
    }
    return changed;
}

BondOptions BondOptions::Chosen(const BondOptions& named) const
{
    BondOptions chosen = *this;
    const std::string mode = Get(kMode);
    std::erase_if(chosen.values, [&](const auto& entry) {
        const Option* const option = FindOption(entry.first);
        const bool refused = option != nullptr && option->refused && !CountsIn(*option, mode);
        return entry.first != kMode && !named.values.contains(entry.first) &&
               (refused || IsInitial(entry.first, entry.second));
    });
    return chosen;
}

std::optional<std::vector<std::string>> ReadLiveSlaves(const std::string& bond)
{
    std::ifstream file(LiveFolder(bond) + "slaves");
    if (!file) {
        return std::nullopt;
    }
    std::string line;
    std::getline(file, line);
    std::vector<std::string> slaves = Words(line);
    // Where a page is too small for all names, the kernel says so with a word of its own.
    if (!slaves.empty() && slaves.back().starts_with("++")) {
        return std::nullopt;
    }
    return slaves;
}

std::map<std::string, std::string> SwitchColumns(const BondOptions& options)
{
    const std::string mode = options.Get(kMode);
    std::map<std::string, std::string> columns;
    const auto add = [&](const char* name, const char* column) {
        const std::string value = options.Get(name);
        const Option* const option = FindOption(name);
        if (!value.empty() && value != option->initial && CountsIn(*option, mode)) {
            columns[column] = value;
        }
    };
    add("updelay", "bond_updelay");
    add("downdelay", "bond_downdelay");
    add("miimon", "other_config:bond-miimon-interval");
    add("primary", "other_config:bond-primary");
    add("lacp_rate", "other_config:lacp-time");
    add("ad_actor_system", "other_config:lacp-system-id");
    add("ad_actor_sys_prio", "other_config:lacp-system-priority");
    // Both ask the driver for its carrier unless they are told to read the card's registers.
    if (options.Get("use_carrier") == "0") {
        columns["other_config:bond-detect-mode"] = "miimon";
    }
    return columns;
}

std::vector<std::string> WithoutTwin(const BondOptions& options)
{
    const std::string mode = options.Get(kMode);
    std::vector<std::string> lost;
    for (const auto& [name, value] : options.values) {
        const Option* const option = FindOption(name);
        const bool counts = option == nullptr || (!option->twin && CountsIn(*option, mode));
        if (counts && !IsInitial(name, value)) {
            lost.push_back(Assignment(name, value));
        }
    }
    return lost;
}

} // namespace vornhost
