/**
 * What the network outside is told about an interface whose addresses have come from elsewhere.
 */
#include "host.h"
#include "rcnetwork/announce.h"
#include "rcnetwork/apply.h"
#include "support/descriptor.h"
#include "systemd/fakesystemd.h"

#include <array>
#include <chrono>
#include <future>
#include <set>
#include <sstream>

#include <arpa/inet.h>
#include <gmock/gmock.h>
#include <linux/if_packet.h>
#include <net/ethernet.h>
#include <net/if.h>
#include <sys/socket.h>

namespace contract {
namespace {

using testing::Contains;
using testing::IsSupersetOf;
using testing::Not;

constexpr char kArpOfEth0[] = "arp 0001"
                              "02000000000a"
                              "c0000205"
                              "000000000000"
                              "c0000205";

std::string Hex(const unsigned char* data, size_t size)
{
    static constexpr char kDigits[] = "0123456789abcdef";
    std::string text;
    for (size_t i = 0; i < size; ++i) {
        text += kDigits[data[i] >> 4U];
        text += kDigits[data[i] & 15U];
    }
    return text;
}

class AnnounceTest : public Host {
protected:
    void SetUp() override
    {
        Host::SetUp();
        Ip("link set eth0 address 02:00:00:00:00:0a up");
        Ip("link set cable0 up");
        Ip("address add 192.0.2.5/24 dev eth0");
        Ip("address add 2001:db8::5/64 dev eth0 nodad");
        m_wire.Reset(socket(AF_PACKET, SOCK_RAW | SOCK_CLOEXEC, htons(ETH_P_ALL)));
        sockaddr_ll cable{};
        cable.sll_family = AF_PACKET;
        cable.sll_protocol = htons(ETH_P_ALL);
        cable.sll_ifindex = static_cast<int>(if_nametoindex("cable0"));
        ASSERT_EQ(bind(m_wire.Get(), reinterpret_cast<sockaddr*>(&cable), sizeof cable), 0);
    }

    /** What has arrived at the other end: ARP packets, and neighbour advertisements from their
     * target on. */
    std::set<std::string> Arrived() const
    {
        constexpr size_t kEthernet = 14;
        constexpr size_t kIpv6 = 40;
        std::array<unsigned char, 2048> frame{};
        std::set<std::string> arrived;
        ssize_t size = 0;
        while ((size = recv(m_wire.Get(), frame.data(), frame.size(), MSG_DONTWAIT)) > 0) {
            const unsigned type = frame[12] * 256U + frame[13];
            if (type == ETHERTYPE_ARP) {
                arrived.insert("arp " + Hex(&frame[kEthernet + 6], 22));
            } else if (type == ETHERTYPE_REVARP) {
                arrived.insert("rarp " + Hex(&frame[kEthernet + 6], 22));
            } else if (type == ETHERTYPE_IPV6 && frame[kEthernet + 6] == IPPROTO_ICMPV6 &&
                       frame[kEthernet + kIpv6] == 136) {
                arrived.insert("advertisement hops " + std::to_string(frame[kEthernet + 7]) + ' ' +
                               Hex(&frame[kEthernet + kIpv6 + 4], 28));
            }
        }
        return arrived;
    }

    vornhost::Descriptor m_wire;
};

TEST_F(AnnounceTest, TellsTheLinkAddressOfEachAddress)
{
    EXPECT_TRUE(vornhost::Announce("eth0"));

    EXPECT_THAT(Arrived(), IsSupersetOf({
                               "rarp 0003"
                               "02000000000a"
                               "00000000"
                               "02000000000a"
                               "00000000",
                               kArpOfEth0,
                               "advertisement hops 255 20000000"
                               "20010db8000000000000000000000005"
                               "0201"
                               "02000000000a",
                           }));
}

TEST_F(AnnounceTest, SaysThatARouterIsOne)
{
    ASSERT_EQ(RunProgram({"sh", "-c", "echo 1 >/proc/sys/net/ipv6/conf/eth0/forwarding"}).exitCode,
              0);

    EXPECT_TRUE(vornhost::Announce("eth0"));

    EXPECT_THAT(Arrived(), Contains("advertisement hops 255 a0000000"
                                    "20010db8000000000000000000000005"
                                    "0201"
                                    "02000000000a"));
}

TEST_F(AnnounceTest, LeavesAddressesOutThatAreNotInUseYet)
{
    Ip("address add 2001:db8::6/64 dev eth0");

    EXPECT_TRUE(vornhost::Announce("eth0"));

    EXPECT_THAT(Arrived(), Not(Contains(testing::HasSubstr("20010db8000000000000000000000006"))));
}

TEST_F(AnnounceTest, FailsForAnInterfaceThatIsNotThere)
{
    EXPECT_FALSE(vornhost::Announce("eth7"));
}

TEST_F(AnnounceTest, GoesOnAsLongAsTheInterfaceIsThere)
{
    const auto begin = std::chrono::steady_clock::now();
    auto announcer = std::async(std::launch::async, [] { return RcNetwork({"announce", "eth0"}); });

    for (int time = 0; time < 2; ++time) {
        EXPECT_TRUE(WaitUntil([&] { return Arrived().contains(kArpOfEth0); })) << time;
    }
    Ip("link set eth0 down name other0");

    EXPECT_EQ(announcer.get(), (Outcome{0, "", ""}));
    EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(12));
    Ip("link set other0 name eth0");
}

TEST_F(AnnounceTest, GoesOnInAUnitOfItsOwnWhereSystemdRuns)
{
    harness::FakeSystemd systemd;
    systemd.AddUnit("vornovs-announce@.service");

    std::vector<vornhost::Remark> remarks;
    EXPECT_TRUE(
        vornhost::ApplyStage({vornhost::StageKind::kAnnouncer, "again", {"eth0"}}, remarks));

    EXPECT_THAT(Arrived(), Contains(kArpOfEth0));
    EXPECT_THAT(remarks, testing::IsEmpty());
    EXPECT_THAT(systemd.Jobs(), testing::ElementsAre("StartUnit vornovs-announce@eth0.service"));
}

} // namespace
} // namespace contract
