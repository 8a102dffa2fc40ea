#include "online.h"

#include "hostsettings.h"
#include "inputs.h"
#include "plan.h"
#include "report.h"

#include "support/tagdevice.h"

#include <algorithm>
#include <thread>

#include <linux/if_addr.h>
#include <linux/rtnetlink.h>
#include <sys/socket.h>

namespace vornhost {
namespace {

using Clock = std::chrono::steady_clock;

constexpr std::chrono::seconds kOnlinePatience{15};
constexpr std::chrono::milliseconds kBetweenAnswers{250};
constexpr std::uint32_t kNotYet = IFA_F_TENTATIVE | IFA_F_DADFAILED;

/** Looks for the addresses of one file. */
class Look {
public:
    Look(const InterfaceFile& file, const LiveState& live, Online& online)
        : m_file(file), m_live(live), m_online(online)
    {
    }
    void Run();

private:
    bool HasCable(const Link& link) const;
    bool IsItsOwn(const Link& link) const;
    bool IsStatic(const Address& address) const;
    bool HasLease(int family) const;
    bool AnyCable() const;
    void LookFor(const WantedAddress& wanted);
    void Note(bool answers, const std::string& what, bool isNotOurs);

    const InterfaceFile& m_file;
    const LiveState& m_live;
    Online& m_online;
};

/** A bridge of the switch has a carrier always; what counts is the way to the wire. */
bool Look::HasCable(const Link& link) const
{
    if (!link.up || !link.carrier) {
        return false;
    }
    std::vector<std::string> ports = m_file.slaveList;
    ports.push_back(PlainOf(link.name));
    const bool isBridge = ports.back() != link.name;
    const bool isKnown = std::any_of(ports.begin(), ports.end(), [&](const std::string& port) {
        return m_live.FindLink(port) != nullptr;
    });
    return !isBridge || !isKnown ||
           std::any_of(ports.begin(), ports.end(), [&](const std::string& port) {
               const Link* wire = m_live.FindLink(port);
               return wire != nullptr && wire->up && wire->carrier;
           });
}

/** The interface itself, its bridge, and the VLAN that stands for its tag meanwhile. */
bool Look::IsItsOwn(const Link& link) const
{
    return PlainOf(link.name) == PlainOf(m_file.name) ||
           (IsTagDevice(link) && m_live.NameOf(link.parent) == PlainOf(m_file.name));
}

bool Look::IsStatic(const Address& address) const
{
    return std::any_of(m_file.addresses.begin(), m_file.addresses.end(),
                       [&](const WantedAddress& wanted) { return wanted.local == address.local; });
}

bool Look::HasLease(int family) const
{
    return std::any_of(m_live.addresses.begin(), m_live.addresses.end(),
                       [&](const Address& address) {
                           const Link* link = m_live.FindLink(address.index);
                           return address.family == family && address.scope == RT_SCOPE_UNIVERSE &&
                                  (address.flags & kNotYet) == 0 && !IsStatic(address) &&
                                  link != nullptr && IsItsOwn(*link) && HasCable(*link);
                       });
}

bool Look::AnyCable() const
{
    return std::any_of(m_live.links.begin(), m_live.links.end(),
                       [&](const Link& link) { return IsItsOwn(link) && HasCable(link); });
}

void Look::Note(bool answers, const std::string& what, bool isNotOurs)
{
    if (answers) {
        ++m_online.answering;
    } else {
        m_online.missing.push_back({m_file.name + ": " + what, isNotOurs});
    }
}

/** Wherever it is: on the interface, on its bridge, or still on the way between them. */
void Look::LookFor(const WantedAddress& wanted)
{
    const auto found =
        std::find_if(m_live.addresses.begin(), m_live.addresses.end(), [&](const Address& address) {
            return address.family == wanted.family && address.local == wanted.local;
        });
    const Link* link = found == m_live.addresses.end() ? nullptr : m_live.FindLink(found->index);
    const bool taken = link != nullptr && (found->flags & IFA_F_DADFAILED) != 0;
    const bool cable = link != nullptr && HasCable(*link);
    Note(cable && (found->flags & kNotYet) == 0, wanted.local,
         taken || (link != nullptr && !cable));
}

void Look::Run()
{
    for (const WantedAddress& wanted : m_file.addresses) {
        LookFor(wanted);
    }
    const bool noCable = !AnyCable();
    if (m_file.client.dhcp) {
        Note(HasLease(AF_INET), "an IPv4 address from a server", noCable);
    }
    if (m_file.client.dhcp6.value_or(false)) {
        Note(HasLease(AF_INET6), "an IPv6 address from a server", noCable);
    } else if (m_file.autoconf.value_or(false)) {
        Note(HasLease(AF_INET6), "an IPv6 address from a router", true);
    }
}

/** @return  whether there is nothing more to wait for. */
bool IsEnough(const Online& online, bool isPatient)
{
    const bool onlyOthers = std::all_of(online.missing.begin(), online.missing.end(),
                                        [](const NotOnline& each) { return each.isNotOurs; });
    return online.missing.empty() || (!isPatient && onlyOthers && online.answering > 0);
}

} // namespace

Online LookWhatAnswers(const std::map<std::string, InterfaceFile>& files, const LiveState& live)
{
    Online online;
    for (const auto& [name, file] : files) {
        const bool counts =
            file.onBoot && !file.slave && file.onlyAsMember.empty() &&
            (file.use == FileUse::kBridge || (file.use == FileUse::kPlain && file.bridge.empty()));
        if (counts) {
            Look(file, live, online).Run();
        }
    }
    return online;
}

bool WaitUntilOnline()
{
    constexpr unsigned kUsualSeconds = 60;
    const auto begin = Clock::now();
    const auto limit = HostSeconds("ONLINE_SECONDS", kUsualSeconds, 1);
    Online online;
    for (;;) {
        std::vector<Remark> remarks; // said by those that bring the network up
        const auto files = ReadInterfaceFiles(remarks);
        const auto live = ReadLiveState();
        if (files && live) {
            online = LookWhatAnswers(*files, *live);
        }
        const auto waited = Clock::now() - begin;
        const bool done = files && live && IsEnough(online, waited < kOnlinePatience);
        if (done || waited >= limit) {
            for (const NotOnline& missing : online.missing) {
                Say({done ? Severity::kWarning : Severity::kError,
                     "does not answer: " + missing.what});
            }
            return done;
        }
        std::this_thread::sleep_for(kBetweenAnswers);
    }
}

} // namespace vornhost
