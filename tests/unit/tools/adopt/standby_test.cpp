#include "adopt/recordedhost.h"

#include <adopt/standby.h>

#include <gmock/gmock.h>
#include <linux/if_addr.h>
#include <linux/rtnetlink.h>
#include <sys/socket.h>

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using unit::RecordedHost;
using vornovsctl::Manager;
using vornovsctl::StandbyFor;

class ListingHands : public vornovsctl::Hands {
public:
    bool Feed(const std::vector<std::string>& argv, const std::string& input) override
    {
        runs.push_back(argv.at(1) + '\n' + input);
        return true;
    }

    std::vector<std::string> runs;
};

/** A host with what servers and routers give to one interface, and something else on another. */
class StandbyTest : public testing::Test {
protected:
    StandbyTest()
    {
        m_host.AddLink("eth0", "52:54:00:00:00:00");
        m_host.AddLink("eth1", "52:54:00:00:00:01");
        m_host.AddAddress("eth0", "192.0.2.10", 24);
        m_host.AddAddress("eth1", "198.51.100.7", 24);
        Leased("192.0.2.17", 24);
        Leased("2001:db8::1:2", 64);
        Leased("2001:db8::180", 128);
        m_host.AddDefaultRoute("eth0", "192.0.2.1", 100);
        m_host.view.live.routes.back().source = "192.0.2.17";
        m_host.AddDefaultRoute("eth0", "fe80::1", 1024);
        m_host.AddDefaultRoute("eth1", "198.51.100.1", 0);
        m_host.AddDefaultRoute("eth0", "", 100);
        vornhost::Route& network = m_host.view.live.routes.back();
        network.family = AF_INET;
        network.destination = "192.0.2.0";
        network.prefixLength = 24;
        network.protocol = RTPROT_DHCP;
        network.source = "192.0.2.17";
    }

    void Leased(const std::string& address, unsigned prefixLength)
    {
        m_host.AddAddress("eth0", address, prefixLength, false);
        m_host.view.live.addresses.back().preferredSeconds = 300;
        m_host.view.live.addresses.back().flags = IFA_F_NOPREFIXROUTE;
    }

    vornhost::Address& At(const std::string& local)
    {
        for (vornhost::Address& address : m_host.view.live.addresses) {
            if (address.local == local) {
                return address;
            }
        }
        throw std::runtime_error("no " + local);
    }

    /** As the kernel has it when the substitutes are there and nothing else is. */
    void LoseAll()
    {
        for (const char* address : {"192.0.2.17", "2001:db8::1:2", "2001:db8::180"}) {
            At(address).preferredSeconds = At(address).validSeconds = UINT32_MAX;
        }
        At("192.0.2.17").prefixLength = 32;
        for (vornhost::Route& route : m_host.view.live.routes) {
            route.priority += 1;
        }
    }

    RecordedHost m_host;
    ListingHands m_hands;
};

TEST_F(StandbyTest, IsLastingAndOfAMetricOfItsOwn)
{
    PutUp(StandbyFor(m_host.view, {{"eth0", Manager::kNetworkd}}), m_hands);

    EXPECT_THAT(m_hands.runs,
                ElementsAre("-4\n"
                            "address replace 192.0.2.17/32 dev eth0 noprefixroute\n"
                            "route replace 192.0.2.0/24 dev eth0 table 254 proto static metric 101"
                            " src 192.0.2.17 scope link\n"
                            "route replace default via 192.0.2.1 dev eth0 table 254 proto static"
                            " metric 101 src 192.0.2.17\n"
                            "route del default via 192.0.2.1 dev eth0 table 254 proto 4"
                            " metric 100\n"
                            "route del 192.0.2.0/24 dev eth0 table 254 proto 16 metric 100\n"
                            "address del 192.0.2.17/24 dev eth0\n",
                            "-6\n"
                            "route replace default via fe80::1 dev eth0 table 254 proto static"
                            " metric 1025\n"
                            "route del default via fe80::1 dev eth0 table 254 proto 4"
                            " metric 1024\n"
                            "address change 2001:db8::1:2/64 dev eth0 noprefixroute mngtmpaddr"
                            " valid_lft forever preferred_lft forever\n"
                            "address change 2001:db8::180/128 dev eth0 noprefixroute"
                            " valid_lft forever preferred_lft forever\n"));
}

