#include "trip.h"

#include "support/keyvaluefile.h"
#include "support/remembered.h"
#include "tools.h"

#include <filesystem>
#include <gtest/gtest.h>
#include <vornplatform/netsdk.h>

namespace contract {
namespace {

namespace fs = std::filesystem;

constexpr char kFolder[] = "/etc/sysconfig/network-scripts";
constexpr char kGateways[] = "/usr/vorn/etc/vornnetd/gateways.conf";
constexpr char kRuns[] = "/run/network-runs";

constexpr char kProgram[] = R"(#!/bin/sh
runs=/run/network-runs
number=$(($(ls -d $runs/run-* 2>/dev/null | wc -l) + 100))
mkdir -p "$runs/run-$number"
echo "$*" >"$runs/run-$number/arguments"
cp -r /etc/sysconfig/network-scripts "$runs/run-$number/files"
status=$(head -n 1 "$runs/statuses")
sed -i 1d "$runs/statuses"
exit "${status:-0}"
)";

Files FilesIn(const fs::path& folder)
{
    Files files;
    if (fs::exists(folder)) {
        for (const auto& entry : fs::directory_iterator(folder)) {
            const std::string name = entry.path().filename().string();
            files[name.substr(std::string("ifcfg-").size())] = ReadFile(entry.path().string());
        }
    }
    return files;
}

void CopyFile(const std::string& from, const std::string& to)
{
    EXPECT_EQ(RunProgram({"/bin/cp", "-f", IfcfgPath(from), IfcfgPath(to)}).exitCode, 0);
}

void RunTool(const std::vector<std::string>& words)
{
    for (const char* const family : {"-4", "-6"}) {
        std::vector<std::string> argv{VORNNETDTOOL, words[0], family};
        argv.insert(argv.end(), words.begin() + 1, words.end());
        EXPECT_EQ(RunProgram(argv), (Outcome{0, "", ""}));
    }
}

} // namespace

void StartWith(const Files& files, const std::string& gateways)
{
    Delete(kFolder);
    Delete("/usr/vorn/etc");
    fs::create_directories(kFolder);
    for (const auto& [interface, text] : files) {
        WriteFile(IfcfgPath(interface), text);
    }
    if (!gateways.empty()) {
        WriteFile(kGateways, gateways);
    }
    InstallNetworkProgram();
}

Files ReadFiles()
{
    return FilesIn(kFolder);
}

std::string ReadGateways()
{
    return ReadFile(kGateways);
}

void InstallNetworkProgram(const std::vector<int>& statuses)
{
    Delete(kRuns);
    std::string lines;
    for (const int status : statuses) {
        lines += std::to_string(status) + '\n';
    }
    WriteFile(std::string(kRuns) + "/statuses", lines);
    WriteFile("/etc/rc.network", kProgram);
    fs::permissions("/etc/rc.network", fs::perms::owner_all);
}

std::vector<NetworkRun> NetworkRuns()
{
    std::map<std::string, NetworkRun> runs;
    for (const auto& entry : fs::directory_iterator(kRuns)) {
        if (entry.is_directory()) {
            std::string arguments = ReadFile((entry.path() / "arguments").string());
            arguments.pop_back();
            runs[entry.path().filename()] = {arguments, FilesIn(entry.path() / "files")};
        }
    }
    std::vector<NetworkRun> list;
    for (const auto& [number, run] : runs) {
        list.push_back(run);
    }
    return list;
}

std::vector<std::string> NetworkCalls()
{
    std::vector<std::string> calls;
    for (const NetworkRun& run : NetworkRuns()) {
        calls.push_back(run.arguments);
    }
    return calls;
}

void ShowBond(const std::string& name, const std::map<std::string, std::string>& options)
{
    for (const auto& [option, value] : options) {
        WriteFile(std::string(vornhost::kInterfaceFolder) + '/' + name + "/bonding/" + option,
                  value + '\n');
    }
}

void HideBond(const std::string& name)
{
    Delete(std::string(vornhost::kInterfaceFolder) + '/' + name);
}

VORNLINKAGGROPT BondRecord(const std::string& name, int mode,
                           const std::vector<std::string>& slaves)
{
    VORNLINKAGGROPT opt{};
    name.copy(opt.szMaster, VORN_NAME_SIZE - 1);
    opt.mode = static_cast<VORN_LINK_AGGR_MODE>(mode);
    for (const std::string& slave : slaves) {
        EXPECT_EQ(VORNNetLinkAggrOptSlsaveAdd(&opt, slave.c_str()), 0);
    }
    return opt;
}

void CopyGateways(const std::string& from, const std::string& to)
{
    RunTool({"--copy-gateway-info", from, to});
}

void DeleteGateways(const std::string& interface)
{
    RunTool({"--del-gateway-info", interface});
}

void ToBridge(const std::string& interface)
{
    CopyFile(interface, "ovs_" + interface);
    EditFile("ovs_" + interface,
             {{"DEVICE", "ovs_" + interface}, {"TYPE", "OVS"}, {"PRIMARY", interface}},
             {"BONDING_OPTS", "BRIDGE", "SLAVE"});
    EditFile(interface, {{"BRIDGE", "ovs_" + interface}});
}

void FromBridge(const std::string& interface)
{
    CopyFile("ovs_" + interface, interface);
    fs::remove(IfcfgPath("ovs_" + interface));
    EditFile(interface, {{"DEVICE", interface}}, {"TYPE", "PRIMARY"});
}

void ToSwitchBond(const std::string& bond, const std::vector<std::string>& slaves)
{
    CopyFile("ovs_" + slaves[0], bond);
    std::string list;
    for (const std::string& slave : slaves) {
        list += slave + ' ';
        EditFile("ovs_" + slave, {{"SLAVE", "yes"}});
        EditFile(slave, {{"SLAVE", "yes"}, {"MASTER", bond}});
    }
    EditFile(bond, {{"DEVICE", bond},
                    {"SLAVE_LIST", '"' + list + '"'},
                    {"BOND_MODE", "ovs-active-backup"},
                    {"BONDING_OPTS", "\"bond_mode=active-backup lacp=off\""}});
}

void FromSwitchBond(const std::string& bond, const std::vector<std::string>& slaves)
{
    CopyFile(bond, "ovs_" + slaves[0]);
    fs::remove(IfcfgPath(bond));
    EditFile("ovs_" + slaves[0], {{"DEVICE", "ovs_" + slaves[0]}},
             {"BONDING_OPTS", "SLAVE_LIST", "BOND_MODE"});
    for (const std::string& slave : slaves) {
        EditFile("ovs_" + slave, {}, {"SLAVE"});
        EditFile(slave, {}, {"MASTER", "SLAVE"});
    }
}

void EditFile(const std::string& interface, const std::map<std::string, std::string>& set,
              const std::vector<std::string>& remove)
{
    auto file = vornhost::KeyValueFile::Load(IfcfgPath(interface));
    ASSERT_TRUE(file) << interface;
    for (const auto& [key, value] : set) {
        EXPECT_TRUE(file->Set(key, value));
    }
    for (const std::string& key : remove) {
        (void)file->Remove(key);
    }
    WriteFile(IfcfgPath(interface), file->Text());
}

} // namespace contract
