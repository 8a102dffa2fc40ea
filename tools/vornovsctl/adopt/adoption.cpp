#include "adopt/adoption.h"

#include "adopt/kernelsettings.h"
#include "adopt/livedetails.h"
#include "adopt/networkdreader.h"
#include "adopt/networkmanagerreader.h"
#include "adopt/silencers.h"
#include "adopt/writer.h"
#include "hands.h"

#include <algorithm>
#include <array>
#include <stdexcept>

namespace vornovsctl {

namespace {

constexpr char kDhcpcdFolder[] = "/var/lib/dhcpcd/";
constexpr char kNetworkProgram[] = "/etc/rc.network";
constexpr std::array kOurUnits{"vornovs-network.service", "vornovs-network-wait-online.service"};
// With nothing to wait for it waits until it has waited too long.
constexpr char kNetworkdWaits[] = "systemd-networkd-wait-online.service";

bool IsEnabled(const HostView& host, const std::string& unit)
{
    return host.run({"systemctl", "is-enabled", unit}).value_or("").starts_with("enabled");
}

bool IsThere(const HostView& host, const std::string& unit)
{
    return host.Exists("/usr/lib/systemd/system/" + unit) ||
           host.Exists("/lib/systemd/system/" + unit) || host.Exists("/etc/systemd/system/" + unit);
}

void AddUnit(const HostView& host, const std::string& unit, bool enable, AdoptionRecord& record)
{
    const bool known = std::any_of(record.units.begin(), record.units.end(),
                                   [&](const ChangedUnit& each) { return each.unit == unit; });
    const bool enabled = IsEnabled(host, unit);
    if (!known && IsThere(host, unit) && enabled != enable) {
        record.units.push_back({unit, enable, enabled});
    }
}

void AddUnits(const HostView& host, const Wishes& wishes, AdoptionRecord& record)
{
    for (const char* unit : kOurUnits) {
        AddUnit(host, unit, true, record);
    }
    const auto links = ReadNetworkdLinks(host);
    const bool nothingLeft = std::all_of(links.begin(), links.end(), [&](const auto& link) {
        return wishes.contains(link.first) || record.Find(link.first) != nullptr;
    });
    if (nothingLeft) {
        AddUnit(host, kNetworkdWaits, false, record);
    }
}

/** How long the lease is good from now on, as far as the kernel knows it. */
std::uint32_t SecondsLeft(const HostView& host, const Lease& lease)
{
    for (const vornhost::Address& address : host.live.addresses) {
        if (address.local == lease.address && address.validSeconds != UINT32_MAX) {
            return address.validSeconds;
        }
    }
    return lease.seconds;
}

/** For our client, which asks for the address that it finds there instead of for any. */
std::optional<std::string> LeaseTextOf(const HostView& host, const Wish& wish)
{
    const vornhost::Link* const link = host.live.Find(wish.name);
    if (!wish.dhcp4 || !wish.lease || link == nullptr) {
        return std::nullopt;
    }
    Lease lease = *wish.lease;
    lease.seconds = SecondsLeft(host, lease);
    return AnswerOf(lease, link->mac);
}

/** The same for the address that a server of IPv6 gave. */
std::optional<std::string> Lease6TextOf(const HostView& host, const Wish& wish)
{
    const vornhost::Link* const link = host.live.Find(wish.name);
    const bool asks = wish.ipv6 && wish.dhcp6.value_or(wish.autoconf.value_or(false));
    for (const vornhost::Address& address : host.live.addresses) {
        if (asks && link != nullptr && address.index == link->index && IsOfServer(address)) {
            return AnswerOf6({address.local, wish.identity.duid.value_or(""),
                              wish.identity.iaid.value_or(""), address.preferredSeconds,
                              address.validSeconds});
        }
    }
    return std::nullopt;
}

AdoptedInterface AdoptedInterfaceOf(const HostView& host, const Hands& hands, const Wish& wish,
                                    const std::map<std::string, NetworkManagerDevice>& profiles)
{
    AdoptedInterface interface;
    interface.name = wish.name;
    interface.manager = wish.manager;
    interface.origin = wish.origin;
    if (const auto profile = profiles.find(wish.name); profile != profiles.end()) {
        interface.profile = profile->second.profile;
    }
    const std::string path = FilePathOf(wish.name);
    interface.files.push_back({path, FileTextOf(wish), kReadableMode, hands.Read(path)});
    const std::string leasePath = kDhcpcdFolder + wish.name + ".lease";
    if (const auto lease = LeaseTextOf(host, wish)) {
        interface.files.push_back({leasePath, *lease, kPrivateMode, hands.Read(leasePath)});
    }
    if (const auto lease = Lease6TextOf(host, wish)) {
        interface.files.push_back(
            {leasePath + '6', *lease, kPrivateMode, hands.Read(leasePath + '6')});
    }
    interface.clients = ClientsOf(host, wish.name);
    interface.stateLine = StateLineOf(host, wish.name);
    interface.settings = KernelSettingsOf(host, wish.name);
    return interface;
}

void AddSilencers(const HostView& host, const Hands& hands, AdoptionRecord& record)
{
    for (const SilencingFile& file :
         SilencersFor(host, hands, record.NamesIn({Phase::kAdopting, Phase::kAdopted}))) {
        if (std::none_of(record.silencers.begin(), record.silencers.end(),
                         [&](const SilencingFile& each) { return each.path == file.path; })) {
            record.silencers.push_back(file);
        }
    }
}

void SetPhase(const std::set<std::string>& names, Phase phase, AdoptionRecord& record)
{
    for (AdoptedInterface& interface : record.interfaces) {
        if (names.contains(interface.name)) {
            interface.phase = phase;
        }
    }
}

void SetUnit(const std::string& unit, bool enabled, Hands& hands)
{
    if (!hands.Run({"systemctl", enabled ? "enable" : "disable", unit})) {
        throw std::runtime_error("cannot " + std::string(enabled ? "enable " : "disable ") + unit);
    }
}

bool RunNetwork(const char* verb, const std::set<std::string>& names, Hands& hands)
{
    std::vector<std::string> words{kNetworkProgram, verb};
    words.insert(words.end(), names.begin(), names.end());
    return hands.Run(words);
}

void RestoreFiles(const AdoptedInterface& interface, Hands& hands)
{
    for (const ChangedFile& file : interface.files) {
        if (file.before) {
            hands.Restore(file.path, *file.before);
        } else {
            hands.Remove(file.path);
        }
    }
}

} // namespace

void AddToRecord(const HostView& host, const Hands& hands, const Wishes& wishes,
                 AdoptionRecord& record)
{
    const auto profiles = ReadNetworkManagerDevices(host);
    for (const auto& [name, wish] : wishes) {
        record.interfaces.push_back(AdoptedInterfaceOf(host, hands, wish, profiles));
    }
    AddUnits(host, wishes, record);
    AddSilencers(host, hands, record);
}

// Our files and units come before the others go: a host that is restarted in between has its
// network from two rather than from nobody.
void PerformAdoption(const HostView& host, const std::set<std::string>& names,
                     AdoptionRecord& record, Hands& hands)
{
    SetPhase(names, Phase::kAdopting, record);
    record.Save(hands);
    for (const AdoptedInterface& interface : record.interfaces) {
        for (const ChangedFile& file : interface.files) {
            if (names.contains(interface.name)) {
                hands.Write(file.path, file.text, file.mode);
            }
        }
    }
    for (const ChangedUnit& unit : record.units) {
        SetUnit(unit.unit, unit.enable, hands);
    }
    SettleSilencers(record, record.NamesIn({Phase::kAdopting, Phase::kAdopted}), hands);
    TakeFromManagers(host, record, names, hands);
    if (!RunNetwork("start", names, hands)) {
        throw std::runtime_error("'/etc/rc.network start' failed: see the system log");
    }
    ForgetNameServers(record, names, hands);
}

LooseEnds PerformRelease(const HostView& host, const std::set<std::string>& names,
                         AdoptionRecord& record, Hands& hands)
{
    SetPhase(names, Phase::kReleasing, record);
    record.Save(hands);
    const std::set<std::string> left = record.NamesIn({Phase::kAdopting, Phase::kAdopted});
    SettleSilencers(record, left, hands);
    for (const ChangedUnit& unit : record.units) {
        if (left.empty()) {
            SetUnit(unit.unit, unit.before, hands);
        }
    }
    for (const AdoptedInterface& interface : record.interfaces) {
        if (names.contains(interface.name)) {
            RestoreFiles(interface, hands);
        }
    }
    (void)RunNetwork("leave", names, hands);
    RestoreKernelSettings(host, record, names, hands);
    LooseEnds ends = GiveToManagers(host, record, names, hands);
    std::erase_if(record.interfaces, [&](const AdoptedInterface& interface) {
        return names.contains(interface.name);
    });
    if (record.interfaces.empty()) {
        AdoptionRecord::Forget(hands);
    } else {
        record.Save(hands);
    }
    return ends;
}

} // namespace vornovsctl
