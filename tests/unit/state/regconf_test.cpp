#include <vornovs/vornovs.h>

#include "support/support.h"

#include <filesystem>
#include <memory>
#include <type_traits>

#include <sys/stat.h>

using harness::Err;
using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::kRegistry;
using unit::kStateFolder;
using unit::ListFolder;
using unit::LongName;
using unit::MakeUnopenable;
using unit::Names;
using unit::ReadFile;
using unit::WriteFile;
using VORN::OVS::OVSRegConf;

namespace fs = std::filesystem;

namespace {

constexpr char kFile[] = "regconf.cpp";
constexpr char kOpenFails[] = " Open /usr/vorn/etc/vornovs/ovs_reg.conf fails";

Names NamesOf(OVSRegConf& store)
{
    Names names;
    (void)store.GetRegNames(names);
    return names;
}

Names Loaded()
{
    OVSRegConf store;
    EXPECT_EQ(store.LoadFromConfig(), 0);
    return NamesOf(store);
}

TEST(OVSRegConf, CanBeDeletedThroughAPointer)
{
    const RecordingPlatform platform;
    EXPECT_TRUE(std::has_virtual_destructor_v<OVSRegConf>);
    const auto store = std::make_unique<OVSRegConf>();
    EXPECT_EQ(store->IsRegister("a"), -1);
    EXPECT_THAT(platform.Calls(), IsEmpty());
}

TEST(OVSRegConf, IsMadeAndDestroyedWithoutTouchingTheFile)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "a\n");
    {
        OVSRegConf store;
        EXPECT_THAT(NamesOf(store), IsEmpty());
    }
    EXPECT_EQ(ReadFile(kRegistry), "a\n");
    EXPECT_THAT(platform.Calls(), IsEmpty());
}

TEST(OVSRegConfRegister, KeepsTheFileSortedWithANewlineAfterEachName)
{
    const RecordingPlatform platform;
    OVSRegConf store;
    EXPECT_EQ(store.Register("c"), 0);
    EXPECT_EQ(store.Register("a"), 0);
    EXPECT_EQ(store.Register("b"), 0);
    EXPECT_EQ(ReadFile(kRegistry), "a\nb\nc\n");
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(OVSRegConfRegister, SortsByBytesWithTheShorterNameFirst)
{
    const RecordingPlatform platform;
    OVSRegConf store;
    for (const char* name : {"ab", "a", "B", "\xC3\xA4", "a b"}) {
        EXPECT_EQ(store.Register(name), 0);
    }
    EXPECT_EQ(ReadFile(kRegistry), "B\na\na b\nab\n\xC3\xA4\n");
}

TEST(OVSRegConfRegister, AsksForTheFolderOnceAndSavesNothingElse)
{
    const RecordingPlatform platform;
    OVSRegConf store;
    EXPECT_EQ(store.Register("a"), 0);
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBCFileCheckDir /usr/vorn/etc/vornovs"));
    EXPECT_THAT(ListFolder(kStateFolder), ElementsAre("ovs_reg.conf"));
}

TEST(OVSRegConfRegister, Answers1ForANameThatIsThereAndLeavesTheFile)
{
    const RecordingPlatform platform;
    OVSRegConf store;
    EXPECT_EQ(store.Register("a"), 0);
    WriteFile(kRegistry, "what another process wrote\n");
    EXPECT_EQ(store.Register("a"), 1);
    EXPECT_EQ(ReadFile(kRegistry), "what another process wrote\n");
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "The a has been registered before")));
}

TEST(OVSRegConfRegister, KeepsTheNameInMemoryWhenTheFileCannotBeOpened)
{
    const RecordingPlatform platform;
    MakeUnopenable(kRegistry);
    OVSRegConf store;
    EXPECT_EQ(store.Register("a"), -1);
    EXPECT_EQ(store.IsRegister("a"), 1);
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, kOpenFails)));
}

TEST(OVSRegConfRegister, SucceedsWithoutSavingWhenTheFolderCannotBeMade)
{
    const RecordingPlatform platform;
    fs::remove_all("/usr/vorn/etc");
    OVSRegConf store;
    EXPECT_EQ(store.Register("a"), 0);
    EXPECT_EQ(store.IsRegister("a"), 1);
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to mkdir [/usr/vorn/etc/vornovs/ovs_reg.conf][493]"),
                            Err(kFile, "Failed to mkdir")));
    EXPECT_THAT(ListFolder("/usr/vorn"), IsEmpty());
}

TEST(OVSRegConfUnRegister, DeletesTheFileWithTheLastName)
{
    const RecordingPlatform platform;
    OVSRegConf store;
    EXPECT_EQ(store.Register("a"), 0);
    EXPECT_EQ(store.UnRegister("a"), 0);
    EXPECT_THAT(ListFolder(kStateFolder), IsEmpty());
    EXPECT_THAT(Loaded(), IsEmpty());
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(OVSRegConfUnRegister, KeepsTheOtherNames)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "a\nb\nc\n");
    OVSRegConf store;
    EXPECT_EQ(store.LoadFromConfig(), 0);
    EXPECT_EQ(store.UnRegister("b"), 0);
    EXPECT_EQ(ReadFile(kRegistry), "a\nc\n");
}

