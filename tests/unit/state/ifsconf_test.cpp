#include <vornovs/vornovs.h>

#include "support/support.h"

#include <filesystem>
#include <memory>
#include <type_traits>

using harness::Err;
using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::kIgnoreList;
using unit::kInterfaceList;
using unit::kStateFolder;
using unit::ListFolder;
using unit::LongName;
using unit::MakeUnopenable;
using unit::ReadFile;
using unit::WriteFile;
using VORN::OVS::OVSIfsConf;

namespace fs = std::filesystem;

namespace {

constexpr char kFile[] = "ifsconf.cpp";
constexpr char kOpenFails[] = " Open /usr/vorn/etc/vornovs/ovs_interface.conf fails";
constexpr char kMkdirFails[] = "Failed to mkdir [/usr/vorn/etc/vornovs/ovs_interface.conf][493]";

TEST(OVSIfsConf, CanBeDeletedThroughAPointer)
{
    const RecordingPlatform platform;
    EXPECT_TRUE(std::has_virtual_destructor_v<OVSIfsConf>);
    const auto list = std::make_unique<OVSIfsConf>(kInterfaceList);
    EXPECT_EQ(list->Write("eth0"), 0);
}

TEST(OVSIfsConf, IsEmptyAndWritesNothingWhenThereIsNoFile)
{
    const RecordingPlatform platform;
    {
        OVSIfsConf list(kInterfaceList);
        EXPECT_EQ(list.Remove("eth0"), -1);
    }
    EXPECT_THAT(ListFolder(kStateFolder), IsEmpty());
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCFileCheckDir /usr/vorn/etc/vornovs",
                            "VLIBCFileExist /usr/vorn/etc/vornovs/ovs_interface.conf"));
}

TEST(OVSIfsConf, LoadsAtConstruction)
{
    const RecordingPlatform platform;
    WriteFile(kInterfaceList, "eth0\n");
    OVSIfsConf list(kInterfaceList);
    WriteFile(kInterfaceList, "");
    EXPECT_EQ(list.Write("eth1"), 0);
    EXPECT_EQ(ReadFile(kInterfaceList), "eth0\neth1\n");
}

TEST(OVSIfsConf, IsUsableAfterAFileThatCannotBeRead)
{
    const RecordingPlatform platform;
    MakeUnopenable(kInterfaceList);
    OVSIfsConf list(kInterfaceList);
    fs::remove(kInterfaceList);
    EXPECT_EQ(list.Write("eth0"), 0);
    EXPECT_EQ(ReadFile(kInterfaceList), "eth0\n");
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, kOpenFails), Err(kFile, "Read interface config fail")));
}

TEST(OVSIfsConf, CountsAFolderThatCannotBeMadeAsAnEmptyList)
{
    const RecordingPlatform platform;
    fs::remove_all("/usr/vorn/etc");
    OVSIfsConf list(kInterfaceList);
    EXPECT_EQ(list.Write("eth0"), 0);
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, kMkdirFails), Err(kFile, "Failed to mkdir"),
                            Err(kFile, kMkdirFails), Err(kFile, "Failed to mkdir")));
    EXPECT_THAT(ListFolder("/usr/vorn"), IsEmpty());
}

TEST(OVSIfsConf, NamesItsOwnFileWhenTheFolderCannotBeMade)
{
    const RecordingPlatform platform;
    fs::remove_all("/usr/vorn/etc");
    const OVSIfsConf list("/somewhere/else");
    EXPECT_EQ(list.CheckAndMkdir(), -1);
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "Failed to mkdir [/somewhere/else][493]"),
                                            Err(kFile, "Failed to mkdir"),
                                            Err(kFile, "Failed to mkdir [/somewhere/else][493]")));
}

