#include "scene.h"

#include "support/atomicfile.h"

#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <sys/stat.h>
#include <unistd.h>

namespace {

using scene::ReadFile;
using scene::WriteFile;
using testing::ElementsAre;
using vornhost::ReplaceFile;

class ReplacingAFile : public testing::Test {
protected:
    void SetUp() override { scene::MakeFolder(m_folder); }
    void TearDown() override
    {
        for (const std::string& name : scene::Names(m_folder)) {
            ::unlink((m_folder + "/" + name).c_str());
            ::rmdir((m_folder + "/" + name).c_str());
        }
    }

    const std::string m_folder = "/tmp/replaced";
    const std::string m_path = m_folder + "/file";
};

TEST_F(ReplacingAFile, MakesItWithExactlyTheMode)
{
    const mode_t mask = ::umask(077);
    EXPECT_TRUE(ReplaceFile(m_path, "text", 0664));
    ::umask(mask);
    EXPECT_EQ(ReadFile(m_path), "text");
    struct stat status {};
    ASSERT_EQ(::stat(m_path.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777, 0664U);
    EXPECT_THAT(scene::Names(m_folder), ElementsAre("file"));
}

TEST_F(ReplacingAFile, KeepsItsMode)
{
    WriteFile(m_path, "old");
    ASSERT_EQ(::chmod(m_path.c_str(), 0604), 0);
    EXPECT_TRUE(ReplaceFile(m_path, "", 0644));
    EXPECT_EQ(ReadFile(m_path), "");
    struct stat status {};
    ASSERT_EQ(::stat(m_path.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777, 0604U);
}

TEST_F(ReplacingAFile, KeepsItsOwner)
{
    WriteFile(m_path, "old");
    if (::chown(m_path.c_str(), 65534, 65533) != 0) {
        GTEST_SKIP() << "only root can give a file to another user; run the tests as root";
    }
    EXPECT_TRUE(ReplaceFile(m_path, "new", 0644));
    struct stat status {};
    ASSERT_EQ(::stat(m_path.c_str(), &status), 0);
    EXPECT_EQ(status.st_uid, 65534U);
    EXPECT_EQ(status.st_gid, 65533U);
}

TEST_F(ReplacingAFile, ReplacesWhatALinkPointsAt)
{
    WriteFile(m_folder + "/real", "old");
    ASSERT_EQ(::symlink("real", m_path.c_str()), 0);
    EXPECT_TRUE(ReplaceFile(m_path, "new", 0644));
    EXPECT_EQ(ReadFile(m_folder + "/real"), "new");
    struct stat status {};
    ASSERT_EQ(::lstat(m_path.c_str(), &status), 0);
    EXPECT_TRUE(S_ISLNK(status.st_mode));
}

TEST_F(ReplacingAFile, RefusesWhatIsNoFile)
{
    ASSERT_EQ(::symlink("missing", m_path.c_str()), 0);
    EXPECT_FALSE(ReplaceFile(m_path, "new", 0644));
    EXPECT_EQ(errno, ENOENT);
    EXPECT_FALSE(ReplaceFile(m_folder, "new", 0644));
    EXPECT_EQ(errno, EISDIR);
    const std::string fifo = m_folder + "/fifo";
    ASSERT_EQ(::mkfifo(fifo.c_str(), 0600), 0);
    EXPECT_FALSE(ReplaceFile(fifo, "new", 0644));
    EXPECT_FALSE(ReplaceFile(m_folder + "/missing/file", "new", 0644));
    EXPECT_EQ(errno, ENOENT);
    EXPECT_THAT(scene::Names(m_folder), ElementsAre("fifo", "file"));
    EXPECT_FALSE(scene::Exists("/tmp/.vornovs-XXXXXX"));
}

TEST_F(ReplacingAFile, TakesAPathOfTheWorkingFolder)
{
    ASSERT_EQ(::chdir(m_folder.c_str()), 0);
    EXPECT_TRUE(ReplaceFile("file", "text", 0644));
    EXPECT_EQ(ReadFile(m_path), "text");
    ASSERT_EQ(::chdir("/"), 0);
}

} // namespace
