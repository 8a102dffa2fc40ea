#include "scene.h"

#include "sandbox/systemlog.h"

#include <filesystem>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <sys/stat.h>
#include <unistd.h>
#include <vornplatform/hook.h>

namespace {

using scene::MakeScript;
using scene::ReadFile;
using scene::WriteFile;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using vornnetsdk::hook::BaseHook;

const std::string kFolder = "/usr/vorn/etc/hooks/net/ovs_change";
constexpr char kRefused[] = "is not run: it is no regular file that only root can change";

class Hook : public testing::Test {
protected:
    void SetUp() override
    {
        std::filesystem::remove_all("/usr/vorn/etc");
        std::filesystem::remove_all("/tmp/ran");
        scene::MakeFolder(kFolder);
    }

    /** A program of the hook that notes down that it ran. */
    static std::string Make(const std::string& name, const std::string& more = "")
    {
        return MakeScript(kFolder + "/" + name, "echo " + name + " >> /tmp/ran\n" + more);
    }

    static std::string Ran() { return ReadFile("/tmp/ran"); }

    BaseHook m_hook{"net", "net/ovs_change"};
};

TEST_F(Hook, RunsItsProgramsInTheOrderOfTheirNames)
{
    for (const char* name : {"20-b", "10-a", "9", "B", "a"}) {
        Make(name);
    }
    EXPECT_TRUE(m_hook.IsValid());
    EXPECT_EQ(m_hook.ExecHook(SDK_PLUGIN_ACTION_BEGIN), 0);
    EXPECT_EQ(Ran(), "10-a\n20-b\n9\nB\na\n");
}

TEST_F(Hook, GivesItsProgramsAnEnvironmentOfItsOwn)
{
    ASSERT_EQ(::setenv("LD_PRELOAD", "", 1), 0);
    Make("env", "/usr/bin/env -u PWD | sort > /tmp/environment");
    EXPECT_EQ(m_hook.SetEnv("ACTION", "delete"), 0);
    EXPECT_EQ(m_hook.SetEnv("EMPTY", ""), 0);
    EXPECT_EQ(m_hook.SetEnv("ACTION", "create"), 0);
    EXPECT_EQ(m_hook.ExecHook(SDK_PLUGIN_ACTION_DONE), 0);
    EXPECT_EQ(ReadFile("/tmp/environment"), "ACTION=create\n"
                                            "EMPTY=\n"
                                            "HOOK_ACTION=5\n"
                                            "HOOK_CATEGORY=net\n"
                                            "HOOK_NAME=net/ovs_change\n"
                                            "LC_ALL=C\n"
                                            "PATH=/usr/sbin:/usr/bin:/sbin:/bin\n");
}

TEST_F(Hook, RefusesVariablesThatAreNone)
{
    EXPECT_LT(m_hook.SetEnv("", "x"), 0);
    EXPECT_LT(m_hook.SetEnv("A=B", "x"), 0);
    EXPECT_LT(m_hook.SetEnv(std::string("A\0B", 3), "x"), 0);
    EXPECT_LT(m_hook.SetEnv("A", std::string("x\0y", 3)), 0);
}

TEST_F(Hook, RunsAProgramThatIsNoScriptWithoutItsDescriptor)
{
    std::filesystem::copy("/bin/ls", kFolder + "/ls");
    Make("script", "ls /proc/self/fd > /tmp/descriptors");
    EXPECT_EQ(m_hook.ExecHook(SDK_PLUGIN_ACTION_BEGIN), 0);
    EXPECT_EQ(Ran(), "script\n");
}

TEST_F(Hook, WithoutAFolderHasNothingToDo)
{
    harness::SystemLog log;
    std::filesystem::remove_all(kFolder);
    EXPECT_EQ(m_hook.ExecHook(SDK_PLUGIN_ACTION_BEGIN), 0);
    scene::MakeFolder(kFolder);
    EXPECT_EQ(m_hook.ExecHook(SDK_PLUGIN_ACTION_BEGIN), 0);
    EXPECT_THAT(log.Lines(), IsEmpty());
}

TEST_F(Hook, LeavesOutInSilenceWhatIsHiddenOrNotExecutable)
{
    harness::SystemLog log;
    Make(".hidden");
    WriteFile(kFolder + "/README", "A note.\n");
    Make("program");
    EXPECT_EQ(m_hook.ExecHook(SDK_PLUGIN_ACTION_BEGIN), 0);
    EXPECT_EQ(Ran(), "program\n");
    EXPECT_THAT(log.Lines(), IsEmpty());
}

TEST_F(Hook, RefusesAProgramThatOthersCanChangeAndRunsTheRest)
{
    harness::SystemLog log;
    for (const auto& [name, mode] : {std::pair{"1-group", 0775}, std::pair{"2-others", 0757}}) {
        ASSERT_EQ(::chmod(Make(name).c_str(), static_cast<mode_t>(mode)), 0);
    }
    ASSERT_EQ(::symlink("/bin/true", (kFolder + "/3-link").c_str()), 0);
    scene::MakeFolder(kFolder + "/4-folder");
    Make("5-good");
    EXPECT_LT(m_hook.ExecHook(SDK_PLUGIN_ACTION_BEGIN), 0);
    EXPECT_EQ(Ran(), "5-good\n");
    EXPECT_THAT(log.Lines(), ElementsAre("3 " + kFolder + "/1-group " + kRefused,
                                         "3 " + kFolder + "/2-others " + kRefused,
                                         "3 " + kFolder + "/3-link " + kRefused,
                                         "3 " + kFolder + "/4-folder " + kRefused));
}

TEST_F(Hook, RefusesAProgramOfAnotherUser)
{
    harness::SystemLog log;
    if (::chown(Make("program").c_str(), 65534, 65534) != 0) {
        GTEST_SKIP() << "only root can give a file to another user; run the tests as root";
    }
    EXPECT_LT(m_hook.ExecHook(SDK_PLUGIN_ACTION_BEGIN), 0);
    EXPECT_EQ(Ran(), "");
    EXPECT_THAT(log.Lines(), ElementsAre("3 " + kFolder + "/program " + kRefused));
}

TEST_F(Hook, RefusesEverythingBelowAFolderThatOthersCanChange)
{
    Make("program");
    for (const char* folder : {"/", "/usr", "/usr/vorn", "/usr/vorn/etc/hooks", kFolder.c_str()}) {
        harness::SystemLog log;
        ASSERT_EQ(::chmod(folder, 0777), 0);
        EXPECT_LT(m_hook.ExecHook(SDK_PLUGIN_ACTION_BEGIN), 0) << folder;
        ASSERT_EQ(::chmod(folder, 0755), 0);
        EXPECT_THAT(log.Lines(), ElementsAre(HasSubstr("others than root can change it")))
            << folder;
    }
    EXPECT_EQ(Ran(), "");
    EXPECT_EQ(m_hook.ExecHook(SDK_PLUGIN_ACTION_BEGIN), 0);
    EXPECT_EQ(Ran(), "program\n");
}

TEST_F(Hook, RefusesAFolderBehindALink)
{
    Make("program");
    std::filesystem::rename("/usr/vorn/etc/hooks/net", "/usr/vorn/etc/elsewhere");
    std::filesystem::create_symlink("/usr/vorn/etc/elsewhere", "/usr/vorn/etc/hooks/net");
    EXPECT_LT(m_hook.ExecHook(SDK_PLUGIN_ACTION_BEGIN), 0);
    EXPECT_EQ(Ran(), "");
}

TEST_F(Hook, LogsAProgramThatFailsAndRunsTheRest)
{
    harness::SystemLog log;
    Make("1-bad", "echo broken >&2; exit 2");
    Make("2-good");
    EXPECT_LT(m_hook.ExecHook(SDK_PLUGIN_ACTION_BEGIN), 0);
    EXPECT_EQ(Ran(), "1-bad\n2-good\n");
    EXPECT_THAT(log.Lines(), ElementsAre("4 " + kFolder + "/1-bad: broken",
                                         "4 " + kFolder + "/1-bad: failed with exit status 2"));
}

TEST_F(Hook, HasANameThatLeadsNowhereElse)
{
    scene::MakeFolder("/usr/vorn/etc/outside");
    MakeScript("/usr/vorn/etc/outside/program", "echo outside >> /tmp/ran");
    for (const char* name : {"../outside", "", "/", "net//ovs_change", "./net", "net/", ".."}) {
        BaseHook hook("net", name);
        EXPECT_FALSE(hook.IsValid()) << name;
        EXPECT_LT(hook.ExecHook(SDK_PLUGIN_ACTION_BEGIN), 0) << name;
    }
    EXPECT_EQ(Ran(), "");
}

} // namespace
