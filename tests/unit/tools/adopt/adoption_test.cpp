#include "adopt/recordedhost.h"

#include <adopt/adoption.h>
#include <adopt/boundaries.h>
#include <adopt/livecheck.h>
#include <adopt/report.h>
#include <filesystem>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <map>
#include <sys/stat.h>

namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using unit::RecordedHost;
using vornovsctl::AdoptionRecord;
using vornovsctl::HostView;
using vornovsctl::Phase;
using vornovsctl::Wishes;

constexpr char kInterfaces[] = "/etc/network/interfaces";
constexpr char kInterfacesText[] = "auto lo\niface lo inet loopback\n\n"
                                   "auto eth0 eth1\n"
                                   "iface eth0 inet static\n    address 192.0.2.10/24\n"
                                   "iface eth1 inet dhcp\n";
constexpr char kFile0[] = "/etc/sysconfig/network-scripts/ifcfg-eth0";
constexpr char kFile1[] = "/etc/sysconfig/network-scripts/ifcfg-eth1";
constexpr char kOurUnit[] = "vornovs-network.service";
constexpr char kRecord[] = "/usr/vorn/etc/vornnetd/adopted/record.json";
constexpr int kNever = -1;

struct Died {};

/** Changes a recorded host, and dies before its n-th change. */
class MortalHands : public vornovsctl::Hands {
public:
    MortalHands(const RecordedHost& host, std::set<std::string>& enabled, int changesLeft = kNever)
        : Hands(host.Root()), m_enabled(enabled), m_changesLeft(changesLeft)
    {
    }

    std::vector<std::string> runs;
    std::map<std::string, std::string> written; // what was written last, also if it is gone by now

    void Write(const std::string& path, const std::string& text, unsigned mode) override
    {
        Live();
        Hands::Write(path, text, mode);
        written[path] = text;
    }
    void Remove(const std::string& path) override
    {
        Live();
        Hands::Remove(path);
    }
    bool Feed(const std::vector<std::string>& argv, const std::string& input) override
    {
        Live();
        std::string line;
        for (const std::string& word : argv) {
            line += (line.empty() ? "" : " ") + word;
        }
        runs.push_back(line + (input.empty() ? "" : " < " + input));
        if (argv[0] == "systemctl" && argv[1] == "enable") {
            m_enabled.insert(argv[2]);
        } else if (argv[0] == "systemctl" && argv[1] == "disable") {
            m_enabled.erase(argv[2]);
        }
        return networkStarts || argv[0] != "/etc/rc.network";
    }
    void EndProcess(const std::string& pidFile, const std::string& program) override
    {
        Live();
        runs.push_back("end " + program + " of " + pidFile);
    }

    bool networkStarts = true;

private:
    void Live()
    {
        if (m_changesLeft == 0) {
            throw Died();
        }
        --m_changesLeft;
    }

    std::set<std::string>& m_enabled;
    int m_changesLeft;
};

/** A host under ifupdown, on which the other managers are installed and systemd runs. */
class OnIfupdown : public testing::Test {
protected:
    OnIfupdown()
    {
        host.AddLink("eth0", "52:54:00:00:00:00");
        host.AddLink("eth1", "52:54:00:00:00:01");
        host.AddAddress("eth0", "192.0.2.10", 24);
        host.Write(kInterfaces, kInterfacesText);
        chmod((host.Root() + kInterfaces).c_str(), 0640);
        host.Write("/run/network/ifstate", "lo=lo\neth0=eth0\neth1=eth1\n");
        host.Write("/run/network/ifstate.eth0", "eth0\n");
        host.Write("/run/network/ifstate.eth1", "eth1\n");
        host.Write("/run/dhclient.eth1.pid", "77\n");
        host.Write("/proc/77/comm", "dhclient\n");
        host.Write("/proc/77/cmdline", std::string("dhclient\0-4\0eth1\0", 17));
        for (const char* program : {"/usr/lib/systemd/systemd-networkd", "/usr/sbin/NetworkManager",
                                    "/lib/systemd/system/vornovs-network.service"}) {
            host.Write(program, "");
        }
        before = host.Files();
    }

