#include "show/hostdot.h"
#include "show/hostjson.h"
#include "show/hosttree.h"
#include "show/samplehost.h"

#include "dotsyntax.h"

#include <fstream>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sstream>

namespace {

using testing::HasSubstr;
using unit::DotFault;
using unit::MakeDevice;
using unit::PlainHost;
using unit::SampleHost;
using vornovsctl::DotOf;
using vornovsctl::DrawTree;
using vornovsctl::FieldsOf;
using vornovsctl::HostModel;
using vornovsctl::Terminal;
using vornovsctl::TreeOf;

std::string Recorded(const std::string& name)
{
    std::ifstream file(VORNOVS_TEST_DATA "/" + name);
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

std::string Tree(const HostModel& host)
{
    return DrawTree(TreeOf(host), Terminal{true, false, 0});
}

TEST(TreeOf, DrawsAHostOnTheSwitch)
{
    EXPECT_EQ(Tree(SampleHost()), R"(nas
├─ clients: apps, vms
├─ switch: running
│  ├─ bridge br-vms no device
│  ├─ bridge ovs_bond0 up 52:54:00:00:00:01
│  │  ├─ 192.0.2.10/24
│  │  ├─ default via 192.0.2.1
│  │  ├─ default via fe80::1 metric 1024
│  │  └─ bond bond0 balance-tcp LACP negotiated
│  │     ├─ member eth1 up 1000 Mbit/s 52:54:00:00:00:01
│  │     └─ member eth2 no link 52:54:00:00:00:02 LACP without partner
│  ├─ bridge ovs_bond1 up 52:54:00:00:00:04
│  │  ├─ 203.0.113.4/24
│  │  └─ bond bond1 active-backup
│  │     ├─ member eth4 up 1000 Mbit/s 52:54:00:00:00:04
│  │     └─ member eth5 up 1000 Mbit/s 52:54:00:00:00:05 active
│  └─ bridge ovs_eth0 up 52:54:00:00:00:00 VLAN 10
│     ├─ 2001:db8::2/64
│     ├─ port eth0 up 1000 Mbit/s 52:54:00:00:00:00
│     ├─ port tap0 up 10 Gbit/s 52:54:00:00:00:07 VLAN 20
│     └─ port tap2 no device trunk 30 40 (No such device)
├─ interface eth3 up 1000 Mbit/s 52:54:00:00:00:03 taken off the switch
│  └─ 198.51.100.2/24
└─ interface eth9 no device taken off the switch
)");
}

TEST(TreeOf, DrawsAPlainHost)
{
    EXPECT_EQ(Tree(PlainHost()), R"(nas
├─ clients: none
├─ switch: not running
├─ Linux bond bond0 up 2000 Mbit/s 802.3ad LACP negotiated 52:54:00:00:00:01
│  ├─ VLAN bond0.10 id 10 up 52:54:00:00:00:01
│  │  ├─ 192.0.2.10/24
│  │  ├─ 2001:db8::2/64
│  │  ├─ default without gateway metric 50 table 100
│  │  └─ default without gateway (IPv6)
│  ├─ member eth1 up 1000 Mbit/s 52:54:00:00:00:01
│  └─ member eth2 up 1000 Mbit/s 52:54:00:00:00:02
├─ Linux bond bond1 up 1000 Mbit/s active-backup 52:54:00:00:00:04
│  └─ member eth3 up 1000 Mbit/s 52:54:00:00:00:03 active
└─ Linux bridge br0 down 52:54:00:00:00:05
   └─ member eth4 up 1000 Mbit/s 52:54:00:00:00:04
)");
}

TEST(TreeOf, DrawsWhatIsKnownWhenTheSwitchDoesNotAnswer)
{
    HostModel host;
    host.switchRuns = true;
    host.devices = {MakeDevice("eth0", 1), MakeDevice("ovs_eth0", 1)};
    host.devices[0].onTheSwitch = true;
    host.devices[1].onTheSwitch = true;
    host.devices[1].kind = "openvswitch";

    EXPECT_EQ(Tree(host),
              R"(host
├─ clients: not known
├─ switch: running, but what is on it is not known
├─ interface eth0 up 1000 Mbit/s 52:54:00:00:00:01 on the switch
└─ switch port ovs_eth0 up 1000 Mbit/s 52:54:00:00:00:01 on the switch
)");
    EXPECT_EQ(DotFault(DotOf(host)), "");
    EXPECT_THAT(DotOf(host), HasSubstr("on the switch"));
}

TEST(TreeOf, DrawsAVlanThatIsAPortOfABridgeOfItsOwn)
{
    HostModel host;
    host.name = "nas";
    host.clients = {"lab"};
    host.switchRuns = true;
    host.devices = {MakeDevice("eth0", 1), MakeDevice("eth0.10", 1)};
    host.devices[1].parent = "eth0";
    host.devices[1].vlan = 10;
    vornovsctl::Port port;
    port.name = "eth0.10";
    port.members = {{"eth0.10", "", {}, false, ""}};
    host.bridges = {{{"ovs_eth0.10", {}, {port}}}};

    EXPECT_EQ(Tree(host), R"(nas
├─ clients: lab
├─ switch: running
│  └─ bridge ovs_eth0.10 no device
│     └─ port eth0.10 up 1000 Mbit/s 52:54:00:00:00:01
└─ interface eth0 up 1000 Mbit/s 52:54:00:00:00:01
   └─ VLAN eth0.10 id 10 up 1000 Mbit/s 52:54:00:00:00:01
)");
    EXPECT_EQ(DotFault(DotOf(host)), "");
}

TEST(TreeOf, DrawsAMemberWithItsBridgeAlone)
{
    HostModel host = PlainHost();
    host.devices[1].master = "br0";
    host.devices[1].addresses.clear();
    host.devices[1].routes.clear();

    EXPECT_THAT(Tree(host), testing::EndsWith(R"(
├─ Linux bond bond0 up 2000 Mbit/s 802.3ad LACP negotiated 52:54:00:00:00:01
│  ├─ member eth1 up 1000 Mbit/s 52:54:00:00:00:01
│  └─ member eth2 up 1000 Mbit/s 52:54:00:00:00:02
├─ Linux bond bond1 up 1000 Mbit/s active-backup 52:54:00:00:00:04
│  └─ member eth3 up 1000 Mbit/s 52:54:00:00:00:03 active
└─ Linux bridge br0 down 52:54:00:00:00:05
   ├─ VLAN bond0.10 id 10 up 52:54:00:00:00:01
   └─ member eth4 up 1000 Mbit/s 52:54:00:00:00:04
)"));
}

TEST(TreeOf, DoesNotCallAnInterfaceTakenOffThatHasComeBack)
{
    HostModel host = SampleHost();
    const std::string before = Tree(host);
    host.takenOff->insert({"eth0", "eth1"});

    EXPECT_EQ(Tree(host), before);
    EXPECT_EQ(DotOf(host), DotOf(SampleHost()));
}

TEST(DotOf, DrawsAHostOnTheSwitch)
{
    EXPECT_EQ(DotOf(SampleHost()), Recorded("samplehost.dot"));
    EXPECT_EQ(DotFault(DotOf(SampleHost())), "");
}

TEST(DotOf, DrawsAPlainHost)
{
    EXPECT_EQ(DotOf(PlainHost()), Recorded("plainhost.dot"));
    EXPECT_EQ(DotFault(DotOf(PlainHost())), "");
}

TEST(DotOf, EscapesWhatWouldMeanSomethingElse)
{
    HostModel host;
    host.name = "n\"as\\N&lt;";
    host.clients = {"a\nb", "\xff", "\xc3\xa4"};
    host.devices = {MakeDevice("e\"t]h;\\", 1)};

    EXPECT_EQ(DotOf(host), R"(graph host {
  graph [rankdir=LR];
  node [shape=box, fontname="sans-serif"];
  edge [fontname="sans-serif"];
  host [label="n\"as\\N&amp;lt;\nclients: a\\x0ab, )"
                           "\xc3\xa4"
                           R"(, \\xff\nswitch: not running", style=bold];
  "device e\"t]h;\\" [label="interface e\"t]h;\\\nup 1000 Mbit/s\n52:54:00:00:00:01"];
  host -- "device e\"t]h;\\";
}
)");
    EXPECT_EQ(DotFault(DotOf(host)), "");
}

TEST(DotSyntax, IsToldFromWhatIsNone)
{
    EXPECT_EQ(DotFault("graph host {\n  a [x=\"y\"];\n  a -- \"b\\\"\" [l=1, m=2];\n}\n"), "");
    for (const char* const text :
         {"", "graph host {", "graph host { a -- ; }", "graph host { a [x=]; }",
          "graph host { \"a ; }", "graph host { a } }", "graph host { a b; }",
          "graph host { a [x=\"y\" z]; }", "graph host { a-b; }", "graph { a -- b -> c; }"}) {
        EXPECT_NE(DotFault(text), "") << text;
    }
}

TEST(FieldsOf, TellsEverything)
{
    EXPECT_EQ(FieldsOf(SampleHost()).dump(2) + '\n', Recorded("samplehost.json"));
    EXPECT_EQ(FieldsOf(PlainHost()).dump(2) + '\n', Recorded("plainhost.json"));
}

TEST(FieldsOf, TellsWhatIsNotKnown)
{
    HostModel host;
    host.unread = {"the registrations cannot be read"};

    EXPECT_EQ(FieldsOf(host).dump(), R"({"host":"","clients":null,"takenOff":null,)"
                                     R"("switchRunning":false,"bridges":null,"devices":[],)"
                                     R"("unread":["the registrations cannot be read"]})");
}

} // namespace
