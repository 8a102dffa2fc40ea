#include "sdk/selection.h"

#include <algorithm>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <net/if_arp.h>
#include <random>

namespace vornhost {

void PrintTo(const Selection& selection, std::ostream* stream)
{
    *stream << "convertible " << testing::PrintToString(selection.convertible) << ", passed over "
            << testing::PrintToString(selection.passedOver) << ", too long "
            << testing::PrintToString(selection.tooLong) << ", not Ethernet "
            << testing::PrintToString(selection.notEthernet);
}

} // namespace vornhost

namespace {

using vornhost::Candidate;
using vornhost::SelectInterfaces;
using vornhost::Selection;

Candidate Device(int index, const std::string& name, const std::string& kind)
{
    Candidate candidate;
    candidate.link.index = index;
    candidate.link.name = name;
    candidate.link.kind = kind;
    candidate.link.type = ARPHRD_ETHER;
    return candidate;
}

Candidate Card(int index, const std::string& name)
{
    Candidate card = Device(index, name, "");
    card.hardware = true;
    return card;
}

Candidate WithFile(Candidate candidate)
{
    candidate.ownFile = true;
    return candidate;
}

Candidate Below(Candidate candidate, int master)
{
    candidate.link.master = master;
    return candidate;
}

Candidate Vlan(int index, const std::string& name, int parent)
{
    Candidate vlan = Device(index, name, "vlan");
    vlan.link.parent = parent;
    return vlan;
}

Selection Convertible(std::vector<std::string> names)
{
    return {std::move(names), {}, {}, {}};
}

Selection PassedOver(std::vector<std::string> names)
{
    return {{}, std::move(names), {}, {}};
}

TEST(SelectInterfaces, TakesHardwareBondsAndVlansOnThem)
{
    EXPECT_EQ(SelectInterfaces({Card(2, "eth0"), Device(3, "bond0", "bond"), Vlan(4, "eth0.10", 2),
                                Vlan(5, "bond0.5", 3), Vlan(6, "eth0.10.7", 4)}),
              Convertible({"eth0", "bond0", "eth0.10", "bond0.5", "eth0.10.7"}));
}

TEST(SelectInterfaces, TakesAnyOtherEthernetDeviceOnlyWithAFileOfItsOwn)
{
    for (const char* const kind : {"veth", "dummy", "tun", "macvlan", "vxlan", "openvswitch"}) {
        EXPECT_EQ(SelectInterfaces({Device(2, "net0", kind)}), Selection()) << kind;
        EXPECT_EQ(SelectInterfaces({WithFile(Device(2, "net0", kind))}), Convertible({"net0"}))
            << kind;
    }
}

TEST(SelectInterfaces, LeavesOutAVlanOnSomethingElse)
{
    Candidate loose = Vlan(9, "far.10", 77); // its parent is in another network
    EXPECT_EQ(SelectInterfaces({Device(2, "veth0", "veth"), Vlan(3, "veth0.10", 2), loose}),
              Selection());
    EXPECT_EQ(SelectInterfaces({Device(2, "veth0", "veth"), WithFile(Vlan(3, "veth0.10", 2))}),
              Convertible({"veth0.10"}));
}

TEST(SelectInterfaces, SurvivesVlansThatStandOnEachOther)
{
    EXPECT_EQ(SelectInterfaces({Vlan(2, "a", 3), Vlan(3, "b", 2)}), Selection());
}

TEST(SelectInterfaces, NeverTakesLoopbackOrTheSwitchsOwnDevice)
{
    Candidate loopback = WithFile(Device(1, "lo", ""));
    loopback.link.loopback = true;
    EXPECT_EQ(SelectInterfaces({loopback, WithFile(Device(2, "ovs-system", "openvswitch"))}),
              Selection());
}

TEST(SelectInterfaces, LeavesOutThePortsOfALinuxBridgeOrBond)
{
    EXPECT_EQ(SelectInterfaces({Device(2, "bond0", "bond"), Below(Card(3, "eth0"), 2),
                                Device(4, "br0", "bridge"), Below(WithFile(Card(5, "eth1")), 4),
                                Below(Card(6, "eth2"), 99)}),
              Convertible({"bond0"}));
}

TEST(SelectInterfaces, TakesAPortOfTheSwitch)
{
    EXPECT_EQ(SelectInterfaces({Device(2, "ovs-system", "openvswitch"), Below(Card(3, "eth0"), 2)}),
              Convertible({"eth0"}));
}

TEST(SelectInterfaces, PutsWhatNoCallerConvertsLast)
{
    Candidate modem = WithFile(Device(7, "ppp0", "ppp"));
    modem.link.type = ARPHRD_PPP;
    EXPECT_EQ(
        SelectInterfaces({WithFile(Device(2, "br0", "bridge")),
                          WithFile(Device(3, "ovs_eth0", "openvswitch")),
                          WithFile(Device(4, "wlan0", "")), WithFile(Device(5, "tun0", "tun")),
                          Card(6, "eth0"), modem, WithFile(Device(8, "ov", "veth"))}),
        (Selection{{"eth0"}, {"br0", "ovs_eth0", "wlan0", "tun0", "ppp0", "ov"}, {}, {}}));
}

TEST(SelectInterfaces, PassesOverALinuxBridgeOfAnyName)
{
    EXPECT_EQ(SelectInterfaces({WithFile(Device(2, "lan", "bridge"))}), PassedOver({"lan"}));
}

TEST(SelectInterfaces, LeavesOutWirelessDevices)
{
    Candidate wireless = Card(2, "wlp3s0");
    wireless.wireless = true;
    EXPECT_EQ(SelectInterfaces({wireless}), Selection());
    EXPECT_EQ(SelectInterfaces({WithFile(wireless)}), (Selection{{}, {}, {}, {"wlp3s0"}}));
}

TEST(SelectInterfaces, LeavesOutWhatIsNoEthernetDevice)
{
    Candidate tunnel = WithFile(Device(2, "wg0", "wireguard"));
    tunnel.link.type = ARPHRD_NONE;
    Candidate fabric = Card(3, "ib0");
    fabric.link.type = ARPHRD_INFINIBAND;
    EXPECT_EQ(SelectInterfaces({tunnel, fabric}), (Selection{{}, {}, {}, {"wg0"}}));
}

TEST(SelectInterfaces, NamesWhatHasNoRoomForTheBridgesPrefix)
{
    EXPECT_EQ(SelectInterfaces({Card(2, "enp0s31f6n1"), Card(3, "enp0s31f6np1"),
                                WithFile(Device(4, "ovs_enp0s31f6n1", "openvswitch"))}),
              (Selection{{"enp0s31f6n1"}, {"ovs_enp0s31f6n1"}, {"enp0s31f6np1"}, {}}));
}

TEST(SelectInterfaces, NeverTakesWhatWasMadeForATag)
{
    Candidate tag = WithFile(Vlan(3, "tag2.10", 2));
    tag.link.vlanId = 10;

    EXPECT_EQ(SelectInterfaces({Card(2, "eth0"), tag}), Convertible({"eth0"}));
}

TEST(SelectInterfaces, TakesAVlanOfAnyNameThatBecomesItsParentsTag)
{
    Candidate vlan = Vlan(3, "enp0s31f6.1000", 2);
    vlan.tag = true;
    EXPECT_EQ(SelectInterfaces({Card(2, "enp0s31f6"), vlan}),
              Convertible({"enp0s31f6", "enp0s31f6.1000"}));

    vlan.tag = false;
    EXPECT_EQ(SelectInterfaces({Card(2, "enp0s31f6"), vlan}),
              (Selection{{"enp0s31f6"}, {}, {"enp0s31f6.1000"}, {}}));
}

TEST(SelectInterfaces, KeepsTheKernelsOrderWhateverTheOrderOfTheList)
{
    std::vector<Candidate> cards;
    std::vector<std::string> names;
    for (int index = 0; index < 20; ++index) {
        cards.push_back(Card(index + 2, "eth" + std::to_string(index)));
        names.push_back("eth" + std::to_string(index));
    }
    std::mt19937 random(1);
    for (int round = 0; round < 10; ++round) {
        std::shuffle(cards.begin(), cards.end(), random);
        EXPECT_EQ(SelectInterfaces(cards), Convertible(names));
    }
}

} // namespace
