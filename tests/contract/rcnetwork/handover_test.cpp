#include "rcnetwork/handover.h"

#include <gtest/gtest.h>

namespace vornhost {
namespace {

const Handover kHandover{{{"bond0", 5}, {"eth0", 5}},
                         {{"bond0", {{"eth0", "eth1"}, "02:00:00:00:00:01", true}}}};

TEST(Handover, ComesBackAsItWasWritten)
{
    EXPECT_EQ(ParseHandover(HandoverText(kHandover, 100), 100), kHandover);
    EXPECT_EQ(ParseHandover(HandoverText(kHandover, 100), 220), kHandover);
}

TEST(Handover, IsForgottenOnceNoConversionCanBeUnderWay)
{
    EXPECT_TRUE(ParseHandover(HandoverText(kHandover, 100), 221).Empty());
}

TEST(Handover, OfAnEarlierBootIsNone)
{
    EXPECT_TRUE(ParseHandover(HandoverText(kHandover, 100), 99).Empty());
}

TEST(Handover, ThatCannotBeReadIsNone)
{
    const std::string text = HandoverText(kHandover, 100);
    for (const std::string& broken :
         {std::string(), text.substr(0, text.size() / 2), std::string("{\"second\": 100}")}) {
        EXPECT_TRUE(ParseHandover(broken, 100).Empty()) << broken;
    }
}

TEST(Handover, OfABondWithoutMembersIsNone)
{
    const Handover handover{{}, {{"bond0", {{}, "02:00:00:00:00:01", false}}}};

    EXPECT_TRUE(ParseHandover(HandoverText(handover, 100), 100).Empty());
}

TEST(Handover, LetsTheFirstMemberSpeakAndSilencesTheOthers)
{
    ASSERT_NE(kHandover.FirstOf("eth0"), nullptr);
    EXPECT_TRUE(kHandover.FirstOf("eth0")->lacp);
    EXPECT_EQ(kHandover.FirstOf("eth1"), nullptr);
    EXPECT_FALSE(kHandover.IsSilent("eth0"));
    EXPECT_TRUE(kHandover.IsSilent("eth1"));
    EXPECT_FALSE(kHandover.IsSilent("eth2"));
}

} // namespace
} // namespace vornhost
