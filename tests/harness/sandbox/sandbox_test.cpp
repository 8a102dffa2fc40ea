#include "sandbox/sandbox.h"
#include "sandbox/systemlog.h"

#include <exception>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iostream>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <sys/prctl.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <syslog.h>
#include <unistd.h>

namespace {

namespace fs = std::filesystem;
using harness::EnterSandbox;
using harness::SandboxOptions;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::UnorderedElementsAreArray;

constexpr uid_t kOrdinaryUser = 65534;

/** Runs the body in a process of its own; its failures and exceptions fail the test. */
void InAnotherProcess(uid_t user, const std::function<void()>& body)
{
    const pid_t child = ::fork();
    if (child == 0) {
        try {
            if (::geteuid() == 0 && user != 0) {
                EXPECT_EQ(::setresgid(user, user, user), 0);
                EXPECT_EQ(::setresuid(user, user, user), 0);
                // Only then may the process write its own user map.
                EXPECT_EQ(::prctl(PR_SET_DUMPABLE, 1), 0);
            }
            body();
        } catch (const std::exception& error) {
            ADD_FAILURE() << error.what();
        }
        std::cout << std::flush;
        ::_exit(testing::Test::HasFailure() ? 1 : 0);
    }
    int status = -1;
    ASSERT_EQ(::waitpid(child, &status, 0), child);
    EXPECT_EQ(status, 0);
}

std::vector<std::string> Names(const fs::path& folder)
{
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(folder)) {
        names.push_back(entry.path().filename());
    }
    return names;
}

/** The ordinary user's row is the only one that a machine without root can run. */
class Sandbox : public testing::TestWithParam<uid_t> {
protected:
    static uid_t User() { return ::geteuid() == 0 ? GetParam() : ::geteuid(); }
};

/** What stays in a folder: the way to this checkout, should it lie there, is never hidden. */
std::vector<std::string> WayToCheckout(const fs::path& folder)
{
    const fs::path way = fs::current_path().lexically_relative(folder);
    return *way.begin() == ".." ? std::vector<std::string>{}
                                : std::vector<std::string>{way.begin()->string()};
}

TEST_P(Sandbox, HasEmptyFoldersThatCanBeWritten)
{
    InAnotherProcess(User(), [] {
        EnterSandbox();
        for (const char* folder : {"/usr/vorn", "/etc/sysconfig", "/etc/init.d", "/run", "/tmp"}) {
            fs::create_directory(fs::path(folder) / "made");
            std::vector<std::string> expected = WayToCheckout(folder);
            expected.emplace_back("made");
            EXPECT_THAT(Names(folder), UnorderedElementsAreArray(expected)) << folder;
        }
    });
}

TEST_P(Sandbox, ShowsWhatTheMachineHasEverywhereElse)
{
    const std::vector<std::string> programs = Names("/usr/bin");
    const fs::path workingFolder = fs::current_path();
    InAnotherProcess(User(), [&] {
        EnterSandbox();
        EXPECT_EQ(Names("/usr/bin"), programs);
        EXPECT_TRUE(fs::exists("/etc/passwd"));
        EXPECT_TRUE(fs::exists("/proc/self/stat"));
        EXPECT_TRUE(std::ofstream("/dev/null").good());
        EXPECT_EQ(fs::current_path(), workingFolder);
    });
}

TEST_P(Sandbox, LeavesTheMachineUntouched)
{
    InAnotherProcess(User(), [] {
        EnterSandbox();
        for (const char* path : {"/tmp/vornovs-leak", "/usr/vornovs-leak", "/etc/vornovs-leak",
                                 "/dev/vornovs-leak", "/run/vornovs-leak", "/vornovs-leak"}) {
            EXPECT_TRUE(std::ofstream(path).good()) << path;
        }
    });
    for (const char* folder : {"/tmp", "/usr", "/etc", "/dev", "/run", "/"}) {
        EXPECT_FALSE(fs::exists(fs::path(folder) / "vornovs-leak")) << folder;
    }
}

TEST_P(Sandbox, BelongsToRootUpToTheRootFolder)
{
    InAnotherProcess(User(), [] {
        EnterSandbox();
        for (const char* path : {"/", "/usr", "/usr/vorn", "/etc", "/tmp"}) {
            struct stat status {};
            EXPECT_EQ(::stat(path, &status), 0) << path;
            EXPECT_EQ(status.st_uid, 0U) << path;
        }
    });
}

TEST_P(Sandbox, HasANetworkOfItsOwnWhenAsked)
{
    InAnotherProcess(User(), [] {
        SandboxOptions options;
        options.network = true;
        EnterSandbox(options);
        EXPECT_THAT(Names("/sys/class/net"), ElementsAre("lo"));
    });
}

TEST_P(Sandbox, KeepsTheEntriesOfAFolderMadeWritable)
{
    const std::vector<std::string> programs = Names("/usr/bin");
    InAnotherProcess(User(), [&] {
        SandboxOptions options;
        options.writable = {"/usr/bin"};
        EnterSandbox(options);
        EXPECT_TRUE(std::ofstream("/usr/bin/vornovs-leak").good());
        EXPECT_TRUE(fs::remove("/usr/bin/vornovs-leak"));
        EXPECT_THAT(Names("/usr/bin"), UnorderedElementsAreArray(programs));
    });
}

TEST_P(Sandbox, CollectsWhatIsLogged)
{
    InAnotherProcess(User(), [] {
        EnterSandbox();
        {
            harness::SystemLog log;
            EXPECT_THAT(log.Lines(), IsEmpty());
            for (int line = 0; line < 40; ++line) { // more than the queue holds
                ::syslog(LOG_ERR, "line %d: full", line);
            }
            EXPECT_EQ(log.Lines().size(), 40U);
            EXPECT_EQ(log.Lines().back(), "3 line 39: full");
        }
        harness::SystemLog log;
        ::syslog(LOG_INFO, "again");
        EXPECT_THAT(log.Lines(), ElementsAre("6 again"));
    });
}

INSTANTIATE_TEST_SUITE_P(As, Sandbox, testing::Values(uid_t{0}, kOrdinaryUser),
                         [](const auto& row) {
                             return row.param == 0 ? "Root" : "AnOrdinaryUser";
                         });

} // namespace