    std::set<std::string> Adopt(MortalHands& hands, const std::set<std::string>& names = {})
    {
        AdoptionRecord record = AdoptionRecord::Load(hands).value_or(AdoptionRecord());
        std::set<std::string> taken = record.NamesIn({Phase::kAdopting, Phase::kReleasing});
        if (taken.empty()) {
            const Wishes wishes = vornovsctl::ReadWishes(host.view, names);
            vornovsctl::AddToRecord(host.view, hands, wishes, record);
            taken = record.NamesIn({Phase::kAdopting});
        }
        vornovsctl::PerformAdoption(host.view, taken, record, hands);
        for (auto& interface : record.interfaces) {
            interface.phase = Phase::kAdopted;
        }
        record.Save(hands);
        return taken;
    }

    void Release(MortalHands& hands, std::set<std::string> names = {})
    {
        auto record = AdoptionRecord::Load(hands);
        if (!record) {
            return;
        }
        if (names.empty()) {
            names = record->NamesIn({Phase::kAdopting, Phase::kAdopted, Phase::kReleasing});
        }
        (void)vornovsctl::PerformRelease(host.view, names, *record, hands);
    }

    /** Whether somebody brings the interface up if the host is restarted now. */
    bool ComesUpAtBoot(const std::string& name) const
    {
        const bool old = host.Read(kInterfaces).find("\niface " + name) != std::string::npos;
        const bool ours = enabled.contains(kOurUnit) &&
                          host.Read("/etc/sysconfig/network-scripts/ifcfg-" + name) != "(none)";
        return old || ours;
    }

    void ExpectAsBefore() const
    {
        EXPECT_EQ(host.Files(), before);
        struct stat status {};
        EXPECT_EQ(stat((host.Root() + kInterfaces).c_str(), &status), 0);
        EXPECT_EQ(status.st_mode & 07777, 0640U);
        EXPECT_THAT(enabled, IsEmpty());
    }

    RecordedHost host;
    std::set<std::string> enabled;
    std::map<std::string, std::string> before;
};

TEST_F(OnIfupdown, AdoptionWritesOurFilesSilencesTheManagersAndStartsOurs)
{
    MortalHands hands(host, enabled);

    EXPECT_THAT(Adopt(hands), ElementsAre("eth0", "eth1"));

    EXPECT_EQ(host.Read(kFile0), "DEVICE=eth0\nONBOOT=yes\nBOOTPROTO=none\nIPADDR=192.0.2.10\n"
                                 "PREFIX=24\n");
    EXPECT_EQ(host.Read(kInterfaces), "auto lo\niface lo inet loopback\n\n"
                                      "#adopted# auto eth0 eth1\n"
                                      "#adopted# iface eth0 inet static\n"
                                      "#adopted#     address 192.0.2.10/24\n"
                                      "#adopted# iface eth1 inet dhcp\n");
    EXPECT_EQ(host.Read("/etc/systemd/network/00-0-vornovs.network"),
              "# Written by 'vornovsctl adopt', removed by 'vornovsctl release'.\n"
              "[Match]\nName=eth0 eth1 ovs_* ovs-system tag*.*\n\n[Link]\nUnmanaged=yes\n");
    EXPECT_EQ(host.Read("/etc/NetworkManager/conf.d/zz-vornovs.conf"),
              "# Written by 'vornovsctl adopt', removed by 'vornovsctl release'.\n"
              "[keyfile]\nunmanaged-devices+=interface-name:eth0;interface-name:eth1;"
              "interface-name:ovs_*;interface-name:ovs-system;interface-name:tag*.*\n");
    EXPECT_EQ(host.Read("/run/network/ifstate"), "lo=lo\n");
    EXPECT_THAT(hands.runs,
                ElementsAre("systemctl enable vornovs-network.service",
                            "end dhclient of /run/dhclient.eth1.pid",
                            "/etc/rc.network start eth0 eth1", "resolvconf -d eth0.inet -f",
                            "resolvconf -d eth0.inet6 -f", "resolvconf -d eth0.dhclient -f",
                            "resolvconf -d eth1.inet -f", "resolvconf -d eth1.inet6 -f",
                            "resolvconf -d eth1.dhclient -f"));
}

