// A switch's tool that fails in every way, and what the library makes of it.
#include "host/client.h"
#include "host/host.h"
#include "support/figures.h"
#include "surroundings/operations.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <array>
#include <chrono>
#include <string_view>

#include <vornovs/vornovs.h>

namespace {

using reliability::Findings;
using reliability::Order;

/** What each call answers in the order of Answers(), one number after the other. */
std::string Answers()
{
    using namespace VORN::OVS; // NOLINT: the library's own names
    std::set<std::string> bridges;
    _tag_VLIB_VLAN tag{};
    std::string answers = std::to_string(ListInterface(bridges));
    answers += " of " + std::to_string(bridges.size()) + ",";
    const int tagged = OVSVlanGet("ovs_eth0", &tag);
    answers += " " + std::to_string(tagged) + (tagged == 1 ? " " + std::to_string(tag.vlanId) : "");
    for (const int answer : {OVSVlanSet("ovs_eth0", "7"), OVSVlanClear("ovs_eth0"),
                             OVSVlanCreate("ovs_eth0", "7"), OVSVlanRemove("ovs_eth0"),
                             AttachPort("ovs_eth0", "tap0"), DetachPort("ovs_eth0", "tap0")}) {
        answers += " " + std::to_string(answer);
    }
    return answers;
}

struct Tool {
    const char* name;
    const char* order;
    /** ListInterface and how many bridges, OVSVlanGet, Set, Clear, Create, Remove, ports. */
    const char* answers;
};

constexpr std::array<Tool, 8> kTools = {
    {{"works", "", "0 of 3, 0 0 0 0 0 1 1"},
     {"fails", "exit 1", "0 of 0, -1 -1 -1 0 0 -1 -1"},
     {"fails with an answer", "exit 1 ovs_eth9", "0 of 1, -1 -1 -1 0 0 -1 -1"},
     {"is killed", "kill 9", "0 of 0, -1 -1 -1 0 0 -1 -1"},
     {"crashes", "kill 11", "0 of 0, -1 -1 -1 0 0 -1 -1"},
     {"says rubbish", "exit 0 \x01\xff%n{]", "0 of 1, 1 0 0 0 0 0 1 1"},
     {"says that there is no tag", "exit 0 []", "0 of 1, 0 0 0 0 0 1 1"},
     {"says a megabyte", "print 1000000", "0 of 27, -1 0 0 0 0 1 1"}}};

TEST(SwitchTool, OfAnyKindGetsTheAnswerThatIsDocumented)
{
    for (const Tool& tool : kTools) {
        SCOPED_TRACE(tool.name);
        reliability::StartWith(reliability::HostOnSwitch());
        if (*tool.order != '\0') {
            Order("ovs-vsctl", tool.order);
        }
        EXPECT_EQ(reliability::RunClient({},
                                         [&](Findings& findings) {
                                             const std::string answers = Answers();
                                             findings.Expect(answers == tool.answers,
                                                             "the answers:", answers.c_str());
                                         }),
                  "");
        if (*tool.order != '\0') {
            Order("ovs-vsctl", "");
        }
        EXPECT_TRUE(reliability::LockIsFree());
    }
    reliability::Figure(std::to_string(kTools.size()) +
                        " surroundings with a switch's tool that fails or lies");
}

TEST(SwitchTool, ThatFailsAsTheLastClientLeavesLosesNoAddress)
{
    reliability::LearnEnds();
    const auto& leaving = reliability::OperationCalled("UnRegister");
    for (const Tool& tool : kTools) {
        SCOPED_TRACE(tool.name);
        reliability::StartWith(leaving.start);
        if (*tool.order == '\0' || std::string_view(tool.order).starts_with("print")) {
            continue; // a thousand lines are a thousand bridges to ask about
        }
        Order("ovs-vsctl", tool.order);
        const reliability::Outcome outcome = reliability::Run(leaving);
        Order("ovs-vsctl", "");
        reliability::ExpectSound(leaving, outcome);
    }
}

/** It has a limit of its own by which it ends, and the library sees to it that it is set. */
TEST(SwitchTool, WaitsNoLongerThanItsLimitForASwitchThatHangs)
{
    reliability::StartWith(reliability::HostOnSwitch());
    Order("ovs-vsctl", "hang");
    const auto begin = std::chrono::steady_clock::now();
    EXPECT_EQ(reliability::RunClient({},
                                     [](Findings& findings) {
                                         findings.Expect(
                                             VORN::OVS::AttachPort("ovs_eth0", "tap0") == -1,
                                             "a switch that hangs has taken a port");
                                     }),
              "");
    const std::chrono::duration<double> taken = std::chrono::steady_clock::now() - begin;
    EXPECT_GT(taken.count(), 9.0);
    EXPECT_LT(taken.count(), 25.0);
    Order("ovs-vsctl", "");
    EXPECT_TRUE(reliability::LockIsFree());
}

} // namespace
