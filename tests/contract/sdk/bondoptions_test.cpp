#include "support/bondoptions.h"

#include "tools.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/mount.h>

namespace {

using contract::WriteFile;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Pair;
using vornhost::BondOptions;

using Values = std::map<std::string, std::string>;

BondOptions Options(const Values& values)
{
    return {values};
}

TEST(BondOptionsParse, TakesNamesAndNumbersOfModesForTheSame)
{
    const Values wanted{{"mode", "802.3ad"},
                        {"miimon", "100"},
                        {"lacp_rate", "fast"},
                        {"xmit_hash_policy", "layer3+4"}};

    EXPECT_EQ(
        BondOptions::Parse("mode=802.3ad miimon=100 lacp_rate=fast xmit_hash_policy=layer3+4"),
        Options(wanted));
    EXPECT_EQ(BondOptions::Parse(" mode=4  miimon=100\tlacp_rate=1 xmit_hash_policy=1 "),
              Options(wanted));
}

TEST(BondOptionsParse, KnowsEveryModesNumber)
{
    const char* const names[] = {"balance-rr", "active-backup", "balance-xor", "broadcast",
                                 "802.3ad",    "balance-tlb",   "balance-alb"};
    for (int number = 0; number < 7; ++number) {
        EXPECT_EQ(BondOptions::Parse("mode=" + std::to_string(number)).Get("mode"), names[number]);
    }
    EXPECT_EQ(BondOptions::Parse("mode=7").Get("mode"), "7");
}

TEST(BondOptionsParse, KeepsWhatItDoesNotKnowAndPassesOverWhatIsNoOption)
{
    EXPECT_EQ(BondOptions::Parse("new_option=1 =2 word"), Options({{"new_option", "1"}}));
    EXPECT_EQ(BondOptions::Parse(""), Options({}));
    EXPECT_EQ(BondOptions::Parse("miimon=100 miimon=50"), Options({{"miimon", "50"}}));
}

TEST(BondOptionProblem, IsWhatTheKernelsToolsWouldNotRead)
{
    EXPECT_EQ(vornhost::BondOptionProblem("miimon", "soon"),
              "is not a number from 0 to 4294967295");
    EXPECT_EQ(vornhost::BondOptionProblem("use_carrier", "256"), "is not a number from 0 to 255");
    EXPECT_EQ(vornhost::BondOptionProblem("ad_actor_sys_prio", "65536"),
              "is not a number from 0 to 65535");
    EXPECT_EQ(vornhost::BondOptionProblem("mode", "7"),
              "is none of balance-rr, active-backup, balance-xor, broadcast, 802.3ad, balance-tlb,"
              " balance-alb");
    EXPECT_EQ(vornhost::BondOptionProblem("lacp_rate", "Fast"), "is none of slow, fast");
    EXPECT_EQ(vornhost::BondOptionProblem("arp_ip_target", "192.0.2.1,x"),
              "is no list of IPv4 addresses");
    EXPECT_EQ(vornhost::BondOptionProblem("ns_ip6_target", "192.0.2.1"),
              "is no list of IPv6 addresses");
}

TEST(BondOptionProblem, IsNoneOfAValueThatTheyTakeOrOfAnOptionThatIsNotKnown)
{
    for (const auto& [name, value] : Values{{"miimon", "4294967295"},
                                            {"mode", "6"},
                                            {"lacp_rate", "fast"},
                                            {"arp_ip_target", "+192.0.2.1,192.0.2.2"},
                                            {"ns_ip6_target", "2001:db8::1"},
                                            {"ad_actor_system", "02:00:00:00:00:01"},
                                            {"primary", "eth1"},
                                            {"bond_updelay", "any"},
                                            {"new_option", "any"}}) {
        EXPECT_EQ(vornhost::BondOptionProblem(name, value), "") << name;
    }
}

TEST(BondOptionsParse, CollectsTheAddressesThatAreAskedFor)
{
    EXPECT_EQ(BondOptions::Parse("arp_ip_target=+192.0.2.1,+192.0.2.2 arp_ip_target=192.0.2.3"),
              Options({{"arp_ip_target", "192.0.2.1,192.0.2.2,192.0.2.3"}}));
}

TEST(BondOptionsText, BeginsWithTheModeAndParsesBack)
{
    const auto options = Options({{"arp_interval", "0"}, {"miimon", "100"}, {"mode", "802.3ad"}});

    EXPECT_EQ(options.Text(), "mode=802.3ad arp_interval=0 miimon=100");
    EXPECT_EQ(BondOptions::Parse(options.Text()), options);
    EXPECT_EQ(Options({}).Text(), "");
    EXPECT_EQ(Options({{"miimon", "100"}}).Text(), "miimon=100");
}

TEST(BondOptionsOverlaidWith, LetsTheOtherWin)
{
    EXPECT_EQ(Options({{"miimon", "100"}, {"updelay", "200"}})
                  .OverlaidWith(Options({{"miimon", "50"}, {"mode", "802.3ad"}})),
              Options({{"miimon", "50"}, {"mode", "802.3ad"}, {"updelay", "200"}}));
}

TEST(BondOptionsWithMode, LeavesOutWhatCountsInOtherModesOnly)
{
    EXPECT_EQ(Options({{"mode", "active-backup"}, {"primary", "eth0"}, {"miimon", "50"}})
                  .WithMode("balance-xor"),
              Options({{"mode", "balance-xor"}, {"miimon", "50"}}));
    EXPECT_EQ(Options({{"mode", "active-backup"}, {"primary", "eth0"}, {"miimon", "50"}})
                  .WithMode("balance-alb"),
              Options({{"mode", "balance-alb"}, {"primary", "eth0"}, {"miimon", "50"}}));
}

TEST(BondOptionsWithMode, PutsMonitoringInThePlaceOfOneThatTheModeRefuses)
{
    EXPECT_EQ(Options({{"mode", "active-backup"},
                       {"arp_interval", "1000"},
                       {"arp_ip_target", "192.0.2.1"},
                       {"miimon", "0"}})
                  .WithMode("802.3ad"),
              Options({{"mode", "802.3ad"}, {"miimon", "100"}}));
    EXPECT_EQ(Options({{"arp_interval", "1000"}}).WithMode("balance-xor"),
              Options({{"mode", "balance-xor"}, {"arp_interval", "1000"}}));
}

TEST(BondOptionsChosen, AreWhatANewBondDoesNotHaveAndWhatTheOtherNames)
{
    const BondOptions live = BondOptions::Parse("mode=balance-rr miimon=50 updelay=0 downdelay=200 "
                                                "min_links=0 new_option=1");

    EXPECT_EQ(live.Chosen(BondOptions::Parse("updelay=100")).Text(),
              "mode=balance-rr downdelay=200 miimon=50 new_option=1 updelay=0");
}

TEST(BondOptionsChosen, AreNotThoseThatTheKernelRefusesInTheirMode)
{
    const BondOptions live = BondOptions::Parse(
        "mode=active-backup lacp_rate=fast tlb_dynamic_lb=0 xmit_hash_policy=layer3+4 primary=eth0 "
        "arp_interval=1000");
    EXPECT_EQ(live.Chosen({}).Text(), "mode=active-backup arp_interval=1000 primary=eth0 "
                                      "xmit_hash_policy=layer3+4");

    const BondOptions other = BondOptions::Parse(
        "mode=802.3ad lacp_rate=fast packets_per_slave=2 primary=eth0 arp_interval=1000");
    EXPECT_EQ(other.Chosen({}).Text(), "mode=802.3ad lacp_rate=fast");
}

/** The kernel's folder of interfaces, with a bond such as this kernel may not be able to make. */
class LiveBond : public testing::Test {
protected:
    LiveBond() { EXPECT_EQ(mount("devices", vornhost::kInterfaceFolder, "tmpfs", 0, nullptr), 0); }
    ~LiveBond() override { EXPECT_EQ(umount(vornhost::kInterfaceFolder), 0); }

