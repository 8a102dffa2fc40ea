#include "scene.h"

#include "sandbox/systemlog.h"

#include <algorithm>
#include <array>
#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>
#include <vornplatform/core.h>

namespace {

using scene::MakeScript;
using scene::ReadFile;
using scene::WriteFile;
using testing::ElementsAre;
using testing::IsEmpty;

constexpr int kOptions = 0xBB;

struct Failure {
    const char* name;
    const char* body; /**< of the script; null: there is none */
    mode_t mode;
};

class ProgramThatFails : public testing::TestWithParam<Failure> {
protected:
    static std::string Program()
    {
        const Failure& failure = GetParam();
        std::string path = "/tmp/program";
        if (failure.body != nullptr) {
            WriteFile(path, failure.body);
            EXPECT_EQ(::chmod(path.c_str(), failure.mode), 0);
        }
        return path;
    }
};

TEST_P(ProgramThatFails, GivesTheFailureResultOfEachFunction)
{
    const std::string program = Program();
    const std::array<const char*, 2> argv = {program.c_str(), nullptr};
    EXPECT_LT(VLIBCExec(program.c_str(), nullptr), 0);
    EXPECT_NE(VLIBCExecl(program.c_str(), kOptions, nullptr), 0);
    EXPECT_NE(VLIBCExecv(program.c_str(), argv.data(), 1), 0);
    ::unlink(program.c_str());
}

INSTANTIATE_TEST_SUITE_P(
    Because, ProgramThatFails,
    testing::Values(Failure{"ItExitsWith1", "#!/bin/sh\nexit 1\n", 0755},
                    Failure{"ItExitsWith255", "#!/bin/sh\nexit 255\n", 0755},
                    Failure{"ASignalEndsIt", "#!/bin/sh\nkill -TERM $$\n", 0755},
                    Failure{"ThereIsNone", nullptr, 0},
                    Failure{"ItIsNotExecutable", "#!/bin/sh\nexit 0\n", 0644},
                    Failure{"ItNamesNoInterpreter", "exit 0\n", 0755},
                    Failure{"ItsInterpreterIsMissing", "#!/bin/nosuchshell\nexit 0\n", 0755}),
    [](const auto& row) { return row.param.name; });

TEST(Exec, GivesZeroWhenTheProgramSucceeds)
{
    EXPECT_EQ(VLIBCExec("/bin/true", nullptr), 0);
    EXPECT_EQ(VLIBCExecl("/bin/true", kOptions, nullptr), 0);
    const std::array<const char*, 2> argv = {"/bin/true", nullptr};
    EXPECT_EQ(VLIBCExecv("/bin/true", argv.data(), 1), 0);
}

TEST(Exec, FailsWithoutAProgramOrAVector)
{
    const std::array<const char*, 1> empty = {nullptr};
    EXPECT_LT(VLIBCExec(nullptr, nullptr), 0);
    EXPECT_NE(VLIBCExecl(nullptr, kOptions, nullptr), 0);
    EXPECT_EQ(VLIBCExecv(nullptr, empty.data(), 1), -1);
    EXPECT_EQ(VLIBCExecv(nullptr, nullptr, 1), -1);
    EXPECT_NE(VLIBCExecv("/bin/true", nullptr, 1), 0);
    EXPECT_LT(VLIBCExec("", nullptr), 0);
}

TEST(Exec, RefusesAProgramThatIsNotNamedFromTheRootFolder)
{
    EXPECT_LT(VLIBCExec("true", nullptr), 0);
    EXPECT_LT(VLIBCExec("../bin/true", nullptr), 0);
}

TEST(Exec, PassesTheArgumentsAsTheyAre)
{
    const std::string script = MakeScript(
        "/tmp/arguments", R"(for one in "$0" "$@"; do echo "<$one>"; done > /tmp/given)");
    const std::string expected = "<" + script + ">\n<a b>\n<>\n<$HOME;*'\">\n";

    EXPECT_EQ(VLIBCExec(script.c_str(), "a b", "", "$HOME;*'\"", nullptr), 0);
    EXPECT_EQ(ReadFile("/tmp/given"), expected);
    WriteFile("/tmp/given", "");

    EXPECT_EQ(VLIBCExecl(script.c_str(), kOptions, "a b", "", "$HOME;*'\"", nullptr), 0);
    EXPECT_EQ(ReadFile("/tmp/given"), expected);
    WriteFile("/tmp/given", "");

    const std::array<const char*, 5> argv = {script.c_str(), "a b", "", "$HOME;*'\"", nullptr};
    EXPECT_EQ(VLIBCExecv(script.c_str(), argv.data(), 1), 0);
    EXPECT_EQ(ReadFile("/tmp/given"), expected);
}

TEST(Exec, TakesNoNameForTheBeginningOfAnotherCommandOfTheSwitch)
{
    harness::SystemLog log;
    EXPECT_LT(VLIBCExec("/usr/bin/ovs-vsctl", "del-port", "eth0", "--", nullptr), 0);
    EXPECT_NE(VLIBCExecl("/usr/bin/ovs-vsctl", kOptions, "set", "port", "--", "tag=1", nullptr), 0);
    EXPECT_EQ(VLIBCPopen("/usr/bin/ovs-vsctl", "r", "get", "port", "--", "tag", nullptr), nullptr);
    EXPECT_THAT(log.Lines(), testing::Each("4 /usr/bin/ovs-vsctl is not run: \"--\" is no name"));
    EXPECT_EQ(log.Lines().size(), 3U);
}

struct NoFile {
    const char* name;
    void (*put)(const char* path);
};

class CopyOnTo : public testing::TestWithParam<NoFile> {};

TEST_P(CopyOnTo, IsRefusedAndSoIsTheWayBack)
{
    scene::MakeFolder("/run/copies");
    WriteFile("/run/copies/source", "text");
    GetParam().put("/run/copies/target");
    const auto begin = std::chrono::steady_clock::now();
    EXPECT_LT(VLIBCExec("/bin/cp", "-f", "/run/copies/source", "/run/copies/target", nullptr), 0);
    EXPECT_LT(VLIBCExec("/bin/cp", "-f", "/run/copies/target", "/run/copies/other", nullptr), 0);
    EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(10));
    EXPECT_THAT(scene::Names("/run/copies"), ElementsAre("source", "target"));
    std::filesystem::remove_all("/run/copies");
}

