// How both stores save: what a reader, a crash and a full disk find. The two classes share the
// code and each test is run for both.
#include <vornovs/vornovs.h>

#include "support/filecalls.h"
#include "support/support.h"

#include <array>
#include <cerrno>
#include <filesystem>
#include <functional>
#include <ostream>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <unistd.h>

using harness::Err;
using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::MatchesRegex;
using unit::FileCalls;
using unit::kInterfaceList;
using unit::kRegistry;
using unit::kStateFolder;
using unit::ListFolder;
using unit::LogLines;
using unit::LongName;
using unit::ReadFile;
using unit::ScopedMount;
using unit::ScopedWithoutOverride;
using unit::WriteFile;

namespace fs = std::filesystem;

namespace {

struct Store {
    std::string name;
    std::string path;
    /** Loads, adds the name, saves. */
    std::function<int(const std::string&)> add;
    /** Loads, removes the name, saves. */
    std::function<int(const std::string&)> remove;
    std::string source;
    std::string addFails;
    std::string removeFails;

    [[nodiscard]] std::string FileName() const { return fs::path(path).filename(); }

    [[nodiscard]] LogLines Refused(const std::string& then) const
    {
        LogLines lines{Err(source, " Open " + path + " fails")};
        if (!then.empty()) {
            lines.push_back(Err(source, then));
        }
        return lines;
    }

    friend void PrintTo(const Store& store, std::ostream* out) { *out << store.name; }
};

int AddToRegistry(const std::string& name)
{
    VORN::OVS::OVSRegConf store;
    (void)store.LoadFromConfig();
    return store.Register(name);
}

int RemoveFromRegistry(const std::string& name)
{
    VORN::OVS::OVSRegConf store;
    (void)store.LoadFromConfig();
    return store.UnRegister(name);
}

Store Registry()
{
    return {"Registry", kRegistry, AddToRegistry, RemoveFromRegistry, "regconf.cpp", "", ""};
}

Store InterfaceList()
{
    return {
        "InterfaceList",
        kInterfaceList,
        [](const std::string& name) { return VORN::OVS::OVSIfsConf(kInterfaceList).Write(name); },
        [](const std::string& name) { return VORN::OVS::OVSIfsConf(kInterfaceList).Remove(name); },
        "ifsconf.cpp",
        std::string("Failed to write to config ") + kInterfaceList,
        "Failed to wrtie the config"};
}

class SavedNames : public testing::TestWithParam<Store> {};

INSTANTIATE_TEST_SUITE_P(Both, SavedNames, testing::Values(Registry(), InterfaceList()),
                         [](const auto& test) { return test.param.name; });

struct stat StatusOf(const std::string& path)
{
    struct stat status {};
    EXPECT_EQ(lstat(path.c_str(), &status), 0) << path;
    return status;
}

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
