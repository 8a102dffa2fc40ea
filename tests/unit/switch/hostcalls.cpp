#include "switch/hostcalls.h"

namespace unit {

Calls PortFound(const std::string& name)
{
    return {"VLIBNetBridgeIfIsMaster " + name, "VLIBNetVlanGet " + name};
}

Calls Discovered(const std::vector<std::string>& interfaces)
{
    Calls calls{"ExecHook net net/ovs_change 4 ACTION=create", "VLIBNetGetInterfaceInfo"};
    for (const std::string& name : interfaces) {
        calls = Sequence({calls, PortFound(name)});
    }
    return calls;
}

std::string GetTag(const std::string& bridge)
{
    return "VLIBCPopen /usr/bin/ovs-vsctl rB get port " + bridge + " tag";
}

Calls BridgeFound(const std::string& bridge)
{
    return {GetTag(bridge), "VLIBCPclose /usr/bin/ovs-vsctl get port " + bridge + " tag",
            "VLIBNetOVSIfIsMaster " + bridge};
}

Calls Listed(const std::vector<std::string>& bridges)
{
    Calls calls{"ExecHook net net/ovs_change 4 ACTION=delete", "VLIBServiceIsRunning vornovs-db",
                "VLIBServiceIsRunning vornovs-vswitch", kListBridges};
    for (const std::string& bridge : bridges) {
        calls = Sequence({calls, BridgeFound(bridge)});
    }
    calls.emplace_back("VLIBCPclose /usr/bin/ovs-vsctl list-br");
    return calls;
}

Calls TagSet(const std::string& bridge, const std::string& tag)
{
    return {
        "VLIBCFileLock 2054 5", "VLIBCFileSetKeyValue " + FileOf(bridge) + " OVS_VLAN_ID=" + tag,
        "VLIBCFileUnlock 2048", "VLIBCExecl /usr/bin/ovs-vsctl set port " + bridge + " tag=" + tag};
}

Calls TagCleared(const std::string& bridge)
{
    return {"VLIBCFileLock 2054 5", "VLIBCFileRemoveKey " + FileOf(bridge) + " OVS_VLAN_ID",
            "VLIBCFileUnlock 2048", "VLIBCExec /usr/bin/ovs-vsctl clear port " + bridge + " tag"};
}

Calls LinuxBondRemoved(const std::string& bond, const std::string& slaves, const std::string& first)
{
    const std::string tool = "VLIBCExec /usr/vorn/sbin/vornnetdtool --del-gateway-info ";
    return {tool + "-4 " + bond, tool + "-6 " + bond,
            "VORNNetLinkAggrSet " + bond + " mode=0 " + slaves, "sleep 3",
            "VORNNetGetEthInfo " + first};
}

Calls EightTries(const std::string& name)
{
    Calls calls;
    for (int i = 0; i < 8; ++i) {
        calls.push_back("VORNNetGetEthInfo " + name);
        calls.emplace_back("sleep 1");
    }
    return calls;
}

LogLines EightLines(int priority, const std::string& name)
{
    LogLines lines;
    for (int i = 0; i < 8; ++i) {
        lines.push_back(
            {priority, kManagerFile, name + " not ready, retry(" + std::to_string(i) + ")"});
    }
    return lines;
}

harness::LogLine SpeedLine()
{
    return harness::Err(kManagerFile, "[OVS] speed 1000");
}

void ReadBonds(harness::RecordingPlatform& platform, VORN::OVS::OVSManager& manager,
               const std::vector<std::string>& bonds)
{
    for (const std::string& bond : bonds) {
        EXPECT_EQ(manager.InitBondOpt(bond), 0);
    }
    platform.Forget();
}

void ReadTags(harness::RecordingPlatform& platform, VORN::OVS::OVSManager& manager,
              const std::vector<std::string>& bridges)
{
    std::string list;
    for (const std::string& bridge : bridges) {
        list += bridge + "\n";
        platform.Output(GetTag(bridge), bridge.substr(bridge.find_first_of("0123456789")) + "\n");
    }
    platform.Output(kListBridges, list);
    Names found;
    EXPECT_EQ(manager.GetSwitchList(found), 0);
    platform.Forget();
}

} // namespace unit
