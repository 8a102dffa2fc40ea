#include "adopt/handover.h"

#include "answer.h"
#include "hands.h"

#include <algorithm>
#include <arpa/inet.h>
#include <array>
#include <linux/if_addr.h>
#include <linux/rtnetlink.h>
#include <sstream>
#include <support/keyvaluefile.h>
#include <sys/socket.h>

namespace vornovsctl {

namespace {

constexpr char kStatePath[] = "/run/network/ifstate";

bool IsActive(const HostView& host, const char* unit)
{
    return host.run({"systemctl", "is-active", unit}).value_or("").starts_with("active");
}

bool Owns(const AdoptionRecord& record, const std::set<std::string>& names, Manager manager)
{
    return std::any_of(record.interfaces.begin(), record.interfaces.end(),
                       [&](const AdoptedInterface& interface) {
                           return interface.manager == manager && names.contains(interface.name);
                       });
}

/**
 * Ended without a word to it, the daemon leaves everything as it is: asked to stop, or to read its
 * files again, it would give leases back and take addresses away.
 */
void StartAnew(const char* unit, Hands& hands)
{
    (void)hands.Run({"systemctl", "kill", "--kill-whom=main", "--signal=KILL", unit});
    (void)hands.Run({"systemctl", "start", unit});
}

void RestartDaemons(const HostView& host, const AdoptionRecord& record,
                    const std::set<std::string>& names, Hands& hands)
{
    if (IsActive(host, kNetworkdUnit)) {
        if (Owns(record, names, Manager::kNetworkd)) {
            StartAnew(kNetworkdUnit, hands);
        } else {
            (void)hands.Run({"networkctl", "reload"});
        }
    }
    if (IsActive(host, kNetworkManagerUnit)) {
        if (Owns(record, names, Manager::kNetworkManager)) {
            StartAnew(kNetworkManagerUnit, hands);
        } else {
            (void)hands.Run({"nmcli", "general", "reload", "conf"});
        }
    }
}

std::vector<std::string> LinesOf(const std::string& text)
{
    std::istringstream stream(text);
    std::vector<std::string> lines;
    for (std::string line; std::getline(stream, line);) {
        lines.push_back(line);
    }
    return lines;
}

/** Brings what ifupdown has written down to what it is to believe. */
void SetStateLine(const AdoptedInterface& interface, bool up, Hands& hands)
{
    const auto file = hands.Read(kStatePath);
    if (interface.stateLine.empty() || (!file && !up)) {
        return;
    }
    std::string text;
    for (const std::string& line : LinesOf(file ? file->text : "")) {
        text += line == interface.stateLine ? "" : line + '\n';
    }
    text += up ? interface.stateLine + '\n' : "";
    hands.Write(kStatePath, text, kReadableMode);
    hands.Write(std::string(kStatePath) + '.' + interface.name, (up ? interface.name : "") + '\n',
                kReadableMode);
}

/** Whether two addresses are the same up to a length. */
bool SameNetwork(int family, const std::string& one, const std::string& other, unsigned length)
{
    std::array<unsigned char, sizeof(in6_addr)> left{};
    std::array<unsigned char, sizeof(in6_addr)> right{};
    if (inet_pton(family, one.c_str(), left.data()) != 1 ||
        inet_pton(family, other.c_str(), right.data()) != 1) {
        return false;
    }
    for (unsigned bit = 0; bit < length; ++bit) {
        const unsigned mask = 0x80U >> (bit % 8);
        if (((left.at(bit / 8) ^ right.at(bit / 8)) & mask) != 0) {
            return false;
        }
    }
    return true;
}

/** Whether a destination such as "192.0.2.64/26" is the network of an address of the interface. */
bool IsOwnNetwork(const HostView& host, const vornhost::Link& link, const std::string& destination)
{
    const std::size_t slash = destination.find('/');
    if (slash == std::string::npos) {
        return false;
    }
    const std::string length = destination.substr(slash + 1);
    const std::string network = destination.substr(0, slash);
    return std::any_of(
        host.live.addresses.begin(), host.live.addresses.end(),
        [&](const vornhost::Address& address) {
            return address.index == link.index && address.scope == RT_SCOPE_UNIVERSE &&
                   (address.flags & IFA_F_NOPREFIXROUTE) != 0 &&
                   std::to_string(address.prefixLength) == length &&
                   SameNetwork(address.family, address.local, network, address.prefixLength);
        });
}

std::vector<std::string> MarkOf(const Json& route, const std::string& family,
                                const std::string& name)
{
    std::vector<std::string> words{"ip",
                                   family,
                                   "route",
                                   "replace",
                                   route.value("dst", ""),
                                   "dev",
                                   name,
                                   "proto",
                                   "static",
                                   "metric",
                                   std::to_string(route.value("metric", 0U))};
    if (const std::string source = route.value("prefsrc", ""); !source.empty()) {
        words.insert(words.end(), {"src", source});
    }
    if (family == "-4") {
        words.insert(words.end(), {"scope", "link"});
    }
    return words;
}

/**
 * NetworkManager makes the routes to an interface's own networks itself and marks them as the
 * kernel's. While the interface is ours they are marked as somebody's, so that they go along when
 * the addresses move.
 */
void MarkNetworkRoutes(const HostView& host, const std::string& name, Hands& hands)
{
    const vornhost::Link* const link = host.live.Find(name);
    for (const std::string family : {"-4", "-6"}) {
        const auto text =
            host.run({"ip", "-j", family, "route", "show", "dev", name, "proto", "kernel"});
        const Json routes = Json::parse(text.value_or("[]"), nullptr, false);
        if (!routes.is_array() || link == nullptr) {
            continue;
        }
        for (const Json& route : routes) {
            if (!route.contains("gateway") && IsOwnNetwork(host, *link, route.value("dst", ""))) {
                (void)hands.Run(MarkOf(route, family, name));
            }
        }
    }
}

/**
 * For the moment in which the daemon takes over it is to leave what is lasting as it finds it, and
 * the members of a bond, all of which it would take down to make them members once more.
 */
std::string KeepTextOf(bool members)
{
    return std::string("[Network]\nKeepConfiguration=static\n") +
           (members ? "KeepMaster=yes\n" : "");
}

std::string KeepPathOf(const AdoptedInterface& interface)
{
    return "/run/systemd/network/" + interface.origin.substr(interface.origin.rfind('/') + 1) +
           ".d/zz-vornovs-keep.conf";
}

void GiveToNetworkd(const HostView& host, const AdoptionRecord& record,
                    const std::set<std::string>& names, Hands& hands)
{
    if (!IsActive(host, kNetworkdUnit)) {
        return;
    }
    if (!Owns(record, names, Manager::kNetworkd)) {
        (void)hands.Run({"networkctl", "reload"});
        return;
    }
    std::map<std::string, bool> paths; // and whether all that the file is for are members
    for (const AdoptedInterface& interface : record.interfaces) {
        if (interface.manager == Manager::kNetworkd && names.contains(interface.name)) {
            const vornhost::Link* const link = host.live.Find(interface.name);
            const bool isMember = link != nullptr && link->master != 0;
            const auto [path, isNew] = paths.emplace(KeepPathOf(interface), isMember);
            path->second = path->second && isMember;
        }
    }
    for (const auto& [path, members] : paths) {
        hands.Write(path, KeepTextOf(members), kReadableMode);
    }
    StartAnew(kNetworkdUnit, hands);
    for (const auto& [path, members] : paths) {
        hands.Remove(path);
        hands.RemoveEmptyFolder(path.substr(0, path.rfind('/')));
    }
}

/** Those who begin anew with these interfaces. */
std::map<std::string, Manager> BeginnersOf(const HostView& host, const AdoptionRecord& record,
                                           const std::set<std::string>& names)
{
    const bool networkd = IsActive(host, kNetworkdUnit);
    const bool networkManager = IsActive(host, kNetworkManagerUnit);
    std::map<std::string, Manager> beginners;
    for (const AdoptedInterface& interface : record.interfaces) {
        const Manager manager = interface.manager;
        const bool begins =
            (manager == Manager::kNetworkd && networkd) ||
            (manager == Manager::kNetworkManager && networkManager && !interface.profile.empty()) ||
            (manager == Manager::kIfupdown && !interface.clients.empty());
        if (begins && names.contains(interface.name)) {
            beginners[interface.name] = manager;
        }
    }
    return beginners;
}

/**
 * NetworkManager makes addresses of IPv6 anew that it finds on an interface. The host has them
 * already, and they are not to be silent while it is asked whether another host has.
 */
void CheckForDuplicates(const std::string& name, bool check, Hands& hands)
{
    (void)hands.Run(
        {"sysctl", "-q", "-w", "net/ipv6/conf/" + name + "/accept_dad=" + (check ? "1" : "0")});
}

/** Told which profile is active on a device, the daemon goes on with it instead of beginning. */
std::set<std::string> GiveToNetworkManager(const HostView& host, const AdoptionRecord& record,
                                           const std::set<std::string>& names, Hands& hands)
{
    std::set<std::string> unchecked;
    if (!IsActive(host, kNetworkManagerUnit)) {
        return unchecked;
    }
    if (!Owns(record, names, Manager::kNetworkManager)) {
        (void)hands.Run({"nmcli", "general", "reload", "conf"});
        return unchecked;
    }
    for (const AdoptedInterface& interface : record.interfaces) {
        const vornhost::Link* const link = host.live.Find(interface.name);
        if (interface.manager == Manager::kNetworkManager && names.contains(interface.name) &&
            link != nullptr && !interface.profile.empty()) {
            if (host.Text("/proc/sys/net/ipv6/conf/" + interface.name + "/accept_dad") == "1\n") {
                CheckForDuplicates(interface.name, false, hands);
                unchecked.insert(interface.name);
            }
            const bool made = link->kind == "bond" || link->kind == "vlan";
            hands.Write("/run/NetworkManager/devices/" + std::to_string(link->index),
                        "[device]\nmanaged=true\nconnection-uuid=" + interface.profile +
                            "\nnm-owned=" + (made ? "true" : "false") + '\n',
                        kReadableMode);
        }
    }
    StartAnew(kNetworkManagerUnit, hands);
    return unchecked;
}

/** As its hook would have done when it brought the interface up. */
void TellNameServers(const AdoptedInterface& interface, Hands& hands)
{
    const auto file = vornhost::KeyValueFile::Parse(
        interface.files.empty() ? std::string() : interface.files.front().text);
    std::string text;
    for (unsigned number = 1; const auto server = file.Get("DNS" + std::to_string(number));
         ++number) {
        text += "nameserver " + *server + '\n';
    }
    if (const auto search = file.Get("DOMAIN")) {
        text += "search " + *search + '\n';
    }
    if (!text.empty()) {
        (void)hands.Feed({"resolvconf", "-a", interface.name + ".inet"}, text);
    }
}

} // namespace

std::vector<EndedClient> ClientsOf(const HostView& host, const std::string& interface)
{
    std::vector<EndedClient> clients;
    for (const char* prefix : {"/run/dhclient.", "/run/dhclient6."}) {
        EndedClient client{prefix + interface + ".pid", {}};
        const auto number = host.Text(client.pidFile);
        if (!number) {
            continue;
        }
        const std::string process = number->substr(0, number->find('\n'));
        if (host.Text("/proc/" + process + "/comm") != "dhclient\n") {
            continue;
        }
        std::istringstream words(host.Text("/proc/" + process + "/cmdline").value_or(""));
        for (std::string word; std::getline(words, word, '\0');) {
            client.words.push_back(word);
        }
        clients.push_back(client);
    }
    return clients;
}

std::string StateLineOf(const HostView& host, const std::string& interface)
{
    for (const std::string& line : LinesOf(host.Text(kStatePath).value_or(""))) {
        if (line.starts_with(interface + '=')) {
            return line;
        }
    }
    return "";
}

void ForgetNameServers(const AdoptionRecord& record, const std::set<std::string>& names,
                       Hands& hands)
{
    constexpr std::array kProtocols{".inet", ".inet6", ".dhclient"};
    for (const AdoptedInterface& interface : record.interfaces) {
        if (interface.manager != Manager::kIfupdown || !names.contains(interface.name)) {
            continue;
        }
        for (const char* const protocol : kProtocols) {
            (void)hands.Run({"resolvconf", "-d", interface.name + protocol, "-f"});
        }
    }
}

void TakeFromManagers(const HostView& host, const AdoptionRecord& record,
                      const std::set<std::string>& names, Hands& hands)
{
    for (const AdoptedInterface& interface : record.interfaces) {
        if (!names.contains(interface.name)) {
            continue;
        }
        for (const EndedClient& client : interface.clients) {
            hands.EndProcess(client.pidFile, "dhclient");
        }
        SetStateLine(interface, false, hands);
    }
    RestartDaemons(host, record, names, hands);
    for (const AdoptedInterface& interface : record.interfaces) {
        if (names.contains(interface.name) && interface.manager == Manager::kNetworkManager) {
            MarkNetworkRoutes(host, interface.name, hands);
        }
    }
}

LooseEnds GiveToManagers(const HostView& host, const AdoptionRecord& record,
                         const std::set<std::string>& names, Hands& hands)
{
    LooseEnds ends;
    ends.standby = StandbyFor(host, BeginnersOf(host, record, names));
    PutUp(ends.standby, hands);
    GiveToNetworkd(host, record, names, hands);
    ends.unchecked = GiveToNetworkManager(host, record, names, hands);
    for (const AdoptedInterface& interface : record.interfaces) {
        if (!names.contains(interface.name)) {
            continue;
        }
        SetStateLine(interface, true, hands);
        if (interface.manager == Manager::kIfupdown) {
            TellNameServers(interface, hands);
        }
        for (const EndedClient& client : interface.clients) {
            if (!client.words.empty()) {
                (void)hands.Run(client.words);
            }
        }
    }
    return ends;
}

void TieUp(const LooseEnds& ends, const HostView& now, Hands& hands)
{
    TakeDown(ends.standby, now, hands);
    for (const std::string& name : ends.unchecked) {
        CheckForDuplicates(name, true, hands);
    }
}

} // namespace vornovsctl
