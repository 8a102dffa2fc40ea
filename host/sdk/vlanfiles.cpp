#include "vlanfiles.h"

#include "support/filestates.h"
#include "support/settings.h"

#include <algorithm>

namespace vornhost {
namespace {

constexpr char kTag[] = "OVS_VLAN_ID";

bool HasFile(const FileStates& states, const std::string& interface)
{
    const auto state = states.find(interface);
    return state != states.end() && state->second.text;
}

unsigned FileMode(const FileStates& states, const std::string& interface)
{
    const auto state = states.find(interface);
    return state == states.end() ? FileState{}.mode : state->second.mode;
}

KeyValueFile NewFile(const std::string& interface, const std::string& more = "")
{
    return KeyValueFile::Parse("DEVICE=" + interface + '\n' + more + "ONBOOT=yes\n");
}

bool HasAddressing(const KeyValueFile& file)
{
    return !ConfiguredAddresses(file).empty() || file.Get("BOOTPROTO") == "dhcp";
}

/** A VLAN's file for an interface that had none, or another number. */
KeyValueFile NewVlanFile(const VlanPlan& plan, const KeyValueFile& parent)
{
    KeyValueFile file = NewFile(plan.name, "VLAN=yes\n");
    ReplaceAddressing(HasAddressing(parent) ? parent : plan.live, file);
    return file;
}

void Renumber(const VlanPlan& plan, KeyValueFile& file)
{
    (void)file.Set("DEVICE", plan.name);
    if (file.Get("VLAN_ID")) {
        (void)file.Set("VLAN_ID", std::to_string(plan.id));
    }
}

void Put(const std::string& interface, const KeyValueFile& build, bool stays, unsigned mode,
         BuiltVlan& built)
{
    built.build[interface] = {build.Text(), mode};
    built.final[interface] =
        stays ? built.build[interface] : FileState{std::nullopt, FileState{}.mode};
}

void BuildVlan(const VlanPlan& plan, const FileStates& current,
               const std::optional<RememberedVlan>& memory, BuiltVlan& built)
{
    if (HasFile(current, plan.name)) {
        Put(plan.name, FileOf(current, plan.name), true, FileMode(current, plan.name), built);
        return;
    }
    const KeyValueFile parent = FileOf(current, plan.parent);
    if (!memory) {
        Put(plan.name, NewVlanFile(plan, parent), true, FileState{}.mode, built);
        return;
    }

    const FileStates& before = memory->state.before;
    const bool hadFile = HasFile(before, memory->name);
    KeyValueFile file = hadFile ? FileOf(before, memory->name) : NewVlanFile(plan, parent);
    KeyValueFile unused = file;
    const bool changed = CarryChanges(FileOf(memory->state.moved, plan.parent), parent,
                                      IsAddressingKey, hadFile ? file : unused);
    if (plan.name != memory->name || plan.id != memory->id) {
        Renumber(plan, file);
    }
    Put(plan.name, file, hadFile || changed, FileMode(before, memory->name), built);
}

void BuildParent(const VlanPlan& plan, const FileStates& current,
                 const std::optional<RememberedVlan>& memory, BuiltVlan& built)
{
    const KeyValueFile now = FileOf(current, plan.parent);
    if (memory && memory->state.before.contains(plan.parent)) {
        const FileStates& before = memory->state.before;
        const bool hadFile = HasFile(before, plan.parent);
        KeyValueFile file = hadFile ? FileOf(before, plan.parent) : NewFile(plan.parent);
        const auto isOwn = [](const std::string& key) {
            return !IsAddressingKey(key) && key != kTag;
        };
        const bool changed =
            CarryChanges(FileOf(memory->state.moved, plan.parent), now, isOwn, file);
        Put(plan.parent, file, hadFile || changed, FileMode(before, plan.parent), built);
        return;
    }
    KeyValueFile file = HasFile(current, plan.parent) ? now : NewFile(plan.parent);
    RemoveAddressing(file);
    (void)file.Remove(kTag);
    Put(plan.parent, file, true, FileMode(current, plan.parent), built);
}

} // namespace

FileStates MovedToParent(const VlanPlan& plan, const FileStates& before)
{
    KeyValueFile file =
        HasFile(before, plan.parent) ? FileOf(before, plan.parent) : NewFile(plan.parent);
    const KeyValueFile vlan = FileOf(before, plan.name);
    ReplaceAddressing(HasFile(before, plan.name) ? vlan : plan.live, file);
    if (!plan.mtu.empty() && !vlan.Get("MTU")) {
        (void)file.Set("MTU", plan.mtu);
    }
    if (file.Get("ONBOOT") == "no" && vlan.Get("ONBOOT") != "no") {
        (void)file.Set("ONBOOT", "yes"); // it was up for the VLAN's sake
    }
    (void)file.Set(kTag, std::to_string(plan.id));

    FileStates moved;
    moved[plan.parent] = {file.Text(), FileMode(before, plan.parent)};
    moved[plan.name] = {};
    return moved;
}

BuiltVlan MovedToVlan(const VlanPlan& plan, const FileStates& current,
                      const std::optional<RememberedVlan>& memory)
{
    BuiltVlan built;
    BuildVlan(plan, current, memory, built);
    BuildParent(plan, current, memory, built);
    return built;
}

bool IsHalfMoved(const RememberedVlan& memory, const FileStates& current)
{
    const auto now = current.find(memory.parent);
    const auto before = memory.state.before.find(memory.parent);
    return now != current.end() && now->second.text && before != memory.state.before.end() &&
           now->second.text != before->second.text &&
           SameSettings(FileOf(memory.state.moved, memory.parent), FileOf(current, memory.parent));
}

} // namespace vornhost
