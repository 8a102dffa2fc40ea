#include "portcolumns.h"

#include "support/interfacevalues.h"

#include <algorithm>
#include <array>
#include <limits>
#include <sstream>
#include <string_view>
#include <utility>

namespace vornhost {
namespace {

constexpr char kOther[] = "other_config:";
constexpr char kOtherToo[] = "other-config:";
constexpr std::array<std::string_view, 3> kModes{"active-backup", "balance-slb", "balance-tcp"};
constexpr std::array<std::string_view, 3> kLacp{"active", "passive", "off"};
constexpr std::array<std::string_view, 2> kDelays{"bond_updelay", "bond_downdelay"};
constexpr std::array<std::string_view, 2> kTruths{"true", "false"};

bool StartsWith(const std::string& text, const char* beginning)
{
    return text.rfind(beginning, 0) == 0;
}

std::string LiveValue(const SwitchPort& live, const std::string& name)
{
    const bool other = StartsWith(name, kOther);
    const SwitchValues& values = other ? live.otherConfig : live.columns;
    const auto found = values.find(other ? name.substr(sizeof kOther - 1) : name);
    return found == values.end() ? std::string() : found->second;
}

std::vector<std::string> Split(const std::string& text)
{
    std::istringstream stream(text);
    std::vector<std::string> parts;
    for (std::string part; std::getline(stream, part, ',');) {
        parts.push_back(part);
    }
    return parts;
}

template <std::size_t N>
bool IsOneOf(const std::array<std::string_view, N>& words, const std::string& word)
{
    return std::find(words.begin(), words.end(), word) != words.end();
}

/** @return  why the switch would not take the option; empty when it does. */
std::string Refusal(const std::string& name, const std::string& value)
{
    constexpr unsigned kMost = std::numeric_limits<int>::max();
    const std::string option = name + "=" + value;
    if (IsOneOf(kDelays, name)) {
        return ToNumber(value, 0, kMost) ? "" : option + " is no number of milliseconds";
    }
    if (name == "bond_fake_iface") {
        return IsOneOf(kTruths, value) ? "" : option + " is neither true nor false";
    }
    const bool known = name == "bond_mode" || name == "lacp" ||
                       (StartsWith(name, kOther) && name.size() > sizeof kOther - 1);
    return known ? "" : "the switch's bonds have no option \"" + name + "\"";
}

/** Quoted whole, so that the tool takes it for one value. */
std::string Quoted(const std::string& value)
{
    constexpr std::string_view kPlain =
        "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789_-";
    if (!value.empty() && value.find_first_not_of(kPlain) == std::string::npos) {
        return value;
    }
    std::string text = "\"";
    for (const char each : value) {
        text += each == '"' || each == '\\' ? "\\" : "";
        text += each;
    }
    return text + "\"";
}

/** A column as the tool wants it. */
std::string Written(const std::string& name)
{
    return StartsWith(name, kOther) ? kOther + Quoted(name.substr(sizeof kOther - 1)) : name;
}

} // namespace

PortColumns::PortColumns(const InterfaceFile& file, const FormerBond* former)
{
    m_hasOptions = !file.bondOptions.empty();
    if (former != nullptr) {
        m_values = former->columns;
        std::erase_if(m_values, [](const auto& column) {
            return !Refusal(column.first, column.second).empty();
        });
    }
    for (const auto& [name, value] : file.bondOptions) {
        const bool other = StartsWith(name, kOtherToo);
        Take(other ? kOther + name.substr(sizeof kOtherToo - 1) : name, value);
    }
    // The kernel's bond carries traffic to a partner that does not speak the protocol, too.
    if (SpeaksLacp()) {
        m_values.try_emplace(std::string(kOther) + "lacp-fallback-ab", "true");
    }
}

void PortColumns::Take(const std::string& name, const std::string& value)
{
    if (std::string refusal = Refusal(name, value); !refusal.empty()) {
        m_refusals.push_back(std::move(refusal));
    } else {
        m_values[name] = value;
    }
}

std::string PortColumns::Get(const std::string& name) const
{
    const auto found = m_values.find(name);
    return found == m_values.end() ? std::string() : found->second;
}

bool PortColumns::SpeaksLacp() const
{
    return Get("lacp") == "active" || Get("lacp") == "passive";
}

std::string PortColumns::Objection() const
{
    if (!m_hasOptions) {
        return "BONDING_OPTS is empty";
    }
    const std::string mode = Get("bond_mode");
    if (!IsOneOf(kModes, mode)) {
        return "the switch has no bond mode \"" + mode + "\"";
    }
    const std::string lacp = Get("lacp");
    if (!lacp.empty() && !IsOneOf(kLacp, lacp)) {
        return "lacp=" + lacp + " is neither active nor passive nor off";
    }
    return {};
}

std::string PortColumns::Keys() const
{
    std::string keys;
    for (const auto& [name, value] : m_values) {
        keys += (keys.empty() ? "" : ",") + name;
    }
    return keys;
}

std::string PortColumns::Changes(const SwitchPort* live, bool wanted) const
{
    if (!wanted || !Objection().empty()) {
        return {};
    }
    std::string changes;
    for (const auto& [name, value] : m_values) {
        if (live == nullptr || LiveValue(*live, name) != value) {
            changes += " " + Written(name) + "=" + Quoted(value);
        }
    }
    const bool same = live != nullptr && live->externalIds.contains(kOptionsKey) &&
                      live->externalIds.at(kOptionsKey) == Keys();
    if (!same) {
        changes += std::string(" external_ids:") + kOptionsKey + "=" + Quoted(Keys());
    }
    return changes;
}

std::vector<std::string> PortColumns::Removals(const std::string& port, const SwitchPort* live,
                                               bool wanted) const
{
    std::vector<std::string> removals;
    if (live == nullptr || !wanted || !Objection().empty() ||
        !live->externalIds.contains(kOptionsKey)) {
        return removals;
    }
    for (const std::string& name : Split(live->externalIds.at(kOptionsKey))) {
        if (m_values.contains(name) || LiveValue(*live, name).empty()) {
            continue;
        }
        std::string removal = StartsWith(name, kOther) ? "remove Port " : "clear Port ";
        removal += port;
        removal += StartsWith(name, kOther) ? " other_config " : " ";
        removal += StartsWith(name, kOther) ? Quoted(name.substr(sizeof kOther - 1)) : name;
        removals.push_back(std::move(removal));
    }
    return removals;
}

} // namespace vornhost
