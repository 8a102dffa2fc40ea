#include "host.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <csignal>
#include <cstdlib>
#include <string>

#include <sys/mount.h>
#include <unistd.h>

namespace contract {
namespace {

using testing::HasSubstr;
using testing::StartsWith;

constexpr char kServersLog[] = "/run/servers.log";
constexpr char kServersProcess[] = "/run/servers.pid";
constexpr char kDhcp[] = "DEVICE=eth0\nBOOTPROTO=dhcp\nIPV6_AUTOCONF=yes\nDHCPV6C=no\nMETRIC=7\n";

/** A host with a real client and, in another network, a real server and router. */
class DhcpHost : public Host {
protected:
    static void SetUpTestSuite()
    {
        for (const char* program : {"vornovs-dhcp", "vornovs-dhcp-event"}) {
            WriteFile(std::string("/usr/vorn/lib/") + program,
                      ReadFile(std::string(VORNOVS_RCNETWORK_FOLDER) + "/" + program));
            (void)RunProgram({"chmod", "0755", std::string("/usr/vorn/lib/") + program});
        }
        WriteFile("/run/resolv.conf", "");
        ASSERT_EQ(mount("tmpfs", "/var/lib/dhcpcd", "tmpfs", 0, nullptr), 0);
        ASSERT_EQ(mount("/run/resolv.conf", "/etc/resolv.conf", nullptr, MS_BIND, nullptr), 0);
    }

    static void TearDownTestSuite()
    {
        (void)umount("/etc/resolv.conf");
        (void)umount("/var/lib/dhcpcd");
    }

    void SetUp() override
    {
        Host::SetUp();
        Ip("netns add outside");
        Ip("link set dev cable0 netns outside");
        Ip("-n outside address add 192.0.2.1/24 dev cable0");
        Ip("-n outside address add 2001:db8::1/64 dev cable0 nodad");
        Ip("-n outside link set dev cable0 up");
        WriteFile("/run/servers.conf",
                  "port=0\nno-ping\nuser=root\nbind-dynamic\ninterface=cable0\nenable-ra\n"
                  "dhcp-authoritative\ndhcp-range=192.0.2.100,192.0.2.120,255.255.255.0,1h\n"
                  "dhcp-range=2001:db8::,ra-only,64,1h\ndhcp-option=option:dns-server,192.0.2.53\n"
                  "dhcp-leasefile=/run/servers.leases\n" +
                      std::string("log-facility=") + kServersLog + "\npid-file=" + kServersProcess +
                      "\n");
        ASSERT_EQ(RunProgram({"ip", "netns", "exec", "outside", "dnsmasq",
                              "--conf-file=/run/servers.conf"}),
                  (Outcome{0, "", ""}));
    }

    void TearDown() override
    {
        (void)RcNetwork({"stop"});
        const int servers = std::atoi(ReadFile(kServersProcess).c_str());
        if (servers > 1) {
            (void)kill(servers, SIGTERM);
        }
        for (const char* file : {kServersLog, kServersProcess, "/run/servers.leases"}) {
            Delete(file);
        }
        // With the other network its end of the cable would go, and the port with that.
        Ip("-n outside link set dev cable0 netns " + std::to_string(getpid()));
        Ip("netns del outside");
        for (const char* ending : {".lease", ".lease6"}) {
            Delete(std::string("/var/lib/dhcpcd/eth0") + ending);
        }
        Host::TearDown();
    }

    /** Every address and route that does not come from the kernel itself, without lifetimes. */
    static std::string Served(const std::string& interface)
    {
        return RunProgram({"sh", "-c",
                           "ip -o address show scope global | sed 's/^[0-9]*: //; s/ *\\\\.*//;"
                           " s/  */ /g'; ip route; ip -6 route | grep -v 'proto kernel'"})
                   .output +
               "on " + interface;
    }

    static bool HasAddresses(const std::string& interface)
    {
        const std::string text =
            RunProgram({"ip", "address", "show", "dev", interface, "scope", "global"}).output;
        return text.find("inet ") != std::string::npos &&
               text.find("inet6 2001:db8:") != std::string::npos &&
               text.find("tentative") == std::string::npos;
    }