    static void Show(const std::string& option, const std::string& text)
    {
        WriteFile(std::string(vornhost::kInterfaceFolder) + "/bond0/bonding/" + option, text);
    }
};

TEST_F(LiveBond, HasItsOptionsReadUnderTheirNames)
{
    Show("mode", "802.3ad 4\n");
    Show("lacp_rate", "fast 1\n");
    Show("xmit_hash_policy", "layer3+4 1\n");
    Show("miimon", "100\n");
    Show("primary", "\n");
    Show("arp_ip_target", "192.0.2.1 192.0.2.2\n");
    Show("ad_partner_mac", "02:00:00:00:00:01\n");

    EXPECT_EQ(BondOptions::ReadLive("bond0"), Options({{"mode", "802.3ad"},
                                                       {"lacp_rate", "fast"},
                                                       {"xmit_hash_policy", "layer3+4"},
                                                       {"miimon", "100"},
                                                       {"arp_ip_target", "192.0.2.1,192.0.2.2"}}));
    EXPECT_EQ(BondOptions::ReadLive("bond1"), std::nullopt);
}

TEST_F(LiveBond, HasItsSlavesReadInTheirOrder)
{
    Show("slaves", "eth1 eth0\n");
    EXPECT_EQ(vornhost::ReadLiveSlaves("bond0"), (std::vector<std::string>{"eth1", "eth0"}));

    Show("slaves", "\n");
    EXPECT_EQ(vornhost::ReadLiveSlaves("bond0"), std::vector<std::string>());

    Show("slaves", "eth0 ++more++ \n");
    EXPECT_EQ(vornhost::ReadLiveSlaves("bond0"), std::nullopt);
    EXPECT_EQ(vornhost::ReadLiveSlaves("bond1"), std::nullopt);
}

TEST(SwitchColumns, AreTheTwinsOfTheOptions)
{
    EXPECT_THAT(vornhost::SwitchColumns(BondOptions::Parse(
                    "mode=802.3ad miimon=50 updelay=200 downdelay=100 lacp_rate=fast "
                    "ad_actor_system=02:00:00:00:00:09 ad_actor_sys_prio=100 use_carrier=0")),
                ElementsAre(Pair("bond_downdelay", "100"), Pair("bond_updelay", "200"),
                            Pair("other_config:bond-detect-mode", "miimon"),
                            Pair("other_config:bond-miimon-interval", "50"),
                            Pair("other_config:lacp-system-id", "02:00:00:00:00:09"),
                            Pair("other_config:lacp-system-priority", "100"),
                            Pair("other_config:lacp-time", "fast")));
    EXPECT_THAT(
        vornhost::SwitchColumns(BondOptions::Parse("mode=active-backup primary=eth1 miimon=100")),
        ElementsAre(Pair("other_config:bond-miimon-interval", "100"),
                    Pair("other_config:bond-primary", "eth1")));
}

TEST(SwitchColumns, AreNotThereForWhatTheSwitchDoesAnyway)
{
    EXPECT_THAT(vornhost::SwitchColumns(BondOptions::Parse(
                    "mode=802.3ad miimon=0 updelay=0 downdelay=0 lacp_rate=slow use_carrier=1 "
                    "ad_actor_system=00:00:00:00:00:00 ad_actor_sys_prio=65535")),
                IsEmpty());
    EXPECT_THAT(
        vornhost::SwitchColumns(BondOptions::Parse("mode=balance-xor primary=eth0 lacp_rate=fast")),
        IsEmpty());
}

TEST(WithoutTwin, NamesWhatHasNoEffectOnTheSwitch)
{
    EXPECT_THAT(vornhost::WithoutTwin(BondOptions::Parse(
                    "mode=802.3ad miimon=100 lacp_rate=fast min_links=2 ad_select=bandwidth "
                    "xmit_hash_policy=layer3+4 updelay=200 new_option=7 num_grat_arp=1")),
                ElementsAre("ad_select=bandwidth", "min_links=2", "new_option=7",
                            "xmit_hash_policy=layer3+4"));
    EXPECT_THAT(vornhost::WithoutTwin(BondOptions::Parse(
                    "mode=active-backup primary=eth0 primary_reselect=failure fail_over_mac=active "
                    "arp_interval=1000 arp_ip_target=192.0.2.1 ad_select=count")),
                ElementsAre("arp_interval=1000", "arp_ip_target=192.0.2.1", "fail_over_mac=active",
                            "primary_reselect=failure"));
}

TEST(WithoutTwin, NamesNothingThatANewBondHasAnyway)
{
    const char* const initial =
        "mode=balance-rr ad_actor_sys_prio=65535 ad_actor_system=00:00:00:00:00:00 "
        "ad_select=stable ad_user_port_key=0 all_slaves_active=0 arp_all_targets=any "
        "arp_interval=0 arp_missed_max=2 arp_validate=none downdelay=0 fail_over_mac=none "
        "lacp_active=on lacp_rate=slow lp_interval=1 miimon=0 min_links=0 num_grat_arp=1 "
        "num_unsol_na=1 packets_per_slave=1 peer_notif_delay=0 primary_reselect=always "
        "resend_igmp=1 tlb_dynamic_lb=1 updelay=0 use_carrier=1 xmit_hash_policy=layer2";
    for (const char* const mode : {"balance-rr", "active-backup", "balance-xor", "broadcast",
                                   "802.3ad", "balance-tlb", "balance-alb"}) {
        BondOptions options = BondOptions::Parse(initial);
        options.values["mode"] = mode;
        EXPECT_THAT(vornhost::WithoutTwin(options), IsEmpty()) << mode;
    }
}

} // namespace
