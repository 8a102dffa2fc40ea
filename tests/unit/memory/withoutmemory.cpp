// Memory runs out: each entry point is run with its first allocation failing, then its second and
// so on until a run passes, once with that allocation alone failing and once with all that follow.
#include "memory/withoutmemory.h"

#include "support/allocations.h"

#include <algorithm>
#include <cstring>
#include <utility>

using harness::RecordingPlatform;
using testing::AnyOf;
using testing::Contains;
using testing::IsEmpty;

namespace unit {

namespace {

/** Runs with the nth allocation failing. */
int RunFailing(long nth, bool allThatFollow, const std::function<int()>& run)
{
    int result = 0;
    try {
        const unit::FailingAllocation failing(nth, allThatFollow);
        result = run();
    } catch (...) {
        ADD_FAILURE() << "an exception left the library at allocation " << nth;
    }
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

} // namespace

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
        if (!FailingAllocation::HasFailed()) {
            EXPECT_EQ(result, entry.success);
            EXPECT_GT(nth, 1) << "nothing was allocated";
            return;
        }
        EXPECT_THAT(entry.failures, Contains(result)) << "at allocation " << nth;
    }
    FAIL() << "no run passed";
}

} // namespace unit
