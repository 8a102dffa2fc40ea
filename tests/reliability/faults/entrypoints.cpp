// Registrations, interfaces, ports, bonds and tags.
#include "faults/scenario.h"

#include <vornovs/vornovs.h>

#include <cerrno>

namespace reliability {

namespace {

using enum Situation;

const unit::BondModes kNoModes;
const unit::BondModes kModes{{"bond0", "ovs-balance-slb"}};
const unit::BondModes kModesBack{{"ovs_bond0", "802.3ad"}};
const unit::BondModes kUnknownBond{{"bond7", "ovs-balance-slb"}};

// What the name of what is done with an interface fails with, beside its own steps.
const std::vector<Fatal> kRegistryOfGuarded{{kFailsToLock, -1}, {kFailsToRead, -1}};

int Register(const std::string& name)
{
    return VORN::OVS::Register(name, kNoModes);
}

int UnRegister(const std::string& name)
{
    return VORN::OVS::UnRegister(name, kNoModes);
}

std::vector<Scenario> Queries()
{
    return {
        {"IsRegister",
         kOnSwitch,
         [] { return VORN::OVS::IsRegister(kClient); },
         0,
         {-1},
         {{kFailsToRead, -1}}},
        {"GetAllRegister",
         kOnSwitch,
         [] {
             unit::Names names;
             return VORN::OVS::GetAllRegister(names);
         },
         1,
         {0},
         {{kFailsToRead, 0}}},
        {"IsOVSRunning",
         kOnSwitch,
         [] { return AsInt(VORN::OVS::IsOVSRunning()); },
         1,
         {0},
         {{kFailsToRead, 0}}},
        {"OVSSetDefault", kOnSwitch,
         [] {
             VORN::OVS::OVSSetDefault();
             return 0;
         },
         0},
    };
}

std::vector<Scenario> Registrations()
{
    const std::vector<Fatal> fatal{{kFailsToRead, 0}, {kFailsToWrite, -1}};
    const auto first = [] { return Register(kClient); };
    const auto last = [] { return UnRegister(kClient); };
    const std::vector<std::pair<std::string, int>> topology{{"VLIBCFileCheckKeyValue", 1}};
    std::vector<Fatal> leaving = kRegistryOfGuarded;
    leaving.push_back({kFailsToWrite, -1});
    return {
        {"RegisterFirst", kPlain, first, 0, {-1}, fatal},
        {"RegisterFirstWithModes",
         kPlain,
         [] { return VORN::OVS::Register(kClient, kModes); },
         0,
         {-1},
         fatal},
        {"RegisterFirstInVain",
         kPlain,
         [] { return VORN::OVS::Register(kClient, kUnknownBond); },
         0,
         {-1},
         {{"open-empty", 0}, {kFailsToWrite, -1}}},
        {"RegisterFirstInBridgeTopology", kPlain, first, 0, {-1}, fatal, topology},
        {"RegisterSecond", kOnSwitch, [] { return Register(kOther); }, 0, {-1}, fatal},
        {"RegisterAgain", kOnSwitch, first, 1, {0, -1}, {{kFailsToLock, 0}, {kFailsToRead, 0}}},
        {"UnRegisterLast", kOnSwitch, last, 0, {-1, 1}, leaving},
        {"UnRegisterLastWithModes",
         kOnSwitch,
         [] { return VORN::OVS::UnRegister(kClient, kModesBack); },
         0,
         {-1, 1},
         leaving},
        {"UnRegisterLastInBridgeTopology", kOnSwitch, last, 0, {-1, 1}, leaving, topology},
        {"UnRegisterLastWithServicesDown",
         kOnSwitch,
         last,
         0,
         {-1, 1},
         leaving,
         {{"VLIBServiceIsRunning", 0}}},
        {"UnRegisterOneOfTwo", kShared, [] { return UnRegister(kOther); }, 0, {-1, 1}, leaving},
        {"UnRegisterUnknown",
         kOnSwitch,
         [] { return UnRegister(kOther); },
         1,
         {-1},
         {{kFailsToLock, -1}, {kFailsToRead, -1}}},
    };
}

/** What one interface's way off the switch fails with. */
std::vector<Fatal> FatalTakingOff()
{
    return {{"VLIBNetOVSIfIsMaster", -1}, {"VLIBCExec /bin/cp", -1}, {"unlink /etc/sysconfig", -1},
            {"VLIBCSzHashAlloc", -1},     {"VLIBCFileSetKeys", -1},  {unit::kIgnoreList, -1}};
}

std::vector<Scenario> Interfaces()
{
    const std::vector<Row> notOfSwitch{
        {"VLIBNetOVSIfIsMaster", "", {{-1, Then::kLine, "The $1 doesn't belong to OVS"}}}};
    const std::vector<Row> wrongWord{{"VLIBCExecl /etc/rc.network start",
                                      "",
                                      {{1, Then::kLine, "Failed to stop the rc.network"}}}};
    std::vector<Scenario> scenarios{
        {"RemoveInterface", kOnSwitch, [] { return VORN::OVS::RemoveInterface("ovs_eth0"); }, 0},
        {"RemoveInterfaceOfABond", kOnSwitch, [] { return VORN::OVS::RemoveInterface(kBond); }, 0},
        {"RemoveInterfaceOfNeither", kOnSwitch,
         [] { return VORN::OVS::RemoveInterface("ovs_eth0"); }, 0},
        {"AddInterface", kTakenOff, [] { return VORN::OVS::AddInterface("eth0"); }, 0},
    };
    for (Scenario& scenario : scenarios) {
        scenario.failures = {-1};
        scenario.mayStayStopped = true;
        scenario.own = notOfSwitch;
        scenario.fatal = FatalTakingOff();
    }
    const std::string file = unit::kIfcfg;
    scenarios[1].fatal = {{"VLIBNetOVSIfIsMaster", -1},
                          {"VLIBCSzListAlloc", -1},
                          {"VLIBCFileGetKeyValue", -1},
                          {"VORNNetLinkAggrOptSlsaveAdd", -1},
                          {"VLIBCExec /bin/cp -f " + file + "ovs_eth", -1},
                          {"unlink " + file + "ovs_eth", -1},
                          {"VLIBCFileSetKeys " + file + "eth", -1},
                          {unit::kIgnoreList, -1}};
    // Of the bond's own file it is only logged.
    scenarios[1].own.push_back(
        {"VLIBCSzHashAlloc", "", {{0, Then::kTold, "Failed to alloc the hash "}}});
    scenarios[1].own.push_back({"open-read", "", {{EIO, Then::kTold, " Open "}}});
    scenarios[2].answers = {{"VLIBNetOVSIfIsMaster", 0}};
    scenarios[3].own = wrongWord;
    return scenarios;
}

std::vector<Scenario> Ports()
{
    std::vector<Fatal> fatal = kRegistryOfGuarded;
    fatal.push_back({"VLIBCExec", -1});
    const std::vector<std::pair<std::string, int>> down{{"VLIBServiceIsRunning", 0}};
    const auto attach = [] { return VORN::OVS::AttachPort("ovs_eth0", "tap1"); };
    const auto detach = [] { return VORN::OVS::DetachPort("ovs_eth0", kPort); };
    return {
        {"AttachPort", kOnSwitch, attach, 1, {0, -1}, fatal},
        {"DetachPort", kOnSwitch, detach, 1, {0, -1}, fatal},
        {"AttachPortWithServicesDown", kOnSwitch, attach, 1, {0, -1}, fatal, down},
        {"DetachPortWithServicesDown", kOnSwitch, detach, 1, {0, -1}, fatal, down},
        {"ListInterface",
         kOnSwitch,
         [] {
             unit::Names names;
             return VORN::OVS::ListInterface(names);
         },
         0,
         {-1},
         {{kFailsToRead, -1}, {"VLIBCPopen /usr/bin/ovs-vsctl r list-br", -1}}},
    };
}

std::vector<Scenario> Bonds()
{
    const auto create = [] {
        std::vector<std::string> slaves;
        {
            const harness::HarnessAllocations guard;
            slaves = {"eth0", "eth4"};
        }
        return VORN::OVS::OVSBondCreate(VORN_LINK_AGGR_OVS_BALANCE_SLB, "ovs_bond1", slaves);
    };
    const auto remove = [] {
        VORNLINKAGGROPT bond{};
        return VORN::OVS::OVSBondRemove(kBond, &bond);
    };
    const auto get = [] {
        VORNLINKAGGROPT bond{};
        return VORN::OVS::OVSBondGet(kBond, &bond);
    };
    std::vector<Scenario> scenarios{
        {"OVSBondCreate", kOnSwitch, create, 0},
        {"OVSBondRemove", kOnSwitch, remove, 0},
        {"OVSBondGet", kOnSwitch, get, 0},
        {"OVSBodChMode", kOnSwitch,
         [] { return VORN::OVS::OVSBodChMode(VORN_LINK_AGGR_OVS_BALANCE_SLB, kBond); }, 0},
    };
    for (Scenario& scenario : scenarios) {
        scenario.failures = {-1};
        scenario.fatal = kRegistryOfGuarded;
    }
    for (const char* step :
         {"VLIBCSzListAlloc", "VLIBCFileGetKeyValue", "VORNNetLinkAggrOptSlsaveAdd"}) {
        scenarios[1].fatal.push_back({step, -1});
    }
    scenarios[2].fatal.push_back({"VORNNetLinkAggrGet", -1});
    scenarios[3].fatal.push_back({"VLIBCSzHashAlloc", -1});
    scenarios[3].fatal.push_back({"VLIBCFileSetKeys", -1});
    return scenarios;
}

std::vector<Scenario> Modes()
{
    return {
        {"StrToMode",
         kPlain,
         [] { return static_cast<int>(VORN::OVS::StrToMode("802.3ad")); },
         VORN_LINK_AGGR_8023AD,
         {0}},
        {"GetUniqueBondName", kOnSwitch,
         [] {
             std::string name;
             return VORN::OVS::GetUniqueBondName(name);
         },
         0},
    };
}

std::vector<Scenario> Tags()
{
    const auto get = [](const char* port) {
        _tag_VLIB_VLAN vlan{};
        return VORN::OVS::OVSVlanGet(port, &vlan);
    };
    const std::vector<Fatal> lock{{"VLIBCFileLock", -1}};
    return {
        {"OVSVlanGet",
         kOnSwitch,
         [get] { return get("ovs_eth1"); },
         1,
         {-1},
         {{"VLIBCPopen", -1}, {"VLIBCPclose", -1}}},
        {"OVSVlanGetWithoutTag",
         kOnSwitch,
         [get] { return get("ovs_eth0"); },
         0,
         {-1, 1},
         {{"VLIBCPopen", -1}, {"VLIBCPclose", -1}}},
        {"OVSVlanSet",
         kOnSwitch,
         [] { return VORN::OVS::OVSVlanSet("ovs_eth0", "20"); },
         0,
         {-1},
         {{"VLIBCExecl", -1}}},
        {"OVSVlanClear",
         kOnSwitch,
         [] { return VORN::OVS::OVSVlanClear("ovs_eth1"); },
         0,
         {-1},
         {{"VLIBCExec", -1}}},
        {"OVSVlanCreate",
         kOnSwitch,
         [] { return VORN::OVS::OVSVlanCreate("ovs_eth0", "20"); },
         0,
         {-1},
         lock},
        {"OVSVlanRemove",
         kOnSwitch,
         [] { return VORN::OVS::OVSVlanRemove("ovs_eth1"); },
         0,
         {-1},
         lock},
    };
}

} // namespace

std::vector<Scenario> EntryPoints()
{
    std::vector<Scenario> all;
    for (auto& part :
         {Queries(), Registrations(), Interfaces(), Ports(), Bonds(), Modes(), Tags()}) {
        all.insert(all.end(), part.begin(), part.end());
    }
    return all;
}

} // namespace reliability
