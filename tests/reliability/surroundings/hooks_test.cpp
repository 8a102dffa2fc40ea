// Hooks that somebody planted: what they are and do is no matter of the conversion.
#include "host/client.h"
#include "host/host.h"
#include "support/figures.h"
#include "surroundings/operations.h"

#include <gtest/gtest.h>

#include <array>
#include <filesystem>
#include <functional>

#include <sys/stat.h>
#include <unistd.h>

namespace {

namespace fs = std::filesystem;

constexpr char kFolder[] = "/usr/vorn/etc/hooks/net/ovs_change";
constexpr char kProgram[] = "/usr/vorn/etc/hooks/net/ovs_change/planted";
constexpr char kMark[] = "/run/fake/hooked";
constexpr uid_t kSomebody = 65534;

struct Hook {
    const char* name;
    std::function<void()> plant;
    bool runs;
};

void WriteProgram(const std::string& end, mode_t mode = 0755)
{
    reliability::WriteFile(kProgram,
                           std::string("#!/bin/sh\necho x >>") + kMark + "\n" + end + "\n", mode);
}

const std::vector<Hook>& Hooks()
{
    static const std::vector<Hook> hooks = {
        {"succeeds", [] { WriteProgram("exit 0"); }, true},
        {"fails", [] { WriteProgram("exit 7"); }, true},
        {"is killed", [] { WriteProgram("kill -9 $$"); }, true},
        {"says a megabyte", [] { WriteProgram("head -c 1000000 /dev/zero; exit 0"); }, true},
        {"complains by the megabyte", [] { WriteProgram("head -c 1000000 /dev/zero >&2"); }, true},
        {"leaves a daemon", [] { WriteProgram("sleep 3 &"); }, true},
        {"is not to be run", [] { WriteProgram("exit 0", 0644); }, false},
        {"can be changed by others", [] { WriteProgram("exit 0", 0777); }, false},
        {"is somebody else's",
         [] {
             WriteProgram("exit 0");
             EXPECT_EQ(::chown(kProgram, kSomebody, kSomebody), 0);
         },
         false},
        {"is a link",
         [] {
             WriteProgram("exit 0");
             fs::rename(kProgram, "/usr/vorn/elsewhere");
             fs::create_symlink("/usr/vorn/elsewhere", kProgram);
         },
         false},
        {"is a FIFO", [] { EXPECT_EQ(::mkfifo(kProgram, 0755), 0); }, false},
        {"is a folder", [] { fs::create_directories(std::string(kProgram) + "/more"); }, false},
        {"is no program", [] { reliability::WriteFile(kProgram, std::string(99, '\0'), 0755); },
         false},
        {"is in a folder that others can change",
         [] {
             WriteProgram("exit 0");
             EXPECT_EQ(::chmod(kFolder, 0777), 0);
         },
         false}};
    return hooks;
}

TEST(PlantedHook, OfAnyKindLeavesTheConversionAsItIs)
{
    reliability::LearnEnds();
    for (const char* const name : {"Register, the first", "UnRegister"}) {
        const auto& operation = reliability::OperationCalled(name);
        for (const Hook& hook : Hooks()) {
            SCOPED_TRACE(std::string(name) + ", the hook " + hook.name);
            reliability::StartWith(operation.start);
            fs::create_directories(kFolder);
            hook.plant();
            const reliability::Outcome outcome = reliability::Run(operation);
            EXPECT_EQ(outcome.result, operation.whole);
            EXPECT_EQ(outcome.files, reliability::WholeEnd(operation));
            reliability::ExpectSound(operation, outcome);
            EXPECT_EQ(reliability::ReadFile(kMark), hook.runs ? "x\nx\n" : "(none)");
            fs::remove(kMark);
            fs::remove("/usr/vorn/elsewhere");
        }
    }
    reliability::Figure(std::to_string(2 * Hooks().size()) + " surroundings with a planted hook");
}

} // namespace
