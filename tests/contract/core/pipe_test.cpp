#include "scene.h"

#include <csignal>
#include <cstdio>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <sys/wait.h>
#include <unistd.h>
#include <vornplatform/core.h>

namespace {

using scene::MakeScript;
using scene::ReadFile;
using scene::WriteFile;

std::string ReadAll(FILE* stream)
{
    std::string text;
    for (int letter = std::fgetc(stream); letter != EOF; letter = std::fgetc(stream)) {
        text += static_cast<char>(letter);
    }
    return text;
}

class PipeOfMode : public testing::TestWithParam<const char*> {};

TEST_P(PipeOfMode, GivesTheOutputOfASuccessfulProgram)
{
    FILE* const stream = VLIBCPopen("/usr/bin/printf", GetParam(), "%s\\n", "one", "two", nullptr);
    ASSERT_NE(stream, nullptr);
    EXPECT_EQ(ReadAll(stream), "one\ntwo\n");
    EXPECT_EQ(VLIBCPclose(stream), 0);
}

TEST_P(PipeOfMode, GivesMoreThanAPipeHolds)
{
    FILE* const stream = VLIBCPopen("/usr/bin/seq", GetParam(), "100000", nullptr);
    ASSERT_NE(stream, nullptr);
    EXPECT_EQ(ReadAll(stream).size(), 588895U);
    EXPECT_EQ(VLIBCPclose(stream), 0);
}

TEST_P(PipeOfMode, GivesTheExitStatusInBits8To15)
{
    const std::string script = MakeScript("/tmp/program", "echo text; exit 42");
    FILE* const stream = VLIBCPopen(script.c_str(), GetParam(), nullptr);
    ASSERT_NE(stream, nullptr);
    EXPECT_EQ(ReadAll(stream), "text\n");
    EXPECT_EQ(VLIBCPclose(stream), 42 << 8);
}

TEST_P(PipeOfMode, GivesTheSignalThatEndedTheProgram)
{
    const std::string script = MakeScript("/tmp/program", "kill -KILL $$");
    FILE* const stream = VLIBCPopen(script.c_str(), GetParam(), nullptr);
    ASSERT_NE(stream, nullptr);
    EXPECT_EQ(VLIBCPclose(stream), SIGKILL);
}

TEST_P(PipeOfMode, GivesNoStreamForAProgramThatIsNotThere)
{
    EXPECT_EQ(VLIBCPopen("/tmp/missing", GetParam(), nullptr), nullptr);
    EXPECT_EQ(VLIBCPopen("/etc/passwd", GetParam(), nullptr), nullptr);
    EXPECT_EQ(VLIBCPopen(nullptr, GetParam(), nullptr), nullptr);
    EXPECT_EQ(VLIBCPopen("printf", GetParam(), nullptr), nullptr);
}

TEST_P(PipeOfMode, LeavesNothingBehind)
{
    const auto before = scene::Names("/proc/self/fd");
    FILE* const stream = VLIBCPopen("/usr/bin/seq", GetParam(), "100000", nullptr);
    ASSERT_NE(stream, nullptr);
    (void)VLIBCPclose(stream);
    EXPECT_EQ(VLIBCPopen("/tmp/missing", GetParam(), nullptr), nullptr);
    EXPECT_EQ(scene::Names("/proc/self/fd"), before);
    EXPECT_EQ(::waitpid(-1, nullptr, 0), -1);
}

INSTANTIATE_TEST_SUITE_P(Modes, PipeOfMode, testing::Values("r", "rB"),
                         [](const auto& row) { return std::string(row.param); });

TEST(Pipe, OfModeRBGivesOutputWhileTheProgramRuns)
{
    const std::string script = MakeScript(
        "/tmp/program", "echo first; while [ ! -e /tmp/gate ]; do sleep 0.02; done; echo second");
    (void)::unlink("/tmp/gate");
    FILE* const stream = VLIBCPopen(script.c_str(), "rB", nullptr);
    ASSERT_NE(stream, nullptr);
    char line[64] = "";
    EXPECT_STREQ(std::fgets(line, sizeof line, stream), "first\n");
    WriteFile("/tmp/gate", "");
    EXPECT_EQ(ReadAll(stream), "second\n");
    EXPECT_EQ(VLIBCPclose(stream), 0);
}

TEST(Pipe, OfModeRBEndsAProgramWhoseOutputNobodyWants)
{
    FILE* const stream = VLIBCPopen("/usr/bin/yes", "rB", nullptr);
    ASSERT_NE(stream, nullptr);
    EXPECT_EQ(VLIBCPclose(stream), SIGPIPE);
}

TEST(Pipe, OfModeRAsksAgainWhenTheProgramFailed)
{
    const std::string script =
        MakeScript("/tmp/program", "echo run >> /tmp/runs; echo ovs_eth0; "
                                   "[ $(wc -l < /tmp/runs) = 1 ] && exit 1; echo ovs_eth1");
    (void)::unlink("/tmp/runs");
    FILE* const stream = VLIBCPopen(script.c_str(), "r", nullptr);
    ASSERT_NE(stream, nullptr);
    EXPECT_EQ(ReadAll(stream), "ovs_eth0\novs_eth1\n") << "the whole answer, and only once";
    EXPECT_EQ(VLIBCPclose(stream), 0);
    EXPECT_EQ(ReadFile("/tmp/runs"), "run\nrun\n");
}

TEST(Pipe, OfModeRAsksNoThirdTime)
{
    const std::string script = MakeScript("/tmp/program", "echo run >> /tmp/runs; exit 1");
    (void)::unlink("/tmp/runs");
    FILE* const stream = VLIBCPopen(script.c_str(), "r", nullptr);
    ASSERT_NE(stream, nullptr);
    EXPECT_EQ(VLIBCPclose(stream), 1 << 8);
    EXPECT_EQ(ReadFile("/tmp/runs"), "run\nrun\n");
}

TEST(Pipe, IsNotOpenedInAnyOtherMode)
{
    for (const char* mode : {"w", "", "rw", "re", "B"}) {
        EXPECT_EQ(VLIBCPopen("/bin/true", mode, nullptr), nullptr) << mode;
    }
    EXPECT_EQ(VLIBCPopen("/bin/true", nullptr, nullptr), nullptr);
}

TEST(Pipe, IsNotClosedWhenItIsNoPipe)
{
    FILE* const file = std::fopen("/etc/passwd", "re");
    ASSERT_NE(file, nullptr);
    EXPECT_EQ(VLIBCPclose(file), -1);
    EXPECT_EQ(std::fclose(file), 0) << "it is still the caller's";
    EXPECT_EQ(VLIBCPclose(nullptr), -1);
}

} // namespace
