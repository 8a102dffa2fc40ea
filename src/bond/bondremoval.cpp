#include <vornovs/vornovs.h>

#include "bond/bondrecord.h"
#include "state/ifcfg.h"
#include "system/handles.h"
#include "system/log.h"
#include "system/pause.h"
#include "system/programs.h"

#include <vornplatform/core.h>
#include <vornplatform/netsdk.h>

#include <unistd.h>

#include <array>
#include <exception>

namespace VORN::OVS {
namespace {

constexpr char kLogFile[] = "bondmanager.cpp";

constexpr int kFewestSlaves = 2;

// Sizes of the buffers that the steps below build names and paths in, terminator included.
constexpr std::size_t kBridgeNameBuffer = 20;
constexpr std::size_t kConflictPathBuffer = 128;
constexpr std::size_t kConflictBuffer = 32;

/** A value as it is read from a file, NUL-terminated. */
using Value = std::array<char, kNameBuffer>;

/** @param shown  the key as the message names it. */
bool ReadKey(const std::string& path, const char* key, const char* shown, Value& value)
{
    if (VLIBCFileGetKeyValue(path.c_str(), key, value.data(), static_cast<int>(value.size()), 0) <
        0) {
        OVS_ERR("Failed to get key [%s]", shown);
        return false;
    }
    return true;
}

bool AddSlaves(const SzList& slaves, VORNLINKAGGROPT* out)
{
    for (int at = 0; at < slaves.Count(); ++at) {
        const char* const slave = slaves.At(at);
        if (VORNNetLinkAggrOptSlsaveAdd(out, slave) < 0) {
            OVS_ERR("Failed to add the slave %s into VORNLINKAGGROPT", slave);
            return false;
        }
    }
    return true;
}

/** Fills the record from the bond's file; what was read by then stays in it on failure. */
bool LoadBondConfig(const std::string& name, VORNLINKAGGROPT* out)
{
    if (out == nullptr) {
        return false;
    }
    *out = {};

    SzList slaves;
    if (!slaves) {
        OVS_ERR("Failed to alloc memory.");
        return false;
    }
    CopyName(out->szMaster, name);

    const std::string path = IfcfgPath(name);
    Value value{};
    // The message has always named this other key; log readers know it so.
    if (!ReadKey(path, kKeySlaveList, "BLOCK_CNT", value)) {
        return false;
    }
    Value trimmed{};
    (void)VLIBCStrTrimSpace(value.data(), trimmed.data());
    slaves.Split(trimmed.data(), " ");
    if (!AddSlaves(slaves, out)) {
        return false;
    }

    if (!ReadKey(path, kKeyBondMode, kKeyBondMode, value)) {
        return false;
    }
    out->mode = VORNNetLinkAggrStringToMode(value.data());
    return true;
}

bool Load(const std::string& name, VORNLINKAGGROPT* out)
{
    if (!LoadBondConfig(name, out)) {
        OVS_ERR("Faild to get");
        return false;
    }
    if (out->nSlave < kFewestSlaves) {
        OVS_ERR("Failt to remove the bonding, since the number of slave is %d for master %s",
                out->nSlave, name.c_str());
        return false;
    }
    return true;
}

/** Has the bridge of an interface whose address conflicts with the bond's ask for another one. */
void MoveConflictToDhcp(const std::string& name)
{
    std::array<char, kConflictBuffer + 1> conflict{}; // ends, whatever the platform fills
    unsigned int word = 0;
    if (VORNNetBondIPConflict(name.c_str(), conflict.data(), kConflictBuffer, &word) != 1) {
        return;
    }
    const std::string path = IfcfgPath(BridgeName(conflict.data()), kConflictPathBuffer);
    (void)VLIBCFileSetKeyValue(path.c_str(), kKeyBootProtocol, "dhcp", 0);
    (void)VLIBCFileSetKeyValue(path.c_str(), kKeyAddress, "", 0);
    (void)VLIBCFileSetKeyValue(path.c_str(), kKeyNetmask, "", 0);
}

/** Gives the bond's configuration to the first slave's bridge and removes the bond's file. */
bool RestoreBridgeConfig(const std::string& name, const std::string& slave)
try {
    const std::string bridge = BridgeName(slave);
    const std::string bondPath = IfcfgPath(name);
    const std::string bridgePath = IfcfgPath(bridge);
    if (VLIBCExec(kCopyProgram, "-f", bondPath.c_str(), bridgePath.c_str(), nullptr) < 0) {
        OVS_ERR("Failed to copy the config %s to %s", bondPath.c_str(), bridgePath.c_str());
        return false;
    }
    if (VLIBCFileExist(bondPath.c_str()) == 1 && ::unlink(bondPath.c_str()) != 0) {
        // Names the bridge's file, not the one that stayed: log readers know it so.
        OVS_ERR("Failed to unlink %s for bridge interface", bridgePath.c_str());
        return false;
    }

    SzHash update;
    if (!update) {
        OVS_ERR("Failed to alloc the hash pshOVSUpdate");
        return false;
    }
    SzHash remove;
    if (!remove) {
        OVS_ERR("Failed to alloc the hash pshOVSDel");
        return false;
    }
    update.Set(kKeyDevice, bridge.c_str());
    for (const char* key : {kKeyBondingOpts, kKeySlaveList, kKeyBondMode}) {
        remove.Set(key, "");
    }
    if (VLIBCFileSetKeys(bridgePath.c_str(), update.Get(), remove.Get(), kLineFormat) < 0) {
        OVS_ERR("Failed to set the key-value to %s", bridgePath.c_str());
        return false;
    }
    return true;
} catch (const std::exception&) {
    return false;
}

/** Takes the marks of membership off a slave and its bridge. */
bool UnmarkSlaveConfig(const std::string& slave)
try {
    const std::string bridgePath = IfcfgPath(BridgeName(slave));
    const std::string slavePath = IfcfgPath(slave);
    if (VLIBCFileRemoveKey(bridgePath.c_str(), kKeySlave) < 0 ||
        VLIBCFileRemoveKey(slavePath.c_str(), kKeyMaster) < 0 ||
        VLIBCFileRemoveKey(slavePath.c_str(), kKeySlave) < 0) {
        OVS_ERR("Remove the OVS slave key fails");
        return false;
    }
    return true;
} catch (const std::exception&) {
    return false;
}

void DissolveFiles(const std::string& name, const std::vector<std::string>& slaves)
{
    if (!RestoreBridgeConfig(name, slaves.front())) {
        OVS_ERR("Faield to remove the ifcfg-%s", name.c_str());
    }
    for (const auto& slave : slaves) {
        if (!UnmarkSlaveConfig(slave)) {
            OVS_ERR("Failed to remove the slave ifcfg of %s", slave.c_str());
        }
    }
}

} // namespace

bool BondManager::Remove(const std::string& name, VORNLINKAGGROPT* out, bool restart)
try {
    if (!Load(name, out)) {
        OVS_ERR("The parameter has wrong foramt when the OVSD bonding remove");
        return false;
    }

    // The lists are made while the network runs: it must not stay stopped for want of memory.
    const std::vector<std::string> slaves = SlavesOf(*out);
    std::vector<std::string> toStop = slaves;
    toStop.push_back(name);
    std::vector<std::string> toStart;
    toStart.reserve(slaves.size());
    for (const auto& slave : slaves) {
        toStart.push_back(BridgeName(slave, kBridgeNameBuffer));
    }

    MoveConflictToDhcp(name);
    if (restart) {
        if (!StopNetwork(toStop)) {
            OVS_ERR("Failed to stop the rc.network");
        }
        Pause(kSettleSeconds);
    }
    DissolveFiles(name, slaves);
    if (restart && !StartNetwork(toStart)) {
        OVS_ERR("Failed to start the rc.network");
    }
    return true;
} catch (const std::exception&) {
    return false;
}

} // namespace VORN::OVS
