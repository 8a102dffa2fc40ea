#include "conversion.h"

#include "automatic.h"
#include "handover.h"
#include "inputs.h"
#include "kinship.h"
#include "report.h"

#include "support/contains.h"
#include "support/filestates.h"
#include "support/interfacename.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>
#include <utility>

namespace vornhost {
namespace {

bool SpeaksLacp(const SwitchPort& bond)
{
    const auto lacp = bond.columns.find("lacp");
    return lacp != bond.columns.end() && lacp->second != "off";
}

/** The mode of the kernel's that stands for the switch's. */
std::string KernelMode(const SwitchPort& bond)
{
    if (SpeaksLacp(bond)) {
        return kLacpMode;
    }
    const auto mode = bond.columns.find("bond_mode");
    const bool balances = mode != bond.columns.end() && mode->second.starts_with("balance");
    return balances ? "balance-xor" : "active-backup";
}

/** What a conversion back is going to take away from the switch. */
Handover HandoverOf(const Inputs& inputs)
{
    Handover handover;
    for (const SwitchBridge& bridge : inputs.switchState.bridges) {
        if (!bridge.marked) {
            continue;
        }
        const std::string name = PlainOf(bridge.name);
        std::vector<std::string> members;
        if (const SwitchPort* bond = bridge.FindBond()) {
            members = Kinship(inputs).LiveMembersOf(name);
            handover.bonds[name] = {members, bridge.hwaddr, SpeaksLacp(*bond)};
        }
        const SwitchPort* own = bridge.FindPort(bridge.name);
        if (own != nullptr && own->tag) {
            handover.tags[name] = *own->tag;
            if (!members.empty()) {
                handover.tags[members.front()] = *own->tag;
            }
        }
    }
    return handover;
}

bool MindRecord(const Inputs& inputs, ConversionStage stage)
{
    if (stage != ConversionStage::kDone && !ConversionRuns()) {
        return true; // the host is reset: whatever goes then is meant to go
    }
    const auto former = ConversionRecord::Load();
    const ConversionRecord record =
        RecordAt(stage, BondsAndVlansOf(inputs), former.value_or(ConversionRecord{}));
    return record == former || record.Save();
}

/** Whether the interface, or the bridge that stands for it, has the addressing of a file. */
bool HasAddressing(const InterfaceFile& wanted, const std::string& name,
                   const std::map<std::string, InterfaceFile>& files)
{
    return std::any_of(files.begin(), files.end(), [&](const auto& entry) {
        const InterfaceFile& file = entry.second;
        return (file.name == name || file.primary == name) && file.addresses == wanted.addresses &&
               file.client == wanted.client;
    });
}

bool Check(bool written, const char* path)
{
    if (!written) {
        Say({Severity::kError, std::string("cannot write ") + path + ": " + std::strerror(errno)});
    }
    return written;
}

} // namespace

std::optional<ConversionStage> FindStage(const std::string& name)
{
    constexpr std::array<std::pair<const char*, ConversionStage>, 3> kStages{
        {{"create", ConversionStage::kToSwitch},
         {"delete", ConversionStage::kToPlain},
         {"end", ConversionStage::kDone}}};
    for (const auto& [word, stage] : kStages) {
        if (name == word) {
            return stage;
        }
    }
    return std::nullopt;
}

bool MindConversion(ConversionStage stage)
{
    std::vector<Remark> remarks;
    const auto inputs = ReadInputs({}, remarks);
    if (!inputs) {
        (void)SayAll(remarks);
        return false;
    }
    const bool recorded = Check(MindRecord(*inputs, stage), kConversionPath);
    if (stage == ConversionStage::kDone) {
        return recorded;
    }
    const bool back = stage == ConversionStage::kToPlain;
    return Check(SaveHandover(back ? HandoverOf(*inputs) : Handover{}), kHandoverPath) && recorded;
}

void SettleConversion(const Inputs& inputs)
{
    if (IsPartOfConversion() || ConfigurationIsLocked()) {
        return;
    }
    const auto former = ConversionRecord::Load();
    if (former && !former->Empty()) {
        (void)Check(MindRecord(inputs, ConversionStage::kDone), kConversionPath);
    }
}

Handover OwedSinceCut(const std::map<std::string, InterfaceFile>& files)
{
    const auto record = ConversionRecord::Load();
    return record && !record->vlans.empty() ? OwedSince(*record, RememberedVlan::LoadAll(), files)
                                            : Handover{};
}

Handover OwedSince(const ConversionRecord& record, const std::vector<RememberedVlan>& remembered,
                   const std::map<std::string, InterfaceFile>& files)
{
    Handover owed;
    for (const FileVlan& vlan : record.vlans) {
        std::vector<std::string> carriers{vlan.parent};
        const auto bond = record.bonds.find(vlan.parent);
        if (bond != record.bonds.end() && !bond->second.slaves.empty()) {
            carriers.push_back(bond->second.slaves.front());
        }
        const auto memory =
            std::find_if(remembered.begin(), remembered.end(), [&](const RememberedVlan& each) {
                return each.parent == vlan.parent && each.id == static_cast<int>(vlan.id);
            });
        for (const std::string& name : carriers) {
            // Who has given the interface another addressing meanwhile means it as it stands.
            if (memory == remembered.end() ||
                HasAddressing(ParseInterfaceFile(memory->name,
                                                 FileOf(memory->state.before, memory->name).Text())
                                  .file,
                              name, files)) {
                owed.tags[name] = vlan.id;
            }
        }
    }
    return owed;
}

ConversionRecord RecordAt(ConversionStage stage, ConversionRecord now,
                          const ConversionRecord& former)
{
    if (stage != ConversionStage::kDone) {
        now.Add(former);
        return now;
    }
    ConversionRecord lost = former;
    std::erase_if(lost.bonds, [&](const auto& entry) { return now.bonds.contains(entry.first); });
    std::erase_if(lost.vlans, [&](const FileVlan& vlan) { return Contains(now.vlans, vlan); });
    return lost;
}

ConversionRecord BondsAndVlansOf(const Inputs& inputs)
{
    ConversionRecord record;
    const Kinship kinship(inputs);
    for (const auto& [name, bond] : inputs.live.bonds) {
        const auto mode = bond.options.find("mode");
        if (!bond.members.empty() && mode != bond.options.end()) {
            record.bonds[name] = {mode->second, bond.members};
        }
    }
    for (const Link& link : inputs.live.links) {
        if (link.kind == "vlan" && !IsTagDevice(link)) {
            record.vlans.push_back(
                {inputs.live.NameOf(link.parent), static_cast<unsigned>(link.vlanId)});
        }
    }
    for (const SwitchBridge& bridge : inputs.switchState.bridges) {
        const std::string name = PlainOf(bridge.name);
        const SwitchPort* own = bridge.FindPort(bridge.name);
        if (!bridge.marked) {
            continue;
        }
        if (const SwitchPort* bond = bridge.FindBond()) {
            record.bonds[name] = {KernelMode(*bond), kinship.LiveMembersOf(name)};
        }
        if (own != nullptr && own->tag) {
            record.vlans.push_back({name, *own->tag});
        }
    }
    return record;
}

} // namespace vornhost
