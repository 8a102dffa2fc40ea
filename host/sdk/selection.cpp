#include "selection.h"

#include "support/interfacename.h"
#include "support/tagdevice.h"

#include <algorithm>
#include <map>
#include <net/if_arp.h>
#include <string_view>

namespace vornhost {

namespace {

constexpr std::string_view kSwitchDevice = "ovs-system";

// Callers compare as far as the shorter of the two goes.
bool AgreesWith(std::string_view name, std::string_view prefix)
{
    const std::size_t length = std::min(name.size(), prefix.size());
    return name.substr(0, length) == prefix.substr(0, length);
}

bool IsPassedOver(const Link& link)
{
    constexpr std::string_view prefixes[] = {kBridgePrefix, "wlan", "ppp", "tun"};
    return link.kind == "bridge" ||
           std::any_of(std::begin(prefixes), std::end(prefixes),
                       [&](std::string_view prefix) { return AgreesWith(link.name, prefix); });
}

class Selector {
public:
    explicit Selector(const std::vector<Candidate>& candidates)
    {
        for (const Candidate& candidate : candidates) {
            m_byIndex[candidate.link.index] = &candidate;
        }
    }

    void Sort(const Candidate& candidate, Selection& selection) const
    {
        const Link& link = candidate.link;
        if (link.loopback || link.name == kSwitchDevice || IsTagDevice(link) ||
            IsPortOfAnother(link) || !IsWorthListing(candidate)) {
            return;
        }
        if (IsPassedOver(link)) {
            selection.passedOver.push_back(link.name);
        } else if (link.type != ARPHRD_ETHER || candidate.wireless) {
            selection.notEthernet.push_back(link.name);
        } else if (!candidate.tag && kBridgePrefixSize + link.name.size() > kLongestInterfaceName) {
            selection.tooLong.push_back(link.name);
        } else {
            selection.convertible.push_back(link.name);
        }
    }

private:
    // A port of the switch can be given to another bridge of it; one of a Linux bridge or bond
    // belongs to that one. The master of a container's interface may be out of sight.
    bool IsPortOfAnother(const Link& link) const
    {
        if (link.master == 0) {
            return false;
        }
        const auto master = m_byIndex.find(link.master);
        return master == m_byIndex.end() || master->second->link.name != kSwitchDevice;
    }

    bool IsWorthListing(const Candidate& candidate) const
    {
        return candidate.ownFile || IsWired(candidate, 0);
    }

    bool IsWired(const Candidate& candidate, int depth) const
    {
        constexpr int kDeepestStack = 8; // of VLANs, the kernel's limit
        const Link& link = candidate.link;
        if (link.kind != "vlan") {
            return link.type == ARPHRD_ETHER && !candidate.wireless &&
                   (candidate.hardware || link.kind == "bond");
        }
        const auto parent = m_byIndex.find(link.parent);
        return depth < kDeepestStack && parent != m_byIndex.end() &&
               IsWired(*parent->second, depth + 1);
    }

    std::map<int, const Candidate*> m_byIndex;
};

} // namespace

Selection SelectInterfaces(std::vector<Candidate> candidates)
{
    std::sort(candidates.begin(), candidates.end(),
              [](const auto& one, const auto& other) { return one.link.index < other.link.index; });

    const Selector selector(candidates);
    Selection selection;
    for (const Candidate& candidate : candidates) {
        selector.Sort(candidate, selection);
    }
    return selection;
}

} // namespace vornhost