TEST_F(OnIfupdown, ReleaseMakesEverythingWhatItWas)
{
    MortalHands hands(host, enabled);
    Adopt(hands);
    hands.runs.clear();

    Release(hands);

    EXPECT_THAT(hands.runs, ElementsAre("systemctl disable vornovs-network.service",
                                        "/etc/rc.network leave eth0 eth1", "dhclient -4 eth1"));
    ExpectAsBefore();
}

TEST_F(OnIfupdown, ReleaseTellsTheResolverWhatIfupdownWould)
{
    host.Write(kInterfaces, "iface eth0 inet static\n    address 192.0.2.10/24\n"
                            "    dns-nameservers 192.0.2.1 192.0.2.2\n    dns-search a.example\n");
    MortalHands hands(host, enabled);
    Adopt(hands, {"eth0"});

    Release(hands);

    EXPECT_EQ(hands.runs.back(), "resolvconf -a eth0.inet < nameserver 192.0.2.1\n"
                                 "nameserver 192.0.2.2\nsearch a.example\n");
}

TEST_F(OnIfupdown, CloudInitIsKeptFromWritingItsFileAnew)
{
    host.Write(kInterfaces, "source /etc/network/interfaces.d/*\n");
    host.Write("/etc/network/interfaces.d/50-cloud-init", kInterfacesText);
    host.Write("/etc/cloud/cloud.cfg.d/05_logging.cfg", "");
    before = host.Files();
    MortalHands hands(host, enabled);

    Adopt(hands);

    EXPECT_EQ(host.Read("/etc/cloud/cloud.cfg.d/99-vornovs-network.cfg"),
              "# Written by 'vornovsctl adopt', removed by 'vornovsctl release'.\n"
              "network: {config: disabled}\n");
    Release(hands);
    ExpectAsBefore();
}

TEST_F(OnIfupdown, OneInterfaceCanGoBackByItself)
{
    MortalHands hands(host, enabled);
    Adopt(hands);

    Release(hands, {"eth0"});

    EXPECT_EQ(host.Read(kInterfaces), "auto lo\niface lo inet loopback\n\n"
                                      "#replaced# auto eth0 eth1\nauto eth0\n"
                                      "iface eth0 inet static\n    address 192.0.2.10/24\n"
                                      "#adopted# iface eth1 inet dhcp\n");
    EXPECT_EQ(host.Read(kFile0), "(none)");
    EXPECT_NE(host.Read(kFile1), "(none)");
    EXPECT_THAT(enabled, ElementsAre(kOurUnit));
    Release(hands);
    ExpectAsBefore();
}

TEST_F(OnIfupdown, AnotherInterfaceCanFollow)
{
    MortalHands hands(host, enabled);
    EXPECT_THAT(Adopt(hands, {"eth0"}), ElementsAre("eth0"));

    Adopt(hands, {"eth1"});

    EXPECT_THAT(host.Read("/etc/systemd/network/00-0-vornovs.network"),
                HasSubstr("Name=eth0 eth1 ovs_*"));
    Release(hands);
    ExpectAsBefore();
}

TEST_F(OnIfupdown, ReleaseKeepsWhatWasEditedInTheManagersFile)
{
    MortalHands hands(host, enabled);
    Adopt(hands);
    host.Write(kInterfaces, host.Read(kInterfaces) + "# a remark\n");

    Release(hands);

    EXPECT_EQ(host.Read(kInterfaces), std::string(kInterfacesText) + "# a remark\n");
}

