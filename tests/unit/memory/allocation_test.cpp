// Memory runs out: each entry point is run with its first allocation failing, then its second and
// so on until a run passes, once with that allocation alone failing and once with all that follow.
#include <vornovs/vornovs.h>

#include "support/bondcalls.h"

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <new>
#include <ostream>
#include <utility>

using harness::HarnessAllocations;
using harness::RecordingPlatform;
using testing::AnyOf;
using testing::Contains;
using testing::IsEmpty;
using unit::BondModes;
using unit::kInterfaceList;
using unit::kRegistry;
using unit::Names;
using unit::ReadFile;
using unit::WriteFile;
using VORN::OVS::BondManager;
using VORN::OVS::OVSIfsConf;
using VORN::OVS::OVSManager;
using VORN::OVS::OVSRegConf;
using VORN::OVS::VlanManager;

namespace {

/** Allocations until one fails; 0: none does. */
long g_countdown = 0;
bool g_allThatFollow = false;
bool g_failed = false;

void* Allocate(std::size_t size)
{
    if (g_countdown > 0 && !HarnessAllocations::Active()) {
        if (g_countdown == 1) {
            g_failed = true;
            g_countdown = g_allThatFollow ? 1 : 0;
            return nullptr;
        }
        --g_countdown;
    }
    return std::malloc(size == 0 ? 1 : size);
}

} // namespace

// Not inlined: the compiler would see memory from `new` go to `free` and warn of a mismatch.
[[gnu::noinline]] void* operator new(std::size_t size)
{
    void* const memory = Allocate(size);
    if (memory == nullptr) {
        throw std::bad_alloc();
    }
    return memory;
}

[[gnu::noinline]] void* operator new[](std::size_t size)
{
    return operator new(size);
}

[[gnu::noinline]] void* operator new(std::size_t size, const std::nothrow_t& /*tag*/) noexcept
{
    return Allocate(size);
}

[[gnu::noinline]] void operator delete(void* memory) noexcept
{
    std::free(memory);
}

[[gnu::noinline]] void operator delete(void* memory, std::size_t /*size*/) noexcept
{
    std::free(memory);
}

[[gnu::noinline]] void operator delete[](void* memory) noexcept
{
    std::free(memory);
}

[[gnu::noinline]] void operator delete[](void* memory, std::size_t /*size*/) noexcept
{
    std::free(memory);
}

namespace {

// Longer than a string holds without an allocation.
const std::string kClient = "a client with a long name";
const std::string kOther = "another client's long name";
const std::string kBond = "ovs_bond-with-a-long-name";

struct Entry {
    std::string name;
    /** Answers the call's result; what it needs beforehand it makes in `prepare`. */
    std::function<int()> run;
    int success;
    std::vector<int> failures;
    /** The host is in bridge topology. */
    bool topology = false;
    /** A failure may leave the network stopped: that is what the call documents. */
    bool mayStayStopped = false;

