#include "repair.h"

#include "wording.h"

#include <support/atomicfile.h>
#include <support/interfacevalues.h>
#include <vornovs/vornovs.h>

#include <algorithm>
#include <chrono>
#include <filesystem>
#include <system_error>
#include <thread>
#include <vornplatform/core.h>
#include <vornplatform/netsdk.h>
#include <vornplatform/sdk.h>

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

/** Takes the host off the switch: every client goes. */
void AddWayOff(const HostTruths& truths, std::vector<RepairStep>& plan)
{
    Names clients = truths.host.clients.value_or(Names());
    const bool begun = clients.erase(kRepairClient) > 0;
    if (clients.empty() && !begun) {
        plan.push_back({RepairStep::Kind::kRegister, kRepairClient});
    }
    if (clients.empty() || begun) {
        plan.push_back({RepairStep::Kind::kUnregister, kRepairClient});
    }
    for (const std::string& client : clients) {
        plan.push_back({RepairStep::Kind::kUnregister, client});
    }
}

/** A VLAN may stand on a bond. */
void AddUnfinished(const HostTruths& truths, const std::vector<HalfState>& found,
                   std::vector<RepairStep>& plan)
{
    const auto isFound = [&](HalfStateClass kind, const std::string& subject) {
        return std::any_of(found.begin(), found.end(), [&](const HalfState& each) {
            return each.kind == kind && each.subject == subject;
        });
    };
    vornhost::ConversionRecord all = truths.converted;
    all.Add(truths.remembered);
    for (const auto& [name, bond] : all.bonds) {
        if (isFound(HalfStateClass::kUnfinishedBond, name)) {
            plan.push_back({RepairStep::Kind::kBuildBond, name, "", bond});
        }
    }
    for (const vornhost::FileVlan& vlan : all.vlans) {
        if (isFound(HalfStateClass::kUnfinishedVlan, vlan.parent)) {
            plan.push_back({RepairStep::Kind::kMakeVlan, vlan.parent, "", {}, vlan.id});
        }
    }
}

void AddWayBack(const HostTruths& truths, std::vector<RepairStep>& plan)
{
    for (const std::string& client : truths.host.clients.value_or(Names())) {
        if (client != kRepairClient) {
            plan.push_back({RepairStep::Kind::kRegister, client});
        }
    }
}

/** The library's own lock: nobody converts the host meanwhile. */
class ConfigurationLock {
public:
    ConfigurationLock()
    {
        if (VLIBCFileLockTimeByFile("/tmp/ovs_config.lock", 1, kLockSeconds, &m_handle) < 0) {
            m_handle = -1;
        }
    }
    ~ConfigurationLock()
    {
        if (m_handle != -1) {
            (void)VLIBCFileUnlockByFile(m_handle);
        }
    }
    ConfigurationLock(const ConfigurationLock&) = delete;
    ConfigurationLock& operator=(const ConfigurationLock&) = delete;
    explicit operator bool() const { return m_handle != -1; }

private:
    static constexpr int kLockSeconds = 5;
    int m_handle = -1;
};

/** The platform remembers the rest of what the bond was. */
void BuildBond(const std::string& name, const vornhost::ConvertedBond& bond)
{
    VORNLINKAGGROPT record{};
    name.copy(record.szMaster, VORN_NAME_SIZE - 1);
    record.mode = VORN::OVS::StrToMode(bond.mode.c_str());
    for (const std::string& slave : bond.slaves) {
        (void)VORNNetLinkAggrOptSlsaveAdd(&record, slave.c_str());
    }
    const ConfigurationLock lock;
    if (lock && record.mode != VORN_LINK_AGGR_NONE) {
        (void)VORNNetLinkAggrSet(&record);
    }
}

void MakeVlan(const std::string& parent, unsigned id)
{
    VORNNETIPCONFIG ipConfig{};
    const ConfigurationLock lock;
    if (lock && VORNNetIFGetIPConfig(parent.c_str(), &ipConfig) >= 0) {
        (void)VLIBNetVlanCreate(parent.c_str(), static_cast<int>(id), &ipConfig);
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
    const bool unfinished =
        Has(found, {HalfStateClass::kUnfinishedBond, HalfStateClass::kUnfinishedVlan});
    const bool registered = truths.host.clients && !truths.host.clients->empty();
    if (Has(found, {HalfStateClass::kUnfinishedFile, HalfStateClass::kRegisteredButPlain,
                    HalfStateClass::kOnSwitchButUnregistered}) ||
        (unfinished && registered)) {
        AddWayOff(truths, plan);
        AddUnfinished(truths, found, plan);
        AddWayBack(truths, plan);
    } else if (unfinished) {
        AddUnfinished(truths, found, plan);
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
    case RepairStep::Kind::kBuildBond:
        return "build " + step.subject + " of " + vornhost::Joined(step.bond.slaves, ", ") +
               " again";
    case RepairStep::Kind::kMakeVlan:
        return "make the VLAN " + std::to_string(step.vlan) + " of " + step.subject + " again";
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
    case RepairStep::Kind::kBuildBond:
        BuildBond(step.subject, step.bond);
        break;
    case RepairStep::Kind::kMakeVlan:
        MakeVlan(step.subject, step.vlan);
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