TEST_F(OnIfupdown, AnAdoptionThatIsCutShortCanBeFinished)
{
    MortalHands whole(host, enabled);
    Adopt(whole);
    const auto adopted = host.Files();
    Release(whole);

    bool died = true;
    int changes = 0;
    for (; died; ++changes) {
        SCOPED_TRACE("dies before change " + std::to_string(changes));
        try {
            MortalHands hands(host, enabled, changes);
            Adopt(hands);
            died = false;
        } catch (const Died&) {
            EXPECT_TRUE(ComesUpAtBoot("eth0"));
            EXPECT_TRUE(ComesUpAtBoot("eth1"));
            Adopt(whole);
        }
        EXPECT_EQ(host.Files(), adopted);
        Release(whole);
        ExpectAsBefore();
    }
    EXPECT_GT(changes, 8);
}

TEST_F(OnIfupdown, AnAdoptionThatIsCutShortCanBeUndone)
{
    MortalHands whole(host, enabled);
    bool died = true;
    for (int changes = 0; died; ++changes) {
        SCOPED_TRACE("dies before change " + std::to_string(changes));
        try {
            MortalHands hands(host, enabled, changes);
            Adopt(hands);
            died = false;
        } catch (const Died&) {
        }
        Release(whole);
        ExpectAsBefore();
    }
}

TEST_F(OnIfupdown, AReleaseThatIsCutShortCanBeFinishedOrTakenBack)
{
    MortalHands whole(host, enabled);
    for (const bool takeBack : {false, true}) {
        bool died = true;
        for (int changes = 0; died; ++changes) {
            SCOPED_TRACE("dies before change " + std::to_string(changes));
            Adopt(whole);
            const auto adopted = host.Files();
            try {
                MortalHands hands(host, enabled, changes);
                Release(hands);
                died = false;
            } catch (const Died&) {
                EXPECT_TRUE(ComesUpAtBoot("eth0"));
                EXPECT_TRUE(ComesUpAtBoot("eth1"));
                // What was given up last may be forgotten already.
                if (takeBack && host.Read(kRecord) != "(none)") {
                    Adopt(whole);
                    EXPECT_EQ(host.Files(), adopted);
                }
                Release(whole);
            }
            ExpectAsBefore();
        }
    }
}

TEST_F(OnIfupdown, ANetworkThatDoesNotStartIsTold)
{
    MortalHands hands(host, enabled);
    hands.networkStarts = false;

    EXPECT_THROW(Adopt(hands), std::runtime_error);

    hands.networkStarts = true;
    Release(hands);
    ExpectAsBefore();
}

TEST_F(OnIfupdown, ThePlanTellsFilesManagersAndUnits)
{
    const MortalHands hands(host, enabled);
    const Wishes wishes = vornovsctl::ReadWishes(host.view, {"eth0"});
    AdoptionRecord record;
    vornovsctl::AddToRecord(host.view, hands, wishes, record);

    EXPECT_EQ(AdoptionText(wishes, record),
              "eth0 (ifupdown, /etc/network/interfaces)\n"
              "  /etc/sysconfig/network-scripts/ifcfg-eth0:\n"
              "    DEVICE=eth0\n    ONBOOT=yes\n    BOOTPROTO=none\n    IPADDR=192.0.2.10\n"
              "    PREFIX=24\n"
              "Kept away from them by:\n"
              "  /etc/network/interfaces (their paragraphs are commented out)\n"
              "  /etc/systemd/network/00-0-vornovs.network\n"
              "  /etc/NetworkManager/conf.d/zz-vornovs.conf\n"
              "At boot from now on: vornovs-network.service\n");
    EXPECT_EQ(ReleaseText(record, {"eth0"}), "eth0 back to ifupdown, /etc/network/interfaces\n"
                                             "As it was: /etc/network/interfaces\n"
                                             "Removed: /etc/systemd/network/00-0-vornovs.network\n"
                                             "Removed: /etc/NetworkManager/conf.d/zz-vornovs.conf\n"
                                             "At boot no longer: vornovs-network.service\n");
    EXPECT_EQ(
        AdoptionFields(wishes, record, false).dump(),
        R"({"interfaces":[{"name":"eth0","manager":"ifupdown",)"
        R"("origin":"/etc/network/interfaces",)"
        R"("file":"/etc/sysconfig/network-scripts/ifcfg-eth0",)"
        R"("text":"DEVICE=eth0\nONBOOT=yes\nBOOTPROTO=none\nIPADDR=192.0.2.10\nPREFIX=24\n",)"
        R"("obstacles":[],"remarks":[]}],)"
        R"("silencedBy":["/etc/network/interfaces","/etc/systemd/network/00-0-vornovs.network",)"
        R"("/etc/NetworkManager/conf.d/zz-vornovs.conf"],)"
        R"("enabled":["vornovs-network.service"],"disabled":[],"done":false})");
}

