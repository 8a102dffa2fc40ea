#include <vornovs/vornovs.h>

#include "support/bondcalls.h"

using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::LongName;

namespace {

TEST(StrToMode, HandsOnWhatThePlatformAnswersWithoutTheLock)
{
    RecordingPlatform platform;
    platform.Answer("VORNNetLinkAggrStringToMode weird", 99);
    EXPECT_EQ(VORN::OVS::StrToMode("802.3ad"), VORN_LINK_AGGR_8023AD);
    EXPECT_EQ(static_cast<int>(VORN::OVS::StrToMode("weird")), 99);
    EXPECT_EQ(VORN::OVS::StrToMode(LongName().c_str()), VORN_LINK_AGGR_NONE);
    EXPECT_THAT(platform.Calls(), ElementsAre("VORNNetLinkAggrStringToMode 802.3ad",
                                              "VORNNetLinkAggrStringToMode weird",
                                              "VORNNetLinkAggrStringToMode " + LongName()));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(StrToMode, TakesANullPointerAsTheEmptyName)
{
    const RecordingPlatform platform;
    EXPECT_EQ(VORN::OVS::StrToMode(nullptr), VORN_LINK_AGGR_NONE);
    EXPECT_THAT(platform.Calls(), ElementsAre("VORNNetLinkAggrStringToMode ''"));
}

TEST(ModeToStr, GivesThePlatformsNameWithoutTheLock)
{
    const RecordingPlatform platform;
    std::string text = "what was there";
    VORN::OVS::ModeToStr(VORN_LINK_AGGR_OVS_BALANCE_TCP, text);
    EXPECT_EQ(text, "ovs-balance-tcp");
    EXPECT_THAT(platform.Calls(), ElementsAre("VORNNetLinkAggrModeToString 8"));
}

TEST(CheckModeSupport, IsTrueForTheSwitchsModesOnly)
{
    const RecordingPlatform platform;
    for (const int mode : {-1, 0, 5, 9}) {
        EXPECT_FALSE(VORN::OVS::CheckModeSupport(static_cast<VORN_LINK_AGGR_MODE>(mode))) << mode;
    }
    for (const int mode : {6, 7, 8}) {
        EXPECT_TRUE(VORN::OVS::CheckModeSupport(static_cast<VORN_LINK_AGGR_MODE>(mode))) << mode;
    }
    EXPECT_THAT(platform.Calls(), IsEmpty());
}

TEST(GetUniqueBondName, Answers0WithAFreeName)
{
    RecordingPlatform platform;
    unit::MakeLive(platform, {"ovs_bond0"});
    std::string name;
    EXPECT_EQ(VORN::OVS::GetUniqueBondName(name), 0);
    EXPECT_EQ(name, "ovs_bond1");
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBCFileExist /sys/class/net/ovs_bond0/flags",
                                              "VLIBCFileExist /sys/class/net/ovs_bond1/flags"));
}

TEST(GetUniqueBondName, Answers0AndLeavesTheOutputWhenNoneIsFree)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCFileExist", 1);
    std::string name = "before";
    EXPECT_EQ(VORN::OVS::GetUniqueBondName(name), 0);
    EXPECT_EQ(name, "before");
}

} // namespace
