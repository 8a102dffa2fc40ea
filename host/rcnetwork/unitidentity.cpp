#include "unitplan.h"

#include <algorithm>

#include <linux/rtnetlink.h>
#include <sys/socket.h>

namespace vornhost {
namespace {

constexpr char kAutoconf[] = "ipv6.conf.autoconf";
constexpr char kTemporary[] = "ipv6.conf.use_tempaddr";
constexpr unsigned kLinkLocalLength = 64;

} // namespace

/** The addresses that the file asks for, its link-local one too. */
std::vector<WantedAddress> UnitPlanner::WantedAddresses() const
{
    if (m_unit.file == nullptr) {
        return {};
    }
    std::vector<WantedAddress> wanted = m_unit.file->addresses;
    if (!m_unit.file->linkLocal.empty()) {
        wanted.push_back({AF_INET6, m_unit.file->linkLocal, kLinkLocalLength});
    }
    return wanted;
}

/** Whether somebody else than the kernel gives the carrier its link-local address. */
bool UnitPlanner::HasOwnLinkLocal() const
{
    const bool asked = m_unit.addWanted && !m_unit.file->linkLocal.empty();
    return asked || ClientHasIpv6();
}

/** The kernel's own link-local address gives way to the one that is asked for. */
void UnitPlanner::PlanLinkLocal()
{
    if (!m_unit.addWanted || m_unit.file->linkLocal.empty()) {
        return;
    }
    if (!m_moves && Live(Carrier(), kAddressMode) != kAddressModeNone) {
        Set(Settings(), Carrier(), kAddressMode, kAddressModeNone);
    }
    for (const Address& address : m_inputs.live.addresses) {
        if (m_unit.carrierLink != nullptr && address.index == m_unit.carrierLink->index &&
            address.family == AF_INET6 && address.scope == RT_SCOPE_LINK &&
            address.local != m_unit.file->linkLocal) {
            RemoveAddress(address, Carrier());
        }
    }
}

void UnitPlanner::WantSetting(const std::string& setting, const std::string& wanted)
{
    // While the interface moves, the target is about to have what the source has.
    const bool follows = m_moves && m_unit.MainSource() != nullptr;
    const std::string live = Live(follows ? MainSource() : Carrier(), setting);
    if (live.empty() || live == wanted ||
        (setting == kAcceptRouters && wanted == "1" && live == "2")) {
        return;
    }
    Set(m_steps.settingsAfter, Carrier(), setting, wanted);
    m_record.formerSettings.emplace(setting, live);
}

/** Whether the file turns the stack off. */
bool UnitPlanner::GoesWithoutIpv6() const
{
    return m_unit.addWanted && !m_unit.takeDown && !m_unit.file->ipv6;
}

void UnitPlanner::PlanAutoconf()
{
    if (!m_unit.addWanted) {
        return;
    }
    const InterfaceFile& file = *m_unit.file;
    const std::string former = m_unit.carrierLink == nullptr ? kNewInterface : Carrier();
    // Where it moves, the stack of the other device is turned off as it is moved.
    if (GoesWithoutIpv6() && !(m_moves && m_unit.MainSource() != nullptr) &&
        Live(former, kDisableIpv6) == "0") {
        Set(Settings(), Carrier(), kDisableIpv6, "1");
    }
    PlanLinkLocal();
    if (file.privacy) {
        WantSetting(kTemporary, std::to_string(*file.privacy));
    }
    if (file.autoconf) {
        // Either the kernel hears routers or the client does.
        const bool kernel = *file.autoconf && !file.ClientHearsRouters();
        WantSetting(kAcceptRouters, kernel ? "1" : "0");
        WantSetting(kAutoconf, kernel ? "1" : "0");
    }
    if (file.metric6 && file.autoconf != false && !file.ClientHearsRouters()) {
        WantSetting(kRouterMetric, std::to_string(*file.metric6));
    }
    // The kernel takes one only for an interface that hears routers.
    if (!file.token.empty() && file.autoconf != false &&
        (m_unit.carrierLink == nullptr || m_unit.carrierLink->token != file.token)) {
        m_steps.finish.links.push_back("token set " + file.token + " dev " + Carrier());
    }
}

} // namespace vornhost