TEST(AdoptionRecord, KeepsBytesThatAreNoText)
{
    const RecordedHost host;
    std::set<std::string> enabled;
    MortalHands hands(host, enabled);
    AdoptionRecord record;
    vornovsctl::AdoptedInterface interface;
    interface.name = "eth0";
    interface.manager = vornovsctl::Manager::kNetworkd;
    interface.files.push_back(
        {"/a", std::string("\0\xff\n", 3), 0600, vornovsctl::SavedFile{"\xe9", 0640, 1, 2}});
    interface.clients.push_back({"/run/pid", {"dhclient", "eth0"}});
    interface.settings = {{"net/ipv6/conf/eth0/accept_ra", "1"}};
    record.interfaces.push_back(interface);
    record.silencers.push_back(
        {vornovsctl::Silencer::kNetdev, "/b", "bond0", vornovsctl::SavedFile{"", 0644, 0, 0}});
    record.units.push_back({"a.service", true, false});

    record.Save(hands);

    EXPECT_EQ(AdoptionRecord::Load(hands), record);
    host.Write(kRecord, "{\"version\": 2}");
    EXPECT_THROW(AdoptionRecord::Load(hands), std::runtime_error);
}

TEST(Networkd, IsEndedWithoutAWordAndKeptFromMakingTheBond)
{
    RecordedHost host;
    std::set<std::string> enabled;
    MortalHands hands(host, enabled);
    const int bond = host.AddLink("bond0", "52:54:00:00:00:00", "bond");
    host.AddLink("eth0", "52:54:00:00:00:00");
    host.Link("eth0").master = bond;
    host.Write("/lib/systemd/systemd-networkd", "");
    host.Write("/etc/systemd/network/10-bond0.netdev", "[NetDev]\nName=bond0\nKind=bond\n");
    host.Write("/etc/systemd/network/20-bond0.network", "[Network]\nAddress=192.0.2.10/24\n");
    host.Write("/etc/systemd/network/30-eth0.network", "[Network]\nBond=bond0\n");
    constexpr char kAddressMode[] = "/proc/sys/net/ipv6/conf/eth0/addr_gen_mode";
    host.Write(kAddressMode, "1\n");
    host.Answer("networkctl --json=short list",
                R"({"Interfaces":[{"Name":"bond0","AdministrativeState":"configured",)"
                R"("NetworkFile":"/etc/systemd/network/20-bond0.network"},)"
                R"({"Name":"eth0","AdministrativeState":"configured",)"
                R"("NetworkFile":"/etc/systemd/network/30-eth0.network"}]})");
    host.Answer("systemctl is-active systemd-networkd.service", "active\n");
    const auto before = host.Files();
    AdoptionRecord record;
    vornovsctl::AddToRecord(host.view, hands, vornovsctl::ReadWishes(host.view, {}), record);

    vornovsctl::PerformAdoption(host.view, {"bond0", "eth0"}, record, hands);

    EXPECT_THAT(hands.runs, ElementsAre("systemctl kill --kill-whom=main --signal=KILL "
                                        "systemd-networkd.service",
                                        "systemctl start systemd-networkd.service",
                                        "/etc/rc.network start bond0 eth0"));
    EXPECT_EQ(host.Read("/etc/systemd/network/10-bond0.netdev.d/00-vornovs.conf"),
              "# Written by 'vornovsctl adopt', removed by 'vornovsctl release'.\n"
              "[Match]\nKernelCommandLine=vornovs.release\n");

    hands.runs.clear();
    host.Write(kAddressMode, "0\n");
    (void)vornovsctl::PerformRelease(host.view, {"bond0", "eth0"}, record, hands);
    host.Write(kAddressMode, "1\n");

    EXPECT_THAT(hands.runs, ElementsAre("/etc/rc.network leave bond0 eth0",
                                        "ip link set dev eth0 addrgenmode none",
                                        "systemctl kill --kill-whom=main --signal=KILL "
                                        "systemd-networkd.service",
                                        "systemctl start systemd-networkd.service"));
    EXPECT_EQ(hands.written["/run/systemd/network/20-bond0.network.d/zz-vornovs-keep.conf"],
              "[Network]\nKeepConfiguration=static\n");
    EXPECT_EQ(hands.written["/run/systemd/network/30-eth0.network.d/zz-vornovs-keep.conf"],
              "[Network]\nKeepConfiguration=static\nKeepMaster=yes\n");
    EXPECT_EQ(host.Files(), before);
}

