// On the way to its limit a client passes every number of descriptors that may be left.
#include "clients/served.h"
#include "clients/traits.h"
#include "host/host.h"
#include "support/figures.h"

#include <gtest/gtest.h>

#include <vornovs/vornovs.h>
#include <vornplatform/core.h>

namespace {

using reliability::Findings;
using reliability::kActor;

/** @return  whether the program's end was told, and told right; if not, that it did not run. */
bool StatusIsRightOrNone(const char* mode)
{
    FILE* const stream = VLIBCPopen(kActor, mode, "exit", "7", nullptr);
    if (stream == nullptr) {
        return true;
    }
    const int status = VLIBCPclose(stream);
    return status == 7 << 8 || status == 127 << 8;
}

/** Right or failed as documented, never wrong. */
void ExpectNothingWrong(Findings& findings)
{
    findings.Expect(VLIBCExec(kActor, "exit", "7", nullptr) < 0, "a failed program succeeded");
    for (const char* const mode : {"r", "rB"}) {
        findings.Expect(StatusIsRightOrNone(mode), "a wrong status in mode", mode);
    }
    int handle = -1;
    const bool locked = VLIBCFileLockTimeByFile(reliability::kLockPath, 1, 0, &handle) == 0;
    findings.Expect(locked == (handle != -1), "the handle does not agree with the result");
    findings.Expect(!locked || VLIBCFileUnlockByFile(handle) == 0, "the lock is not released");

    const int attached = VORN::OVS::AttachPort("ovs_eth0", "tap0");
    findings.Expect(attached == 1 || attached == -1, "an undocumented result");
    // The registration is one step: had or not had, never the loss of another one's.
    (void)VORN::OVS::Register("client", {});
    (void)VORN::OVS::UnRegister("client", {});
}

TEST(ClientWithFewDescriptorsLeft, IsServedRightOrToldThatItIsNot)
{
    constexpr int kEnough = 24;
    int servedFrom = kEnough;
    for (int left = kEnough; left >= 0; --left) {
        reliability::StartWith({{"/usr/vorn/etc/vornovs/ovs_reg.conf", "keeper\n"}});
        const reliability::Trait few = {"few left",
                                        [&] { (void)reliability::LeaveDescriptors(left); }};
        EXPECT_EQ(reliability::RunClient({few}, ExpectNothingWrong), "") << left << " left";
        const std::string names = reliability::ReadFile("/usr/vorn/etc/vornovs/ovs_reg.conf");
        EXPECT_TRUE(names == "keeper\n" || names == "client\nkeeper\n") << left << ": " << names;
        EXPECT_TRUE(reliability::LockIsFree()) << left << " left";
        if (reliability::RunClient({few}, reliability::ExpectServed).empty()) {
            servedFrom = left;
        }
    }
    EXPECT_LT(servedFrom, kEnough);
    EXPECT_EQ(reliability::RunClient({}, reliability::ExpectServed), "");
    reliability::Figure(std::to_string(kEnough + 1) +
                        " clients with 0 to 24 descriptors left: served in full from " +
                        std::to_string(servedFrom) + " on, never told anything wrong");
}

} // namespace
