// The calls that hold the lock and ask for a registered client: ports and bonds.
#include <vornovs/vornovs.h>

#include "support/bondcalls.h"

#include <algorithm>
#include <functional>
#include <ostream>

using harness::Err;
using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::Calls;
using unit::FileOf;
using unit::kRegistry;
using unit::LongName;
using unit::MakeUnopenable;
using unit::Sequence;
using unit::SwitchBond;
using unit::WriteFile;

namespace {

constexpr char kFile[] = "libvornovs.cpp";
constexpr char kLock[] = "VLIBCFileLockTimeByFile /tmp/ovs_config.lock 1 5";
constexpr char kUnlock[] = "VLIBCFileUnlockByFile";
const Calls kAsked{"VLIBCFileCheckDir /usr/vorn/etc/vornovs",
                   "VLIBCFileExist /usr/vorn/etc/vornovs/ovs_reg.conf"};
const harness::LogLine kNoLock = Err(kFile, "Failed to lock/tmp/ovs_config.lock");
const harness::LogLine kNotLocked = Err(kFile, "Failed to lock the file");

const SwitchBond kBond{"ovs_bond0", 7, {"eth0", "eth1"}};

struct Row {
    std::string name;
    std::function<int()> run;
    int success;
    /** The answer, and the log line, when no client is registered. */
    int idle;
    std::vector<harness::LogLine> idleLog;
    /** And when the registrations cannot be read. */
    harness::LogLine unreadLog;
    /** What is done under the lock, after the registrations were read. */
    Calls work;
    /** The call whose failure is the operation's, its answer then, and the last line logged. */
    std::string failing;
    std::string failure;

    friend void PrintTo(const Row& row, std::ostream* out) { *out << row.name; }
};

VORNLINKAGGROPT& Record()
{
    static VORNLINKAGGROPT record;
    record = {};
    return record;
}

const harness::LogLine kNotRunning = Err(kFile, "OVS not running");
const harness::LogLine kNotLoaded = Err(kFile, "Failed to load the ovs config");
const Calls kServices{"VLIBServiceIsRunning vornovs-db", "VLIBServiceIsRunning vornovs-vswitch"};

Row Port(const std::string& name, int (*run)(const std::string&, const std::string&),
         const std::string& verb)
{
    const std::string command = "VLIBCExec /usr/bin/ovs-vsctl " + verb + "-port ovs_eth0 tap0";
    return {name,
            [run] { return run("ovs_eth0", "tap0"); },
            1,
            0,
            {},
            kNotLoaded,
            Sequence({kServices, {command}}),
            command,
            "Failed to " + std::string(verb == "add" ? "attach" : "detach") +
                " the port tap0 to interface ovs_eth0"};
}

Row Bond(const std::string& name, const std::function<int()>& run, const Calls& work,
         const std::string& failing, const std::string& failure)
{
    return {name, run, 0, -1, {kNotRunning}, kNotRunning, work, failing, failure};
}

std::vector<Row> Rows()
{
    const std::string bondFile = FileOf("ovs_bond0");
    return {
        Port("AttachPort", &VORN::OVS::AttachPort, "add"),
        Port("DetachPort", &VORN::OVS::DetachPort, "del"),
        Bond(
            "OVSBondCreate",
            [] {
                std::vector<std::string> slaves = kBond.slaves;
                return VORN::OVS::OVSBondCreate(VORN_LINK_AGGR_OVS_BALANCE_SLB, "ovs_bond0",
                                                slaves);
            },
            unit::BondBuilt(kBond), "VLIBCFileExist /sys/class/net/ovs_eth1/flags",
            "Fail to creat the bonding for ovs_bond0"),
        Bond(
            "OVSBondRemove", [] { return VORN::OVS::OVSBondRemove("ovs_bond0", &Record()); },
            unit::BondDissolved(kBond), "VLIBCFileGetKeyValue " + bondFile + " BOND_MODE",
            "Fail to remove the bonding for ovs_bond0"),
        Bond(
            "OVSBondGet", [] { return VORN::OVS::OVSBondGet("ovs_bond0", &Record()); },
            {"VORNNetLinkAggrGet ovs_bond0"}, "VORNNetLinkAggrGet ovs_bond0",
            "Fail to creat the bonding for ovs_bond0"),
        Bond(
            "OVSBodChMode",
            [] { return VORN::OVS::OVSBodChMode(VORN_LINK_AGGR_OVS_ACTIVE_BACKUP, "ovs_bond0"); },
            {"VORNNetLinkAggrModeToString 6",
             "VLIBCFileSetKeys " + bondFile +
                 " BOND_MODE=ovs-active-backup 'BONDING_OPTS=\"bond_mode=active-backup "
                 "lacp=off\"'",
             "VLIBCExecl /etc/rc.network set-ovs-bond ovs_bond0"},
            "VLIBCFileSetKeys " + bondFile, "Fail to creat the bonding for ovs_bond0"),
    };
}

class Guarded : public testing::TestWithParam<Row> {
protected:
    Guarded()
    {
        WriteFile(kRegistry, "a\n");
        unit::MakeLive(platform, {"ovs_eth0", "ovs_eth1"});
        unit::RecordBond(platform, kBond);
        platform.Bond("ovs_bond0", 7, {"eth0", "eth1"});
    }
    RecordingPlatform platform;
};

INSTANTIATE_TEST_SUITE_P(Calls, Guarded, testing::ValuesIn(Rows()),
                         [](const auto& test) { return test.param.name; });

TEST_P(Guarded, WorksUnderTheLockWhileAClientIsRegistered)
{
    EXPECT_EQ(GetParam().run(), GetParam().success);
    EXPECT_EQ(platform.Calls(), Sequence({{kLock}, kAsked, GetParam().work, {kUnlock}}));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST_P(Guarded, DoesNothingWithoutAClient)
{
    unit::RenewFolders();
    EXPECT_EQ(GetParam().run(), GetParam().idle);
    EXPECT_EQ(platform.Calls(), Sequence({{kLock}, kAsked, {kUnlock}}));
    EXPECT_EQ(platform.Log(), GetParam().idleLog);
}

TEST_P(Guarded, DoesNothingWhenTheRegistrationsCannotBeRead)
{
    unit::RenewFolders();
    MakeUnopenable(kRegistry);
    EXPECT_EQ(GetParam().run(), -1);
    EXPECT_EQ(platform.Calls(), Sequence({{kLock}, kAsked, {kUnlock}}));
    EXPECT_EQ(platform.Log().back(), GetParam().unreadLog);
}

TEST_P(Guarded, DoesNothingWhenTheLockIsHeldElsewhere)
{
    platform.Answer("VLIBCFileLockTimeByFile", -1);
    EXPECT_EQ(GetParam().run(), -1);
    EXPECT_THAT(platform.Calls(), ElementsAre(kLock));
    EXPECT_THAT(platform.Log(), ElementsAre(kNoLock, kNotLocked));
}

TEST_P(Guarded, GivesAHandleBackThatAFailedLockLeft)
{
    platform.Answer("VLIBCFileLockTimeByFile", -1);
    platform.LockHandle(0);
    EXPECT_EQ(GetParam().run(), -1);
    EXPECT_THAT(platform.Calls(), ElementsAre(kLock, kUnlock));
}

TEST_P(Guarded, KeepsItsResultWhenTheUnlockFails)
{
    platform.Answer("VLIBCFileUnlockByFile", -1);
    EXPECT_EQ(GetParam().run(), GetParam().success);
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to unlock/tmp/ovs_config.lock"),
                                            Err(kFile, "Failed to unlock the file")));
}

