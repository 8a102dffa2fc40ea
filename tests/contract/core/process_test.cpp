#include "scene.h"

#include "support/process.h"

#include <chrono>
#include <csignal>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <fcntl.h>
#include <unistd.h>

namespace {

using namespace std::chrono_literals;
using scene::MakeScript;
using testing::HasSubstr;
using vornhost::ProcessOptions;
using vornhost::ProcessResult;
using vornhost::RunProcess;

TEST(Process, GivesStatusOutputAndErrors)
{
    const std::string script = MakeScript("/tmp/program", "echo out; echo \"$1\" >&2; exit 3");
    const ProcessResult result = RunProcess({script, "a b"});
    EXPECT_EQ(result.status, 3 << 8);
    EXPECT_EQ(result.output, "out\n");
    EXPECT_EQ(result.errors, "a b\n");
    EXPECT_FALSE(result.timedOut);
    EXPECT_FALSE(result.Succeeded());
}

TEST(Process, ReadsTheInput)
{
    ProcessOptions options;
    options.input = std::string(300000, 'x');
    const ProcessResult result = RunProcess({"/bin/cat"}, options);
    EXPECT_TRUE(result.Succeeded());
    EXPECT_EQ(result.output, options.input);
    EXPECT_EQ(RunProcess({"/bin/cat"}).output, "");
    EXPECT_TRUE(RunProcess({"/bin/true"}, options).Succeeded()) << "though it does not read it";
}

TEST(Process, HasThePlainEnvironmentUnlessToldOtherwise)
{
    EXPECT_EQ(RunProcess({"/usr/bin/env"}).output,
              "PATH=/usr/sbin:/usr/bin:/sbin:/bin\nLC_ALL=C\n");
    ProcessOptions options;
    options.environment = {"A=1"};
    EXPECT_EQ(RunProcess({"/usr/bin/env"}, options).output, "A=1\n");
}

TEST(Process, HasNoDescriptorButTheStandardOnes)
{
    const int stray = ::open("/etc/passwd", O_RDONLY); // NOLINT: without O_CLOEXEC on purpose
    EXPECT_EQ(RunProcess({"/bin/ls", "/proc/self/fd"}).output, "0\n1\n2\n3\n");
    ::close(stray);
}

TEST(Process, IsEndedWithItsGroupAtTheDeadline)
{
    const std::string script = MakeScript("/tmp/program", "echo begun; sleep 60 & wait");
    ProcessOptions options;
    options.deadline = 200ms;
    const auto begin = std::chrono::steady_clock::now();
    const ProcessResult result = RunProcess({script}, options);
    EXPECT_LT(std::chrono::steady_clock::now() - begin, 10s);
    EXPECT_TRUE(result.timedOut);
    EXPECT_EQ(result.status, SIGTERM);
    EXPECT_EQ(result.output, "begun\n");
}

TEST(Process, ThatCannotBeStartedSaysWhy)
{
    const ProcessResult missing = RunProcess({"/tmp/missing"});
    EXPECT_EQ(missing.status, -1);
    EXPECT_THAT(missing.errors, HasSubstr("No such file"));
    EXPECT_EQ(RunProcess({"true"}).status, -1) << "a path that is not absolute";
    EXPECT_EQ(RunProcess({}).status, -1);
}

TEST(Process, DoesNotHoldUpItsCallerByADaemonThatItLeaves)
{
    const std::string script = MakeScript("/tmp/program", "setsid sleep 2 & echo out");
    const auto begin = std::chrono::steady_clock::now();
    EXPECT_EQ(RunProcess({script}).output, "out\n");
    EXPECT_LT(std::chrono::steady_clock::now() - begin, 1900ms);
}

TEST(Process, GivesTheStatusThoughSigchldWasIgnored)
{
    EXPECT_EQ(scene::ResultOf([] {
                  (void)::signal(SIGCHLD, SIG_IGN);
                  return RunProcess({"/bin/false"}).status == 1 << 8 ? 0 : 1;
              }),
              0);
}

TEST(Process, WritesToWhereWeWriteWhenNothingIsToBeCollected)
{
    const std::string script = MakeScript("/tmp/program", "echo out; echo err >&2");
    EXPECT_EQ(scene::ResultOf([&] {
                  const int file =
                      ::open("/tmp/ours", O_RDWR | O_CREAT | O_TRUNC | O_CLOEXEC, 0600);
                  ::dup2(file, 1);
                  ::dup2(file, 2);
                  ProcessOptions options;
                  options.capture = false;
                  return RunProcess({script}, options).output.empty() ? 0 : 1;
              }),
              0);
    EXPECT_EQ(scene::ReadFile("/tmp/ours"), "out\nerr\n");
}

} // namespace
