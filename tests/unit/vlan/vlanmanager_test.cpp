#include <vornovs/vornovs.h>

#include "support/support.h"

#include <cstring>

using harness::Err;
using harness::Info;
using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::kExitedWith1;
using unit::kExitedWith77;
using unit::kKilled;
using unit::LongName;
using VORN::OVS::VlanManager;

namespace {

constexpr char kFile[] = "vlanmanager.cpp";
constexpr char kGet[] = "VLIBCPopen /usr/bin/ovs-vsctl rB get port ovs_eth0 tag";
constexpr char kSet[] = "VLIBCExecl /usr/bin/ovs-vsctl set port ovs_eth0 tag=20";
constexpr char kClear[] = "VLIBCExec /usr/bin/ovs-vsctl clear port ovs_eth0 tag";

/** A record whose every byte shows whether it was written. */
_tag_VLIB_VLAN Untouched()
{
    _tag_VLIB_VLAN vlan{};
    std::memset(&vlan, 0x7E, sizeof(vlan));
    return vlan;
}

TEST(VlanManagerGet, ReadsTheTagOfAPort)
{
    RecordingPlatform platform;
    platform.Output(kGet, "10\n");
    _tag_VLIB_VLAN vlan = Untouched();
    EXPECT_EQ(VlanManager::Get("ovs_eth0", &vlan), 1);
    EXPECT_STREQ(vlan.szIfName, "ovs_eth0");
    EXPECT_STREQ(vlan.szRealName, "ovs_eth0");
    EXPECT_EQ(vlan.vlanId, 10);
    EXPECT_THAT(platform.Calls(),
                ElementsAre(kGet, "VLIBCPclose /usr/bin/ovs-vsctl get port ovs_eth0 tag"));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(VlanManagerGet, Answers0ForAPortWithoutATag)
{
    RecordingPlatform platform;
    platform.Output(kGet, "[]\n");
    _tag_VLIB_VLAN vlan = Untouched();
    EXPECT_EQ(VlanManager::Get("ovs_eth0", &vlan), 0);
    EXPECT_STREQ(vlan.szIfName, "ovs_eth0");
    EXPECT_STREQ(vlan.szRealName, "ovs_eth0");
    EXPECT_EQ(vlan.vlanId, Untouched().vlanId);
    EXPECT_THAT(platform.Log(), ElementsAre(Info(kFile, "ovs_eth0 without any vlan tag")));
}

TEST(VlanManagerGet, LooksAtTheFirstTwoCharactersForAnEmptyTag)
{
    for (const char* text : {"[]", "[] 12\n", "[]x"}) {
        RecordingPlatform platform;
        platform.Output(kGet, text);
        _tag_VLIB_VLAN vlan{};
        EXPECT_EQ(VlanManager::Get("ovs_eth0", &vlan), 0) << text;
    }
    for (const char* text : {"[", "[x]\n", " []\n"}) {
        RecordingPlatform platform;
        platform.Output(kGet, text);
        _tag_VLIB_VLAN vlan = Untouched();
        EXPECT_EQ(VlanManager::Get("ovs_eth0", &vlan), 1) << text;
        EXPECT_EQ(vlan.vlanId, 0) << text;
    }
}

TEST(VlanManagerGet, GivesId0AndResult1ForNoOutput)
{
    RecordingPlatform platform;
    platform.Output(kGet, "");
    _tag_VLIB_VLAN vlan = Untouched();
    EXPECT_EQ(VlanManager::Get("ovs_eth0", &vlan), 1);
    EXPECT_EQ(vlan.vlanId, 0);
}

TEST(VlanManagerGet, ReadsTheFirstLinesDecimalDigitsUpToAnotherCharacter)
{
    const std::vector<std::pair<std::string, int>> rows{
        {"4094", 4094}, {" 12abc", 12}, {"0x10", 0}, {"010", 10}, {"abc", 0}, {"\n12", 0}};
    for (const auto& [text, id] : rows) {
        RecordingPlatform platform;
        platform.Output(kGet, text);
        _tag_VLIB_VLAN vlan = Untouched();
        EXPECT_EQ(VlanManager::Get("ovs_eth0", &vlan), 1) << text;
        EXPECT_EQ(vlan.vlanId, id) << text;
    }
}

TEST(VlanManagerGet, ReadsNoMoreThanOneLineOf1023Characters)
{
    RecordingPlatform platform;
    platform.Output(kGet, std::string(1022, ' ') + "123\n");
    _tag_VLIB_VLAN vlan = Untouched();
    EXPECT_EQ(VlanManager::Get("ovs_eth0", &vlan), 1);
    EXPECT_EQ(vlan.vlanId, 1);
}

TEST(VlanManagerGet, FailsWhenTheToolCannotBeStarted)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCPopen", 0);
    _tag_VLIB_VLAN vlan = Untouched();
    EXPECT_EQ(VlanManager::Get("ovs_eth0", &vlan), -1);
    EXPECT_STREQ(vlan.szIfName, "ovs_eth0");
    EXPECT_STREQ(vlan.szRealName, "ovs_eth0");
    EXPECT_EQ(vlan.vlanId, Untouched().vlanId);
    EXPECT_THAT(platform.Calls(), ElementsAre(kGet));
    EXPECT_THAT(
        platform.Log(),
        ElementsAre(Err(kFile, "Fail to execute cmd /usr/bin/ovs-vsctlget port ovs_eth0 tag")));
}

TEST(VlanManagerGet, NamesTheExitCodeOfAToolThatFails)
{
    const std::vector<std::pair<int, std::string>> rows{{kExitedWith1, "1"},
                                                        {kExitedWith77, "77"},
                                                        {255 << 8, "255"},
                                                        {kKilled, "-1"},
                                                        {kKilled | 0x80, "-1"}};
    for (const auto& [status, code] : rows) {
        RecordingPlatform platform;
        platform.Output(kGet, "10\n", status);
        _tag_VLIB_VLAN vlan = Untouched();
        EXPECT_EQ(VlanManager::Get("ovs_eth0", &vlan), -1) << status;
        EXPECT_EQ(vlan.vlanId, Untouched().vlanId) << status;
        EXPECT_THAT(
            platform.Log(),
            ElementsAre(Err(kFile, "Execute cmd /usr/bin/ovs-vsctlget port ovs_eth0 tag failed, "
                                   "err=" +
                                       code)))
            << status;
    }
}

TEST(VlanManagerGet, CutsTheNamesInTheRecordTo15Characters)
{
    RecordingPlatform platform;
    const std::string port = "abcdefghijklmnopq";
    platform.Output("VLIBCPopen /usr/bin/ovs-vsctl rB get port " + port + " tag", "5\n");
    _tag_VLIB_VLAN vlan = Untouched();
    EXPECT_EQ(VlanManager::Get(port, &vlan), 1);
    EXPECT_STREQ(vlan.szIfName, "abcdefghijklmno");
    EXPECT_STREQ(vlan.szRealName, "abcdefghijklmno");
}

TEST(VlanManagerGet, StandsANameOf5000Characters)
{
    RecordingPlatform platform;
    platform.Answer("VLIBCPopen", 0);
    _tag_VLIB_VLAN vlan = Untouched();
    EXPECT_EQ(VlanManager::Get(LongName(), &vlan), -1);
    EXPECT_EQ(std::string(vlan.szIfName), std::string(15, 'x'));
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err(kFile, "Fail to execute cmd /usr/bin/ovs-vsctlget port " +
                                           LongName() + " tag")));
}

