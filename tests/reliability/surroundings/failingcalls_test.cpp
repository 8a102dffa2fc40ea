// Each call that changes a file fails, as a broken disk or a quota has it.
#include "host/host.h"
#include "support/figures.h"
#include "surroundings/failingcalls.h"
#include "surroundings/operations.h"

#include <gtest/gtest.h>

#include <array>
#include <cerrno>

namespace {

using reliability::Operation;
using reliability::Outcome;

struct Breakage {
    const char* name;
    int error;
    bool always;
};

constexpr std::array<Breakage, 2> kBreakages = {
    {{"EIO or EDQUOT once", EIO, false}, {"ENOSPC from there on", ENOSPC, true}}};

/** An error that comes once is the disk's or the quota's in turn. */
int ErrorOf(const Breakage& breakage, int call)
{
    return !breakage.always && call % 2 == 0 ? EDQUOT : breakage.error;
}

class Calls : public testing::Test {
protected:
    static void SetUpTestSuite() { reliability::LearnEnds(); }
};

int CountCalls(const Operation& operation)
{
    reliability::StartWith(operation.start);
    Operation counted = operation;
    counted.run = [&] {
        reliability::CountFileCalls();
        (void)operation.run();
        return reliability::FileCalls();
    };
    return reliability::Run(counted).result;
}

/** A file whose removal fails stays, whoever wanted it gone. */
void ForgetFilesBeside(Outcome& outcome)
{
    std::erase_if(outcome.files, [](const auto& file) {
        return file.first.find(".new") != std::string::npos ||
               file.first.find("/.vornovs") != std::string::npos;
    });
}

TEST_F(Calls, ThatFailOneAfterTheOtherLoseAndTearNothing)
{
    int tried = 0;
    for (const Operation& operation : reliability::Operations()) {
        const int calls = CountCalls(operation);
        EXPECT_GT(calls, 0) << operation.name;
        for (const Breakage& breakage : kBreakages) {
            for (int first = 1; first <= calls; ++first) {
                SCOPED_TRACE(operation.name + ", call " + std::to_string(first) + " of " +
                             std::to_string(calls) + ": " + breakage.name);
                reliability::StartWith(operation.start);
                Outcome outcome = reliability::Run(operation, [&] {
                    reliability::FailFileCalls(first, ErrorOf(breakage, first), breakage.always);
                });
                if (breakage.always) {
                    ForgetFilesBeside(outcome);
                }
                reliability::ExpectSound(operation, outcome);
                ++tried;
            }
        }
    }
    reliability::Figure(std::to_string(tried) +
                        " surroundings with a call that fails as a broken disk has it");
}

} // namespace
