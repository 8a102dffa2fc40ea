#include "decision.h"

#include "decider.h"

#include <algorithm>

namespace vornhost {
namespace {

constexpr int kAfterAllLinks = 1 << 30;

std::set<std::string> NamesToDecide(const Inputs& inputs)
{
    std::set<std::string> names;
    for (const auto& [name, file] : inputs.files) {
        names.insert(PlainOf(name));
    }
    for (const SwitchBridge& bridge : inputs.switchState.bridges) {
        if (PlainOf(bridge.name) != bridge.name) {
            names.insert(PlainOf(bridge.name));
        }
    }
    for (const auto& [name, record] : inputs.runState.interfaces) {
        names.insert(name);
    }
    return names;
}

bool IsExcused(const Inputs& inputs, const Kinship& kinship, const std::string& name)
{
    const Link* link = inputs.live.FindLink(name);
    const bool made =
        link != nullptr && (link->kind == "bond" || link->kind == "vlan" || link->kind == "bridge");
    return made || inputs.request.known.contains(name) || !kinship.HeirOf(name).empty() ||
           !kinship.MasterOf(name).empty() || !kinship.HostOf(name).empty();
}

/** In the order in which they came up, so that routes are made in the order in which they stood. */
int Rank(const Unit& unit)
{
    if (unit.port != nullptr) {
        return unit.port->index;
    }
    return unit.members.empty() ? kAfterAllLinks : unit.members.front()->index;
}

} // namespace

std::set<std::string> Concerned(const Inputs& inputs)
{
    return Kinship(inputs).Closure(inputs.request.names);
}

std::vector<Unit> DecideUnits(const Inputs& inputs, const Kinship& kinship,
                              std::vector<Remark>& remarks)
{
    const std::set<std::string> known = NamesToDecide(inputs);
    const std::set<std::string>& asked = inputs.request.names;
    const bool starts = inputs.request.verb == Verb::kStart;
    std::vector<Unit> units;
    for (const std::string& name : asked.empty() ? known : kinship.Closure(asked)) {
        const bool named = asked.contains(name);
        if (!known.contains(name)) {
            if (starts && named && !IsExcused(inputs, kinship, name)) {
                remarks.push_back({Severity::kError, name + " has no configuration file"});
            }
            continue;
        }
        Unit unit = Decider(inputs, kinship, name, remarks).Decide();
        if (unit.target != Target::kLeaveAlone) {
            units.push_back(std::move(unit));
        } else if (named && starts && !IsExcused(inputs, kinship, name)) {
            remarks.push_back({Severity::kError, name + " was not started"});
        }
    }
    std::stable_sort(units.begin(), units.end(),
                     [](const Unit& one, const Unit& other) { return Rank(one) < Rank(other); });
    return units;
}

std::set<std::string> WantedOnSwitch(const Inputs& inputs)
{
    const std::set<std::string> concerned = Concerned(inputs);
    std::set<std::string> names;
    for (const auto& [name, file] : inputs.files) {
        const bool asked =
            inputs.request.names.empty() ? file.onBoot : concerned.contains(PlainOf(name));
        if (file.use == FileUse::kBridge && !file.slave && asked) {
            names.insert(PlainOf(name));
        }
    }
    return names;
}

std::set<std::string> NotOnSwitch(const Inputs& inputs)
{
    std::vector<Remark> remarks;
    std::set<std::string> names;
    for (const Unit& unit : DecideUnits(inputs, Kinship(inputs), remarks)) {
        if (unit.target == Target::kSwitch && !unit.joined) {
            names.insert(unit.name);
        }
    }
    return names;
}

} // namespace vornhost