TEST(OVSIfsConf, MakesTheStateFolderWhateverItsPath)
{
    const RecordingPlatform platform;
    fs::remove(kStateFolder);
    OVSIfsConf list("/usr/vorn/etc/elsewhere");
    EXPECT_EQ(list.CheckAndMkdir(), 0);
    EXPECT_TRUE(fs::is_directory(kStateFolder));
    EXPECT_EQ(list.Write("eth0"), 0);
    EXPECT_EQ(ReadFile("/usr/vorn/etc/elsewhere"), "eth0\n");
}

TEST(OVSIfsConfLoad, TakesAnEmptyLineAsTheEmptyNameAndSavesItBack)
{
    const RecordingPlatform platform;
    WriteFile(kInterfaceList, "eth1\n\neth0\n");
    OVSIfsConf list(kInterfaceList);
    EXPECT_EQ(list.Write("x"), 0);
    EXPECT_EQ(ReadFile(kInterfaceList), "\neth0\neth1\nx\n");
    EXPECT_EQ(list.Remove("x"), 0);
    EXPECT_EQ(ReadFile(kInterfaceList), "\neth0\neth1\n");
}

TEST(OVSIfsConfLoad, MergesAndCollapsesDuplicates)
{
    const RecordingPlatform platform;
    WriteFile(kInterfaceList, "a\na\n");
    OVSIfsConf list(kInterfaceList);
    WriteFile(kInterfaceList, "b\na");
    EXPECT_EQ(list.LoadFromConfig(), 0);
    EXPECT_EQ(list.Write("c"), 0);
    EXPECT_EQ(ReadFile(kInterfaceList), "a\nb\nc\n");
}

TEST(OVSIfsConfLoad, FailsOnAFileThatCannotBeOpened)
{
    const RecordingPlatform platform;
    OVSIfsConf list(kInterfaceList);
    MakeUnopenable(kInterfaceList);
    EXPECT_EQ(list.LoadFromConfig(), -1);
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, kOpenFails)));
}

TEST(OVSIfsConfWrite, SortsTheNames)
{
    const RecordingPlatform platform;
    OVSIfsConf list(kInterfaceList);
    EXPECT_EQ(list.Write("eth1"), 0);
    EXPECT_EQ(list.Write("eth0"), 0);
    EXPECT_EQ(list.Write("bond0"), 0);
    EXPECT_EQ(ReadFile(kInterfaceList), "bond0\neth0\neth1\n");
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(OVSIfsConfWrite, AnswersMinus1ForANameThatIsThereAndLeavesTheFile)
{
    const RecordingPlatform platform;
    OVSIfsConf list(kInterfaceList);
    EXPECT_EQ(list.Write("eth0"), 0);
    WriteFile(kInterfaceList, "what another process wrote\n");
    EXPECT_EQ(list.Write("eth0"), -1);
    EXPECT_EQ(ReadFile(kInterfaceList), "what another process wrote\n");
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "The eth0 has exist")));
}

TEST(OVSIfsConfWrite, KeepsTheNameInMemoryWhenTheFileCannotBeOpened)
{
    const RecordingPlatform platform;
    OVSIfsConf list(kInterfaceList);
    MakeUnopenable(kInterfaceList);
    EXPECT_EQ(list.Write("eth0"), -1);
    EXPECT_EQ(list.Write("eth0"), -1);
    EXPECT_THAT(
        platform.Log(),
        ElementsAre(
            Err(kFile, kOpenFails),
            Err(kFile, "Failed to write to config /usr/vorn/etc/vornovs/ovs_interface.conf"),
            Err(kFile, "The eth0 has exist")));
}

TEST(OVSIfsConfRemove, DeletesTheFileWithTheLastName)
{
    const RecordingPlatform platform;
    WriteFile(kInterfaceList, "eth0\n");
    OVSIfsConf list(kInterfaceList);
    EXPECT_EQ(list.Remove("eth0"), 0);
    EXPECT_THAT(ListFolder(kStateFolder), IsEmpty());
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(OVSIfsConfRemove, AnswersMinus1ForANameThatIsNotThereAndLeavesTheFile)
{
    const RecordingPlatform platform;
    WriteFile(kInterfaceList, "b\na");
    OVSIfsConf list(kInterfaceList);
    EXPECT_EQ(list.Remove("eth0"), -1);
    EXPECT_EQ(ReadFile(kInterfaceList), "b\na");
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "The eth0 has not been used before")));
}

