#include "scene.h"

#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>
#include <vornplatform/core.h>

namespace {

using scene::MakeScript;
using scene::ReadFile;
using scene::WriteFile;

constexpr char kService[] = "vornovs-db";
constexpr char kScript[] = "/etc/init.d/vornovs-db";
constexpr char kPidFile[] = "/run/db.pid";

/** A script whose statements name this very process. */
void MakeService(const std::string& processName)
{
    MakeScript(kScript, "# pidfile: " + std::string(kPidFile) + "\n# processname: " + processName +
                            "\necho \"$@\" >> /tmp/verbs\nexit 0");
}

class Service : public testing::Test {
protected:
    void SetUp() override
    {
        m_name = ReadFile("/proc/self/comm");
        m_name.pop_back();
        MakeService(m_name);
        WriteFile(kPidFile, std::to_string(::getpid()) + "\n");
        ::unlink("/tmp/verbs");
    }

    std::string m_name;
};

TEST_F(Service, RunsWhenTheProcessOfItsPidFileBearsItsName)
{
    EXPECT_EQ(VLIBServiceIsRunning(kService), 1);
    EXPECT_FALSE(scene::Exists("/tmp/verbs")) << "and its script is not asked";
}

TEST_F(Service, RunsUnderANameThatTheKernelCuts)
{
    MakeService(m_name + std::string(16 - m_name.size(), 'x'));
    EXPECT_EQ(VLIBServiceIsRunning(kService), m_name.size() < 15 ? 0 : 1);
    ASSERT_EQ(m_name, "core_contract_t") << "what the kernel keeps of this test's name";
}

TEST_F(Service, DoesNotRunWhenTheNumberIsAnothersByNow)
{
    MakeService("ovsdb-server");
    EXPECT_EQ(VLIBServiceIsRunning(kService), 0);
}

TEST_F(Service, DoesNotRunWhenItsProcessIsGone)
{
    const pid_t child = ::fork();
    if (child == 0) {
        ::_exit(0);
    }
    WriteFile(kPidFile, std::to_string(child));
    EXPECT_TRUE(scene::Within(std::chrono::seconds(5), [&] {
        return VLIBServiceIsRunning(kService) == 0;
    })) << "it has ended but is not waited for";
    EXPECT_EQ(::waitpid(child, nullptr, 0), child);
    EXPECT_EQ(VLIBServiceIsRunning(kService), 0);
}

TEST_F(Service, DoesNotRunWhenNothingSaysSo)
{
    for (const char* text : {"", "garbage\n", "-5\n", "0\n", "99999999999999999999\n"}) {
        WriteFile(kPidFile, text);
        EXPECT_EQ(VLIBServiceIsRunning(kService), 0) << text;
    }
    ::unlink(kPidFile);
    EXPECT_EQ(VLIBServiceIsRunning(kService), 0);
    MakeScript(kScript, "exit 0");
    EXPECT_EQ(VLIBServiceIsRunning(kService), 0);
    EXPECT_EQ(VLIBServiceIsRunning("vornwifid"), 0);
}

TEST_F(Service, IsStartedStoppedAndRestartedByItsScript)
{
    EXPECT_EQ(VLIBServiceStart(kService, 0), 0);
    EXPECT_EQ(VLIBServiceStop(kService, 0), 0);
    EXPECT_EQ(VLIBServiceRestart(kService), 0);
    EXPECT_EQ(ReadFile("/tmp/verbs"), "start\nstop\nrestart\n");
}

TEST_F(Service, WhoseScriptFailsIsReported)
{
    MakeScript(kScript, "exit 1");
    EXPECT_LT(VLIBServiceStart(kService, 0), 0);
    EXPECT_LT(VLIBServiceStop(kService, 0), 0);
    EXPECT_LT(VLIBServiceRestart(kService), 0);
    ::unlink(kScript);
    EXPECT_LT(VLIBServiceStart(kService, 0), 0);
}

TEST_F(Service, IsNoPath)
{
    MakeScript("/etc/evil", "echo evil >> /tmp/verbs");
    for (const char* name : {"../evil", "/etc/evil", ".", "..", "", "sub/evil"}) {
        EXPECT_LT(VLIBServiceStart(name, 0), 0) << name;
        EXPECT_EQ(VLIBServiceIsRunning(name), 0) << name;
    }
    EXPECT_LT(VLIBServiceStart(nullptr, 0), 0);
    EXPECT_EQ(VLIBServiceIsRunning(nullptr), 0);
    EXPECT_FALSE(scene::Exists("/tmp/verbs"));
}

} // namespace
