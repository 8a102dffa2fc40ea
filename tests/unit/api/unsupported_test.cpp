// A host that cannot carry the switch. This build's answer is always 0, so the linker puts the
// function below in the place of NotSupportOVS() for the callers in libvornovs.cpp.
#include <vornovs/vornovs.h>

#include "support/support.h"

using harness::Info;
using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;

namespace {

int g_reason = 0;

/** Gives the host a reason while it lives. */
class Reason {
public:
    explicit Reason(int reason) { g_reason = reason; }
    ~Reason() { g_reason = 0; }
    Reason(const Reason&) = delete;
    Reason& operator=(const Reason&) = delete;
};

} // namespace

extern "C" int WrappedNotSupportOVS() asm("__wrap__ZN4VORN3OVS13NotSupportOVSEv");

extern "C" int WrappedNotSupportOVS()
{
    return g_reason;
}

namespace {

TEST(Register, AnswersTheReasonOfAnUnsupportedHostWithoutTheLock)
{
    for (const int reason : {1, 7}) {
        const RecordingPlatform platform;
        const Reason unsupported(reason);
        EXPECT_EQ(VORN::OVS::Register("a", {{"bond0", "802.3ad"}}), reason);
        EXPECT_THAT(platform.Calls(), IsEmpty());
        EXPECT_THAT(platform.Log(),
                    ElementsAre(Info("libvornovs.cpp",
                                     "Current environment doesn't support OVS for reason " +
                                         std::to_string(reason))));
    }
}

TEST(Register, GoesOnWithANegativeReasonAndKeepsItAsTheResultWithoutTheLock)
{
    RecordingPlatform platform;
    const Reason negative(-5);
    platform.Answer("VLIBCFileLockTimeByFile", -1);
    EXPECT_EQ(VORN::OVS::Register("a", {}), -5);
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBCFileLockTimeByFile /tmp/ovs_config.lock 1 5"));
}

TEST(IsOVSSupport, HandsAPositiveReasonOnAndMakesANegativeOne0)
{
    const RecordingPlatform platform;
    {
        const Reason unsupported(7);
        EXPECT_EQ(VORN::OVS::IsOVSSupport(), 7);
    }
    const Reason negative(-5);
    EXPECT_EQ(VORN::OVS::IsOVSSupport(), 0);
}

TEST(UnRegister, DoesNotAskWhetherTheHostIsSupported)
{
    const RecordingPlatform platform;
    const Reason unsupported(7);
    EXPECT_EQ(VORN::OVS::UnRegister("a", {}), 1);
}

} // namespace
