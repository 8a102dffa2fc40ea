#include "surroundings/operations.h"

#include "host/host.h"
#include "sandbox/systemlog.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <sstream>

#include <vornovs/vornovs.h>

namespace reliability {
namespace {

using namespace VORN::OVS; // NOLINT: the library's own names

constexpr char kAddress[] = "IPADDR=192.0.2.7";
constexpr char kPlain[] = "DEVICE=eth0\nONBOOT=yes\nIPADDR=192.0.2.7\nNETMASK=255.255.255.0\n";

std::vector<std::string> LinesOf(const std::string& text)
{
    std::vector<std::string> lines;
    std::istringstream stream(text);
    for (std::string line; std::getline(stream, line);) {
        lines.push_back(line);
    }
    return lines;
}

void AddLines(const Files& files, std::set<std::string>& lines)
{
    for (const auto& [path, text] : files) {
        for (const std::string& line : LinesOf(text)) {
            lines.insert(line);
        }
    }
}

/** Files grow by lines, and configuration files pass through the contents of others. */
void ExpectWholeLines(const std::string& path, const std::string& text,
                      const std::set<std::string>& known)
{
    EXPECT_TRUE(text.empty() || text.ends_with('\n')) << path << " is cut: " << text;
    for (const std::string& line : LinesOf(text)) {
        EXPECT_TRUE(known.contains(line)) << path << " has a line that nobody wrote: " << line;
    }
}

void ExpectWholeFiles(const Operation& operation, const Files& files)
{
    std::set<std::string> known;
    AddLines(operation.start, known);
    AddLines(WholeEnd(operation), known);
    bool hasAddress = false;
    for (const auto& [path, text] : files) {
        ExpectWholeLines(path, text, known);
        hasAddress = hasAddress || text.find(kAddress) != std::string::npos;
    }
    EXPECT_TRUE(hasAddress) << "the host's address is lost";
}

/** Of the lists of names it is agreed that a write error while they are saved is ignored. */
Files WithoutState(Files files)
{
    std::erase_if(files, [](const auto& file) { return file.first.starts_with(kStateFolder); });
    return files;
}

void ExpectNothingBeside(const Files& files)
{
    for (const auto& [path, text] : files) {
        const std::string name = std::filesystem::path(path).filename();
        EXPECT_TRUE(!name.starts_with('.') && name.find(".new") == std::string::npos)
            << path << " is left";
    }
}

/** What each operation leaves when nothing is wrong. */
std::map<std::string, Files>& Ends()
{
    static std::map<std::string, Files> ends;
    return ends;
}

int ConvertBack()
{
    return UnRegister("keeper", {});
}

int CreateBond()
{
    std::vector<std::string> slaves = {"eth0", "eth2"};
    return OVSBondCreate(VORN_LINK_AGGR_OVS_BALANCE_SLB, "ovs_bond5", slaves);
}

int RemoveBond()
{
    VORNLINKAGGROPT bond{};
    return OVSBondRemove("ovs_bond0", &bond);
}

int SetDefault()
{
    OVSSetDefault();
    return 0;
}

} // namespace

Files PlainHost()
{
    return {{IfcfgPath("eth0"), kPlain}, {kGatewayPath, "eth0 inet 192.0.2.1\n"}};
}

Files HostOnSwitch()
{
    const std::string bridge = std::string(kPlain).replace(7, 4, "ovs_eth0");
    return {{kRegistrations, "keeper\n"},
            {kInterfaces, "eth0\neth2\n"},
            {kIgnored, "eth1\n"},
            {kGatewayPath, "ovs_eth0 inet 192.0.2.1\n"},
            {IfcfgPath("eth0"), std::string(kPlain) + "BRIDGE=ovs_eth0\n"},
            {IfcfgPath("ovs_eth0"), bridge + "TYPE=OVS\nPRIMARY=eth0\nOVS_VLAN_ID=5\n"},
            {IfcfgPath("eth1"), "DEVICE=eth1\nONBOOT=yes\n"},
            {IfcfgPath("eth2"), "DEVICE=eth2\nONBOOT=yes\nBRIDGE=ovs_eth2\n"},
            {IfcfgPath("ovs_eth2"), "DEVICE=ovs_eth2\nONBOOT=yes\nTYPE=OVS\nPRIMARY=eth2\n"},
            {IfcfgPath("ovs_bond0"), "DEVICE=ovs_bond0\nSLAVE_LIST=\"eth0 eth2 \"\n"
                                     "BOND_MODE=ovs-active-backup\n"}};
}

const std::vector<Operation>& Operations()
{
    static const std::set<int> registering = {0, 1, -1};
    static const std::set<int> changing = {0, -1};
    static const auto chMode = [] {
        return OVSBodChMode(VORN_LINK_AGGR_OVS_BALANCE_TCP, "ovs_bond0");
    };
    static const std::vector<Operation> operations = {
        {"Register", HostOnSwitch(), [] { return Register("client", {}); }, registering, 0},
        {"UnRegister", HostOnSwitch(), ConvertBack, registering, 0},
        {"Register, the first", PlainHost(), [] { return Register("client", {}); }, registering, 0},
        {"AddInterface", HostOnSwitch(), [] { return AddInterface("eth1"); }, changing, 0},
        {"AttachPort",
         HostOnSwitch(),
         [] { return AttachPort("ovs_eth0", "tap0"); },
         {1, 0, -1},
         1},
        {"OVSVlanCreate", HostOnSwitch(), [] { return OVSVlanCreate("ovs_eth0", "7"); }, changing,
         0},
        {"OVSVlanRemove", HostOnSwitch(), [] { return OVSVlanRemove("ovs_eth0"); }, changing, 0},
        {"OVSBodChMode", HostOnSwitch(), chMode, changing, 0},
        {"OVSBondCreate", HostOnSwitch(), CreateBond, changing, 0},
        {"OVSBondRemove", HostOnSwitch(), RemoveBond, changing, 0},
        {"OVSSetDefault", HostOnSwitch(), SetDefault, {0}, 0},
    };
    return operations;
}

const Operation& OperationCalled(const std::string& name)
{
    return *std::find_if(Operations().begin(), Operations().end(),
                         [&](const Operation& operation) { return operation.name == name; });
}

Files LibraryFiles()
{
    Files files;
    for (const char* const folder :
         {kConfigurationFolder, kStateFolder, "/usr/vorn/etc/vornnetd"}) {
        std::error_code none;
        for (const auto& entry : std::filesystem::directory_iterator(folder, none)) {
            if (entry.is_regular_file(none) && !entry.is_symlink(none)) {
                files[entry.path()] = ReadFile(entry.path());
            }
        }
    }
    return files;
}

Outcome Run(const Operation& operation, const std::function<void()>& spoil)
{
    harness::SystemLog log;
    Findings findings;
    RunClient(
        {{"in bad surroundings", spoil}},
        [&](Findings& shared) { shared.SetResult(operation.run()); }, findings);
    return {findings.Result(), findings.Text(), LibraryFiles(), log.Lines()};
}

const Files& WholeEnd(const Operation& operation)
{
    return Ends().at(operation.name);
}

void LearnEnds()
{
    if (!Ends().empty()) {
        return;
    }
    MakeInterfaces({"eth0", "eth1", "eth2", "ovs_eth0", "ovs_eth2"});
    for (const Operation& operation : Operations()) {
        StartWith(operation.start);
        const Outcome outcome = Run(operation);
        EXPECT_EQ(outcome.findings, "") << operation.name;
        EXPECT_EQ(outcome.result, operation.whole) << operation.name;
        Ends()[operation.name] = outcome.files;
    }
}

bool IsWhole(const Operation& operation, const Outcome& outcome)
{
    return outcome.result == operation.whole && outcome.files == WholeEnd(operation);
}

void ExpectSound(const Operation& operation, const Outcome& outcome)
{
    EXPECT_TRUE(operation.documented.contains(outcome.result)) << outcome.result;
    EXPECT_EQ(outcome.findings, "");
    ExpectWholeFiles(operation, outcome.files);
    ExpectNothingBeside(outcome.files);
    EXPECT_TRUE(LockIsFree());
    const bool done = outcome.result == operation.whole &&
                      WithoutState(outcome.files) == WithoutState(WholeEnd(operation));
    EXPECT_TRUE(done || !outcome.log.empty()) << "not done, and nobody is told";
}

} // namespace reliability