TEST(OVSIfsConfRemove, FailsWhenTheFileCannotBeOpened)
{
    const RecordingPlatform platform;
    WriteFile(kInterfaceList, "a\nb\n");
    OVSIfsConf list(kInterfaceList);
    fs::remove(kInterfaceList);
    MakeUnopenable(kInterfaceList);
    EXPECT_EQ(list.Remove("a"), -1);
    EXPECT_EQ(list.Remove("a"), -1);
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, kOpenFails), Err(kFile, "Failed to wrtie the config"),
                            Err(kFile, "The a has not been used before")));
}

TEST(OVSIfsConfWriteToConfig, SavesTheGivenNames)
{
    const RecordingPlatform platform;
    const OVSIfsConf list(kInterfaceList);
    EXPECT_EQ(list.WriteToConfig({"b", "a"}), 0);
    EXPECT_EQ(ReadFile(kInterfaceList), "a\nb\n");
    EXPECT_EQ(list.WriteToConfig({}), 0);
    EXPECT_THAT(ListFolder(kStateFolder), IsEmpty());
}

TEST(OVSIfsConfWriteToConfig, SucceedsWithoutSavingWhenTheFolderCannotBeMade)
{
    const RecordingPlatform platform;
    const OVSIfsConf list(kInterfaceList);
    fs::remove_all("/usr/vorn/etc");
    EXPECT_EQ(list.WriteToConfig({"a"}), 0);
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, kMkdirFails), Err(kFile, "Failed to mkdir")));
}

TEST(OVSIfsConfWriteToConfig, FailsWhenTheFileCannotBeOpened)
{
    const RecordingPlatform platform;
    const OVSIfsConf list(kInterfaceList);
    MakeUnopenable(kInterfaceList);
    EXPECT_EQ(list.WriteToConfig({"a"}), -1);
    EXPECT_EQ(list.WriteToConfig({}), -1);
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, kOpenFails), Err(kFile, kOpenFails)));
}

TEST(OVSIfsConf, KeepsTheTwoListsApart)
{
    const RecordingPlatform platform;
    OVSIfsConf converted(kInterfaceList);
    OVSIfsConf ignored(kIgnoreList);
    EXPECT_EQ(converted.Write("eth0"), 0);
    EXPECT_EQ(ignored.Write("eth0"), 0);
    EXPECT_EQ(ignored.Remove("eth0"), 0);
    EXPECT_EQ(ReadFile(kInterfaceList), "eth0\n");
    EXPECT_EQ(ReadFile(kIgnoreList), std::nullopt);
}

TEST(OVSIfsConf, StandsNamesOf5000Characters)
{
    const RecordingPlatform platform;
    OVSIfsConf list(kInterfaceList);
    EXPECT_EQ(list.Write(LongName()), 0);
    EXPECT_EQ(ReadFile(kInterfaceList), LongName() + "\n");
    EXPECT_EQ(list.Write(LongName()), -1);
    EXPECT_EQ(list.Remove(LongName()), 0);
    EXPECT_EQ(list.Remove(LongName()), -1);
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "The " + LongName() + " has exist"),
                            Err(kFile, "The " + LongName() + " has not been used before")));
}

TEST(OVSIfsConf, StandsAPathOf5000Characters)
{
    const RecordingPlatform platform;
    const std::string path = "/usr/vorn/" + LongName();
    OVSIfsConf list(path);
    EXPECT_EQ(list.Write("eth0"), -1);
    EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, " Open " + path + " fails"),
                                            Err(kFile, "Failed to write to config " + path)));
}

} // namespace
