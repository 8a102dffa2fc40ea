#include <vornovs/vornovs.h>

#include "state/ifcfg.h"
#include "system/handles.h"
#include "system/log.h"
#include "system/pause.h"
#include "system/programs.h"

#include <vornplatform/core.h>

#include <algorithm>
#include <exception>

namespace VORN::OVS {
namespace {

constexpr char kLogFile[] = "bondmanager.cpp";

constexpr std::size_t kFewestSlaves = 2;

bool IsAcceptable(VORN_LINK_AGGR_MODE mode, const std::string& master,
                  const std::vector<std::string>& slaves)
{
    if (!BondManager::CheckModeSupport(mode)) {
        OVS_ERR("OVS don't support this bonding mode %d", static_cast<int>(mode));
        return false;
    }
    if (IsInterfaceExist(master)) {
        OVS_ERR("The master interface %s exist", master.c_str());
        return false;
    }
    if (slaves.size() < kFewestSlaves) {
        OVS_ERR("The number of bonding slave must bigger than 2");
        return false;
    }
    return true;
}

bool HaveBridges(const std::vector<std::string>& slaves)
{
    return std::all_of(slaves.begin(), slaves.end(), [](const std::string& slave) {
        const std::string bridge = BridgeName(slave);
        if (!IsInterfaceExist(bridge)) {
            OVS_ERR("The slave interface %s doesn't have the OVS version %s", slave.c_str(),
                    bridge.c_str());
            return false;
        }
        return true;
    });
}

std::vector<std::string> BridgesAndSlaves(const std::vector<std::string>& slaves)
{
    std::vector<std::string> names;
    for (const auto& slave : slaves) {
        names.push_back(BridgeName(slave));
        names.push_back(slave);
    }
    return names;
}

/** The quotes are part of the value, and so is the blank after the last name. */
std::string SlaveListText(const std::vector<std::string>& slaves)
{
    std::string text = "\"";
    for (const auto& slave : slaves) {
        text.append(TextOf(slave)).append(" ");
    }
    return text.append("\"");
}

/** Makes the bond's file from that of the first slave's bridge, addressing and all. */
bool WriteBondConfig(VORN_LINK_AGGR_MODE mode, const std::string& master,
                     const std::vector<std::string>& slaves)
try {
    const std::string bondPath = IfcfgPath(master);
    const std::string sourcePath = IfcfgPath(BridgeName(slaves.front(), kPathBuffer));
    if (VLIBCExec(kCopyProgram, "-f", sourcePath.c_str(), bondPath.c_str(), nullptr) < 0) {
        OVS_ERR("Failed to copy the config %s to %s", sourcePath.c_str(), bondPath.c_str());
        return false;
    }

    SzHash update;
    if (!update) {
        OVS_ERR("Failed to alloc the hash buffer");
        return false;
    }
    update.Set(kKeyDevice, master.c_str());
    update.Set(kKeySlaveList, SlaveListText(slaves).c_str());
    std::string text;
    BondManager::ModeToStr(mode, text);
    update.Set(kKeyBondMode, text.c_str());
    BondManager::ModeToBondOPT(mode, text);
    update.Set(kKeyBondingOpts, text.c_str());
    if (VLIBCFileSetKeys(bondPath.c_str(), update.Get(), nullptr, kLineFormat) < 0) {
        OVS_ERR("Failed to set the key-value to %s", bondPath.c_str());
        return false;
    }
    return true;
} catch (const std::exception&) {
    return false;
}

/** Marks a slave and its bridge as members of the bond. */
bool MarkSlaveConfig(const std::string& slave, const std::string& master)
try {
    const std::string bridgePath = IfcfgPath(BridgeName(slave));
    const std::string slavePath = IfcfgPath(slave);

    SzHash bridgeUpdate;
    SzHash slaveUpdate;
    if (!bridgeUpdate || !slaveUpdate) {
        OVS_ERR("Failed to alloc the hash buffer");
        return false;
    }
    bridgeUpdate.Set(kKeySlave, "yes");
    slaveUpdate.Set(kKeySlave, "yes");
    slaveUpdate.Set(kKeyMaster, master.c_str());
    if (VLIBCFileSetKeys(bridgePath.c_str(), bridgeUpdate.Get(), nullptr, kLineFormat) < 0) {
        OVS_ERR("Failed to set the key-value to %s", bridgePath.c_str());
        return false;
    }
    if (VLIBCFileSetKeys(slavePath.c_str(), slaveUpdate.Get(), nullptr, kLineFormat) < 0) {
        OVS_ERR("Failed to set the key-value to %s", slavePath.c_str());
        return false;
    }
    return true;
} catch (const std::exception&) {
    return false;
}

} // namespace

bool BondManager::Create(VORN_LINK_AGGR_MODE mode, const std::string& master,
                         std::vector<std::string>& slaves, bool restart)
try {
    bool accepted = IsAcceptable(mode, master, slaves);
    if (accepted) {
        // Before the slaves are looked at, and not taken back when one of them is refused.
        (void)CopyGatewayInfo(slaves.front().c_str(), master.c_str());
        accepted = HaveBridges(slaves);
    }
    if (!accepted) {
        OVS_ERR("The parameter has wrong format when create the OVS bonding");
        return false;
    }

    // Both lists are made while the network runs: it must not stay stopped for want of memory.
    const std::vector<std::string> toStop = BridgesAndSlaves(slaves);
    const std::vector<std::string> toStart{master};
    if (restart) {
        if (!StopNetwork(toStop)) {
            OVS_ERR("Failed to stop the rc.network");
        }
        Pause(kSettleSeconds);
    }
    if (!WriteBondConfig(mode, master, slaves)) {
        OVS_ERR("Failed to Create the ifcfg config for %s", master.c_str());
    }
    for (const auto& slave : slaves) {
        (void)MarkSlaveConfig(slave, master);
    }
    if (restart && !StartNetwork(toStart)) {
        OVS_ERR("Failed to start the rc.network");
    }
    return true;
} catch (const std::exception&) {
    return false;
}

} // namespace VORN::OVS
