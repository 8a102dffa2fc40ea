#include "adopt/boundaries.h"

#include "adopt/ifupdownreader.h"
#include "adopt/livedetails.h"
#include "adopt/networkdreader.h"
#include "adopt/networkmanagerreader.h"
#include "adopt/silencers.h"
#include "adopt/writer.h"

#include <algorithm>
#include <linux/if_arp.h>
#include <linux/rtnetlink.h>

namespace vornovsctl {

namespace {

constexpr char kSwitchDevice[] = "openvswitch";

/** Everything that managers say, asked once. */
struct Managers {
    InterfacesConfig ifupdown;
    std::map<std::string, NetworkdLink> networkd;
    std::map<std::string, NetworkManagerDevice> networkManager;

    explicit Managers(const HostView& host)
        : ifupdown(ReadInterfaces(host)), networkd(ReadNetworkdLinks(host)),
          networkManager(ReadNetworkManagerDevices(host))
    {
    }

    bool Manage(const std::string& name) const
    {
        return ifupdown.Has(name) || networkd.contains(name) || networkManager.contains(name);
    }
};

bool HasGlobalAddress(const HostView& host, const vornhost::Link& link)
{
    return host.live.HasGlobalAddress(link);
}

std::set<std::string> EveryOne(const HostView& host, const Managers& managers)
{
    std::set<std::string> names;
    for (const vornhost::Link& link : host.live.links) {
        const bool ours = host.Exists(FilePathOf(link.name));
        if (IsWired(host, link) && (managers.Manage(link.name) || (!ours && link.kind != "veth" &&
                                                                   HasGlobalAddress(host, link)))) {
            names.insert(link.name);
        }
    }
    return names;
}

Wish WishOf(const HostView& host, const Managers& managers, const std::string& name)
{
    const auto network = managers.networkd.find(name);
    const auto profile = managers.networkManager.find(name);
    const bool byIfupdown = managers.ifupdown.Has(name);
    const int claims = (byIfupdown ? 1 : 0) + (network != managers.networkd.end() ? 1 : 0) +
                       (profile != managers.networkManager.end() ? 1 : 0);
    Wish wish;
    if (profile != managers.networkManager.end()) {
        wish = ReadNetworkManager(host, name, profile->second.profile);
    } else if (network != managers.networkd.end()) {
        wish = ReadNetworkd(host, name, network->second.file);
        if (const std::string obstacle = NetworkFileObstacle(network->second.file);
            !obstacle.empty()) {
            wish.obstacles.push_back(obstacle);
        }
    } else if (byIfupdown) {
        wish = ReadIfupdown(host, managers.ifupdown, name);
    } else {
        wish = ReadUnmanaged(host, name);
    }
    const vornhost::Link* const link = host.live.Find(name);
    const bool settled = (profile == managers.networkManager.end() || profile->second.settled) &&
                         (network == managers.networkd.end() || network->second.settled);
    // Without a cable it is never done.
    if (!settled && link != nullptr && link->carrier) {
        wish.obstacles.push_back(std::string(NameOf(wish.manager)) +
                                 " is still bringing it up: try again in a moment");
    }
    if (claims > 1) {
        wish.obstacles.emplace_back("several managers have it in their files: decide on one first");
    }
    CompleteFromKernel(host, wish);
    return wish;
}

void RefuseUnfit(const HostView& host, Wish& wish)
{
    const vornhost::Link* const link = host.live.Find(wish.name);
    if (link == nullptr) {
        return;
    }
    if (!IsWired(host, *link)) {
        wish.obstacles.emplace_back("it is no wired interface, bond or VLAN");
    }
    const vornhost::Link* const master = host.LinkOf(link->master);
    if (master != nullptr && master->kind != "bond") {
        wish.obstacles.push_back("it is a port of " + master->name + ", which is " +
                                 (master->kind == kSwitchDevice || master->name == "ovs-system"
                                      ? "the switch"
                                      : "a " + (master->kind.empty() ? "device" : master->kind) +
                                            " and cannot be carried over"));
    }
    if (host.Exists(FilePathOf(wish.name))) {
        wish.obstacles.push_back("there is " + FilePathOf(wish.name) +
                                 " already: remove it, or the other manager's configuration");
    }
}

void RemarkLeftOut(const HostView& host, Wish& wish)
{
    const vornhost::Link* const link = host.live.Find(wish.name);
    for (const vornhost::Address& address : host.live.addresses) {
        const bool lasting = link != nullptr && address.index == link->index &&
                             address.scope == RT_SCOPE_UNIVERSE &&
                             address.validSeconds == UINT32_MAX;
        const auto& list = address.family == AF_INET ? wish.addresses4 : wish.addresses6;
        const bool known = std::any_of(list.begin(), list.end(), [&](const std::string& each) {
            return each.substr(0, each.find('/')) == address.local;
        });
        const bool assigned = address.family == AF_INET ? wish.dhcp4 : wish.IsDynamic();
        if (lasting && !known && !assigned) {
            wish.remarks.push_back(address.local +
                                   " is in no file and will be gone after the next boot");
        }
    }
}

/** What the kernel makes of a bond's members is the bond's manager's, too. */
void SettleManagers(Wishes& wishes)
{
    for (auto& [name, wish] : wishes) {
        const auto master = wishes.find(wish.master);
        if (wish.manager == Manager::kNobody && master != wishes.end()) {
            wish.manager = master->second.manager;
            wish.origin = master->second.origin;
        }
    }
}

/** Whether what systemd-networkd knows of name servers ever comes to the resolver. */
void SettleResolver(const HostView& host, Wish& wish)
{
    const bool resolved = host.Exists("/run/systemd/resolve/resolv.conf");
    if (wish.manager == Manager::kNetworkd && !resolved && wish.master.empty()) {
        wish.dns.clear();
        wish.search.clear();
        wish.peerDns = false;
    }
}

} // namespace

bool IsWired(const HostView& host, const vornhost::Link& link)
{
    const std::string folder = "/sys/class/net/" + link.name + '/';
    const bool wireless = host.Exists(folder + "wireless") || host.Exists(folder + "phy80211");
    const bool kind =
        link.kind.empty() || link.kind == "veth" || link.kind == "bond" || link.kind == "vlan";
    return kind && !wireless && !link.loopback && link.type == ARPHRD_ETHER;
}

std::set<std::string> WithTheirGroups(const HostView& host, std::set<std::string> names)
{
    for (std::size_t before = 0; before != names.size();) {
        before = names.size();
        for (const vornhost::Link& link : host.live.links) {
            const vornhost::Link* const master = host.LinkOf(link.master);
            const std::string bond =
                master != nullptr && master->kind == "bond" ? master->name : "";
            const std::string parent = link.kind == "vlan" ? host.NameOf(link.parent) : "";
            for (const std::string& other : {bond, parent}) {
                if (!other.empty() && (names.contains(link.name) || names.contains(other))) {
                    names.insert(link.name);
                    names.insert(other);
                }
            }
        }
    }
    return names;
}

Wishes ReadWishes(const HostView& host, const std::set<std::string>& names)
{
    const Managers managers(host);
    Wishes wishes;
    for (const std::string& name :
         WithTheirGroups(host, names.empty() ? EveryOne(host, managers) : names)) {
        Wish wish = WishOf(host, managers, name);
        RefuseUnfit(host, wish);
        SettleResolver(host, wish);
        RemarkLeftOut(host, wish);
        for (const std::string& fault : FaultsOf(wish, FileTextOf(wish))) {
            wish.obstacles.push_back(fault);
        }
        wishes[name] = std::move(wish);
    }
    SettleManagers(wishes);
    return wishes;
}

} // namespace vornovsctl