INSTANTIATE_TEST_SUITE_P(
    IsFrom, CopyOnTo,
    testing::Values(NoFile{"AFolder", [](const char* path) { (void)::mkdir(path, 0755); }},
                    NoFile{"AFifo", [](const char* path) { (void)::mkfifo(path, 0600); }},
                    NoFile{"ADevice",
                           [](const char* path) { (void)!::symlink("/dev/null", path); }}),
    [](const auto& row) { return row.param.name; });

TEST(Exec, CopiesFilesThroughLinks)
{
    WriteFile("/tmp/source", "text");
    WriteFile("/tmp/target", "older");
    (void)!::symlink("/tmp/target", "/tmp/link");
    EXPECT_EQ(VLIBCExec("/bin/cp", "-f", "/tmp/source", "/tmp/link", nullptr), 0);
    EXPECT_EQ(ReadFile("/tmp/target"), "text");
}

TEST(Exec, PassesAsManyArgumentsAsThereAre)
{
    const std::string script = MakeScript("/tmp/count", "echo $# > /tmp/given");
    std::vector<const char*> argv(126, "x");
    argv[0] = script.c_str();
    argv.push_back(nullptr);
    EXPECT_EQ(VLIBCExecv(script.c_str(), argv.data(), 1), 0);
    EXPECT_EQ(ReadFile("/tmp/given"), "125\n");
}

TEST(Exec, DoesNotWaitForAProgramThatNobodyWantsToWaitFor)
{
    const std::string script = MakeScript(
        "/tmp/slow", "while [ ! -e /tmp/gate ]; do sleep 0.02; done; echo done > /tmp/ended");
    const std::array<const char*, 2> argv = {script.c_str(), nullptr};
    EXPECT_EQ(VLIBCExecv(script.c_str(), argv.data(), 0), 0);
    EXPECT_FALSE(scene::Exists("/tmp/ended"));
    EXPECT_EQ(::waitpid(-1, nullptr, 0), -1) << "nobody is left to be waited for";
    WriteFile("/tmp/gate", "");
    EXPECT_TRUE(
        scene::Within(std::chrono::seconds(10), [] { return ReadFile("/tmp/ended") == "done\n"; }));
}

