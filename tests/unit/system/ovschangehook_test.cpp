#include <vornovs/vornovs.h>

#include "support/support.h"

#include <memory>
#include <type_traits>

using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::LongName;
using VORN::OVS::OVSChangeHook;

namespace {

TEST(OVSChangeHook, IsAHookThatCanBeDeletedThroughItsBase)
{
    RecordingPlatform platform;
    static_assert(std::is_base_of_v<vornnetsdk::hook::BaseHook, OVSChangeHook>);
    static_assert(std::has_virtual_destructor_v<OVSChangeHook>);
    static_assert(sizeof(OVSChangeHook) == sizeof(vornnetsdk::hook::BaseHook));
    {
        const std::unique_ptr<vornnetsdk::hook::BaseHook> hook =
            std::make_unique<OVSChangeHook>("create");
        EXPECT_TRUE(hook->IsValid());
    }
    EXPECT_THAT(platform.OpenHandles(), IsEmpty());
}

TEST(OVSChangeHook, NamesTheHookAndThenSetsTheAction)
{
    const RecordingPlatform platform;
    const OVSChangeHook hook("create");
    EXPECT_THAT(platform.AllCalls(),
                ElementsAre("BaseHook net net/ovs_change", "SetEnv ACTION create"));
}

TEST(OVSChangeHook, RunsWithTheActionInItsEnvironment)
{
    const RecordingPlatform platform;
    OVSChangeHook hook("delete");
    EXPECT_EQ(hook.ExecHook(SDK_PLUGIN_ACTION_BEGIN), 0);
    EXPECT_EQ(hook.ExecHook(SDK_PLUGIN_ACTION_DONE), 0);
    EXPECT_THAT(platform.Calls(), ElementsAre("ExecHook net net/ovs_change 4 ACTION=delete",
                                              "ExecHook net net/ovs_change 5 ACTION=delete"));
}

TEST(OVSChangeHook, DoesNotMindAnActionThatCannotBeSet)
{
    RecordingPlatform platform;
    platform.Answer("SetEnv", -1);
    const OVSChangeHook hook("create");
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(OVSChangeHook, StandsAnActionOf5000Characters)
{
    const RecordingPlatform platform;
    OVSChangeHook hook(LongName());
    (void)hook.ExecHook(SDK_PLUGIN_ACTION_BEGIN);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("ExecHook net net/ovs_change 4 ACTION=" + LongName()));
}

} // namespace
