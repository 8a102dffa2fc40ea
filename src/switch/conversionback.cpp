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

#include <unistd.h>

#include <exception>

namespace VORN::OVS {
namespace {

constexpr char kLogFile[] = "ovsmanager.cpp";

void CopyGatewaysBack(const std::set<std::string>& bridges)
{
    for (const auto& bridge : bridges) {
        (void)CopyGatewayInfo(bridge.c_str(), PlainName(bridge).c_str());
    }
}

void TakeTopologyOffSwitch()
{
    SetTopologyKey(kTopologyBridge, kKeyOnBoot, "yes");
    SetTopologyKey(kTopologyWired, kKeyBridge, kTopologyBridge);
    SetTopologyKey(kTopologyWireless, kKeyBridge, kTopologyBridge);
}

} // namespace

bool OVSManager::DeleteAll()
try {
    OVSChangeHook hook("delete");
    std::set<std::string> bridges;
    (void)hook.ExecHook(SDK_PLUGIN_ACTION_BEGIN);

    if (GetSwitchList(bridges) < 0) {
        OVS_ERR("Fail to get all ovs switch list");
        return false;
    }
    m_ifs = bridges;
    CopyGatewaysBack(m_ifs);
    if (RemoveOVSVlan() < 0) {
        OVS_ERR("Failed to remove ovs vlan");
        return false;
    }

    if (RemoveOVSBond() < 0) {
        OVS_ERR("Failed to create bond for ovs-interface");
        return false;
    }

    StoppedNetwork network;
    for (const auto& bridge : m_ifs) {
        if (DestroyOVS(bridge) < 0) {
            OVS_ERR("Failed to delete ovs for %s", bridge.c_str());
        }
    }
    if (IsBridgeTopology()) {
        TakeTopologyOffSwitch();
    }
    network.Start();

    if (!m_bonds.empty()) {
        Pause(kSettleSeconds);
        if (CreateLinuxBond() < 0) {
            OVS_ERR("Failed to create linux bond");
        }
    }
    if (!m_vlans.empty()) {
        Pause(kSettleSeconds);
        if (CreateLinuxVlan() < 0) {
            OVS_ERR("Failed to create the linux vlan");
            return false;
        }
    }
    (void)hook.ExecHook(SDK_PLUGIN_ACTION_DONE);
    return true;
} catch (const std::exception&) {
    return false;
}

int OVSManager::DestroyOVS(const std::string& bridge) const
try {
    OVSIfsConf converted(kInterfaceListPath);
    const std::string plain = PlainName(bridge, kPathBuffer);
    const std::string plainPath = IfcfgPath(plain);
    const std::string bridgePath = IfcfgPath(bridge);

    if (VLIBCExec(kCopyProgram, "-f", bridgePath.c_str(), plainPath.c_str(), nullptr) < 0) {
        OVS_ERR("Failed to copy the config %s to %s", bridgePath.c_str(), plainPath.c_str());
        return -1;
    }
    if (VLIBCFileExist(bridgePath.c_str()) == 1 && ::unlink(bridgePath.c_str()) != 0) {
        OVS_ERR("Failed to unlink %s for bridge interface", bridgePath.c_str());
        return -1;
    }

    SzHash update;
    if (!update) {
        OVS_ERR("Failed to alloc the hash pshIfsUpdate");
        return -1;
    }
    SzHash remove;
    if (!remove) {
        OVS_ERR("Failed to alloc the hash pshIfsDel");
        return -1;
    }
    update.Set(kKeyDevice, plain.c_str());
    for (const char* key : {kKeyType, kKeyPrimary}) {
        remove.Set(key, "");
    }
    if (VLIBCFileSetKeys(plainPath.c_str(), update.Get(), remove.Get(), kLineFormat) < 0) {
        OVS_ERR("Failed to set the key-value to %s", plainPath.c_str());
        return -1;
    }

    if (converted.Remove(plain) < 0) {
        OVS_ERR("Failed to remove the ovs interface file");
    }
    return 0;
} catch (const std::exception&) {
    return -1;
}

int OVSManager::RemoveOVSVlan() const
{
    for (const auto& [port, vlan] : m_vlans) {
        if (VlanManager::Remove(port) < 0) {
            OVS_ERR("Failed to remove vlan of %s", port.c_str());
            return -1;
        }
    }
    return 0;
}

int OVSManager::RemoveOVSBond()
try {
    for (const auto& [key, bond] : m_bonds) {
        VORNLINKAGGROPT removed{};
        if (!BondManager::Remove(key, &removed, true)) {
            OVS_ERR("Failed to remove OVS bonding");
            return -1;
        }
        for (const auto& slave : SlavesOf(bond)) {
            m_ifs.insert(BridgeName(slave));
        }
        m_ifs.erase(key);
    }
    return 0;
} catch (const std::exception&) {
    return -1;
}

int OVSManager::CreateLinuxBond()
try {
    for (auto& [key, bond] : m_bonds) {
        // A record whose name lacks the prefix keeps its name.
        if (const std::string plain = PlainName(NameOf(bond.szMaster)); !plain.empty()) {
            CopyName(bond.szMaster, plain);
        }
        if (VORNNetLinkAggrSet(&bond) < 0) {
            OVS_ERR("Failed to create linux bond");
            return -1;
        }
        (void)WaitForLink(NameOf(bond.szMaster), LOG_INFO);
    }
    return 0;
} catch (const std::exception&) {
    return -1;
}

int OVSManager::CreateLinuxVlan() const
try {
    for (const auto& [key, vlan] : m_vlans) {
        const std::string parent = PlainName(NameOf(vlan.szRealName));
        VORNNETIPCONFIG ipConfig{};
        if (VORNNetIFGetIPConfig(parent.c_str(), &ipConfig) < 0) {
            OVS_ERR("Failed to get config of %s", parent.c_str());
            return -1;
        }
        if (VLIBNetVlanCreate(parent.c_str(), vlan.vlanId, &ipConfig) < 0) {
            OVS_ERR("Failed to create vlan tag %d of %s", vlan.vlanId, parent.c_str());
            return -1;
        }
    }
    return 0;
} catch (const std::exception&) {
    return -1;
}

} // namespace VORN::OVS
