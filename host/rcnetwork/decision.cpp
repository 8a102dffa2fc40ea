#include "decision.h"

#include "decider.h"

#include <algorithm>
#include <iterator>

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
    return (link != nullptr && IsOfMadeKind(*link)) || inputs.request.known.contains(name) ||
           !kinship.HeirOf(name).empty() || !kinship.MasterOf(name).empty() ||
           !kinship.HostOf(name).empty();
}

/** In the order in which they came up, so that routes are made in the order in which they stood. */
int Rank(const Unit& unit)
{
    if (unit.port != nullptr) {
        return unit.port->index;
    }
    return unit.members.empty() ? kAfterAllLinks : unit.members.front()->index;
}

/** Whether there is such an interface once the devices that the units ask for are made. */
bool WillBeThere(const Inputs& inputs, const std::vector<Unit>& units, const std::string& name)
{
    return inputs.live.FindLink(name) != nullptr ||
           std::any_of(units.begin(), units.end(), [&](const Unit& unit) {
               const bool isMade = unit.IsGroup() || unit.kind == UnitKind::kVlan;
               return (unit.target == Target::kSwitch && unit.bridge == name) ||
                      (isMade && unit.addWanted && unit.name == name);
           });
}

/**
 * Puts VLANs that are to be made behind what they stand on. Those on nothing are left out: one
 * device that cannot be made would keep the whole host from its network.
 */
void PutVlansOnTheirParents(const Inputs& inputs, const Kinship& kinship, std::vector<Unit>& units,
                            std::vector<Remark>& remarks)
{
    const auto firstMade = std::stable_partition(units.begin(), units.end(), [](const Unit& unit) {
        return unit.kind != UnitKind::kVlan || !unit.addWanted || unit.takeDown ||
               (unit.port != nullptr && !unit.rebuilt);
    });
    std::vector<Unit> left;
    std::copy(firstMade, units.end(), std::back_inserter(left));
    units.erase(firstMade, units.end());
    const auto hasParent = [&](const Unit& unit) {
        return WillBeThere(inputs, units, kinship.ParentFor(*inputs.files.at(unit.name).vlan));
    };
    for (bool found = true; found;) {
        const auto next = std::find_if(left.begin(), left.end(), hasParent);
        found = next != left.end();
        if (found) {
            units.push_back(*next);
            left.erase(next);
        }
    }
    for (const Unit& unit : left) {
        const bool asked = !inputs.request.names.empty() || unit.file->onBoot;
        remarks.push_back({asked ? Severity::kError : Severity::kWarning,
                           "there is no interface " + inputs.files.at(unit.name).vlan->parent +
                               " for " + unit.name});
    }
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
    PutVlansOnTheirParents(inputs, kinship, units, remarks);
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