TEST(Exec, ReportsAProgramThatDoesNotEvenStartWhenNobodyWaits)
{
    const std::array<const char*, 2> argv = {"/tmp/missing", nullptr};
    EXPECT_NE(VLIBCExecv("/tmp/missing", argv.data(), 0), 0);
}

TEST(Exec, LeavesNoChildBehind)
{
    EXPECT_EQ(VLIBCExec("/bin/true", nullptr), 0);
    EXPECT_LT(VLIBCExec("/bin/false", nullptr), 0);
    EXPECT_EQ(::waitpid(-1, nullptr, 0), -1);
    EXPECT_EQ(errno, ECHILD);
}

TEST(Exec, LeavesNoDescriptorBehind)
{
    const auto before = scene::Names("/proc/self/fd");
    EXPECT_EQ(VLIBCExec("/bin/true", nullptr), 0);
    EXPECT_LT(VLIBCExec("/tmp/missing", nullptr), 0);
    EXPECT_EQ(scene::Names("/proc/self/fd"), before);
}

TEST(Exec, LogsWhatAFailedProgramSaid)
{
    harness::SystemLog log;
    const std::string script =
        MakeScript("/tmp/program", "echo answer; echo 'no bridge br9' >&2; echo >&2; exit 3");
    EXPECT_LT(VLIBCExec(script.c_str(), "del-br", "br9", nullptr), 0);
    EXPECT_THAT(log.Lines(), ElementsAre("4 /tmp/program: no bridge br9",
                                         "4 /tmp/program del-br br9: failed with exit status 3"));
}

TEST(Exec, LogsWhyAProgramDidNotStart)
{
    harness::SystemLog log;
    EXPECT_LT(VLIBCExec("/tmp/missing", nullptr), 0);
    EXPECT_THAT(log.Lines(),
                ElementsAre("4 /tmp/missing: cannot be started: No such file or directory"));
}

TEST(Exec, LogsNothingOfASilentSuccess)
{
    harness::SystemLog log;
    EXPECT_EQ(VLIBCExec("/bin/echo", "answer", nullptr), 0);
    EXPECT_THAT(log.Lines(), IsEmpty());
}

TEST(Exec, GivesEachThreadTheStatusOfItsOwnProgram)
{
    const std::string good = MakeScript("/tmp/good", "exit 0");
    const std::string bad = MakeScript("/tmp/bad", "exit 7");
    std::array<int, 8> wrong{};
    std::vector<std::thread> threads;
    for (size_t index = 0; index < wrong.size(); ++index) {
        threads.emplace_back([&, index] {
            for (int round = 0; round < 10; ++round) {
                const bool fails = (index + static_cast<size_t>(round)) % 2 == 0;
                const int result = VLIBCExec((fails ? bad : good).c_str(), nullptr);
                wrong[index] += (result < 0) != fails ? 1 : 0;
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_THAT(wrong, testing::Each(0));
}

// What a sanitizer for threads does in the child costs more than all of this.
#ifndef __SANITIZE_THREAD__
using Milliseconds = std::chrono::duration<double, std::milli>;

/** Time of the fastest of some calls: what the machine does besides only ever adds to it. */
Milliseconds CostOfACall()
{
    Milliseconds least = std::chrono::hours(1);
    for (int call = 0; call < 20; ++call) {
        const auto begin = std::chrono::steady_clock::now();
        EXPECT_EQ(VLIBCExec("/bin/true", nullptr), 0);
        least = std::min<Milliseconds>(least, std::chrono::steady_clock::now() - begin);
    }
    return least;
}

TEST(Exec, CostsNoMoreInALargeClient)
{
    constexpr size_t kSize = size_t{2} << 30;
    const auto small = CostOfACall();
    void* const memory = ::mmap(nullptr, kSize, PROT_READ | PROT_WRITE,
                                MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0);
    ASSERT_NE(memory, MAP_FAILED);
    // Small pages, as a client's heap has after a while.
    (void)::madvise(memory, kSize, MADV_NOHUGEPAGE);
    for (size_t offset = 0; offset < kSize; offset += 4096) {
        static_cast<char*>(memory)[offset] = 1;
    }
    const auto large = CostOfACall();
    ::munmap(memory, kSize);
    // Copying the page tables of that much takes some 60 ms each time.
    EXPECT_LT(large.count(), small.count() + 20.0);
}
#endif

} // namespace