TEST(VlanManagerSet, SetsTheTagOfThePort)
{
    const RecordingPlatform platform;
    EXPECT_EQ(VlanManager::Set("ovs_eth0", "20"), 0);
    EXPECT_THAT(platform.Calls(), ElementsAre(kSet));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(VlanManagerSet, FailsOnEveryAnswerBut0)
{
    for (const int answer : {-1, 1}) {
        RecordingPlatform platform;
        platform.Answer("VLIBCExecl", answer);
        EXPECT_EQ(VlanManager::Set("ovs_eth0", "20"), -1) << answer;
        EXPECT_THAT(platform.Log(),
                    ElementsAre(Err(kFile, "set ovs_eth0's vlan tag failed, tag ID = 20")))
            << answer;
    }
}

TEST(VlanManagerSet, DoesNotReadTheId)
{
    const RecordingPlatform platform;
    EXPECT_EQ(VlanManager::Set("ovs_eth0", "no number"), 0);
    EXPECT_EQ(VlanManager::Set("ovs_eth0", ""), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCExecl /usr/bin/ovs-vsctl set port ovs_eth0 'tag=no number'",
                            "VLIBCExecl /usr/bin/ovs-vsctl set port ovs_eth0 tag="));
}

TEST(VlanManagerSet, CutsTheTagToItsBuffer)
{
    const RecordingPlatform platform;
    EXPECT_EQ(VlanManager::Set(LongName(), LongName()), 0);
    EXPECT_THAT(platform.Calls(), ElementsAre("VLIBCExecl /usr/bin/ovs-vsctl set port " +
                                              LongName() + " tag=" + std::string(1019, 'x')));
}

TEST(VlanManagerClear, ClearsTheTagOfThePort)
{
    const RecordingPlatform platform;
    EXPECT_EQ(VlanManager::Clear("ovs_eth0"), 0);
    EXPECT_THAT(platform.Calls(), ElementsAre(kClear));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(VlanManagerClear, FailsOnEveryAnswerBut0)
{
    for (const int answer : {-1, 1}) {
        RecordingPlatform platform;
        platform.Answer("VLIBCExec", answer);
        EXPECT_EQ(VlanManager::Clear("ovs_eth0"), -1) << answer;
        EXPECT_THAT(platform.Log(), ElementsAre(Err(kFile, "clear ovs_eth0's vlan tag failed")))
            << answer;
    }
}

TEST(VlanManagerClear, StandsANameOf5000Characters)
{
    const RecordingPlatform platform;
    EXPECT_EQ(VlanManager::Clear(LongName()), 0);
    EXPECT_THAT(platform.Calls(),
                ElementsAre("VLIBCExec /usr/bin/ovs-vsctl clear port " + LongName() + " tag"));
}

} // namespace
