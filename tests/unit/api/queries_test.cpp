#include <vornovs/vornovs.h>

#include "support/support.h"

#include <filesystem>

using harness::Err;
using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::kRegistry;
using unit::LongName;
using unit::MakeUnopenable;
using unit::Names;
using unit::WriteFile;
using VORN::OVS::GetAllRegister;
using VORN::OVS::IsOVSRunning;
using VORN::OVS::IsOVSSupport;
using VORN::OVS::IsRegister;

namespace {

constexpr char kFile[] = "libvornovs.cpp";

const unit::LogLines kCannotLoad{
    Err("regconf.cpp", " Open /usr/vorn/etc/vornovs/ovs_reg.conf fails"),
    Err(kFile, "Failed to load the ovs config")};

const unit::Calls kLoaded{"VLIBCFileCheckDir /usr/vorn/etc/vornovs",
                          "VLIBCFileExist /usr/vorn/etc/vornovs/ovs_reg.conf"};

TEST(IsRegister, Answers0ForARegisteredName)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "a\nb\n");
    EXPECT_EQ(IsRegister("b"), 0);
    EXPECT_EQ(platform.Calls(), kLoaded);
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(IsRegister, AnswersMinus1ForAnUnknownName)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "a\nb\n");
    EXPECT_EQ(IsRegister("c"), -1);
    EXPECT_EQ(IsRegister(""), -1);
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(IsRegister, AnswersMinus1WithoutARegistry)
{
    const RecordingPlatform platform;
    EXPECT_EQ(IsRegister("a"), -1);
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(IsRegister, AnswersMinus1ForARegistryThatCannotBeRead)
{
    const RecordingPlatform platform;
    MakeUnopenable(kRegistry);
    EXPECT_EQ(IsRegister("a"), -1);
    EXPECT_EQ(platform.Log(), kCannotLoad);
}

TEST(IsRegister, StandsANameOf5000Characters)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, LongName() + "\n");
    EXPECT_EQ(IsRegister(LongName()), 0);
    EXPECT_EQ(IsRegister(LongName() + "y"), -1);
}

TEST(GetAllRegister, MergesTheNamesIntoTheCallersSet)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "a\nb\n");
    Names names{"x"};
    EXPECT_EQ(GetAllRegister(names), 3);
    EXPECT_EQ(names, (Names{"a", "b", "x"}));
    EXPECT_EQ(platform.Calls(), kLoaded);
}

TEST(GetAllRegister, CountsTheCallersNamesWithoutARegistry)
{
    const RecordingPlatform platform;
    Names names{"x", "y"};
    EXPECT_EQ(GetAllRegister(names), 2);
}

TEST(GetAllRegister, Answers0AndKeepsTheSetForARegistryThatCannotBeRead)
{
    const RecordingPlatform platform;
    MakeUnopenable(kRegistry);
    Names names{"x"};
    EXPECT_EQ(GetAllRegister(names), 0);
    EXPECT_EQ(names, Names{"x"});
    EXPECT_EQ(platform.Log(), kCannotLoad);
}

TEST(IsOVSRunning, IsFalseWithoutAClientThoughTheServicesRun)
{
    const RecordingPlatform platform;
    EXPECT_FALSE(IsOVSRunning());
    EXPECT_EQ(platform.Calls(), kLoaded);
}

TEST(IsOVSRunning, IsTrueWithAClientThoughTheServicesDoNotRun)
{
    RecordingPlatform platform;
    platform.Answer("VLIBServiceIsRunning", 0);
    WriteFile(kRegistry, "a\n");
    EXPECT_TRUE(IsOVSRunning());
    EXPECT_EQ(platform.Calls(), kLoaded);
}

TEST(IsOVSRunning, IsTrueWithTheEmptyNameAsTheOnlyClient)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "\n");
    EXPECT_TRUE(IsOVSRunning());
}

TEST(IsOVSRunning, IsFalseForARegistryThatCannotBeRead)
{
    const RecordingPlatform platform;
    MakeUnopenable(kRegistry);
    EXPECT_FALSE(IsOVSRunning());
    EXPECT_EQ(platform.Log(), kCannotLoad);
}

TEST(IsOVSRunning, IsFalseWhenTheStateFolderCannotBeMade)
{
    const RecordingPlatform platform;
    std::filesystem::remove_all("/usr/vorn/etc");
    EXPECT_FALSE(IsOVSRunning());
    EXPECT_THAT(
        platform.Log(),
        ElementsAre(Err("regconf.cpp", "Failed to mkdir [/usr/vorn/etc/vornovs/ovs_reg.conf][493]"),
                    Err("regconf.cpp", "Failed to mkdir")));
}

TEST(IsOVSSupport, Is0OnEveryHost)
{
    const RecordingPlatform platform;
    EXPECT_EQ(IsOVSSupport(), 0);
    EXPECT_THAT(platform.Calls(), IsEmpty());
    EXPECT_THAT(platform.Log(), IsEmpty());
}

} // namespace