TEST_P(Guarded, LogsAFailureOfItsWorkAndGivesTheLockBack)
{
    platform.Answer(GetParam().failing, GetParam().name == "OVSBondCreate" ? 0 : -1);
    EXPECT_EQ(GetParam().run(), -1);
    EXPECT_EQ(platform.Calls().back(), kUnlock);
    EXPECT_EQ(platform.Log().back(), Err(kFile, GetParam().failure));
}

TEST_F(Guarded, FillsTheCallersRecord)
{
    VORNLINKAGGROPT record{};
    EXPECT_EQ(VORN::OVS::OVSBondGet("ovs_bond0", &record), 0);
    EXPECT_EQ(record.nSlave, 2);
    record = {};
    EXPECT_EQ(VORN::OVS::OVSBondRemove("ovs_bond0", &record), 0);
    EXPECT_STREQ(record.rgszSlave[1], "eth1");
    EXPECT_EQ(record.mode, VORN_LINK_AGGR_OVS_BALANCE_SLB);
}

TEST_F(Guarded, CountsTheEmptyNameAsAClient)
{
    WriteFile(kRegistry, "\n");
    EXPECT_EQ(VORN::OVS::AttachPort("ovs_eth0", "tap0"), 1);
}

TEST_F(Guarded, TakesAPortAsAttachedWhenTheSwitchCannotBeStarted)
{
    platform.Answer("VLIBServiceIsRunning", 0);
    platform.Answer("VLIBServiceStart", -1);
    EXPECT_EQ(VORN::OVS::AttachPort("ovs_eth0", "tap0"), 1);
    EXPECT_EQ(VORN::OVS::DetachPort("ovs_eth0", "tap0"), 1);
    EXPECT_EQ(std::count_if(platform.Calls().begin(), platform.Calls().end(),
                            [](const std::string& call) { return call.starts_with("VLIBCExec"); }),
              0);
}

TEST_F(Guarded, LogsTheSwitchsRefusalOfAPortTwice)
{
    platform.Answer("VLIBCExec /usr/bin/ovs-vsctl", 1);
    EXPECT_EQ(VORN::OVS::AttachPort("ovs_eth0", "tap0"), -1);
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err("ovsmanager.cpp", "Fail to attach the tap0 into ovs_eth0"),
                            Err(kFile, "Failed to attach the port tap0 to interface ovs_eth0")));
}

TEST_F(Guarded, StandsNamesOf5000Characters)
{
    EXPECT_EQ(VORN::OVS::AttachPort(LongName(), LongName()), 1);
    EXPECT_EQ(VORN::OVS::OVSBondGet(LongName(), &Record()), -1);
    EXPECT_EQ(VORN::OVS::OVSBondRemove(LongName(), &Record()), -1);
    EXPECT_EQ(platform.Log().back(), Err(kFile, "Fail to remove the bonding for " + LongName()));
    EXPECT_EQ(VORN::OVS::OVSBodChMode(VORN_LINK_AGGR_OVS_BALANCE_TCP, LongName()), 0);
}

} // namespace
