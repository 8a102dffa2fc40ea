#include "faults/contract.h"

namespace reliability {

namespace {

constexpr int kKilled = 9;
constexpr int kExitedWith1 = 1 << 8;
constexpr int kExitedWith77 = 77 << 8;

/** A program: an exit status, another one, the platform's own failure, death by a signal. */
std::vector<Way> Program(const std::string& line)
{
    return {{1, Then::kLine, line},
            {127, Then::kLine, line},
            {-1, Then::kLine, line},
            {-kKilled, Then::kLine, line}};
}

std::vector<Way> Negative(const std::string& line)
{
    return {{-1, Then::kLine, line}, {-5, Then::kLine, line}};
}

std::vector<Way> Silent()
{
    return {{-1, Then::kSilent, ""}, {1, Then::kSilent, ""}};
}

std::vector<Way> Answers(const std::vector<int>& results)
{
    std::vector<Way> ways;
    for (const int result : results) {
        ways.push_back({result, Then::kAnswer, ""});
    }
    return ways;
}

std::vector<Row> Programs()
{
    const std::string tag = "/usr/bin/ovs-vsctlget port $5 tag";
    const std::string tagFailed = "Execute cmd " + tag + " failed, err=";
    return {
        // Whatever keeps it from succeeding, the platform's answer is negative.
        {"VLIBCExec /bin/cp -f", "", Negative("Failed to copy the config $3 to $4")},
        {"VLIBCExec /usr/bin/ovs-vsctl add-port", "", Program("Fail to attach the $4 into $3")},
        {"VLIBCExec /usr/bin/ovs-vsctl del-port", "", Program("Fail to detach the $4 into $3")},
        {"VLIBCExec /usr/bin/ovs-vsctl clear port", "", Program("clear $4's vlan tag failed")},
        {"VLIBCExecl /usr/bin/ovs-vsctl set port", "",
         Program("set $4's vlan tag failed, tag ID = ")},
        {"VLIBCExec /usr/vorn/sbin/vornnetdtool --del-gateway-info", "",
         Program("Failed to use the vornnetdtool to delete gateway info")},
        {"VLIBCExecl /usr/vorn/sbin/vornnetdtool --copy-gateway-info", "",
         Program("Failed to copy the gateway info from $4 to $5")},
        {"VLIBCExecl /etc/rc.network stop", "", Program("Failed to stop the rc.network")},
        {"VLIBCExecl /etc/rc.network start", "", Program("Failed to start the rc.network")},
        {"VLIBCExecl /etc/rc.network set-ovs-bond", "",
         Program("Failed to change the OVS bonding mode")},
        {"VLIBCExecv /etc/rc.network stop", "", Program("Failed to stop the rc.network")},
        {"VLIBCExecv /etc/rc.network start", "", Program("Failed to start the rc.network")},
        {"VLIBCExecv", "", Program("Failed to start the rc.network")},
        {"VLIBCPopen /usr/bin/ovs-vsctl r list-br",
         "",
         {{0, Then::kLine, "Failed to excute /usr/bin/ovs-vsctl list-br to get all ovs-brs"},
          {0, Then::kAnswer, "", "ovs_eth0\nov"},
          {0, Then::kAnswer, "", ""},
          {kExitedWith1, Then::kAnswer, "", "ovs_eth0\n"},
          {kKilled, Then::kAnswer, "", "\n \x01\xFF rubbish " + std::string(5000, 'x') + "\n"}}},
        {"VLIBCPopen /usr/bin/ovs-vsctl rB get port",
         "",
         {{0, Then::kLine, "Fail to execute cmd " + tag},
          {kExitedWith1, Then::kLine, tagFailed + "1", "10\n"},
          {kExitedWith77, Then::kLine, tagFailed + "77", ""},
          {kKilled, Then::kLine, tagFailed + "-1", "10\n"},
          {0, Then::kAnswer, "", ""},
          {0, Then::kAnswer, "", "\x01rubbish"},
          {0, Then::kAnswer, "", std::string(5000, '9')}}},
        {"VLIBCPclose /usr/bin/ovs-vsctl list-br", "", Silent()},
        {"VLIBCPclose /usr/bin/ovs-vsctl get port",
         "",
         {{kExitedWith1, Then::kLine,
           "Execute cmd /usr/bin/ovs-vsctlget port $4 tag failed, err=1"},
          {kKilled, Then::kLine, "Execute cmd /usr/bin/ovs-vsctlget port $4 tag failed, err=-1"}}},
    };
}

std::vector<Row> Files()
{
    const Way silent{1, Then::kSilent, ""};
    const Way unseen{-1, Then::kSilent, ""};
    return {
        {"VLIBCFileGetKeyValue", "SLAVE_LIST", Negative("Failed to get key [BLOCK_CNT]")},
        {"VLIBCFileGetKeyValue", "BOND_MODE", Negative("Failed to get key [BOND_MODE]")},
        {"VLIBCFileSetKeyValue",
         "OVS_VLAN_ID",
         {{-1, Then::kLine, "Add OVS_VLAN_ID key failed"}, silent}},
        {"VLIBCFileSetKeyValue",
         "ONBOOT",
         {{1, Then::kLine, "Failed to set key ONBOOT in $1"}, unseen}},
        {"VLIBCFileSetKeyValue",
         "BRIDGE",
         {{1, Then::kLine, "Failed to set key BRIDGE in $1"}, unseen}},
        {"VLIBCFileSetKeyValue", "", {unseen, silent}},
        {"VLIBCFileRemoveKey",
         "OVS_VLAN_ID",
         {{-1, Then::kLine, "Remove OVS_VLAN_ID key failed"}, silent}},
        {"VLIBCFileRemoveKey",
         "BRIDGE",
         {{1, Then::kLine, "Failed to remove key BRIDGE in $1"}, unseen}},
        {"VLIBCFileRemoveKey", "", {{-1, Then::kLine, "Remove the OVS slave key fails"}, silent}},
        {"VLIBCFileSetKeys", "", Negative("Failed to set the key-value to $1")},
        {"VLIBCFileCheckKeyValue", "", Answers({-1, 0})},
        {"VLIBCFileExist", "", Answers({0, 1, -1})},
        {"VLIBCFileCheckDir", "", {{0, Then::kTold, "Failed to mkdir ["}}},
        {"VLIBCFileLockTimeByFile", "", Negative("Failed to lock/tmp/ovs_config.lock")},
        {"VLIBCFileUnlockByFile", "", Negative("Failed to unlock/tmp/ovs_config.lock")},
        {"VLIBCFileLock", "", {{-1, Then::kError, "VLIBCErrSetEx 1024 vlanmanager.cpp"}, silent}},
        {"VLIBCFileUnlock", "", {{-1, Then::kError, "VLIBCErrSetEx 1280 vlanmanager.cpp"}, silent}},
        {"VLIBCSzHashAlloc", "", {{0, Then::kLine, "Failed to alloc the hash "}}},
        {"VLIBCSzHashSetValue", "", Answers({-1})},
        {"VLIBCSzListAlloc", "", {{0, Then::kLine, "Failed to alloc memory."}}},
        {"VLIBCStrSep", "", Silent()},
        {"VLIBCStrTrimSpace", "", Silent()},
    };
}

std::vector<Row> ServicesAndHooks()
{
    return {
        {"VLIBServiceIsRunning", "", Answers({0, -1})},
        {"VLIBServiceStart", "", Negative("Failed to call the ovs-db related upstart")},
        {"VLIBServiceStop vornovs-vswitch", "",
         Negative("Failed to kill the process ovs-vswitchd")},
        {"VLIBServiceStop vornovs-db", "", Negative("Failed to kill the process ovsdb-server")},
        {"VLIBServiceRestart", "", Negative("Filed to restart the vornwifid")},
        {"BaseHook", "", Answers({0})},
        {"SetEnv", "", Silent()},
        {"ExecHook", "", Silent()},
        {"sleep", "", {{1, Then::kSilent, ""}}}, // a signal ended it one second early
    };
}

std::vector<Row> Network()
{
    return {
        {"VLIBNetGetInterfaceInfo",
         "",
         {{0, Then::kLine, "No interface."}, {-1, Then::kLine, "Get interface info fail."}}},
        {"VLIBNetBridgeIfIsMaster", "", Answers({1, -1})},
        {"VLIBNetVlanGet", "", Answers({-1, 0, 2})},
        {"VLIBNetVlanCreate", "", Negative("Failed to create vlan tag $2 of $1")},
        {"VLIBNetVlanRemove", "", Negative("Failed to remove the vlan of $1")},
        {"VLIBNetOVSIfIsMaster", "", Answers({-1, 0, 3})},
        {"VORNNetGetEthInfo",
         "",
         {{-1, Then::kLine, "$1 not ready, retry(0)"}, {1, Then::kLine, "$1 not ready, retry(0)"}}},
        {"VORNNetIFGetIPConfig", "", Negative("Failed to get config of $1")},
        {"VORNNetLinkAggrGet", "", Negative("Failed to get the ")},
        {"VORNNetLinkAggrSet", "mode=0", Negative("Failed to remove bonding")},
        {"VORNNetLinkAggrSet", "", Negative("Failed to create linux bond")},
        {"VORNNetLinkAggrStringToMode", "", Answers({0})},
        {"VORNNetLinkAggrOptSlsaveAdd", "",
         Negative("Failed to add the slave $1 into VORNLINKAGGROPT")},
        {"VORNNetBondIPConflict", "", {{-1, Then::kSilent, ""}, {0, Then::kSilent, ""}}},
    };
}

} // namespace

const std::vector<Row>& Contract()
{
    static const std::vector<Row> rows = [] {
        std::vector<Row> all;
        for (const auto& part : {Programs(), Files(), ServicesAndHooks(), Network()}) {
            all.insert(all.end(), part.begin(), part.end());
        }
        return all;
    }();
    return rows;
}

} // namespace reliability