TEST(NetworkManager, IsToldWhichProfileIsActiveWhenItGetsAnInterfaceBack)
{
    RecordedHost host;
    std::set<std::string> enabled;
    MortalHands hands(host, enabled);
    host.AddLink("eth0", "52:54:00:00:00:00");
    host.Write("/usr/sbin/NetworkManager", "");
    host.Answer("nmcli -t -e yes -f DEVICE,STATE,CON-UUID device", "eth0:connected:one\n");
    host.Answer("nmcli -t connection show one", "connection.id:lan\n"
                                                "connection.type:802-3-ethernet\n"
                                                "ipv4.method:auto\nipv6.method:auto\n");
    host.Answer("systemctl is-active NetworkManager.service", "active\n");
    host.Write("/proc/sys/net/ipv4/conf/eth0/promote_secondaries", "0\n");
    host.Write("/proc/sys/net/ipv6/conf/eth0/autoconf", "1\n");
    AdoptionRecord record;
    vornovsctl::AddToRecord(host.view, hands, vornovsctl::ReadWishes(host.view, {}), record);
    vornovsctl::PerformAdoption(host.view, {"eth0"}, record, hands);

    host.Write("/proc/sys/net/ipv6/conf/eth0/accept_dad", "1\n");
    host.Write("/proc/sys/net/ipv4/conf/eth0/promote_secondaries", "1\n");
    hands.runs.clear();

    EXPECT_THAT(vornovsctl::PerformRelease(host.view, {"eth0"}, record, hands).unchecked,
                ElementsAre("eth0"));

    EXPECT_THAT(hands.runs, Contains("sysctl -q -w net/ipv6/conf/eth0/accept_dad=0"));
    EXPECT_THAT(hands.runs, Contains("sysctl -q -w net/ipv4/conf/eth0/promote_secondaries=0"));
    EXPECT_THAT(hands.runs, Not(Contains(HasSubstr("autoconf"))));
    EXPECT_EQ(host.Read("/run/NetworkManager/devices/2"),
              "[device]\nmanaged=true\nconnection-uuid=one\nnm-owned=false\n");
    EXPECT_EQ(hands.runs.back(), "systemctl start NetworkManager.service");
}

