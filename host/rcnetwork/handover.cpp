#include "handover.h"

#include "hold.h"

#include "support/atomicfile.h"

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <ctime>
#include <fstream>
#include <sstream>

#include <nlohmann/json.hpp>
#include <unistd.h>

namespace vornhost {
namespace {

using Json = nlohmann::json;

/** Longer than any conversion takes from one program to the next. */
constexpr unsigned long kLifetimeSeconds = 120;

/** A clock that nobody sets and that goes on while the host sleeps. */
unsigned long BootSecond()
{
    timespec now{};
    (void)clock_gettime(CLOCK_BOOTTIME, &now);
    return static_cast<unsigned long>(now.tv_sec);
}

} // namespace

const HandedBond* Handover::FirstOf(const std::string& name) const
{
    const auto found = std::find_if(bonds.begin(), bonds.end(), [&](const auto& entry) {
        return !entry.second.members.empty() && entry.second.members.front() == name;
    });
    return found == bonds.end() ? nullptr : &found->second;
}

bool Handover::IsSilent(const std::string& name) const
{
    return std::any_of(bonds.begin(), bonds.end(), [&](const auto& entry) {
        const auto& members = entry.second.members;
        const auto found = std::find(members.begin(), members.end(), name);
        return found != members.end() && found != members.begin();
    });
}

std::string HandoverText(const Handover& handover, unsigned long second)
{
    Json bonds = Json::object();
    for (const auto& [name, bond] : handover.bonds) {
        bonds[name] = {{"members", bond.members}, {"mac", bond.mac}, {"lacp", bond.lacp}};
    }
    return Json{{"second", second}, {"tags", handover.tags}, {"bonds", bonds}}.dump(1) + "\n";
}

Handover ParseHandover(const std::string& text, unsigned long second)
{
    Handover handover;
    try {
        const Json json = Json::parse(text);
        const auto written = json.at("second").get<unsigned long>();
        if (written > second || second - written > kLifetimeSeconds) {
            return {};
        }
        handover.tags = json.at("tags").get<std::map<std::string, unsigned>>();
        for (const auto& [name, bond] : json.at("bonds").items()) {
            handover.bonds[name] = {bond.at("members").get<std::vector<std::string>>(),
                                    bond.at("mac").get<std::string>(), bond.at("lacp").get<bool>()};
            if (handover.bonds[name].members.empty()) {
                return {}; // nobody would carry its traffic
            }
        }
    } catch (const std::exception&) {
        return {};
    }
    return handover;
}

bool IsPartOfConversion()
{
    return std::getenv(kHoldMark) != nullptr;
}

Handover LoadHandover()
{
    if (!IsPartOfConversion()) {
        return {};
    }
    std::ifstream file(kHandoverPath);
    std::ostringstream text;
    text << file.rdbuf();
    return ParseHandover(text.str(), BootSecond());
}

bool SaveHandover(const Handover& handover)
{
    if (handover.Empty()) {
        return unlink(kHandoverPath) == 0 || errno == ENOENT;
    }
    return ReplaceFile(kHandoverPath, HandoverText(handover, BootSecond()), kPrivateFile);
}

} // namespace vornhost
