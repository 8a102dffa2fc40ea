#include "repair.h"

#include "wording.h"

#include <support/atomicfile.h>
#include <vornovs/vornovs.h>

#include <algorithm>
#include <chrono>
#include <filesystem>
#include <system_error>
#include <thread>

namespace vornovsctl {

namespace {

namespace fs = std::filesystem;

// A writer has its file for some milliseconds; one that is older has none.
constexpr std::chrono::seconds kStrayAge{5};
constexpr std::chrono::milliseconds kBetweenLooks{100};

bool Has(const std::vector<HalfState>& found, std::initializer_list<HalfStateClass> kinds)
{
    return std::any_of(found.begin(), found.end(), [&](const HalfState& each) {
        return std::find(kinds.begin(), kinds.end(), each.kind) != kinds.end();
    });
}

/** Every client goes and comes back, so that the library converts the whole host both ways. */
void AddConversions(Names clients, std::vector<RepairStep>& plan)
{
    const bool begun = clients.erase(kRepairClient) > 0;
    if (clients.empty() && !begun) {
        plan.push_back({RepairStep::Kind::kRegister, kRepairClient});
    }
    if (clients.empty() || begun) {
        plan.push_back({RepairStep::Kind::kUnregister, kRepairClient});
    }
    for (const auto kind : {RepairStep::Kind::kUnregister, RepairStep::Kind::kRegister}) {
        for (const std::string& client : clients) {
            plan.push_back({kind, client});
        }
    }
}

/**
 * A bridge's file that was copied to another name and removed, and not yet edited there, is the
 * only one to hold the settings, which a conversion would write over.
 */
void AddRestorations(const HostTruths& truths, std::vector<RepairStep>& plan)
{
    for (const FileTruth& file : truths.files) {
        if (file.type == "OVS" && file.device != file.Name() && !InterfaceOf(file.device).empty() &&
            truths.FindFile(file.device) == nullptr) {
            plan.push_back({RepairStep::Kind::kRestoreFile, file.device, file.Name()});
        }
    }
}

std::string PathOf(const std::string& interface)
{
    return std::string(vornhost::kConfigurationFolder) + "/ifcfg-" + interface;
}

/** A bond's file that is nothing yet but a copy of its first member's bridge's goes. */
void AddRemovals(const HostTruths& truths, std::vector<RepairStep>& plan)
{
    for (const FileTruth& file : truths.files) {
        const FileTruth* from = file.device == file.Name() ? nullptr : truths.FindFile(file.device);
        if (file.type == "OVS" && file.content.slaveList.empty() && from != nullptr &&
            from->IsBridges() && from->content.primary != InterfaceOf(file.Name()) &&
            !InterfaceOf(file.Name()).empty()) {
            plan.push_back({RepairStep::Kind::kRemoveFile, PathOf(file.Name())});
        }
    }
}

void RestoreFile(const std::string& interface, const std::string& source)
{
    if (const auto file = vornhost::KeyValueFile::Load(PathOf(source))) {
        (void)vornhost::ReplaceFile(PathOf(interface), file->Text(), 0644);
    }
}

/** A file that a writer still has goes by itself. */
void RemoveStray(const std::string& path)
{
    std::error_code error;
    for (;; std::this_thread::sleep_for(kBetweenLooks)) {
        const auto written = fs::last_write_time(path, error);
        if (error || fs::file_time_type::clock::now() - written >= kStrayAge) {
            fs::remove(path, error);
            return;
        }
    }
}

} // namespace

std::vector<RepairStep> PlanRepair(const HostTruths& truths, const std::vector<HalfState>& found)
{
    std::vector<RepairStep> plan;
    AddRestorations(truths, plan);
    AddRemovals(truths, plan);
    const bool strayOnly = std::all_of(found.begin(), found.end(), [](const HalfState& each) {
        return each.kind == HalfStateClass::kStrayFile;
    });
    if (!strayOnly) {
        plan.push_back({RepairStep::Kind::kStartNetwork, ""});
    }
    if (Has(found, {HalfStateClass::kUnfinishedFile, HalfStateClass::kRegisteredButPlain,
                    HalfStateClass::kOnSwitchButUnregistered})) {
        AddConversions(truths.host.clients.value_or(Names()), plan);
    }
    for (const std::string& path : truths.strays) {
        plan.push_back({RepairStep::Kind::kRemoveFile, path});
    }
    return plan;
}

std::string TextOf(const RepairStep& step)
{
    switch (step.kind) {
    case RepairStep::Kind::kRestoreFile:
        return "put the file of " + Quoted(step.subject) + " back from that of " +
               Quoted(step.source);
    case RepairStep::Kind::kStartNetwork:
        return "make the live network what the files say";
    case RepairStep::Kind::kUnregister:
        return "unregister " + Quoted(step.subject);
    case RepairStep::Kind::kRegister:
        return "register " + Quoted(step.subject);
    case RepairStep::Kind::kRemoveFile:
        return "remove " + step.subject;
    }
    return "";
}

void TakeStep(const RepairStep& step)
{
    switch (step.kind) {
    case RepairStep::Kind::kRestoreFile:
        RestoreFile(step.subject, step.source);
        break;
    case RepairStep::Kind::kStartNetwork:
        (void)VORN::OVS::StartNetwork({});
        break;
    case RepairStep::Kind::kUnregister:
        (void)VORN::OVS::UnRegister(step.subject, {});
        break;
    case RepairStep::Kind::kRegister:
        (void)VORN::OVS::Register(step.subject, {});
        break;
    case RepairStep::Kind::kRemoveFile:
        RemoveStray(step.subject);
        break;
    }
}

} // namespace vornovsctl
