// The steps of the conversions, of bonds and of tags.
#include "faults/scenario.h"

#include <vornovs/vornovs.h>

namespace reliability {

namespace {

using enum Situation;
using VORN::OVS::BondManager;
using VORN::OVS::OVSManager;
using VORN::OVS::VlanManager;

/** Runs a step on a manager that has not read anything. */
template <typename Step>
std::function<int()> On(Step step)
{
    return [step] {
        OVSManager manager;
        return step(manager);
    };
}

/** Runs a step on a manager that has read the interfaces, or the switch's bridges. */
template <typename Step>
std::function<int()> AfterReading(bool plain, Step step)
{
    return [plain, step] {
        OVSManager manager;
        unit::Names bridges;
        (void)(plain ? manager.GetInterface() : manager.GetSwitchList(bridges));
        return step(manager);
    };
}

std::vector<Scenario> Reading()
{
    return {
        {"GetInterface",
         kPlain,
         On([](OVSManager& m) { return m.GetInterface(); }),
         0,
         {-1},
         {{"VLIBNetGetInterfaceInfo", -1}}},
        {"GetSwitchList",
         kOnSwitch,
         On([](OVSManager& m) {
             unit::Names bridges;
             return m.GetSwitchList(bridges);
         }),
         0,
         {-1},
         {{"VLIBCPopen /usr/bin/ovs-vsctl r list-br", -1}}},
        {"InitBondOpt", kPlain, On([](OVSManager& m) { return m.InitBondOpt("bond0"); }), 0},
        {"InitBondOptWithMode",
         kPlain,
         On([](OVSManager& m) { return m.InitBondOpt("bond0", "802.3ad"); }),
         0,
         {-1}},
    };
}

std::vector<Scenario> ToTheSwitch()
{
    const auto create = On([](OVSManager& m) { return AsInt(m.CreateAll()); });
    const std::vector<Fatal> files{
        {"VLIBCExec /bin/cp", -1}, {"VLIBCSzHashAlloc", -1}, {"VLIBCFileSetKeys", -1}};
    return {
        {"CreateAll",
         kPlain,
         create,
         1,
         {0},
         {{"VLIBNetGetInterfaceInfo", 0},
          {"VORNNetLinkAggrSet", 0}, // the record keeps the mode that it was to go with
          {"VLIBCFileLock", 0},
          // A slave that has no bridge for want of these is refused by its bond.
          {"VLIBCSzHashAlloc", kDepends},
          {"VLIBCExec /bin/cp", kDepends},
          {"VLIBCFileSetKeys", kDepends},
          {"VLIBCExecl /etc/rc.network start", kDepends}}},
        {"CreateOVS",
         kPlain,
         On([](OVSManager& m) { return m.CreateOVS("eth0"); }),
         0,
         {-1},
         files},
        {"CreateOVSForGeneral",
         kPlain,
         On([](OVSManager& m) {
             return m.CreateOVSForGeneral("eth0", "ovs_eth0",
                                          "/etc/sysconfig/network-scripts/ifcfg-eth0",
                                          "/etc/sysconfig/network-scripts/ifcfg-ovs_eth0");
         }),
         0,
         {-1},
         files},
        {"CreateOVSBond",
         kOnSwitch,
         On([](OVSManager& m) {
             VORNLINKAGGROPT removed{};
             (void)BondManager::Remove(kBond, &removed, true);
             (void)m.InitBondOpt("bond0", "ovs-balance-slb");
             return m.CreateOVSBond();
         }),
         -1,
         {0}},
        {"CreateOVSVlan",
         kPlain,
         AfterReading(true, [](OVSManager& m) { return m.CreateOVSVlan(); }),
         0,
         {-1},
         {{"VLIBCFileLock", -1}}},
        {"RemoveLinuxBond",
         kPlain,
         AfterReading(true, [](OVSManager& m) { return m.RemoveLinuxBond(); }),
         0,
         {-1},
         {{"VORNNetLinkAggrSet", -1}}},
        {"RemoveLinuxVlan",
         kPlain,
         AfterReading(true, [](OVSManager& m) { return m.RemoveLinuxVlan(); }),
         0,
         {-1},
         {{"VLIBNetVlanRemove", -1}}},
    };
}

std::vector<Scenario> Back()
{
    return {
        {"DeleteAll",
         kOnSwitch,
         On([](OVSManager& m) { return AsInt(m.DeleteAll()); }),
         1,
         {0},
         {{"VLIBCPopen /usr/bin/ovs-vsctl r list-br", 0},
          {"VLIBCFileLock", 0},
          {"VLIBCSzListAlloc", 0},
          {"VLIBCFileGetKeyValue", 0},
          {"VORNNetLinkAggrOptSlsaveAdd", 0},
          {"VORNNetIFGetIPConfig", 0},
          {"VLIBNetVlanCreate", 0}}},
        {"DestroyOVS",
         kOnSwitch,
         On([](OVSManager& m) { return m.DestroyOVS("ovs_eth0"); }),
         0,
         {-1},
         {{"VLIBCExec /bin/cp", -1},
          {"unlink /etc/sysconfig", -1},
          {"VLIBCSzHashAlloc", -1},
          {"VLIBCFileSetKeys", -1}}},
        {"RemoveOVSBond",
         kOnSwitch,
         AfterReading(false, [](OVSManager& m) { return m.RemoveOVSBond(); }),
         0,
         {-1},
         {{"VLIBCSzListAlloc", -1},
          {"VLIBCFileGetKeyValue", -1},
          {"VORNNetLinkAggrOptSlsaveAdd", -1}}},
        {"RemoveOVSVlan",
         kOnSwitch,
         AfterReading(false, [](OVSManager& m) { return m.RemoveOVSVlan(); }),
         0,
         {-1},
         {{"VLIBCFileLock", -1}}},
        {"CreateLinuxBond",
         kOnSwitch,
         AfterReading(false, [](OVSManager& m) { return m.CreateLinuxBond(); }),
         0,
         {-1},
         {{"VORNNetLinkAggrSet", -1}}},
        {"CreateLinuxVlan",
         kOnSwitch,
         AfterReading(false, [](OVSManager& m) { return m.CreateLinuxVlan(); }),
         0,
         {-1},
         {{"VORNNetIFGetIPConfig", -1}, {"VLIBNetVlanCreate", -1}}},
    };
}

std::vector<Scenario> Bonds()
{
    const auto create = [] {
        std::vector<std::string> slaves;
        {
            const harness::HarnessAllocations guard;
            slaves = {"eth0", "eth1"};
        }
        return AsInt(
            BondManager::Create(VORN_LINK_AGGR_OVS_BALANCE_TCP, "ovs_bond1", slaves, false));
    };
    const auto remove = [] {
        VORNLINKAGGROPT bond{};
        return AsInt(BondManager::Remove(kBond, &bond, false));
    };
    return {
        {"BondCreateWithoutRestart", kOnSwitch, create, 1, {0}},
        {"BondRemoveWithoutRestart",
         kOnSwitch,
         remove,
         1,
         {0},
         {{"VLIBCSzListAlloc", 0},
          {"VLIBCFileGetKeyValue", 0},
          {"VORNNetLinkAggrOptSlsaveAdd", 0}}},
        {"BondGet",
         kOnSwitch,
         [] {
             VORNLINKAGGROPT bond{};
             return AsInt(BondManager::Get(kBond, &bond));
         },
         1,
         {0},
         {{"VORNNetLinkAggrGet", 0}}},
        {"BondChMode",
         kOnSwitch,
         [] { return AsInt(BondManager::BondChMode(VORN_LINK_AGGR_OVS_BALANCE_TCP, kBond)); },
         1,
         {0},
         {{"VLIBCSzHashAlloc", 0}, {"VLIBCFileSetKeys", 0}}},
    };
}

std::vector<Scenario> Tags()
{
    std::vector<Scenario> scenarios{
        {"VlanCreate", kOnSwitch, [] { return VlanManager::Create("ovs_eth0", "20"); }, 0},
        {"VlanRemove", kOnSwitch, [] { return VlanManager::Remove("ovs_eth1"); }, 0},
        {"VlanSet", kOnSwitch, [] { return VlanManager::Set("ovs_eth0", "20"); }, 0},
        {"VlanClear", kOnSwitch, [] { return VlanManager::Clear("ovs_eth1"); }, 0},
    };
    for (Scenario& scenario : scenarios) {
        scenario.failures = {-1};
        scenario.silent = true;
    }
    scenarios[0].fatal = scenarios[1].fatal = {{"VLIBCFileLock", -1}};
    scenarios[2].fatal = {{"VLIBCExecl", -1}};
    scenarios[3].fatal = {{"VLIBCExec", -1}};
    return scenarios;
}

} // namespace

std::vector<Scenario> Steps()
{
    std::vector<Scenario> all;
    for (auto& part : {Reading(), ToTheSwitch(), Back(), Bonds(), Tags()}) {
        all.insert(all.end(), part.begin(), part.end());
    }
    return all;
}

} // namespace reliability
