#include "rcnetwork/runstate.h"

#include <gtest/gtest.h>

namespace vornhost {
namespace {

TEST(RunState, ComesBackAsItWasWritten)
{
    RunState state;
    InterfaceRecord& record = state.interfaces["eth0"];
    record.addresses = {"192.0.2.5/24", "2001:db8::5/64"};
    record.routes = {"inet default table 254 metric 0 via 192.0.2.1"};
    record.unchecked = {"2001:db8::5/64"};
    record.broughtUp = true;
    record.formerMtu = 1500;
    record.tag = 10;
    record.formerSettings = {{"ipv6.conf.disable_ipv6", "0"}};

    EXPECT_EQ(ParseRunState(RunStateText(state)), state);
}

TEST(RunState, LeavesOutInterfacesOfWhichNothingWasMade)
{
    RunState state;
    state.interfaces["eth0"] = {};

    EXPECT_EQ(ParseRunState(RunStateText(state)), RunState());
}

TEST(RunState, IsEmptyWhenTheTextIsNoneOfThisVersion)
{
    for (const char* text : {"", "{", "[]", "{\"version\": 2, \"interfaces\": {}}",
                             "{\"version\": 1, \"interfaces\": {\"eth0\": {\"addresses\": 7}}}"}) {
        EXPECT_EQ(ParseRunState(text), RunState()) << text;
    }
}

} // namespace
} // namespace vornhost
