#include "plan.h"

#include "decision.h"
#include "inputs.h"
#include "routeplan.h"
#include "unitplan.h"

#include <algorithm>
#include <sstream>

namespace vornhost {
namespace {

void AddStage(Plan& plan, StageKind kind, const std::string& title, std::vector<std::string> lines)
{
    if (!lines.empty()) {
        plan.stages.push_back({kind, title, std::move(lines)});
    }
}

/** A bridge may be left by several at once. */
std::vector<std::string> Once(const std::vector<std::string>& lines)
{
    std::vector<std::string> once;
    for (const std::string& line : lines) {
        if (std::find(once.begin(), once.end(), line) == once.end()) {
            once.push_back(line);
        }
    }
    return once;
}

/** What is on disk while the plan runs: it may be cut short after any step. */
InterfaceRecord Both(const InterfaceRecord& former, const InterfaceRecord& next)
{
    InterfaceRecord both = former;
    both.addresses.insert(next.addresses.begin(), next.addresses.end());
    both.routes.insert(next.routes.begin(), next.routes.end());
    both.unchecked.insert(next.unchecked.begin(), next.unchecked.end());
    both.formerSettings.insert(next.formerSettings.begin(), next.formerSettings.end());
    both.made = former.made || next.made;
    both.ownMac = next.ownMac.empty() ? former.ownMac : next.ownMac;
    both.broughtUp = former.broughtUp || next.broughtUp;
    both.formerMtu = former.formerMtu ? former.formerMtu : next.formerMtu;
    both.tag = next.tag ? next.tag : former.tag;
    both.ownSettings.insert(next.ownSettings.begin(), next.ownSettings.end());
    both.client = former.client || next.client;
    return both;
}

void AddRecords(const Inputs& inputs, const Steps& steps, Plan& plan)
{
    plan.recordBefore = inputs.runState;
    plan.recordAfter = inputs.runState;
    for (const auto& [name, record] : steps.records) {
        plan.recordBefore.interfaces[name] = Both(plan.recordBefore.interfaces[name], record);
        plan.recordAfter.interfaces[name] = record;
        plan.recordAfter.interfaces[name].unchecked.clear();
    }
}

/**
 * The order is what keeps the host reachable: addresses stand on both sides while the ports
 * change over, so that each packet finds them wherever it arrives.
 */
void AddStages(const Steps& steps, Plan& plan)
{
    if (steps.needsSwitch) {
        AddStage(
            plan, StageKind::kServices, "start the switch",
            {std::string(kDatabaseService) + " start", std::string(kSwitchService) + " start"});
    }
    AddStage(plan, StageKind::kSwitch, "make bridges", steps.makeBridges);
    AddStage(plan, StageKind::kWait, "wait for bridges", steps.waitFor);
    AddStage(plan, StageKind::kBatch, "create devices", steps.creation.Lines());
    AddStage(plan, StageKind::kSettings, "settings of new devices", steps.creationSettings);
    AddStage(plan, StageKind::kBatch, "make devices", steps.devices.Lines());
    AddStage(plan, StageKind::kReady, "wait for links", steps.readyBefore);
    // A client would put back what is taken away.
    AddStage(plan, StageKind::kClients, "end clients", steps.endClients);
    AddStage(plan, StageKind::kSettings, "settings before", steps.settingsBefore);
    AddStage(plan, StageKind::kCards, "cards", steps.cards);
    AddStage(plan, StageKind::kBatch, "build beside", steps.beside.Lines());
    std::vector<std::string> joinAndLeave = Once(steps.leave);
    joinAndLeave.insert(joinAndLeave.end(), steps.join.begin(), steps.join.end());
    AddStage(plan, StageKind::kSwitch, "join and leave", joinAndLeave);
    AddStage(plan, StageKind::kBatch, "replace devices", steps.replacement.Lines());
    AddStage(plan, StageKind::kSettings, "settings of replaced devices", steps.replacementSettings);
    AddStage(plan, StageKind::kBatch, "move", steps.move.Lines());
    AddStage(plan, StageKind::kAnnounce, "announce", steps.announce);
    AddStage(plan, StageKind::kSwitch, "remove bridges", Once(steps.removeBridges));
    AddStage(plan, StageKind::kBatch, "tidy", steps.tidy.Lines());
    AddStage(plan, StageKind::kReady, "wait for members", steps.readyAfter);
    AddStage(plan, StageKind::kBatch, "put in order", steps.order.Lines());
    AddStage(plan, StageKind::kAnnouncer, "announce again", steps.announceAgain);
    AddStage(plan, StageKind::kSettings, "settings after", steps.settingsAfter);
    AddStage(plan, StageKind::kBatch, "finish", steps.finish.Lines());
    AddStage(plan, StageKind::kRouters, "hear routers", Once(steps.hearRouters));
    AddStage(plan, StageKind::kResolver, "resolver", steps.resolver);
    AddStage(plan, StageKind::kReady, "wait for partners", steps.negotiate);
    AddStage(plan, StageKind::kClients, "start clients", steps.startClients);
    AddStage(plan, StageKind::kGateways, "forget gateways", steps.forgetGateways);
}

} // namespace

const SwitchBridge* SwitchState::Find(const std::string& bridge) const
{
    const auto found = std::find_if(bridges.begin(), bridges.end(),
                                    [&](const SwitchBridge& each) { return each.name == bridge; });
    return found == bridges.end() ? nullptr : &*found;
}

Plan MakePlan(const Inputs& inputs)
{
    Plan plan;
    plan.waitForSwitch = inputs.request.withoutSwitch.empty();
    plan.servicePatience = inputs.request.servicePatience;
    const Kinship kinship(inputs);
    const std::vector<Unit> units = DecideUnits(inputs, kinship, plan.remarks);
    Steps steps;
    for (const Unit& unit : units) {
        UnitPlanner(inputs, kinship, unit, steps, plan.remarks).Run();
    }
    RoutePlanner(inputs, units, steps).Run();
    AddStages(steps, plan);
    AddRecords(inputs, steps, plan);
    return plan;
}

std::string Plan::Text() const
{
    std::ostringstream text;
    for (const Stage& stage : stages) {
        text << stage.title << ":\n";
        for (const std::string& line : stage.lines) {
            text << "  " << line << "\n";
        }
    }
    return text.str();
}

} // namespace vornhost
