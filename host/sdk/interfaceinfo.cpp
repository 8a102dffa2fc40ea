#include "selection.h"

#include "support/interfacefile.h"
#include "support/livesettings.h"
#include "support/vlanrules.h"

#include <algorithm>
#include <cstring>
#include <exception>
#include <filesystem>
#include <syslog.h>
#include <vornplatform/sdk.h>

namespace {

using vornhost::Candidate;
using vornhost::Selection;

constexpr int kConvertibleInterfaces = 2;

bool HasEntry(const std::string& interface, const char* entry)
{
    std::error_code ignored; // an interface that has gone by now has nothing
    return std::filesystem::exists("/sys/class/net/" + interface + '/' + entry, ignored);
}

std::vector<Candidate> ReadCandidates()
{
    std::vector<Candidate> candidates;
    const auto network = vornhost::LiveNetwork::Read();
    for (const vornhost::Link& link : network.links) {
        Candidate candidate{link};
        candidate.hardware = HasEntry(link.name, "device");
        candidate.wireless = HasEntry(link.name, "wireless") || HasEntry(link.name, "phy80211");
        candidate.ownFile = vornhost::LoadInterfaceFile(link.name).has_value();
        candidate.tag = link.kind == "vlan" && vornhost::ObstacleToTag(network, link).empty();
        candidates.push_back(candidate);
    }
    return candidates;
}

void LogLeftOut(const std::vector<std::string>& names, const char* reason)
{
    for (const std::string& name : names) {
        ::syslog(LOG_ERR, "vornsdk: interface %s is left out: %s", name.c_str(), reason);
    }
}

int FillEntries(const Selection& selection, VLIBNETIFINFO* entries, int capacity)
{
    std::vector<std::string> names = selection.convertible;
    names.insert(names.end(), selection.passedOver.begin(), selection.passedOver.end());
    const auto count = std::min(names.size(), static_cast<std::size_t>(capacity));
    for (std::size_t index = 0; index < count; ++index) {
        entries[index] = {};
        names[index].copy(entries[index].szIfName, VORN_NAME_SIZE - 1);
    }

    LogLeftOut(selection.tooLong, "its name and the bridge's prefix exceed 15 characters");
    LogLeftOut(selection.notEthernet, "it is no wired Ethernet interface");
    LogLeftOut({names.begin() + static_cast<std::ptrdiff_t>(count), names.end()},
               "the list is full");
    return static_cast<int>(count);
}

} // namespace

int VLIBNetGetInterfaceInfo(VLIBNETIFINFO* entries, int capacity, int selector)
{
    if (entries == nullptr || capacity <= 0 || selector != kConvertibleInterfaces) {
        ::syslog(LOG_ERR, "vornsdk: no list of interfaces for the selector %d and %d entries",
                 selector, capacity);
        return -1;
    }

    try {
        const auto candidates = ReadCandidates();
        if (candidates.empty()) {
            ::syslog(LOG_ERR, "vornsdk: the kernel does not list its interfaces");
            return -1;
        }
        return FillEntries(vornhost::SelectInterfaces(candidates), entries, capacity);
    } catch (const std::exception& error) {
        ::syslog(LOG_ERR, "vornsdk: cannot list the interfaces: %s", error.what());
        return -1;
    }
}
