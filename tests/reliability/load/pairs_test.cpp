// A client that registers and withdraws again and again has no more of anything afterwards.
#include "faults/scene.h"
#include "support/figures.h"

#include <vornovs/vornovs.h>

#include <fstream>

#include <malloc.h>
#include <sys/wait.h>

namespace reliability {

namespace {

constexpr int kPairs = 200;
constexpr int kWarmUp = 20;

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr bool kMeasuresMemory = false; // the sanitizer keeps what was freed
#else
constexpr bool kMeasuresMemory = true;
#endif

long ResidentKilobytes()
{
    std::ifstream status("/proc/self/status");
    for (std::string word; status >> word;) {
        long kilobytes = 0;
        if (word == "VmRSS:" && status >> kilobytes) {
            return kilobytes;
        }
    }
    return -1;
}

TEST(Pairs, LeaveNoDescriptorNoChildAndNoMemory)
{
    const Scene scene(Situation::kPlain);
    harness::RecordingPlatform platform;
    unit::SimulatedHost host(platform, scene.Restore());
    const auto makePairs = [&](int count) {
        for (int i = 0; i < count; ++i) {
            EXPECT_EQ(VORN::OVS::Register(kClient, {}), 0);
            EXPECT_EQ(VORN::OVS::UnRegister(kClient, {}), 0);
            platform.Forget();
        }
    };
    makePairs(kWarmUp);
    const std::vector<std::string> descriptors = unit::ListFolder("/proc/self/fd");
    const auto inUse = static_cast<long>(::mallinfo2().uordblks);
    const long resident = ResidentKilobytes();

    makePairs(kPairs);
    EXPECT_EQ(unit::ListFolder("/proc/self/fd"), descriptors);
    EXPECT_EQ(::waitpid(-1, nullptr, WNOHANG), -1) << "a child is left";
    const long grown = static_cast<long>(::mallinfo2().uordblks) - inUse;
    const long grownResident = ResidentKilobytes() - resident;
    if (kMeasuresMemory) {
        EXPECT_LT(grown, 4096) << "bytes in use after " << kPairs << " pairs";
        EXPECT_LT(grownResident, 1024) << "kilobytes resident";
    }
    Figure(std::to_string(kPairs) + " registrations and withdrawals in one process: " +
           std::to_string(grown) + " bytes and no descriptor more in use than before");
}

} // namespace

} // namespace reliability