    static std::ptrdiff_t Requests(const std::string& kind)
    {
        const std::string log = ReadFile(kServersLog);
        std::ptrdiff_t count = 0;
        for (auto at = log.find(kind); at != std::string::npos; at = log.find(kind, at + 1)) {
            ++count;
        }
        return count;
    }

    static int Client(const std::string& interface)
    {
        return std::atoi(ReadFile("/run/vornovs/dhcp/" + interface + ".pid").c_str());
    }
};

/** The same text for another interface. */
std::string On(std::string text, const std::string& from, const std::string& to)
{
    for (auto at = text.find(from); at != std::string::npos; at = text.find(from, at + 1)) {
        text.replace(at, from.size(), to);
    }
    return text;
}

TEST_F(DhcpHost, AnAddressThatTheKernelRefusesKeepsNobodyElseFromTheNetwork)
{
    File("eth0", kDhcp);
    File("eth1", "DEVICE=eth1\nIPADDR=198.51.100.1\nPREFIX=24\nIPV6ADDR=ff02::5/64\n");

    const Outcome outcome = RcNetwork({"start"});

    EXPECT_EQ(outcome.exitCode, 1);
    EXPECT_THAT(outcome.errors, HasSubstr("could not be done: addr add ff02::5/64 dev eth1"));
    EXPECT_TRUE(WaitUntil([] { return HasAddresses("eth0"); }));
    EXPECT_THAT(Network(), HasSubstr("eth1 198.51.100.1/24"));
    EXPECT_EQ(RcNetwork({"start"}).exitCode, 1);
    EXPECT_TRUE(HasAddresses("eth0"));
}

TEST_F(DhcpHost, TheLeaseGoesWhereTheAddressesGo)
{
    File("eth0", kDhcp);
    ASSERT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""}));
    ASSERT_TRUE(WaitUntil([] { return HasAddresses("eth0"); }));
    const std::string plain = Served("eth0");
    EXPECT_THAT(plain, HasSubstr("default via 192.0.2.1 dev eth0 proto dhcp src 192.0.2.1"));
    EXPECT_THAT(plain, HasSubstr("proto ra metric 7 mtu 1500 pref medium"));
    EXPECT_TRUE(WaitUntil([] {
        return ReadFile("/etc/resolv.conf").find("nameserver 192.0.2.53\n") != std::string::npos;
    }));
    EXPECT_EQ(RcNetwork({"--dry-run", "start"}), (Outcome{0, "", ""}));

    File("br0", On(kDhcp, "eth0", "br0") + "TYPE=Bridge\n");
    File("eth0", "DEVICE=eth0\nBRIDGE=br0\n");
    const auto acknowledged = Requests("DHCPACK");
    EXPECT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""}));
    EXPECT_EQ(Served("br0"), On(plain, "eth0", "br0"));
    EXPECT_TRUE(WaitUntil([&] { return Requests("DHCPACK") > acknowledged; }));
    EXPECT_EQ(Served("br0"), On(plain, "eth0", "br0"));
    EXPECT_EQ(RcNetwork({"--dry-run", "start"}), (Outcome{0, "", ""}));

    Delete(IfcfgPath("br0"));
    File("eth0", kDhcp);
    EXPECT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""}));
    EXPECT_TRUE(WaitUntil([&] { return Requests("DHCPACK") > acknowledged + 1; }));
    EXPECT_EQ(Served("eth0"), plain);
    EXPECT_TRUE(WaitUntil([] {
        return ReadFile("/etc/resolv.conf").find("from eth0.dhcp\n") != std::string::npos;
    })) << ReadFile("/etc/resolv.conf");
    EXPECT_EQ(Requests("DHCPDISCOVER"), 1);
    EXPECT_EQ(Requests("DHCPRELEASE"), 0);
}

/** What a client tells when a server has given it something. */
void TellNameServer(const std::string& interface, const std::string& server)
{
    EXPECT_EQ(RunProgram({"env", "interface=" + interface, "reason=BOUND", "protocol=dhcp",
                          "if_configured=true", "if_up=true", "if_down=false",
                          "interface_order=" + interface, "new_domain_name_servers=" + server,
                          "/usr/vorn/lib/vornovs-dhcp-event"}),
              (Outcome{0, "", ""}));
}

