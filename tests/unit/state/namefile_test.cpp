// How both stores save: what a reader, a crash and a full disk find. The two classes share the
// code and each test is run for both.
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
using unit::LongName;
using unit::ReadFile;
using unit::Registry;
using unit::SavedNames;
using unit::ScopedMount;
using unit::ScopedWithoutOverride;
using unit::StatusOf;
using unit::WriteFile;

namespace fs = std::filesystem;

namespace {

INSTANTIATE_TEST_SUITE_P(Both, SavedNames, testing::Values(Registry(), InterfaceList()),
                         [](const auto& test) { return test.param.name; });

TEST_P(SavedNames, AreWrittenBesideSyncedAndRenamed)
{
    const RecordingPlatform platform;
    const FileCalls calls;
    EXPECT_EQ(GetParam().add("eth0"), 0);
    const std::string temporary = GetParam().FileName() + ".new";
    EXPECT_THAT(calls.List(),
                ElementsAre("fsync " + temporary,
                            "rename " + temporary + " " + GetParam().FileName(), "fsync vornovs"));
    EXPECT_EQ(ReadFile(GetParam().path), "eth0\n");
    EXPECT_THAT(ListFolder(kStateFolder), ElementsAre(GetParam().FileName()));
}

TEST_P(SavedNames, TakeOverWhatAKilledClientLeftBeside)
{
    const RecordingPlatform platform;
    WriteFile(GetParam().path + ".new", "a long name that was being written when the client\n");
    EXPECT_EQ(GetParam().add("eth0"), 0);
    EXPECT_EQ(ReadFile(GetParam().path), "eth0\n");
    EXPECT_THAT(ListFolder(kStateFolder), ElementsAre(GetParam().FileName()));
}

TEST_P(SavedNames, LeaveTheFileThatAnotherClientIsWriting)
{
    const RecordingPlatform platform;
    const std::string beside = GetParam().path + ".new";
    WriteFile(beside, "eth9\n");
    const int other = open(beside.c_str(), O_WRONLY | O_CLOEXEC);
    ASSERT_EQ(flock(other, LOCK_EX | LOCK_NB), 0);
    EXPECT_EQ(GetParam().add("eth0"), 0);
    (void)close(other);
    EXPECT_EQ(ReadFile(GetParam().path), "eth0\n");
    EXPECT_EQ(ReadFile(beside), "eth9\n");
    EXPECT_THAT(ListFolder(kStateFolder),
                ElementsAre(GetParam().FileName(), GetParam().FileName() + ".new"));
}

/** Files beside the store's that other clients are writing, as many as are looked at. */
class HundredWriters {
public:
    explicit HundredWriters(const std::string& path)
    {
        for (std::size_t at = 0; at < m_files.size(); ++at) {
            const std::string file = path + ".new" + (at == 0 ? "" : std::to_string(at));
            m_files[at] = open(file.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0600);
            EXPECT_EQ(flock(m_files[at], LOCK_EX | LOCK_NB), 0) << file;
        }
    }
    ~HundredWriters()
    {
        for (const int file : m_files) {
            (void)close(file);
        }
    }
    HundredWriters(const HundredWriters&) = delete;
    HundredWriters& operator=(const HundredWriters&) = delete;

private:
    std::array<int, 100> m_files{};
};

TEST_P(SavedNames, StayAsTheyWereBesideAHundredWriters)
{
    const RecordingPlatform platform;
    WriteFile(GetParam().path, "a\n");
    const HundredWriters writers(GetParam().path);
    EXPECT_EQ(GetParam().add("b"), 0);
    EXPECT_EQ(ReadFile(GetParam().path), "a\n");
}

TEST_P(SavedNames, AreRefusedBesideAHundredWritersWhenThereWasNoFile)
{
    const RecordingPlatform platform;
    const HundredWriters writers(GetParam().path);
    EXPECT_EQ(GetParam().add("b"), -1);
    EXPECT_EQ(ReadFile(GetParam().path), std::nullopt);
}

TEST_P(SavedNames, TakeTheNewFilesModeFromTheUmask)
{
    const RecordingPlatform platform;
    const mode_t mask = umask(027);
    EXPECT_EQ(GetParam().add("eth0"), 0);
    (void)umask(mask);
    EXPECT_EQ(StatusOf(GetParam().path).st_mode, S_IFREG | 0640U);
}

TEST_P(SavedNames, KeepOwnerAndModeOfTheFileButNotTheFile)
{
    const RecordingPlatform platform;
    WriteFile(GetParam().path, "eth0\n");
    ASSERT_EQ(chown(GetParam().path.c_str(), 0, 0), 0);
    ASSERT_EQ(chmod(GetParam().path.c_str(), 0606), 0);
    // A second group exists only where the sandbox did not have to make itself root.
    const bool otherOwner = chown(GetParam().path.c_str(), 12, 34) == 0;
    const struct stat before = StatusOf(GetParam().path);
    EXPECT_EQ(GetParam().add("eth1"), 0);
    const struct stat after = StatusOf(GetParam().path);
    EXPECT_NE(after.st_ino, before.st_ino);
    EXPECT_EQ(after.st_mode, S_IFREG | 0606U);
    EXPECT_EQ(after.st_uid, otherOwner ? 12U : 0U);
    EXPECT_EQ(after.st_gid, otherOwner ? 34U : 0U);
    EXPECT_EQ(ReadFile(GetParam().path), "eth0\neth1\n");
}

TEST_P(SavedNames, LeaveAReaderOfTheOldFileTheOldNames)
{
    const RecordingPlatform platform;
    WriteFile(GetParam().path, "eth0\n");
    const int reader = open(GetParam().path.c_str(), O_RDONLY | O_CLOEXEC);
    ASSERT_GE(reader, 0);
    EXPECT_EQ(GetParam().add("eth1"), 0);
    std::array<char, 64> text{};
    EXPECT_EQ(read(reader, text.data(), text.size()), 5);
    EXPECT_STREQ(text.data(), "eth0\n");
    (void)close(reader);
}

TEST_P(SavedNames, ReplaceAHardLinkedFileWithoutChangingTheOther)
{
    const RecordingPlatform platform;
    WriteFile("/usr/vorn/other", "eth0\n");
    fs::create_hard_link("/usr/vorn/other", GetParam().path);
    EXPECT_EQ(GetParam().add("eth1"), 0);
    EXPECT_EQ(ReadFile("/usr/vorn/other"), "eth0\n");
}

TEST_P(SavedNames, AreNotCutByShortOrInterruptedWrites)
{
    const RecordingPlatform platform;
    FileCalls calls;
    calls.WriteSingleBytes();
    calls.Fail("write", EINTR, 3);
    EXPECT_EQ(GetParam().add("eth0"), 0);
    EXPECT_EQ(ReadFile(GetParam().path), "eth0\n");
}

TEST_P(SavedNames, StayAsTheyWereOnAFullDisk)
{
    const RecordingPlatform platform;
    const ScopedMount disk(kStateFolder, "size=8k");
    WriteFile(GetParam().path, "eth0\n");
    EXPECT_EQ(GetParam().add(LongName()), 0);
    EXPECT_EQ(ReadFile(GetParam().path), "eth0\n");
    EXPECT_THAT(ListFolder(kStateFolder), ElementsAre(GetParam().FileName()));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST_P(SavedNames, LeaveNoFileWhenTheDiskIsFullAndThereWasNone)
{
    const RecordingPlatform platform;
    const ScopedMount disk(kStateFolder, "size=4k");
    EXPECT_EQ(GetParam().add(LongName()), 0);
    EXPECT_THAT(ListFolder(kStateFolder), IsEmpty());
}

TEST_P(SavedNames, StayAsTheyWereWhenNoFileFitsBeside)
{
    const RecordingPlatform platform;
    const ScopedMount disk(kStateFolder, "nr_inodes=2"); // the folder's and the file's
    WriteFile(GetParam().path, "eth0\n");
    EXPECT_EQ(GetParam().add("eth1"), 0);
    EXPECT_EQ(ReadFile(GetParam().path), "eth0\n");
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST_P(SavedNames, StayAsTheyWereWhenSyncOrRenameFails)
{
    for (const char* function : {"fsync", "rename"}) {
        const RecordingPlatform platform;
        WriteFile(GetParam().path, "eth0\n");
        FileCalls calls;
        calls.Fail(function, EIO, 1);
        EXPECT_EQ(GetParam().add("eth1"), 0) << function;
        EXPECT_EQ(ReadFile(GetParam().path), "eth0\n") << function;
        EXPECT_THAT(ListFolder(kStateFolder), ElementsAre(GetParam().FileName())) << function;
        EXPECT_THAT(platform.Log(), IsEmpty()) << function;
    }
}

TEST_P(SavedNames, StayAsTheyWereWhenTheirReplacementCannotBeTaken)
{
    for (const std::string function : {"flock", "fstat", "lstat", "ftruncate"}) {
        const RecordingPlatform platform;
        WriteFile(GetParam().path, "eth0\n");
        FileCalls calls;
        calls.Watch(
            [&](const std::string& call) {
                return call.starts_with(function) && call.ends_with(".new") ? EIO : 0;
            },
            {});
        EXPECT_EQ(GetParam().add("eth1"), 0) << function;
        EXPECT_EQ(ReadFile(GetParam().path), "eth0\n") << function;
        EXPECT_THAT(ListFolder(kStateFolder), ElementsAre(GetParam().FileName())) << function;
    }
}

TEST_P(SavedNames, AreWrittenBesideAReplacementThatAnotherWriterHas)
{
    const std::string theirs = GetParam().path + ".new";
    for (const bool gone : {true, false}) {
        const RecordingPlatform platform;
        WriteFile(GetParam().path, "eth0\n");
        FileCalls calls;
        calls.Watch(
            [&](const std::string& call) {
                if (gone && call == "lstat " + theirs) {
                    return ENOENT;
                }
                if (!gone && call == "flock " + theirs) {
                    fs::rename(theirs, theirs + "-away");
                    WriteFile(theirs, "");
                }
                return 0;
            },
            {});
        EXPECT_EQ(GetParam().add("eth1"), 0);
        EXPECT_EQ(ReadFile(GetParam().path), "eth0\neth1\n");
        EXPECT_TRUE(fs::remove(theirs));
        fs::remove(theirs + "-away");
    }
}

TEST_P(SavedNames, AreWrittenInPlaceWhereOwnerOrModeCannotBeKept)
{
    for (const char* function : {"fchown", "fchmod"}) {
        const RecordingPlatform platform;
        fs::remove(GetParam().path);
        WriteFile(GetParam().path, "eth0\n");
        const struct stat before = StatusOf(GetParam().path);
        FileCalls calls;
        calls.Fail(function, EPERM);
        EXPECT_EQ(GetParam().add("eth1"), 0) << function;
        EXPECT_EQ(ReadFile(GetParam().path), "eth0\neth1\n") << function;
        EXPECT_EQ(StatusOf(GetParam().path).st_ino, before.st_ino) << function;
        EXPECT_THAT(ListFolder(kStateFolder), ElementsAre(GetParam().FileName())) << function;
        EXPECT_THAT(platform.Log(), IsEmpty()) << function;
    }
}

TEST_P(SavedNames, AreSavedInAFolderThatCannotBeSynced)
{
    const RecordingPlatform platform;
    FileCalls calls;
    calls.Fail("fsync", EINVAL, 2);
    EXPECT_EQ(GetParam().add("eth0"), 0);
    EXPECT_EQ(ReadFile(GetParam().path), "eth0\n");
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST_P(SavedNames, AreSavedInAFolderThatCannotBeRead)
{
    const RecordingPlatform platform;
    ASSERT_EQ(chmod(kStateFolder, 0333), 0);
    {
        const ScopedWithoutOverride unprivileged;
        EXPECT_EQ(GetParam().add("eth0"), 0);
    }
    EXPECT_EQ(ReadFile(GetParam().path), "eth0\n");
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST_P(SavedNames, AreReadWholeWhateverSignalsCome)
{
    const RecordingPlatform platform;
    WriteFile(GetParam().path, "eth0\n");
    FileCalls calls;
    calls.Fail("read", EINTR, 1);
    EXPECT_EQ(GetParam().add("eth1"), 0);
    EXPECT_EQ(ReadFile(GetParam().path), "eth0\neth1\n");
}

TEST_P(SavedNames, AreReadUpToAnError)
{
    const RecordingPlatform platform;
    WriteFile(GetParam().path, "eth0\n");
    FileCalls calls;
    calls.Fail("read", EIO, 1);
    EXPECT_EQ(GetParam().add("eth1"), 0);
    EXPECT_EQ(ReadFile(GetParam().path), "eth1\n");
    EXPECT_THAT(platform.Log(), IsEmpty());
}

} // namespace
