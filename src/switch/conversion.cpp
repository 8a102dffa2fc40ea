#include <vornovs/vornovs.h>

#include "bond/bondrecord.h"
#include "state/ifcfg.h"
#include "state/statefiles.h"
#include "switch/network.h"
#include "switch/topology.h"
#include "switch/waitforlink.h"
#include "system/handles.h"
#include "system/log.h"
#include "system/pause.h"
#include "system/programs.h"

#include <vornplatform/core.h>
#include <vornplatform/netsdk.h>
#include <vornplatform/sdk.h>

#include <exception>
#include <utility>

namespace VORN::OVS {
namespace {

constexpr char kLogFile[] = "ovsmanager.cpp";

void CopyGatewaysToBridges(const std::set<std::string>& interfaces)
{
    for (const auto& name : interfaces) {
        (void)CopyGatewayInfo(name.c_str(), BridgeName(name).c_str());
    }
}

/** Points the bridged wireless side at the switch bridge that replaces the wired interface. */
void PutTopologyOnSwitch()
{
    SetTopologyKey(kTopologyBridge, kKeyOnBoot, "no");

    const std::string wiredPath = IfcfgPath(kTopologyWired);
    if (VLIBCFileRemoveKey(wiredPath.c_str(), kKeyBridge) > 0) {
        OVS_ERR("Failed to remove key %s in %s", kKeyBridge, wiredPath.c_str());
    }

    SetTopologyKey(kTopologyWireless, kKeyBridge, "ovs_eth0");
}

void WaitForFirstBridge(const std::set<std::string>& interfaces)
{
    if (interfaces.empty()) {
        return;
    }
    const auto speed = WaitForLink(BridgeName(*interfaces.begin()), LOG_INFO);
    if (speed) {
        OVS_ERR("[OVS] speed %d", *speed);
    }
}

} // namespace

bool OVSManager::CreateAll()
try {
    OVSChangeHook hook("create");
    (void)hook.ExecHook(SDK_PLUGIN_ACTION_BEGIN);

    if (GetInterface() < 0) {
        OVS_ERR("Failed to get all interface");
        return false;
    }
    CopyGatewaysToBridges(m_ifs);
    if (RemoveLinuxVlan() < 0) {
        OVS_ERR("Failed to remove linux vlan");
    }
    if (RemoveLinuxBond() < 0) {
        OVS_ERR("Failed to remove linux bond");
    }

    StoppedNetwork network;
    if (IsBridgeTopology()) {
        PutTopologyOnSwitch();
        m_ifs.insert(kTopologyWired);
    }
    for (const auto& name : m_ifs) {
        if (CreateOVS(name) < 0) {
            OVS_ERR("Failed to create ovs for %s", name.c_str());
        }
    }
    network.Start();
    WaitForFirstBridge(m_ifs);

    if (!m_bonds.empty()) {
        Pause(kSettleSeconds);
        if (CreateOVSBond() < 0) {
            OVS_ERR("Failed to create bond for ovs-interface");
            return false;
        }
    }
    if (CreateOVSVlan() < 0) {
        OVS_ERR("Failed to create vlan for ovs-interface");
        return false;
    }
    (void)hook.ExecHook(SDK_PLUGIN_ACTION_DONE);
    return true;
} catch (const std::exception&) {
    return false;
}

int OVSManager::CreateOVS(const std::string& name) const
try {
    OVSIfsConf converted(kInterfaceListPath);
    const std::string bridge = BridgeName(name, kPathBuffer);
    const std::string plainPath = IfcfgPath(name);
    const std::string bridgePath = IfcfgPath(bridge);

    SzHash update;
    if (!update) {
        OVS_ERR("Failed to alloc the hash buffer");
        return -1;
    }
    if (CreateOVSForGeneral(name.c_str(), bridge.c_str(), plainPath.c_str(), bridgePath.c_str()) <
        0) {
        OVS_ERR("Failed to handle the ifcfg for non-br interface %s", name.c_str());
        return -1;
    }
    update.Set(kKeyBridge, bridge.c_str());
    if (VLIBCFileSetKeys(plainPath.c_str(), update.Get(), nullptr, kLineFormat) < 0) {
        OVS_ERR("Failed to set the key-value to %s", plainPath.c_str());
        return -1;
    }

    (void)converted.Write(name);
    return 0;
} catch (const std::exception&) {
    return -1;
}

int OVSManager::CreateOVSForGeneral(const char* name, const char* bridge, const char* source,
                                    const char* target) const
{
    SzHash update;
    if (!update) {
        OVS_ERR("Failed to alloc the hash buffer");
        return -1;
    }
    SzHash remove;
    if (!remove) {
        OVS_ERR("Failed to alloc the hash pshIfsDel");
        return -1;
    }

    if (VLIBCExec(kCopyProgram, "-f", source, target, nullptr) < 0) {
        OVS_ERR("Failed to copy the config %s to %s", source, target);
        return -1;
    }
    update.Set(kKeyDevice, bridge);
    update.Set(kKeyType, "OVS");
    update.Set(kKeyPrimary, name);
    for (const char* key : {kKeyBondingOpts, kKeyBridge, kKeySlave}) {
        remove.Set(key, "");
    }
    if (VLIBCFileSetKeys(target, update.Get(), remove.Get(), kLineFormat) < 0) {
        OVS_ERR("Failed to set the key-value to %s", target);
        return -1;
    }
    return 0;
}

int OVSManager::CreateOVSBond()
try {
    for (auto& [key, bond] : m_bonds) {
        std::vector<std::string> slaves = SlavesOf(bond);
        CopyName(bond.szMaster, BridgeName(key));
        if (!BondManager::Create(bond.mode, NameOf(bond.szMaster), slaves, true)) {
            OVS_ERR("Failed to create ovs bond");
            return -1;
        }
    }
    return 0;
} catch (const std::exception&) {
    return -1;
}

int OVSManager::CreateOVSVlan() const
try {
    for (const auto& [key, vlan] : m_vlans) {
        const std::string bridge = BridgeName(NameOf(vlan.szRealName));
        const std::string tag = std::to_string(vlan.vlanId);
        if (VlanManager::Create(bridge, tag) < 0) {
            OVS_ERR("Failed to create the vlan tag %s of %s", tag.c_str(), bridge.c_str());
            return -1;
        }
    }
    return 0;
} catch (const std::exception&) {
    return -1;
}

int OVSManager::RemoveLinuxVlan() const
try {
    for (const auto& [key, vlan] : m_vlans) {
        const std::string name = NameOf(vlan.szIfName);
        if (VLIBNetVlanRemove(name.c_str()) < 0) {
            OVS_ERR("Failed to remove the vlan of %s", name.c_str());
            return -1;
        }
    }
    return 0;
} catch (const std::exception&) {
    return -1;
}

int OVSManager::RemoveLinuxBond()
try {
    for (auto& [key, bond] : m_bonds) {
        (void)RemoveGateWayInfo(NameOf(bond.szMaster).c_str());

        const auto mode = std::exchange(bond.mode, VORN_LINK_AGGR_NONE);
        if (VORNNetLinkAggrSet(&bond) < 0) {
            OVS_ERR("Failed to remove bonding");
            return -1;
        }
        Pause(kSettleSeconds);
        bond.mode = mode; // the bond is rebuilt on the switch from this record

        for (const auto& slave : SlavesOf(bond)) {
            m_ifs.insert(slave);
        }
        m_ifs.erase(key);
        (void)WaitForLink(NameOf(bond.rgszSlave[0]), LOG_ERR);
    }
    return 0;
} catch (const std::exception&) {
    return -1;
}

} // namespace VORN::OVS
