// How both stores save where the file is no plain file, or may not be written.
#include "state/savednames.h"
#include "support/filecalls.h"

#include <array>
#include <cerrno>
#include <filesystem>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <unistd.h>

using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::FileCalls;
using unit::InterfaceList;
using unit::kStateFolder;
using unit::ListFolder;
using unit::LogLines;
using unit::ReadFile;
using unit::Registry;
using unit::SavedNames;
using unit::ScopedMount;
using unit::ScopedWithoutOverride;
using unit::WriteFile;

namespace fs = std::filesystem;

namespace {

INSTANTIATE_TEST_SUITE_P(Both, SavedNames, testing::Values(Registry(), InterfaceList()),
                         [](const auto& test) { return test.param.name; });

TEST_P(SavedNames, AreWrittenInPlaceWhereTheFileIsAMountPoint)
{
    const RecordingPlatform platform;
    WriteFile("/usr/vorn/mounted", "eth0\n");
    WriteFile(GetParam().path, "");
    ASSERT_EQ(mount("/usr/vorn/mounted", GetParam().path.c_str(), nullptr, MS_BIND, nullptr), 0);
    EXPECT_EQ(GetParam().add("eth1"), 0);
    EXPECT_EQ(umount2(GetParam().path.c_str(), MNT_DETACH), 0);
    EXPECT_EQ(ReadFile("/usr/vorn/mounted"), "eth0\neth1\n");
    EXPECT_THAT(ListFolder(kStateFolder), ElementsAre(GetParam().FileName()));
}

TEST_P(SavedNames, GoThroughASymbolicLink)
{
    const RecordingPlatform platform;
    WriteFile("/usr/vorn/target", "eth0\nand what is longer than the new text\n");
    fs::create_symlink("/usr/vorn/target", GetParam().path);
    EXPECT_EQ(GetParam().remove("and what is longer than the new text"), 0);
    EXPECT_TRUE(fs::is_symlink(GetParam().path));
    EXPECT_EQ(ReadFile("/usr/vorn/target"), "eth0\n");
    EXPECT_THAT(ListFolder("/usr/vorn"), ElementsAre("etc", "target"));
    EXPECT_THAT(ListFolder(kStateFolder), ElementsAre(GetParam().FileName()));
}

TEST_P(SavedNames, GoThroughASymbolicLinkToNothing)
{
    const RecordingPlatform platform;
    fs::create_symlink("/usr/vorn/target", GetParam().path);
    EXPECT_EQ(GetParam().add("eth0"), 0);
    EXPECT_TRUE(fs::is_symlink(GetParam().path));
    EXPECT_EQ(ReadFile("/usr/vorn/target"), "eth0\n");
}

TEST_P(SavedNames, GoIntoAFifoThatSomebodyReads)
{
    RecordingPlatform platform;
    ASSERT_EQ(mkfifo(GetParam().path.c_str(), 0600), 0);
    const int reader = open(GetParam().path.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC);
    ASSERT_GE(reader, 0);
    platform.Answer("VLIBCFileExist", 0);
    EXPECT_EQ(GetParam().add("eth0"), 0);
    std::array<char, 64> text{};
    EXPECT_EQ(read(reader, text.data(), text.size()), 5);
    EXPECT_STREQ(text.data(), "eth0\n");
    (void)close(reader);
    EXPECT_TRUE(fs::is_fifo(GetParam().path));
}

TEST_P(SavedNames, DoNotWaitForAFifosReader)
{
    RecordingPlatform platform;
    ASSERT_EQ(mkfifo(GetParam().path.c_str(), 0600), 0);
    platform.Answer("VLIBCFileExist", 0);
    EXPECT_EQ(GetParam().add("eth0"), -1);
    EXPECT_EQ(platform.Log(), GetParam().Refused(GetParam().addFails));
}

TEST_P(SavedNames, AreNotReadFromADeviceWithoutAnEnd)
{
    const RecordingPlatform platform;
    fs::create_symlink("/dev/zero", GetParam().path);
    EXPECT_EQ(VORN::OVS::OVSRegConf().LoadFromConfig(),
              GetParam().path == unit::kRegistry ? -1 : 0);
    EXPECT_EQ(VORN::OVS::OVSIfsConf(GetParam().path).LoadFromConfig(), -1);
}

TEST_P(SavedNames, AreRefusedByAFolderOfThatName)
{
    RecordingPlatform platform;
    fs::create_directory(GetParam().path);
    platform.Answer("VLIBCFileExist", 0);
    EXPECT_EQ(GetParam().add("eth0"), -1);
    EXPECT_EQ(platform.Log(), GetParam().Refused(GetParam().addFails));
}

TEST_P(SavedNames, AreRefusedByAReadOnlyFile)
{
    const RecordingPlatform platform;
    WriteFile(GetParam().path, "eth0\n");
    ASSERT_EQ(chmod(GetParam().path.c_str(), 0444), 0);
    {
        const ScopedWithoutOverride unprivileged;
        EXPECT_EQ(GetParam().add("eth1"), -1);
    }
    EXPECT_EQ(platform.Log(), GetParam().Refused(GetParam().addFails));
    EXPECT_EQ(ReadFile(GetParam().path), "eth0\n");
    EXPECT_THAT(ListFolder(kStateFolder), ElementsAre(GetParam().FileName()));
}

TEST_P(SavedNames, AreRefusedByAReadOnlyFileAsTheLastOneLeaves)
{
    const RecordingPlatform platform;
    WriteFile(GetParam().path, "eth0\n");
    ASSERT_EQ(chmod(GetParam().path.c_str(), 0444), 0);
    {
        const ScopedWithoutOverride unprivileged;
        EXPECT_EQ(GetParam().remove("eth0"), -1);
    }
    EXPECT_EQ(platform.Log(), GetParam().Refused(GetParam().removeFails));
    EXPECT_EQ(ReadFile(GetParam().path), "eth0\n");
}

TEST_P(SavedNames, AreRefusedByAReadOnlyFolderThatHasNoSuchFile)
{
    const RecordingPlatform platform;
    ASSERT_EQ(chmod(kStateFolder, 0555), 0);
    {
        const ScopedWithoutOverride unprivileged;
        EXPECT_EQ(GetParam().add("eth0"), -1);
    }
    EXPECT_EQ(platform.Log(), GetParam().Refused(GetParam().addFails));
    EXPECT_THAT(ListFolder(kStateFolder), IsEmpty());
}

TEST_P(SavedNames, AreWrittenInPlaceInAReadOnlyFolderWhoseFileCanBeWritten)
{
    const RecordingPlatform platform;
    WriteFile(GetParam().path, "eth0\n");
    ASSERT_EQ(chmod(kStateFolder, 0555), 0);
    {
        const ScopedWithoutOverride unprivileged;
        EXPECT_EQ(GetParam().add("eth1"), 0);
    }
    EXPECT_EQ(platform.Log(), LogLines{});
    EXPECT_EQ(ReadFile(GetParam().path), "eth0\neth1\n");
    EXPECT_THAT(ListFolder(kStateFolder), ElementsAre(GetParam().FileName()));
}

TEST_P(SavedNames, AreRefusedByAReadOnlyFileSystem)
{
    const RecordingPlatform platform;
    ScopedMount disk(kStateFolder, "size=1m");
    WriteFile(GetParam().path, "eth0\n");
    disk.MakeReadOnly();
    EXPECT_EQ(GetParam().add("eth1"), -1);
    EXPECT_EQ(GetParam().remove("eth0"), -1);
    LogLines expected = GetParam().Refused(GetParam().addFails);
    const LogLines removal = GetParam().Refused(GetParam().removeFails);
    expected.insert(expected.end(), removal.begin(), removal.end());
    EXPECT_EQ(platform.Log(), expected);
    EXPECT_EQ(ReadFile(GetParam().path), "eth0\n");
}

TEST_P(SavedNames, AreRefusedWhereTheFileCannotEvenBeLookedAt)
{
    RecordingPlatform platform;
    fs::remove(kStateFolder);
    WriteFile(kStateFolder, "no folder");
    platform.Answer("VLIBCFileCheckDir", 1);
    EXPECT_EQ(GetParam().add("eth0"), -1);
    EXPECT_EQ(platform.Log(), GetParam().Refused(GetParam().addFails));
}

TEST_P(SavedNames, LeaveStrangersFilesAlone)
{
    const RecordingPlatform platform;
    const std::string stranger = GetParam().path + "." + std::to_string(gettid()) + ".0";
    WriteFile(stranger, "not ours\n");
    EXPECT_EQ(GetParam().add("eth0"), 0);
    EXPECT_EQ(ReadFile(GetParam().path), "eth0\n");
    EXPECT_EQ(ReadFile(stranger), "not ours\n");
    EXPECT_EQ(ListFolder(kStateFolder).size(), 2U);
}

TEST_P(SavedNames, LeaveTheFolderSyncedWhenTheLastOneLeaves)
{
    const RecordingPlatform platform;
    WriteFile(GetParam().path, "eth0\n");
    const FileCalls calls;
    EXPECT_EQ(GetParam().remove("eth0"), 0);
    EXPECT_THAT(calls.List(), ElementsAre("unlink " + GetParam().FileName(), "fsync vornovs"));
    EXPECT_THAT(ListFolder(kStateFolder), IsEmpty());
}

TEST_P(SavedNames, LeaveAnEmptyFileWhenTheLastOneLeavesAndItCannotBeDeleted)
{
    const RecordingPlatform platform;
    WriteFile(GetParam().path, "eth0\n");
    ASSERT_EQ(chmod(kStateFolder, 0555), 0);
    {
        const ScopedWithoutOverride unprivileged;
        EXPECT_EQ(GetParam().remove("eth0"), 0);
    }
    EXPECT_EQ(ReadFile(GetParam().path), "");
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST_P(SavedNames, EmptyALinksTargetAndDeleteTheLinkWhenTheLastOneLeaves)
{
    const RecordingPlatform platform;
    WriteFile("/usr/vorn/target", "eth0\n");
    fs::create_symlink("/usr/vorn/target", GetParam().path);
    EXPECT_EQ(GetParam().remove("eth0"), 0);
    EXPECT_THAT(ListFolder(kStateFolder), IsEmpty());
    EXPECT_EQ(ReadFile("/usr/vorn/target"), "");
}

TEST(SavedNamesWithoutAFolder, GoIntoTheWorkingFolder)
{
    const RecordingPlatform platform;
    const fs::path before = fs::current_path();
    fs::current_path("/usr/vorn");
    const FileCalls calls;
    EXPECT_EQ(VORN::OVS::OVSIfsConf("names").Write("eth0"), 0);
    EXPECT_EQ(calls.List().back(), "fsync vorn");
    EXPECT_EQ(ReadFile("/usr/vorn/names"), "eth0\n");
    fs::current_path(before);
}

} // namespace
