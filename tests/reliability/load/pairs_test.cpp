// A client that registers and withdraws again and again has no more of anything afterwards.
#include "faults/scene.h"
#include "support/figures.h"
#include "support/sanitizer.h"

#include <vornovs/vornovs.h>

#include <fstream>

#include <malloc.h>
#include <sys/wait.h>
#ifdef VORNOVS_ADDRESS_SANITIZER
#include <sanitizer/allocator_interface.h>
#endif

namespace reliability {

namespace {

constexpr int kPairs = 200;
constexpr int kWarmUp = 20;

/** Memory that was taken and not given back. */
long BytesInUse()
{
#ifdef VORNOVS_ADDRESS_SANITIZER
    return static_cast<long>(::__sanitizer_get_current_allocated_bytes());
#else
    return static_cast<long>(::mallinfo2().uordblks);
#endif
}

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
    const long inUse = BytesInUse();
    const long resident = ResidentKilobytes();

    makePairs(kPairs);
    EXPECT_EQ(unit::ListFolder("/proc/self/fd"), descriptors);
    EXPECT_EQ(::waitpid(-1, nullptr, WNOHANG), -1) << "a child is left";
    const long grown = BytesInUse() - inUse;
    const long grownResident = ResidentKilobytes() - resident;
    EXPECT_LT(grown, 4096) << "bytes in use after " << kPairs << " pairs";
    if (!kAddressSanitizer) { // which keeps what was freed
        EXPECT_LT(grownResident, 1024) << "kilobytes resident";
    }
    Figure(std::to_string(kPairs) + " registrations and withdrawals in one process: " +
           std::to_string(grown) + " bytes and no descriptor more in use than before");
}

} // namespace

} // namespace reliability