    friend void PrintTo(const Entry& entry, std::ostream* out) { *out << entry.name; }
};

class WithoutMemory : public testing::TestWithParam<std::tuple<Entry, bool>> {
protected:
    static const Entry& Tested() { return std::get<0>(GetParam()); }
};

/** Runs with the nth allocation failing. */
int RunFailing(long nth, bool allThatFollow, const std::function<int()>& run)
{
    g_failed = false;
    g_allThatFollow = allThatFollow;
    g_countdown = nth;
    int result = 0;
    try {
        result = run();
    } catch (...) {
        g_countdown = 0;
        ADD_FAILURE() << "an exception left the library at allocation " << nth;
    }
    g_countdown = 0;
    return result;
}

/** A host with two ports, a bond and a VLAN, on the switch and off it. */
void PrepareHost(RecordingPlatform& platform)
{
    platform.CarryOutFileEdits();
    platform.Interfaces({"eth0", "eth1", "bond0", "eth0.10", "full"});
    platform.Vlan("eth0.10", "eth0", 10);
    platform.Bond("bond0", 1, {"eth2", "eth3"});
    platform.Bond("ovs_bond0", 7, {"eth2", "eth3"});
    platform.Output("VLIBCPopen /usr/bin/ovs-vsctl r list-br",
                    "ovs_eth0\novs_eth1\na-bridge-with-a-long-name\n");
    platform.Output("VLIBCPopen /usr/bin/ovs-vsctl rB get port ovs_eth0 tag", "10\n");
    // A name field filled to its last byte is longer than a string holds without an allocation.
    VORNLINKAGGROPT unterminated = harness::BondRecord("", 7, {"eth2", "eth3"});
    std::memcpy(unterminated.szMaster, "ovs_bond-is-full", sizeof(unterminated.szMaster));
    platform.Bond("full", unterminated);
    _tag_VLIB_VLAN unterminatedVlan{};
    std::memcpy(unterminatedVlan.szIfName, "eth1.0123456789a", sizeof(unterminatedVlan.szIfName));
    std::memcpy(unterminatedVlan.szRealName, "ovs_parent-eth1x", sizeof(unterminatedVlan.szIfName));
    platform.Vlan("full", unterminatedVlan);
    for (const char* name : {"eth0", "eth1", "eth2", "eth3", "ovs_eth0", "ovs_eth1"}) {
        WriteFile(std::string(unit::kIfcfg) + name, "DEVICE=" + std::string(name) + "\n");
    }
    WriteFile(kRegistry, kClient + "\n");
    WriteFile(kInterfaceList, "eth0\neth1\n");
    unit::MakeLive(platform, {"ovs_eth0", "ovs_eth1", "ovs_eth2", "ovs_eth3"});
    unit::RecordBond(platform, {kBond, 7, {"eth0", "eth1"}});
    platform.Bond(kBond, 7, {"eth0", "eth1"});
    platform.Conflict(kBond, "conflicting-interface");
    platform.Answer("VLIBNetOVSIfIsMaster " + kBond, 2);
}

long CountCalls(const RecordingPlatform& platform, const std::string& function)
{
    return std::count_if(
        platform.Calls().begin(), platform.Calls().end(),
        [&](const std::string& call) { return call.substr(0, call.find(' ')) == function; });
}

/** Whether the file holds one of the whole states that it may be in. */
void ExpectWholeState()
{
    EXPECT_THAT(ReadFile(kRegistry).value_or(""),
                AnyOf("", kClient + "\n", kOther + "\n", kClient + "\n" + kOther + "\n"));
    for (const std::string& file : unit::ListFolder(unit::kStateFolder)) {
        EXPECT_THAT(file, AnyOf("ovs_reg.conf", "ovs_interface.conf", "ovs_ignore.conf"));
    }
}

/** Whatever is stopped must be started again: a host must not go dark for want of memory. */
void ExpectStartAfterEachStop(const RecordingPlatform& platform, long nth)
{
    bool stopped = false;
    for (const std::string& call : platform.Calls()) {
        const bool script = call.find(" /etc/rc.network ") != std::string::npos;
        stopped = script ? call.find(" /etc/rc.network stop") != std::string::npos : stopped;
    }
    EXPECT_FALSE(stopped) << "at allocation " << nth;
}

TEST_P(WithoutMemory, AnswersItsFailureAndLeavesNothingOpen)
{
    const auto& [entry, allThatFollow] = GetParam();
    constexpr long kMostAllocations = 5000;
    for (long nth = 1; nth < kMostAllocations; ++nth) {
        unit::RenewFolders();
        RecordingPlatform platform;
        PrepareHost(platform);
        platform.Answer("VLIBCFileCheckKeyValue", entry.topology ? 1 : 0);
        const int result = RunFailing(nth, allThatFollow, entry.run);
        EXPECT_THAT(platform.OpenHandles(), IsEmpty()) << "at allocation " << nth;
        EXPECT_EQ(CountCalls(platform, "VLIBCFileLockTimeByFile"),
                  CountCalls(platform, "VLIBCFileUnlockByFile"))
            << "at allocation " << nth;
        ExpectWholeState();
        if (!entry.mayStayStopped) {
            ExpectStartAfterEachStop(platform, nth);
        }
        if (!g_failed) {
            EXPECT_EQ(result, entry.success);
            EXPECT_GT(nth, 1) << "nothing was allocated";
            return;
        }
        EXPECT_THAT(entry.failures, Contains(result)) << "at allocation " << nth;
    }
    FAIL() << "no run passed";
}

/** Runs something on an object made before memory runs out, or not at all. */
template <typename Object>
std::function<int()> On(int (*run)(Object&))
{
    return [run] {
        Object object;
        return run(object);
    };
}

OVSIfsConf MakeList()
{
    const HarnessAllocations guard;
    return OVSIfsConf(kInterfaceList);
}

int AsInt(bool result)
{
    return result ? 1 : 0;
}

const BondModes kModes{{"bond0", "802.3ad"}, {"a bond with a long name", "a long mode name"}};
const std::string kInterface = "../../class/net/lo";
const std::string kLongName = "an-interface-with-a-long-name";

std::vector<Entry> Queries()
{
    return {
        {"IsRegister", [] { return VORN::OVS::IsRegister(kClient); }, 0, {-1}},
        {"GetAllRegister",
         [] {
             Names names;
             const int count = VORN::OVS::GetAllRegister(names);
             const HarnessAllocations guard;
             EXPECT_EQ(static_cast<std::size_t>(count), names.size());
             return count;
         },
         1,
         {0}},
        {"IsOVSRunning", [] { return AsInt(VORN::OVS::IsOVSRunning()); }, 1, {0}},
        {"IsInterfaceExist", [] { return AsInt(VORN::OVS::IsInterfaceExist(kInterface)); }, 1, {0}},
        {"OVSSetDefault",
         [] {
             VORN::OVS::OVSSetDefault();
             return 0;
         },
         0,
         {0}},
    };
}

std::vector<Entry> Registrations()
{
    return {
        {"RegisterFirst",
         [] {
             {
                 const HarnessAllocations guard;
                 unit::RenewFolders();
             }
             return VORN::OVS::Register(kClient, kModes);
         },
         0,
         {0, -1}},
        {"RegisterSecond", [] { return VORN::OVS::Register(kOther, kModes); }, 0, {0, -1}},
        {"RegisterAgain", [] { return VORN::OVS::Register(kClient, kModes); }, 1, {0, -1}},
        {"UnRegisterLast", [] { return VORN::OVS::UnRegister(kClient, kModes); }, 0, {0, -1}},
        {"UnRegisterUnknown", [] { return VORN::OVS::UnRegister(kOther, kModes); }, 1, {-1}},
    };
}

std::vector<Entry> Stores()
{
    return {
        {"OVSRegConfLoad",
         On<OVSRegConf>([](OVSRegConf& s) { return s.LoadFromConfig(); }),
         0,
         {-1}},
        {"OVSRegConfRegister",
         On<OVSRegConf>([](OVSRegConf& s) { return s.Register(kOther); }),
         0,
         {-1}},
        {"OVSRegConfUnRegister",
         [] {
             OVSRegConf store;
             {
                 const HarnessAllocations guard;
                 (void)store.LoadFromConfig();
                 (void)store.Register(kOther);
             }
             return store.UnRegister(kOther);
         },
         0,
         {-1}},
        {"OVSRegConfGetRegNames",
         [] {
             OVSRegConf store;
             {
                 const HarnessAllocations guard;
                 (void)store.LoadFromConfig();
             }
             Names names;
             return store.GetRegNames(names);
         },
         1,
         {-1}},
    };
}

std::vector<Entry> Lists()
{
    return {
        {"OVSIfsConf",
         [] {
             std::string path;
             {
                 const HarnessAllocations guard;
                 path = kInterfaceList;
             }
             const OVSIfsConf list(std::move(path));
             return 0;
         },
         0,
         {0}},
        {"OVSIfsConfLoad",
         [] {
             OVSIfsConf list = MakeList();
             return list.LoadFromConfig();
         },
         0,
         {-1}},
        {"OVSIfsConfWrite",
         [] {
             OVSIfsConf list = MakeList();
             return list.Write(kLongName);
         },
         0,
         {-1}},
        {"OVSIfsConfRemove",
         [] {
             OVSIfsConf list = MakeList();
             return list.Remove("eth0");
         },
         0,
         {-1}},
        {"OVSIfsConfWriteToConfig",
         [] {
             const OVSIfsConf list = MakeList();
             Names names;
             {
                 const HarnessAllocations guard;
                 names = {"eth0", kLongName};
             }
             return list.WriteToConfig(names);
         },
         0,
         {-1}},
    };
}

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

std::string NameOfRow(const testing::TestParamInfo<std::tuple<Entry, bool>>& row)
{
    return std::get<0>(row.param).name + (std::get<1>(row.param) ? "FromThenOn" : "Once");
}

INSTANTIATE_TEST_SUITE_P(Queries, WithoutMemory,
                         testing::Combine(testing::ValuesIn(Queries()), testing::Bool()),
                         NameOfRow);
INSTANTIATE_TEST_SUITE_P(Registrations, WithoutMemory,
                         testing::Combine(testing::ValuesIn(Registrations()), testing::Bool()),
                         NameOfRow);
INSTANTIATE_TEST_SUITE_P(Stores, WithoutMemory,
                         testing::Combine(testing::ValuesIn(Stores()), testing::Bool()), NameOfRow);
INSTANTIATE_TEST_SUITE_P(Lists, WithoutMemory,
                         testing::Combine(testing::ValuesIn(Lists()), testing::Bool()), NameOfRow);
INSTANTIATE_TEST_SUITE_P(Steps, WithoutMemory,
                         testing::Combine(testing::ValuesIn(Steps()), testing::Bool()), NameOfRow);
INSTANTIATE_TEST_SUITE_P(Managers, WithoutMemory,
                         testing::Combine(testing::ValuesIn(Managers()), testing::Bool()),
                         NameOfRow);
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