TEST(OVSRegConfUnRegister, Answers2ForANameThatIsNotThereAndLeavesTheFile)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "b\na");
    OVSRegConf store;
    EXPECT_EQ(store.LoadFromConfig(), 0);
    EXPECT_EQ(store.UnRegister("A"), 2);
    EXPECT_EQ(ReadFile(kRegistry), "b\na");
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "The A has not been registered before")));
}

TEST(OVSRegConfUnRegister, KeepsTheRemovalInMemoryWhenTheFileCannotBeOpened)
{
    RecordingPlatform platform;
    WriteFile(kRegistry, "a\nb\n");
    OVSRegConf store;
    EXPECT_EQ(store.LoadFromConfig(), 0);
    fs::remove(kRegistry);
    MakeUnopenable(kRegistry);
    EXPECT_EQ(store.UnRegister("a"), -1);
    EXPECT_EQ(store.IsRegister("a"), -1);
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, kOpenFails)));
}

TEST(OVSRegConfUnRegister, FailsForTheLastNameToo)
{
    const RecordingPlatform platform;
    OVSRegConf store;
    EXPECT_EQ(store.Register("a"), 0);
    fs::remove(kRegistry);
    MakeUnopenable(kRegistry);
    EXPECT_EQ(store.UnRegister("a"), -1);
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, kOpenFails)));
    EXPECT_TRUE(fs::exists(kRegistry));
}

TEST(OVSRegConfUnRegister, SucceedsWithoutSavingWhenTheFolderCannotBeMade)
{
    const RecordingPlatform platform;
    OVSRegConf store;
    EXPECT_EQ(store.Register("a"), 0);
    fs::remove_all("/usr/vorn/etc");
    EXPECT_EQ(store.UnRegister("a"), 0);
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to mkdir [/usr/vorn/etc/vornovs/ovs_reg.conf][493]"),
                            Err(kFile, "Failed to mkdir")));
}

TEST(OVSRegConfIsRegister, Answers1OrMinus1AndNever0)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "abc\n");
    OVSRegConf store;
    EXPECT_EQ(store.LoadFromConfig(), 0);
    EXPECT_EQ(store.IsRegister("abc"), 1);
    EXPECT_EQ(store.IsRegister("ab"), -1);
    EXPECT_EQ(store.IsRegister("ABC"), -1);
    EXPECT_EQ(store.IsRegister(""), -1);
}

TEST(OVSRegConfGetRegNames, CountsTheNamesThatTheSetHeldBefore)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "a\nb\n");
    OVSRegConf store;
    EXPECT_EQ(store.LoadFromConfig(), 0);
    Names names{"x", "y"};
    EXPECT_EQ(store.GetRegNames(names), 4);
    EXPECT_EQ(names, (Names{"a", "b", "x", "y"}));
}

TEST(OVSRegConfGetRegNames, CountsANameThatTheSetHeldOnce)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "a\nb\n");
    OVSRegConf store;
    EXPECT_EQ(store.LoadFromConfig(), 0);
    Names names{"b"};
    EXPECT_EQ(store.GetRegNames(names), 2);
    EXPECT_EQ(names, (Names{"a", "b"}));
}

TEST(OVSRegConfLoad, AsksForFolderAndFile)
{
    const RecordingPlatform platform;
    EXPECT_THAT(Loaded(), IsEmpty());
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBCFileCheckDir /usr/vorn/etc/vornovs",
                                              "VLIBCFileExist /usr/vorn/etc/vornovs/ovs_reg.conf"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(OVSRegConfLoad, TakesEmptyLinesAndCarriageReturnsAsTheyStand)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "x\n\ny\nx\r\n z \n");
    EXPECT_EQ(Loaded(), (Names{"", " z ", "x", "x\r", "y"}));
}

TEST(OVSRegConfLoad, TakesALastLineWithoutANewline)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "a\nb");
    EXPECT_EQ(Loaded(), (Names{"a", "b"}));
}

TEST(OVSRegConfLoad, FindsNoNameInAnEmptyFile)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "");
    EXPECT_THAT(Loaded(), IsEmpty());
}

TEST(OVSRegConfLoad, FindsNoNameInAFolderOfThatName)
{
    const RecordingPlatform platform;
    fs::create_directory(kRegistry);
    EXPECT_THAT(Loaded(), IsEmpty());
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(OVSRegConfLoad, FindsTheEmptyNameInALoneNewline)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "\n");
    EXPECT_EQ(Loaded(), Names{""});
}

