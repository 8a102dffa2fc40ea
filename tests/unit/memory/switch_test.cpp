// Conversions, bonds, VLANs, interfaces and ports without memory.
#include "memory/withoutmemory.h"

#include <utility>

using harness::HarnessAllocations;
using testing::AnyOf;
using unit::Names;
using unit::WriteFile;
using VORN::OVS::BondManager;
using VORN::OVS::OVSManager;
using VORN::OVS::VlanManager;

using unit::AsInt;
using unit::Entry;
using unit::kBond;
using unit::kLongName;
using unit::NameOfRow;
using unit::On;
using unit::WithoutMemory;

namespace {

/** Runs on a manager that has read the host before memory runs out. */
std::function<int()> OnFilledManager(int (*run)(OVSManager&))
{
    return [run] {
        OVSManager manager;
        {
            const HarnessAllocations guard;
            (void)manager.GetInterface();
        }
        return run(manager);
    };
}

std::vector<Entry> Managers()
{
    return {
        {"GetInterface",
         On<OVSManager>([](OVSManager& m) { return m.GetInterface(); }),
         0,
         {0, -1}},
        {"GetSwitchList",
         On<OVSManager>([](OVSManager& m) {
             Names bridges;
             return m.GetSwitchList(bridges);
         }),
         0,
         {0, -1}},
        {"InitBondOpt",
         On<OVSManager>([](OVSManager& m) { return m.InitBondOpt("bond0"); }),
         0,
         {0}},
        {"InitBondOptWithMode",
         On<OVSManager>([](OVSManager& m) { return m.InitBondOpt(kLongName, kLongName); }),
         0,
         {-1}},
        {"CreateAll",
         On<OVSManager>([](OVSManager& m) { return AsInt(m.CreateAll()); }),
         1,
         {0, 1}},
        {"DeleteAll",
         On<OVSManager>([](OVSManager& m) { return AsInt(m.DeleteAll()); }),
         1,
         {0, 1}},
    };
}

std::vector<Entry> Steps()
{
    return {
        {"CreateOVS",
         On<OVSManager>([](OVSManager& m) { return m.CreateOVS("eth2"); }),
         0,
         {0, -1}},
        {"DestroyOVS",
         On<OVSManager>([](OVSManager& m) { return m.DestroyOVS("ovs_eth0"); }),
         0,
         {0, -1}},
        {"CreateAllInBridgeTopology",
         On<OVSManager>([](OVSManager& m) { return AsInt(m.CreateAll()); }),
         1,
         {0, 1},
         true},
        {"CreateLinuxVlan",
         OnFilledManager([](OVSManager& m) { return m.CreateLinuxVlan(); }),
         0,
         {-1}},
        {"RemoveLinuxVlan",
         OnFilledManager([](OVSManager& m) { return m.RemoveLinuxVlan(); }),
         0,
         {-1}},
        {"CreateOVSVlan",
         OnFilledManager([](OVSManager& m) { return m.CreateOVSVlan(); }),
         0,
         {0, -1}},
        {"CreateLinuxBond",
         [] {
             OVSManager manager;
             {
                 const HarnessAllocations guard;
                 (void)manager.InitBondOpt("full");
             }
             return manager.CreateLinuxBond();
         },
         0,
         {-1}},
        {"RemoveLinuxBond",
         OnFilledManager([](OVSManager& m) { return m.RemoveLinuxBond(); }),
         0,
         {-1}},
        {"RemoveOVSVlan",
         OnFilledManager([](OVSManager& m) { return m.RemoveOVSVlan(); }),
         0,
         {-1}},
    };
}

std::vector<Entry> BondsAndVlans()
{
    return {
        {"BondChMode",
         [] { return AsInt(BondManager::BondChMode(VORN_LINK_AGGR_OVS_BALANCE_SLB, kLongName)); },
         1,
         {0, 1}},
        {"ModeToStr",
         [] {
             std::string text;
             BondManager::ModeToStr(VORN_LINK_AGGR_OVS_ACTIVE_BACKUP, text);
             const HarnessAllocations guard;
             EXPECT_THAT(text, AnyOf("", "ovs-active-backup"));
             return text.empty() ? 0 : 1;
         },
         1,
         {0}},
        {"ModeToBondOPT",
         [] {
             std::string text;
             BondManager::ModeToBondOPT(VORN_LINK_AGGR_OVS_BALANCE_SLB, text);
             const HarnessAllocations guard;
             EXPECT_THAT(text, AnyOf("", "\"bond_mode=balance-slb lacp=off\""));
             return text.empty() ? 0 : 1;
         },
         1,
         {0}},
        {"VlanCreate", [] { return VlanManager::Create(kLongName, kLongName); }, 0, {0, -1}},
        {"VlanRemove", [] { return VlanManager::Remove(kLongName); }, 0, {0, -1}},
        {"VlanSet", [] { return VlanManager::Set(kLongName, kLongName); }, 0, {-1}},
        {"VlanGet",
         [] {
             _tag_VLIB_VLAN vlan{};
             return VlanManager::Get(kLongName, &vlan);
         },
         0,
         {-1}},
    };
}

std::vector<Entry> SwitchBonds()
{
    const auto create = [](bool restart) {
        return [restart] {
            std::vector<std::string> slaves;
            {
                const HarnessAllocations guard;
                slaves = {"eth0", "eth1"};
            }
            return AsInt(
                BondManager::Create(VORN_LINK_AGGR_OVS_BALANCE_TCP, kLongName, slaves, restart));
        };
    };
    const auto remove = [](bool restart) {
        return [restart] {
            VORNLINKAGGROPT record{};
            return AsInt(BondManager::Remove(kBond, &record, restart));
        };
    };
    return {
        {"BondCreate", create(true), 1, {0, 1}},
        {"BondCreateWithoutRestart", create(false), 1, {0, 1}},
        {"BondRemove", remove(true), 1, {0, 1}},
        {"BondRemoveWithoutRestart", remove(false), 1, {0, 1}},
        {"OVSBondRemove",
         [] {
             VORNLINKAGGROPT record{};
             return VORN::OVS::OVSBondRemove(kBond, &record);
         },
         0,
         {0, -1}},
        {"OVSBondGet",
         [] {
             VORNLINKAGGROPT record{};
             return VORN::OVS::OVSBondGet("bond0", &record);
         },
         0,
         {-1}},
        {"CreateOVSBond",
         [] {
             OVSManager manager;
             {
                 const HarnessAllocations guard;
                 (void)manager.InitBondOpt("bond0");
             }
             return manager.CreateOVSBond();
         },
         0,
         {0, -1}},
        {"RemoveOVSBond",
         [] {
             OVSManager manager;
             {
                 const HarnessAllocations guard;
                 (void)manager.InitBondOpt(kBond);
             }
             return manager.RemoveOVSBond();
         },
         0,
         {0, -1}},
        {"StrToMode",
         [] { return static_cast<int>(VORN::OVS::StrToMode("a-mode-with-a-long-name")); },
         0,
         {0}},
    };
}

std::vector<Entry> InterfacesAndPorts()
{
    return {
        {"RemoveInterface",
         [] { return VORN::OVS::RemoveInterface("ovs_eth0"); },
         0,
         {0, -1},
         false,
         true},
        {"RemoveInterfaceOfABond",
         [] { return VORN::OVS::RemoveInterface(kBond); },
         0,
         {0, -1},
         false,
         true},
        {"AddInterface",
         [] {
             {
                 const HarnessAllocations guard;
                 WriteFile(unit::kIgnoreList, "eth2\n");
             }
             return VORN::OVS::AddInterface("eth2");
         },
         0,
         {0, -1},
         false,
         true},
        {"ListInterface",
         [] {
             Names names;
             return VORN::OVS::ListInterface(names);
         },
         0,
         {0, -1}},
        {"AttachPort", [] { return VORN::OVS::AttachPort("ovs_eth0", "tap0"); }, 1, {-1}},
        {"DetachPort", [] { return VORN::OVS::DetachPort("ovs_eth0", "tap0"); }, 1, {-1}},
    };
}

INSTANTIATE_TEST_SUITE_P(Managers, WithoutMemory,
                         testing::Combine(testing::ValuesIn(Managers()), testing::Bool()),
                         NameOfRow);
INSTANTIATE_TEST_SUITE_P(Steps, WithoutMemory,
                         testing::Combine(testing::ValuesIn(Steps()), testing::Bool()), NameOfRow);
INSTANTIATE_TEST_SUITE_P(BondsAndVlans, WithoutMemory,
                         testing::Combine(testing::ValuesIn(BondsAndVlans()), testing::Bool()),
                         NameOfRow);
INSTANTIATE_TEST_SUITE_P(SwitchBonds, WithoutMemory,
                         testing::Combine(testing::ValuesIn(SwitchBonds()), testing::Bool()),
                         NameOfRow);
INSTANTIATE_TEST_SUITE_P(InterfacesAndPorts, WithoutMemory,
                         testing::Combine(testing::ValuesIn(InterfacesAndPorts()), testing::Bool()),
                         NameOfRow);

} // namespace
