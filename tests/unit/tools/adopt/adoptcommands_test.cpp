#include "ctl.h"

#include <filesystem>
#include <fstream>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <linux/if_arp.h>

namespace {

using testing::HasSubstr;
using unit::Ctl;
using unit::Failed;
using unit::Host;
using unit::WrongUsage;

class AdoptCommands : public unit::OnAHost {
protected:
    AdoptCommands()
    {
        std::filesystem::remove_all("/usr/vorn/etc/vornnetd");
        std::filesystem::create_directories("/usr/vorn/etc/vornnetd");
    }

    static void AddLink(const std::string& name, const std::string& kind = "")
    {
        vornhost::Link link;
        link.index = static_cast<int>(Host().links.size()) + 2;
        link.name = name;
        link.kind = kind;
        link.mtu = 1500;
        link.type = ARPHRD_ETHER;
        Host().links.push_back(link);
    }
};

TEST_F(AdoptCommands, AdoptHasNothingToDoWhereNobodyManagesAnything)
{
    EXPECT_EQ(Ctl({"adopt"}), Failed(5, "there is no wired interface that somebody manages."));
}

TEST_F(AdoptCommands, AdoptOnlyTellsItsPlanInADryRun)
{
    AddLink("eth7");

    const unit::Outcome outcome = Ctl({"adopt", "--dry-run", "eth7"});

    EXPECT_EQ(outcome.exitStatus, 0);
    EXPECT_THAT(outcome.output, HasSubstr("eth7 (nobody manages it)\n"
                                          "  /etc/sysconfig/network-scripts/ifcfg-eth7:\n"
                                          "    DEVICE=eth7\n"));
    EXPECT_FALSE(std::filesystem::exists("/etc/sysconfig/network-scripts/ifcfg-eth7"));
    EXPECT_FALSE(std::filesystem::exists("/usr/vorn/etc/vornnetd/adopted"));
}

TEST_F(AdoptCommands, AdoptRefusesWithTheReasonAndChangesNothing)
{
    AddLink("br7", "bridge");

    EXPECT_EQ(Ctl({"adopt", "br7", "eth7"}),
              Failed(1, "br7: it is no wired interface, bond or VLAN\n"
                        "eth7: there is no such interface\n"
                        "Nothing was changed."));
    EXPECT_EQ(Ctl({"adopt", "a/b"}), WrongUsage("the interface's name holds a slash"));
}

TEST_F(AdoptCommands, AdoptRefusesWhileClientsAreRegistered)
{
    PutOnTheSwitch({"lab"});
    AddLink("eth7");

    EXPECT_EQ(Ctl({"adopt", "eth7"}),
              Failed(1, "clients are registered: lab.\n"
                        "Bring the host home first: 'vornovsctl unregister NAME' for each of "
                        "them.\nNothing was changed."));
}

TEST_F(AdoptCommands, ReleaseHasNothingToDoWhereNothingIsAdopted)
{
    EXPECT_EQ(Ctl({"release"}), Failed(5, "no interface is adopted."));
    EXPECT_EQ(Ctl({"release", "eth0"}), Failed(5, "not adopted: eth0."));
}

TEST_F(AdoptCommands, ReleaseRefusesWhileAnInterfaceIsOnTheSwitch)
{
    PutOnTheSwitch({"lab"});
    AddLink("eth0");
    AddLink("ovs_eth0", "openvswitch");
    std::filesystem::create_directories("/usr/vorn/etc/vornnetd/adopted");
    std::ofstream("/usr/vorn/etc/vornnetd/adopted/record.json")
        << R"({"version":1,"interfaces":[{"name":"eth0","manager":"ifupdown","origin":"",)"
           R"("profile":"","phase":"adopted","files":[],"clients":[],"stateLine":"","settings":{}}],)"
           R"("silencers":[],"units":[]})";

    EXPECT_EQ(Ctl({"release"}),
              Failed(1, "eth0 is on the switch for clients: lab.\n"
                        "Bring the host home first: 'vornovsctl unregister NAME' for each of "
                        "them.\nNothing was changed."));
    EXPECT_EQ(Ctl({"release", "--json"}).output,
              R"({
  "command": "release",
  "exitStatus": 1,
  "interfaces": [
    {
      "name": "eth0",
      "manager": "ifupdown",
      "origin": ""
    }
  ],
  "files": [],
  "enabled": [],
  "disabled": [],
  "done": false,
  "error": "eth0 is on the switch for clients: lab. Bring the host home first: 'vornovsctl unregister NAME' for each of them. Nothing was changed."
}
)");
}

} // namespace
