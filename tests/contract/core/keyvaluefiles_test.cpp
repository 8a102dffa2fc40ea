#include "scene.h"

#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <sys/mount.h>
#include <vornplatform/core.h>

namespace {

using scene::ReadFile;
using scene::WriteFile;
using testing::ElementsAre;

TEST(KeyValueFiles, AreAsTheyWereWhenTheDiskIsFull)
{
    const std::string folder = "/usr/vorn/small";
    const std::string path = folder + "/ifcfg-eth0";
    scene::MakeFolder(folder);
    ASSERT_EQ(::mount("small", folder.c_str(), "tmpfs", 0, "size=16k"), 0);
    WriteFile(path, "A=1\n");
    WriteFile(folder + "/filler", std::string(8192, 'x'));
    EXPECT_LT(VLIBCFileSetKeyValue(path.c_str(), "B", std::string(8000, 'x').c_str(), 0), 0);
    EXPECT_EQ(ReadFile(path), "A=1\n");
    EXPECT_THAT(scene::Names(folder), ElementsAre("filler", "ifcfg-eth0"));
    EXPECT_EQ(::umount(folder.c_str()), 0);
}

TEST(KeyValueFiles, ExistOrNot)
{
    EXPECT_EQ(VLIBCFileExist("/sys/class/net/lo/flags"), 1);
    EXPECT_EQ(VLIBCFileExist("/etc"), 1);
    EXPECT_EQ(VLIBCFileExist("/sys/class/net/nosuch/flags"), 0);
    EXPECT_EQ(VLIBCFileExist(nullptr), 0);
    EXPECT_NE(VLIBCFileCheckDir("/usr/vorn"), 0);
    EXPECT_EQ(VLIBCFileCheckDir("/etc/passwd"), 0);
    EXPECT_EQ(VLIBCFileCheckDir("/usr/vorn/missing"), 0);
    EXPECT_EQ(VLIBCFileCheckDir(nullptr), 0);
}

} // namespace
