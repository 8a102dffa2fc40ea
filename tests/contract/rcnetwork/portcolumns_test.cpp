#include "rcnetwork/portcolumns.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace vornhost {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

InterfaceFile FileWith(const std::string& options)
{
    return ParseInterfaceFile("ovs_bond0", "DEVICE=ovs_bond0\nTYPE=OVS\nPRIMARY=eth0\n"
                                           "SLAVE_LIST=\"eth0 eth1 \"\nBONDING_OPTS=\"" +
                                               options + "\"\n")
        .file;
}

SwitchPort LivePort()
{
    SwitchPort port;
    port.name = "bond0";
    port.columns = {{"bond_mode", "balance-tcp"}, {"lacp", "active"}, {"bond_updelay", "100"}};
    port.otherConfig = {{"lacp-time", "fast"}, {"somebody", "else"}};
    port.externalIds = {{"vornovs-options", "bond_mode,lacp,other_config:lacp-time"}};
    return port;
}

TEST(PortColumns, SetOnlyWhatDiffers)
{
    const SwitchPort live = LivePort();
    const PortColumns columns(FileWith("bond_mode=active-backup lacp=active"), nullptr);

    EXPECT_EQ(columns.Changes(&live, true),
              " bond_mode=active-backup other_config:lacp-fallback-ab=true"
              " external_ids:vornovs-options=\"bond_mode,lacp,other_config:lacp-fallback-ab\"");
}

TEST(PortColumns, ClearWhatEarlierOptionsSetAndNothingElse)
{
    const SwitchPort live = LivePort();
    const PortColumns columns(FileWith("bond_mode=active-backup"), nullptr);

    EXPECT_THAT(columns.Removals("bond0", &live, true),
                ElementsAre("clear Port bond0 lacp", "remove Port bond0 other_config lacp-time"));
}

TEST(PortColumns, TakeTheFilesValueBeforeTheRememberedOne)
{
    const FormerBond former{{}, {{"bond_updelay", "200"}, {"other_config:lacp-time", "slow"}}};
    const PortColumns columns(
        FileWith("bond_mode=balance-slb lacp=off other-config:lacp-time=fast"), &former);

    EXPECT_EQ(columns.Changes(nullptr, true),
              " bond_mode=balance-slb bond_updelay=200 lacp=off other_config:lacp-time=fast"
              " external_ids:vornovs-options="
              "\"bond_mode,bond_updelay,lacp,other_config:lacp-time\"");
}

TEST(PortColumns, QuoteWhatTheToolWouldTakeForTheEndOfAValue)
{
    const PortColumns columns(FileWith("bond_mode=balance-slb other_config:a=b\"c\\d"), nullptr);

    EXPECT_EQ(columns.Changes(nullptr, true),
              " bond_mode=balance-slb other_config:a=\"b\\\"c\\\\d\""
              " external_ids:vornovs-options=\"bond_mode,other_config:a\"");
}

TEST(PortColumns, QuoteAKeyThatTheToolWouldTakeForTheEndOfOne)
{
    SwitchPort live = LivePort();
    live.otherConfig["x:y"] = "1";
    live.externalIds["vornovs-options"] = "bond_mode,other_config:x:y";
    const PortColumns columns(FileWith("bond_mode=balance-slb other_config:a[b]=c"), nullptr);

    EXPECT_EQ(columns.Changes(nullptr, true),
              " bond_mode=balance-slb other_config:\"a[b]\"=c"
              " external_ids:vornovs-options=\"bond_mode,other_config:a[b]\"");
    EXPECT_THAT(columns.Removals("bond0", &live, true),
                ElementsAre("remove Port bond0 other_config \"x:y\""));
}

TEST(PortColumns, LeaveOutWhatTheSwitchWouldNotTake)
{
    const PortColumns columns(
        FileWith("bond_mode=balance-slb bond_updelay=soon bond_downdelay=200 miimon=100"
                 " bond_fake_iface=yes other_config:=1 bond_updelay=-1"),
        nullptr);

    EXPECT_EQ(columns.Objection(), "");
    EXPECT_THAT(columns.Refusals(),
                ElementsAre("bond_updelay=soon is no number of milliseconds",
                            "the switch's bonds have no option \"miimon\"",
                            "bond_fake_iface=yes is neither true nor false",
                            "the switch's bonds have no option \"other_config:\"",
                            "bond_updelay=-1 is no number of milliseconds"));
    EXPECT_EQ(columns.Changes(nullptr, true),
              " bond_downdelay=200 bond_mode=balance-slb"
              " external_ids:vornovs-options=\"bond_downdelay,bond_mode\"");
}

TEST(PortColumns, ChangeNothingWhenItIsSo)
{
    SwitchPort live = LivePort();
    const PortColumns columns(FileWith("bond_mode=balance-tcp lacp=active"), nullptr);
    live.otherConfig["lacp-fallback-ab"] = "true";
    live.externalIds["vornovs-options"] = "bond_mode,lacp,other_config:lacp-fallback-ab";

    EXPECT_EQ(columns.Changes(&live, true), "");
    EXPECT_THAT(columns.Removals("bond0", &live, true), IsEmpty());
}

struct Refusal {
    const char* options;
    const char* reason;
};

class RefusesOptions : public testing::TestWithParam<Refusal> {};

TEST_P(RefusesOptions, AndLeavesTheBondAsItIs)
{
    const SwitchPort live = LivePort();
    const PortColumns columns(FileWith(GetParam().options), nullptr);

    EXPECT_EQ(columns.Objection(), GetParam().reason);
    EXPECT_EQ(columns.Changes(&live, true), "");
    EXPECT_THAT(columns.Removals("bond0", &live, true), IsEmpty());
}

INSTANTIATE_TEST_SUITE_P(
    Options, RefusesOptions,
    testing::Values(Refusal{"", "BONDING_OPTS is empty"},
                    Refusal{"mode=4 miimon=100", "the switch has no bond mode \"\""},
                    Refusal{"bond_mode=round-robin", "the switch has no bond mode \"round-robin\""},
                    Refusal{"bond_mode=balance-tcp lacp=maybe",
                            "lacp=maybe is neither active nor passive nor off"}));

} // namespace
} // namespace vornhost
