#include "checks.h"

#include "wording.h"

#include <vornovs/vornovs.h>

#include <algorithm>
#include <set>
#include <support/interfacename.h>

namespace vornovsctl {

namespace {

constexpr std::size_t kLongestClientName = 255;
constexpr int kModes = VORN_LINK_AGGR_OVS_BALANCE_TCP;

bool IsControl(char character)
{
    const auto byte = static_cast<unsigned char>(character);
    return byte < 0x20 || byte == 0x7f;
}

// What stands in a file of lines, in paths and among options has to stay what it is.
std::string NameFault(const std::string& name, std::size_t longest)
{
    if (name.empty()) {
        return "is empty";
    }
    if (name.size() > longest) {
        return "is longer than " + std::to_string(longest) + " characters";
    }
    if (name.front() == '-') {
        return "begins with '-'";
    }
    if (std::any_of(name.begin(), name.end(), IsControl)) {
        return "holds a line break or another control character";
    }
    return name.find('/') == std::string::npos ? "" : "holds a slash";
}

} // namespace

std::string ClientFault(const std::string& name)
{
    return NameFault(name, kLongestClientName);
}

std::string InterfaceFault(const std::string& name)
{
    std::string fault = NameFault(name, vornhost::kLongestInterfaceName);
    if (!fault.empty()) {
        return fault;
    }
    if (name.find_first_of(" :") != std::string::npos) {
        return "holds a blank or a colon";
    }
    if (name == "." || name == ".." || name.front() == '#') {
        return "cannot be one of an interface";
    }
    return "";
}

std::string PlainInterfaceFault(const std::string& name)
{
    std::string fault = InterfaceFault(name);
    if (fault.empty() &&
        name.size() + vornhost::kBridgePrefixSize > vornhost::kLongestInterfaceName) {
        return "is longer than 11 characters, which leaves no room for its bridge's";
    }
    return fault;
}

std::string SwitchModeFault(const std::string& mode)
{
    if (VORN::OVS::CheckModeSupport(ModeOf(mode))) {
        return "";
    }
    std::vector<std::string> names;
    for (const VORN_LINK_AGGR_MODE each : Modes(true)) {
        names.push_back(NameOf(each));
    }
    return Quoted(mode) + " is none of the switch, which has " + List(names);
}

std::string VlanFault(const std::string& id)
{
    const bool digits = !id.empty() && id.size() <= 4 &&
                        id.find_first_not_of("0123456789") == std::string::npos &&
                        id.front() != '0';
    if (digits && std::stoi(id) <= 4094) {
        return "";
    }
    return Quoted(id) + " is no number from 1 to 4094" +
           (id == "0" ? "; 'vlan clear' and 'vlan remove' take a tag away" : "");
}

std::string SlavesFault(const std::vector<std::string>& slaves)
{
    const std::set<std::string> different(slaves.begin(), slaves.end());
    if (different.size() != slaves.size()) {
        return "name an interface twice";
    }
    if (slaves.size() < 2) {
        return "are fewer than two";
    }
    return slaves.size() <= VORN_LINK_AGGR_SLAVES
               ? ""
               : "are more than " + std::to_string(VORN_LINK_AGGR_SLAVES);
}

VORN_LINK_AGGR_MODE ModeOf(const std::string& name)
{
    return VORN::OVS::StrToMode(name.c_str());
}

std::string NameOf(VORN_LINK_AGGR_MODE mode)
{
    std::string name;
    VORN::OVS::ModeToStr(mode, name);
    // A mode without a name is answered with some text, too, which is no mode's.
    return mode != VORN_LINK_AGGR_NONE && ModeOf(name) == mode ? name : "";
}

std::vector<VORN_LINK_AGGR_MODE> Modes(bool ofTheSwitch)
{
    std::vector<VORN_LINK_AGGR_MODE> modes;
    for (int number = 1; number <= kModes; ++number) {
        const auto mode = static_cast<VORN_LINK_AGGR_MODE>(number);
        if (VORN::OVS::CheckModeSupport(mode) == ofTheSwitch) {
            modes.push_back(mode);
        }
    }
    return modes;
}

} // namespace vornovsctl