TEST(Belongings, AreAddressesRoutesAndNameServers)
{
    RecordedHost host;
    host.AddLink("eth0", "52:54:00:00:00:00");
    host.AddLink("eth1", "52:54:00:00:00:01");
    host.AddAddress("eth0", "192.0.2.10", 24);
    host.AddAddress("eth1", "192.0.2.70", 24);
    host.AddDefaultRoute("eth0", "192.0.2.1", 0);
    host.Write("/etc/resolv.conf", "# by hand\nnameserver 192.0.2.1\nsearch a.example b.example\n");

    const auto before = vornovsctl::BelongingsOf(host.view, {"eth0"});
    host.view.live.routes.clear();

    EXPECT_THAT(before, ElementsAre("192.0.2.10 on eth0", "the default route via 192.0.2.1 on eth0",
                                    "the domain a.example", "the domain b.example",
                                    "the name server 192.0.2.1"));
    EXPECT_THAT(vornovsctl::Missing(before, vornovsctl::BelongingsOf(host.view, {"eth0"})),
                ElementsAre("the default route via 192.0.2.1 on eth0"));
}

TEST(AnswerOf, IsWhatTheServerSent)
{
    const vornovsctl::Lease lease{"192.0.2.17",
                                  "255.255.255.0",
                                  "192.0.2.1",
                                  {"192.0.2.254"},
                                  {"192.0.2.2", "192.0.2.3"},
                                  "example.net",
                                  600,
                                  0};

    const auto answer = AnswerOf(lease, "52:54:00:00:00:07");

    ASSERT_TRUE(answer);
    std::string expected(240, '\0');
    expected.replace(0, 3, std::string("\x02\x01\x06", 3));
    expected.replace(16, 4, std::string("\xc0\x00\x02\x11", 4));
    expected.replace(28, 6, std::string("\x52\x54\x00\x00\x00\x07", 6));
    expected.replace(236, 4, "\x63\x82\x53\x63");
    expected += std::string("\x35\x01\x05", 3) + std::string("\x36\x04\xc0\x00\x02\x01", 6) +
                std::string("\x33\x04\x00\x00\x02\x58", 6) +
                std::string("\x01\x04\xff\xff\xff\x00", 6) +
                std::string("\x03\x04\xc0\x00\x02\xfe", 6) +
                std::string("\x06\x08\xc0\x00\x02\x02\xc0\x00\x02\x03", 10) + "\x0f\x0b" +
                "example.net" + "\xff";
    EXPECT_EQ(*answer, expected);
    EXPECT_FALSE(AnswerOf(lease, "no address"));
    EXPECT_FALSE(AnswerOf(vornovsctl::Lease(), "52:54:00:00:00:07"));
}

TEST(AnswerOf6, IsAReplyThatMakesTheClientAskAllServers)
{
    const vornovsctl::Lease6 lease{"2001:db8::180", "00:03:00:01:52:54", "2b506735", 300, 600};

    const auto answer = AnswerOf6(lease);

    ASSERT_TRUE(answer);
    EXPECT_EQ(*answer, std::string("\x07\0\0\0", 4) +
                           std::string("\0\x01\0\x06\0\x03\0\x01\x52\x54", 10) +
                           std::string("\0\x02\0\x0a\0\x03\0\x01\0\0\0\0\0\0", 14) +
                           std::string("\0\x03\0\x28\x2b\x50\x67\x35\0\0\0\x05\0\0\0\x08", 16) +
                           std::string("\0\x05\0\x18", 4) +
                           std::string("\x20\x01\x0d\xb8\0\0\0\0\0\0\0\0\0\0\x01\x80", 16) +
                           std::string("\0\0\x01\x2c\0\0\x02\x58", 8));
    EXPECT_FALSE(vornovsctl::AnswerOf6({"2001:db8::180", "", "2b506735", 300, 600}));
    EXPECT_FALSE(vornovsctl::AnswerOf6({"192.0.2.1", "00:03", "2b506735", 300, 600}));
}

} // namespace