TEST_F(StandbyTest, HasTheRoutesThatTheKernelMadeOfAddresses)
{
    m_host.view.live.routes.clear();
    m_host.view.live.addresses.clear();
    m_host.AddAddress("eth0", "192.0.2.10", 24);
    m_host.AddAddress("eth0", "2001:db8::10", 64);
    m_host.AddAddress("eth0", "fe80::10", 64);
    Leased("192.0.2.17", 24); // as it is to be
    const auto standby = StandbyFor(m_host.view, {{"eth0", Manager::kNetworkManager}});

    PutUp(standby, m_hands);

    EXPECT_THAT(m_hands.runs,
                ElementsAre("-4\n"
                            "address replace 192.0.2.10/32 dev eth0 noprefixroute\n"
                            "route replace 192.0.2.0/24 dev eth0 table 254 proto static metric 1"
                            " src 192.0.2.10 scope link\n"
                            "address del 192.0.2.10/24 dev eth0\n",
                            "-6\n"
                            "route replace 2001:db8::/64 dev eth0 table 254 proto static"
                            " metric 257\n"
                            "route replace fe80::/64 dev eth0 table 254 proto static metric 257\n"
                            "address change 2001:db8::10/64 dev eth0 noprefixroute"
                            " valid_lft forever preferred_lft forever\n"
                            "address change fe80::10/64 dev eth0 scope link noprefixroute"
                            " valid_lft forever preferred_lft forever\n"
                            "route del 2001:db8::/64 dev eth0 table 254 proto 2 metric 256\n"
                            "route del fe80::/64 dev eth0 table 254 proto 2 metric 256\n"));
    EXPECT_TRUE(IsReplaced(standby, m_host.view));
    m_host.view.live.addresses.front().prefixLength = 32;
    EXPECT_FALSE(IsReplaced(standby, m_host.view));
}

TEST_F(StandbyTest, LeavesTheKernelsRouteOfAnAddressThatStays)
{
    m_host.view.live.routes.clear();
    m_host.view.live.addresses.clear();
    Leased("2001:db8::1:2", 64);
    m_host.view.live.addresses.back().flags = 0;
    m_host.AddAddress("eth0", "2001:db8::10", 64);

    PutUp(StandbyFor(m_host.view, {{"eth0", Manager::kNetworkd}}), m_hands);

    EXPECT_THAT(m_hands.runs,
                ElementsAre("-6\n"
                            "route replace 2001:db8::/64 dev eth0 table 254 proto static"
                            " metric 257\n"
                            "address change 2001:db8::1:2/64 dev eth0 noprefixroute mngtmpaddr"
                            " valid_lft forever preferred_lft forever\n"));
}

TEST_F(StandbyTest, LeavesToTheKernelWhatRoutersTell)
{
    vornhost::Route& network = m_host.view.live.routes.back();
    m_host.view.live.routes = {network, m_host.view.live.routes.front()};

    PutUp(StandbyFor(m_host.view, {{"eth0", Manager::kIfupdown}}), m_hands);

    EXPECT_THAT(m_hands.runs,
                ElementsAre("-4\n"
                            "address replace 192.0.2.17/32 dev eth0 noprefixroute\n"
                            "route replace 192.0.2.0/24 dev eth0 table 254 proto static metric 101"
                            " src 192.0.2.17 scope link\n"
                            "route del 192.0.2.0/24 dev eth0 table 254 proto 16 metric 100\n"
                            "address del 192.0.2.17/24 dev eth0\n",
                            "-6\n"
                            "address change 2001:db8::180/128 dev eth0"
                            " valid_lft 500 preferred_lft 300\n"));
}

TEST_F(StandbyTest, GoesWhenEverythingIsThereAgain)
{
    const auto standby = StandbyFor(m_host.view, {{"eth0", Manager::kNetworkd}});

    EXPECT_TRUE(IsReplaced(standby, m_host.view));
    TakeDown(standby, m_host.view, m_hands);

    EXPECT_THAT(m_hands.runs,
                ElementsAre("-4\n"
                            "route del default via 192.0.2.1 dev eth0 table 254 proto static"
                            " metric 101\n"
                            "route del 192.0.2.0/24 dev eth0 table 254 proto static metric 101\n"
                            "address del 192.0.2.17/32 dev eth0\n",
                            "-6\n"
                            "route del default via fe80::1 dev eth0 table 254 proto static"
                            " metric 1025\n"));
}

TEST_F(StandbyTest, EndsWithItsLeaseWhenNoServerAnswers)
{
    const auto standby = StandbyFor(m_host.view, {{"eth0", Manager::kNetworkd}});
    LoseAll();

    EXPECT_FALSE(IsReplaced(standby, m_host.view));
    TakeDown(standby, m_host.view, m_hands);

    EXPECT_THAT(m_hands.runs,
                ElementsAre("-4\n"
                            "address change 192.0.2.17/32 dev eth0 noprefixroute"
                            " valid_lft 500 preferred_lft 300\n",
                            "-6\n"
                            "address change 2001:db8::1:2/64 dev eth0 noprefixroute mngtmpaddr"
                            " valid_lft 500 preferred_lft 300\n"
                            "address change 2001:db8::180/128 dev eth0 noprefixroute"
                            " valid_lft 500 preferred_lft 300\n"));
}

TEST_F(StandbyTest, IsNotNeededForWhatIsOfOtherInterfaces)
{
    const auto standby = StandbyFor(m_host.view, {{"eth2", Manager::kNetworkd}});

    PutUp(standby, m_hands);

    EXPECT_THAT(standby.addresses, IsEmpty());
    EXPECT_THAT(standby.routes, IsEmpty());
    EXPECT_THAT(m_hands.runs, IsEmpty());
}

} // namespace
