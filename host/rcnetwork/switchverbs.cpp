#include "reconcile.h"

#include "apply.h"
#include "handover.h"
#include "inputs.h"
#include "kinship.h"
#include "portcolumns.h"
#include "unit.h"

#include <algorithm>
#include <cerrno>
#include <cstring>

namespace vornhost {
namespace {

bool Refuse(const std::string& text)
{
    Say({Severity::kError, text});
    return false;
}

bool Apply(const Stage& stage)
{
    std::vector<Remark> remarks;
    const bool done = ApplyStage(stage, remarks);
    for (Remark& remark : remarks) {
        remark.severity = done ? Severity::kWarning : Severity::kError;
    }
    (void)SayAll(remarks);
    return done;
}

std::optional<Inputs> Read()
{
    std::vector<Remark> remarks;
    auto inputs = ReadInputs({}, remarks);
    if (!inputs) {
        (void)SayAll(remarks);
    }
    return inputs;
}

} // namespace

bool KeepTags()
{
    const Handover handover = LoadHandover();
    if (handover.tags.empty()) {
        return true;
    }
    const auto inputs = Read();
    if (!inputs || !inputs->switchState.running) {
        return inputs.has_value();
    }
    const Kinship kinship(*inputs);
    Stage stage{StageKind::kSwitch, "keep tags", {}};
    for (const auto& [name, tag] : handover.tags) {
        const SwitchBridge* bridge = inputs->switchState.Find(kinship.BridgeFor(name));
        const SwitchPort* own = bridge == nullptr ? nullptr : bridge->FindPort(bridge->name);
        if (own != nullptr && bridge->marked && own->tag != tag) {
            stage.lines.push_back("set Port " + bridge->name + " tag=" + std::to_string(tag));
        }
    }
    return stage.lines.empty() || Apply(stage);
}

bool SetSwitchBond(const std::string& bridge)
{
    const auto inputs = Read();
    if (!inputs) {
        return false;
    }
    const Kinship kinship(*inputs);
    const InterfaceFile* file = kinship.UsableFile(bridge);
    if (file == nullptr || file->use != FileUse::kBridge || file->slaveList.empty()) {
        return Refuse("ifcfg-" + bridge + " is not the file of a bond on the switch");
    }
    const SwitchBridge* live = inputs->switchState.Find(bridge);
    if (!inputs->switchState.running || live == nullptr || live->FindBond() == nullptr) {
        return Refuse(bridge + " is not on the switch, or no bond there");
    }
    const SwitchPort& port = *live->FindBond();
    const auto former = inputs->formerBonds.find(PlainOf(bridge));
    const bool same =
        former != inputs->formerBonds.end() && former->second.bond.HasSlaves(file->slaveList);
    const PortColumns columns(*file, same ? &former->second : nullptr);
    if (const std::string objection = columns.Objection(); !objection.empty()) {
        return Refuse("ifcfg-" + bridge + ": " + objection + "; the bond is left as it is");
    }
    for (const std::string& refusal : columns.Refusals()) {
        Say({Severity::kWarning, std::string("ifcfg-").append(bridge).append(": ") + refusal});
    }
    Stage stage{StageKind::kSwitch, "set bond", {}};
    if (const std::string changes = columns.Changes(&port, true); !changes.empty()) {
        stage.lines.push_back("set Port " + port.name + changes);
    }
    for (const std::string& removal : columns.Removals(port.name, &port, true)) {
        stage.lines.push_back(removal);
    }
    if (!stage.lines.empty() && !Apply(stage)) {
        return false;
    }
    return !columns.SpeaksLacp() || port.negotiated ||
           Apply({StageKind::kReady, "wait for partners", {"switch " + bridge + " " + port.name}});
}

} // namespace vornhost
