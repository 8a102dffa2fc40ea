#include <vornovs/vornovs.h>

#include "support/bondcalls.h"

#include <cstring>
#include <ostream>

using harness::Err;
using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::Calls;
using unit::kIfcfg;
using unit::LongName;
using unit::MakeLive;
using unit::ReadFile;
using unit::WriteFile;
using VORN::OVS::BondManager;

namespace {

constexpr char kFile[] = "bondmanager.cpp";

VORN_LINK_AGGR_MODE Mode(int value)
{
    return static_cast<VORN_LINK_AGGR_MODE>(value);
}

struct ModeRow {
    int mode;
    bool supported;
    int converted;
    std::string options;

    friend void PrintTo(const ModeRow& row, std::ostream* out) { *out << "mode " << row.mode; }
};

class Modes : public testing::TestWithParam<ModeRow> {};

INSTANTIATE_TEST_SUITE_P(
    All, Modes,
    testing::Values(ModeRow{1, false, 7, ""}, ModeRow{2, false, 8, ""}, ModeRow{3, false, 7, ""},
                    ModeRow{4, false, 6, ""}, ModeRow{5, false, 7, ""},
                    ModeRow{6, true, 4, "\"bond_mode=active-backup lacp=off\""},
                    ModeRow{7, true, 3, "\"bond_mode=balance-slb lacp=off\""},
                    ModeRow{8, true, 2, "\"bond_mode=balance-tcp lacp=active\""},
                    ModeRow{0, false, 0, ""}, ModeRow{9, false, 0, ""}, ModeRow{-1, false, 0, ""},
                    ModeRow{-2147483647 - 1, false, 0, ""}, ModeRow{2147483647, false, 0, ""}),
    [](const auto& test) {
        const int mode = test.param.mode;
        return mode < 0 ? "Minus" + std::to_string(-static_cast<long long>(mode))
                        : "Mode" + std::to_string(mode);
    });

TEST_P(Modes, AreConvertedAsTheTableSays)
{
    const RecordingPlatform platform;
    const ModeRow& row = GetParam();
    EXPECT_EQ(BondManager::CheckModeSupport(Mode(row.mode)), row.supported);
    EXPECT_EQ(BondManager::DefaultModeConvert(Mode(row.mode)), Mode(row.converted));
    std::string options = "what was there";
    BondManager::ModeToBondOPT(Mode(row.mode), options);
    EXPECT_EQ(options, row.options);
    EXPECT_THAT(platform.Calls(), IsEmpty());
}

TEST(ModeToBondOPT, GivesTheLengthsThatTheFileExpects)
{
    const RecordingPlatform platform;
    std::string options;
    BondManager::ModeToBondOPT(Mode(6), options);
    EXPECT_EQ(options.size(), 34U);
    BondManager::ModeToBondOPT(Mode(7), options);
    EXPECT_EQ(options.size(), 32U);
    BondManager::ModeToBondOPT(Mode(8), options);
    EXPECT_EQ(options.size(), 35U);
}

TEST(DefaultModeConvert, Gives3ForMode1ThereAndBack)
{
    const RecordingPlatform platform;
    const auto thereAndBack = [](int mode) {
        return BondManager::DefaultModeConvert(BondManager::DefaultModeConvert(Mode(mode)));
    };
    EXPECT_EQ(thereAndBack(1), Mode(3));
    EXPECT_EQ(thereAndBack(2), Mode(2));
    EXPECT_EQ(thereAndBack(3), Mode(3));
    EXPECT_EQ(thereAndBack(4), Mode(4));
    EXPECT_EQ(thereAndBack(5), Mode(3));
}

TEST(StrToMode, HandsOnWhatThePlatformAnswersUnchecked)
{
    RecordingPlatform platform;
    platform.Answer("VORNNetLinkAggrStringToMode weird", -17);
    EXPECT_EQ(BondManager::StrToMode("weird"), Mode(-17));
    EXPECT_EQ(BondManager::StrToMode("802.3ad"), Mode(2));
    EXPECT_THAT(platform.Calls(), ElementsAre("VORNNetLinkAggrStringToMode weird",
                                              "VORNNetLinkAggrStringToMode 802.3ad"));
}

TEST(StrToMode, StandsATextOf5000Characters)
{
    const RecordingPlatform platform;
    EXPECT_EQ(BondManager::StrToMode(LongName()), Mode(0));
    EXPECT_THAT(platform.Calls(), ElementsAre("VORNNetLinkAggrStringToMode " + LongName()));
}

TEST(ModeToStr, CopiesThePlatformsText)
{
    const RecordingPlatform platform;
    std::string text = "what was there";
    BondManager::ModeToStr(Mode(2), text);
    EXPECT_EQ(text, "802.3ad");
    EXPECT_THAT(platform.Calls(), ElementsAre("VORNNetLinkAggrModeToString 2"));
}

TEST(BondManagerGet, ReadsThePlatformsRecord)
{
    RecordingPlatform platform;
    platform.Bond("bond0", 4, {"eth0", "eth1"});
    VORNLINKAGGROPT record{};
    EXPECT_TRUE(BondManager::Get("bond0", &record));
    const VORNLINKAGGROPT expected = harness::BondRecord("bond0", 4, {"eth0", "eth1"});
    EXPECT_EQ(std::memcmp(&record, &expected, sizeof(record)), 0);
    EXPECT_THAT(platform.Calls(), ElementsAre("VORNNetLinkAggrGet bond0"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(BondManagerGet, FailsOnANegativeAnswer)
{
    RecordingPlatform platform;
    platform.Answer("VORNNetLinkAggrGet", -1);
    VORNLINKAGGROPT record{};
    EXPECT_FALSE(BondManager::Get("bond0", &record));
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to get the OVS bonding of bond0")));
}

TEST(BondManagerGet, TakesAPositiveAnswerAsSuccess)
{
    RecordingPlatform platform;
    platform.Answer("VORNNetLinkAggrGet", 1);
    VORNLINKAGGROPT record{};
    EXPECT_TRUE(BondManager::Get("bond0", &record));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(BondManagerGet, StandsANameOf5000Characters)
{
    const RecordingPlatform platform;
    VORNLINKAGGROPT record{};
    EXPECT_FALSE(BondManager::Get(LongName(), &record));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to get the OVS bonding of " + LongName())));
}

TEST(BondChMode, WritesModeAndOptionsAndHasTheScriptApplyThem)
{
    const RecordingPlatform platform;
    EXPECT_TRUE(BondManager::BondChMode(Mode(7), "ovs_bond0"));
    EXPECT_THAT(
        platform.Calls(),
        ElementsAre("VORNNetLinkAggrModeToString 7",
                    "VLIBCFileSetKeys /etc/sysconfig/network-scripts/ifcfg-ovs_bond0 "
                    "BOND_MODE=ovs-balance-slb 'BONDING_OPTS=\"bond_mode=balance-slb lacp=off\"'",
                    "VLIBCExecl /etc/rc.network set-ovs-bond ovs_bond0"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(BondChMode, LeavesTheQuotedOptionsInTheFileEvenWhenTheScriptFails)
{
    for (const int answer : {-1, 1}) {
        RecordingPlatform platform;
        platform.CarryOutFileEdits();
        platform.Answer("VLIBCExecl", answer);
        WriteFile(std::string(kIfcfg) + "bond0", "DEVICE=bond0\nBONDING_OPTS=\"old\"\nX=1\n");
        EXPECT_TRUE(BondManager::BondChMode(Mode(7), "bond0"));
        EXPECT_EQ(ReadFile(std::string(kIfcfg) + "bond0"),
                  "DEVICE=bond0\nBONDING_OPTS=\"bond_mode=balance-slb lacp=off\"\nX=1\n"
                  "BOND_MODE=ovs-balance-slb\n");
        EXPECT_THAT(platform.Log(),
                    ElementsAre(Err(kFile, "Failed to change the OVS bonding mode")));
    }
}

TEST(BondChMode, WritesEmptyOptionsForAModeThatTheSwitchHasNot)
{
    const RecordingPlatform platform;
    EXPECT_TRUE(BondManager::BondChMode(Mode(4), "bond0"));
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VORNNetLinkAggrModeToString 4",
                            "VLIBCFileSetKeys /etc/sysconfig/network-scripts/ifcfg-bond0 "
                            "BOND_MODE=active-backup BONDING_OPTS=",
                            "VLIBCExecl /etc/rc.network set-ovs-bond bond0"));
}

TEST(BondChMode, FailsWithoutAHash)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCSzHashAlloc", 0);
    EXPECT_FALSE(BondManager::BondChMode(Mode(7), "bond0"));
    EXPECT_THAT(platform.Calls(), IsEmpty());
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to alloc the hash pshBondUpdate")));
}

TEST(BondChMode, DoesNotRunTheScriptWhenTheFileCannotBeWritten)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileSetKeys", -1);
    EXPECT_FALSE(BondManager::BondChMode(Mode(6), "bond0"));
    EXPECT_EQ(platform.Calls().size(), 2U);
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to set the key-value to "
                                       "/etc/sysconfig/network-scripts/ifcfg-bond0")));
    EXPECT_THAT(platform.OpenHandles(), IsEmpty());
}

TEST(BondChMode, TakesAPositiveAnswerOfTheEditAsSuccess)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileSetKeys", 1);
    EXPECT_TRUE(BondManager::BondChMode(Mode(6), "bond0"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(BondChMode, PutsModeBeforeOptions)
{
    const RecordingPlatform platform;
    EXPECT_TRUE(BondManager::BondChMode(Mode(6), "bond0"));
    EXPECT_THAT(platform.AllCalls(),
                ElementsAre("VLIBCSzHashAlloc", "VORNNetLinkAggrModeToString 6",
                            "VLIBCSzHashSetValue BOND_MODE ovs-active-backup",
                            "VLIBCSzHashSetValue BONDING_OPTS '\"bond_mode=active-backup "
                            "lacp=off\"'",
                            testing::StartsWith("VLIBCFileSetKeys"),
                            testing::StartsWith("VLIBCExecl"), "VLIBCSzHashFree"));
}

TEST(BondChMode, CutsThePathToItsBuffer)
{
    const RecordingPlatform platform;
    EXPECT_TRUE(BondManager::BondChMode(Mode(4), LongName()));
    const std::string path = (kIfcfg + LongName()).substr(0, 4095);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VORNNetLinkAggrModeToString 4",
                            "VLIBCFileSetKeys " + path + " BOND_MODE=active-backup BONDING_OPTS=",
                            "VLIBCExecl /etc/rc.network set-ovs-bond " + LongName()));
}

TEST(GetUniqueBondName, GivesTheFirstNameThatNoInterfaceHas)
{
    for (int used = 0; used < 10; ++used) {
        RecordingPlatform platform;
        Calls asked;
        for (int i = 0; i <= used; ++i) {
            const std::string name = "ovs_bond" + std::to_string(i);
            asked.push_back("VLIBCFileExist /sys/class/net/" + name + "/flags");
            if (i < used) {
                MakeLive(platform, {name});
            }
        }
        std::string name = "before";
        EXPECT_TRUE(BondManager::GetUniqueName(name));
        EXPECT_EQ(name, "ovs_bond" + std::to_string(used));
        EXPECT_EQ(platform.Calls(), asked);
    }
}

TEST(GetUniqueBondName, LeavesTheOutputWhenAllTenAreInUse)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileExist", 1);
    std::string name = "before";
    EXPECT_TRUE(BondManager::GetUniqueName(name));
    EXPECT_EQ(name, "before");
    EXPECT_EQ(platform.Calls().size(), 10U);
    EXPECT_THAT(platform.Log(), IsEmpty());
}

} // namespace