TEST_F(DhcpHost, NameServersOfThePreferredWayComeFirstWhoeverSpokeLast)
{
    WriteFile("/run/vornovs/dhcp/eth0.conf", "interface eth0\nmetric 200\n");
    WriteFile("/run/vornovs/dhcp/eth1.conf", "interface eth1\nmetric 100\n");
    for (const bool again : {false, true}) {
        TellNameServer("eth1", "192.0.2.1");
        EXPECT_THAT(ReadFile("/etc/resolv.conf"), HasSubstr("nameserver 192.0.2.1\n")) << again;
        TellNameServer("eth0", "192.0.2.2");
        EXPECT_THAT(ReadFile("/etc/resolv.conf"),
                    HasSubstr("from eth1.dhcp, eth0.dhcp\n"
                              "# /etc/resolv.conf.head can replace this line\n"
                              "nameserver 192.0.2.1\nnameserver 192.0.2.2\n"))
            << again;
    }
    for (const std::string interface : {"eth0", "eth1"}) {
        Delete("/run/vornovs/dhcp/" + interface + ".conf");
        Delete("/run/dhcpcd/hook-state/resolv.conf/" + interface + ".dhcp");
    }
}

TEST_F(DhcpHost, AClientThatWasKilledIsStartedAnewAndAStopEndsIt)
{
    File("eth0", kDhcp);
    ASSERT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""}));
    ASSERT_TRUE(WaitUntil([] { return HasAddresses("eth0"); }));
    const std::string plain = Served("eth0");
    const int first = Client("eth0");
    ASSERT_GT(first, 1);
    ASSERT_EQ(kill(first, SIGKILL), 0);

    EXPECT_EQ(Served("eth0"), plain);
    EXPECT_TRUE(WaitUntil([] {
        return RcNetwork({"--dry-run", "start"}).output.rfind("start clients:", 0) == 0;
    }));
    EXPECT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""}));
    EXPECT_NE(Client("eth0"), first);
    EXPECT_EQ(RcNetwork({"--dry-run", "start"}), (Outcome{0, "", ""}));
    EXPECT_TRUE(WaitUntil([] { return Requests("DHCPACK") == 2; }));
    EXPECT_EQ(Served("eth0"), plain);

    EXPECT_EQ(RcNetwork({"stop"}), (Outcome{0, "", ""}));
    EXPECT_EQ(Served("eth0"), "on eth0");
    EXPECT_THAT(ReadFile("/etc/resolv.conf"), testing::Not(HasSubstr("nameserver")));
    EXPECT_EQ(ReadFile("/proc/sys/net/ipv6/conf/eth0/accept_ra"), "1\n");
    EXPECT_TRUE(WaitUntil([] { return Processes("comm", "dhcpcd\n").empty(); }));
    EXPECT_EQ(Requests("DHCPDISCOVER"), 1);
    EXPECT_EQ(Requests("DHCPRELEASE"), 0);
}

TEST_F(DhcpHost, AnAddressOfAServerBecomesOneOfTheFile)
{
    File("eth0", kDhcp);
    ASSERT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""}));
    ASSERT_TRUE(WaitUntil([] { return HasAddresses("eth0"); }));
    std::string address =
        RunProgram({"sh", "-c", "ip -4 -o address show dev eth0 | awk '{ print $4 }'"}).output;
    address.pop_back();

    File("eth0", "DEVICE=eth0\nIPADDR=" + address + "\nGATEWAY=192.0.2.1\nDNS1=192.0.2.9\n");
    EXPECT_EQ(RcNetwork({"start"}).exitCode, 0);

    EXPECT_THAT(RunProgram({"ip", "address", "show", "dev", "eth0"}).output,
                HasSubstr("scope global eth0\n       valid_lft forever"));
    EXPECT_THAT(Served("eth0"),
                StartsWith("eth0 inet " + address +
                           " brd 192.0.2.255 scope global eth0\ndefault via 192.0.2.1 dev eth0 "
                           "proto static \n192.0.2.0/24 dev eth0 proto kernel"));
    EXPECT_THAT(ReadFile("/etc/resolv.conf"), HasSubstr("from eth0.conf\n"));
    EXPECT_THAT(ReadFile("/etc/resolv.conf"), HasSubstr("nameserver 192.0.2.9\n"));
    EXPECT_EQ(RcNetwork({"--dry-run", "start"}), (Outcome{0, "", ""}));
}

} // namespace
} // namespace contract