TEST(OVSRegConfLoad, KeepsNulBytesAndLinesLongerThanAnyBuffer)
{
    const RecordingPlatform platform;
    const std::string withNul("a\0b", 3);
    const std::string huge(100000, 'h');
    WriteFile(kRegistry, withNul + "\n" + huge + "\n");
    EXPECT_EQ(Loaded(), (Names{withNul, huge}));
}

TEST(OVSRegConfLoad, MergesWhenItIsRunTwice)
{
    const RecordingPlatform platform;
    OVSRegConf store;
    WriteFile(kRegistry, "a\n");
    EXPECT_EQ(store.LoadFromConfig(), 0);
    WriteFile(kRegistry, "b\n");
    EXPECT_EQ(store.LoadFromConfig(), 0);
    EXPECT_EQ(NamesOf(store), (Names{"a", "b"}));
}

TEST(OVSRegConfLoad, FailsOnAFileThatCannotBeOpenedAndKeepsWhatItHeld)
{
    const RecordingPlatform platform;
    OVSRegConf store;
    WriteFile(kRegistry, "a\n");
    EXPECT_EQ(store.LoadFromConfig(), 0);
    fs::remove(kRegistry);
    MakeUnopenable(kRegistry);
    EXPECT_EQ(store.LoadFromConfig(), -1);
    EXPECT_EQ(NamesOf(store), Names{"a"});
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, kOpenFails)));
}

TEST(OVSRegConfLoad, OpensTheFileOnlyWhenThePlatformDoesNotAnswer0)
{
    for (const int answer : {-1, 1, 2}) {
        RecordingPlatform platform;
        WriteFile(kRegistry, "a\n");
        platform.Answer("VLIBCFileExist", answer);
        EXPECT_EQ(Loaded(), Names{"a"}) << answer;
    }
    RecordingPlatform platform;
    platform.Answer("VLIBCFileExist", 0);
    EXPECT_THAT(Loaded(), IsEmpty());
}

TEST(OVSRegConfLoad, CountsAFolderThatCannotBeMadeAsNoRegistration)
{
    const RecordingPlatform platform;
    fs::remove_all("/usr/vorn/etc");
    EXPECT_THAT(Loaded(), IsEmpty());
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Failed to mkdir [/usr/vorn/etc/vornovs/ovs_reg.conf][493]"),
                            Err(kFile, "Failed to mkdir")));
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBCFileCheckDir /usr/vorn/etc/vornovs"));
}

TEST(OVSRegConfCheckAndMkdir, MakesTheFolderWithMode0755)
{
    const RecordingPlatform platform;
    fs::remove(kStateFolder);
    const mode_t mask = umask(0);
    EXPECT_EQ(OVSRegConf().CheckAndMkdir(), 0);
    (void)umask(mask);
    struct stat status {};
    ASSERT_EQ(stat(kStateFolder, &status), 0);
    EXPECT_EQ(status.st_mode, S_IFDIR | 0755U);
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBCFileCheckDir /usr/vorn/etc/vornovs"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(OVSRegConfCheckAndMkdir, MakesNoParent)
{
    const RecordingPlatform platform;
    fs::remove_all("/usr/vorn/etc");
    EXPECT_EQ(OVSRegConf().CheckAndMkdir(), -1);
    EXPECT_THAT(ListFolder("/usr/vorn"), IsEmpty());
    EXPECT_THAT(
        platform.Log(),
        ElementsAre(Err(kFile, "Failed to mkdir [/usr/vorn/etc/vornovs/ovs_reg.conf][493]")));
}

TEST(OVSRegConfCheckAndMkdir, TakesEveryAnswerBut0AsAFolder)
{
    for (const int answer : {-1, 1, 2}) {
        RecordingPlatform platform;
        fs::remove_all(kStateFolder);
        platform.Answer("VLIBCFileCheckDir", answer);
        EXPECT_EQ(OVSRegConf().CheckAndMkdir(), 0) << answer;
        EXPECT_FALSE(fs::exists(kStateFolder)) << answer;
    }
}

TEST(OVSRegConfWriteToConfig, LeavesNoFileForNoNames)
{
    const RecordingPlatform platform;
    EXPECT_EQ(OVSRegConf().WriteToConfig(), 0);
    EXPECT_THAT(ListFolder(kStateFolder), IsEmpty());
}

TEST(OVSRegConf, StandsNamesOf5000Characters)
{
    const RecordingPlatform platform;
    OVSRegConf store;
    EXPECT_EQ(store.Register(LongName()), 0);
    EXPECT_EQ(ReadFile(kRegistry), LongName() + "\n");
    EXPECT_EQ(Loaded(), Names{LongName()});
    EXPECT_EQ(store.IsRegister(LongName()), 1);
    EXPECT_EQ(store.Register(LongName()), 1);
    EXPECT_EQ(store.UnRegister(LongName() + "y"), 2);
    EXPECT_EQ(store.UnRegister(LongName()), 0);
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "The " + LongName() + " has been registered before"),
                            Err(kFile, "The " + LongName() + "y has not been registered before")));
}

} // namespace
