/**
 * Bonds. This platform does not take them apart: a bond goes on to the switch as it is, as the port
 * of a bridge of its own, and comes back the same way. So none can be read to be rebuilt, and
 * making or changing one is refused. The names of the modes and the record itself are complete.
 */
#include <algorithm>
#include <array>
#include <cstring>
#include <syslog.h>
#include <vornplatform/netsdk.h>

namespace {

struct ModeName {
    VORN_LINK_AGGR_MODE mode;
    const char* name;
};

// The kernel's own names, and the switch's under a prefix: two of them are called the same.
constexpr std::array kModes{
    ModeName{VORN_LINK_AGGR_BALANCE_RR, "balance-rr"},
    ModeName{VORN_LINK_AGGR_8023AD, "802.3ad"},
    ModeName{VORN_LINK_AGGR_BALANCE_XOR, "balance-xor"},
    ModeName{VORN_LINK_AGGR_ACTIVE_BACKUP, "active-backup"},
    ModeName{VORN_LINK_AGGR_BALANCE_ALB, "balance-alb"},
    ModeName{VORN_LINK_AGGR_OVS_ACTIVE_BACKUP, "ovs-active-backup"},
    ModeName{VORN_LINK_AGGR_OVS_BALANCE_SLB, "ovs-balance-slb"},
    ModeName{VORN_LINK_AGGR_OVS_BALANCE_TCP, "ovs-balance-tcp"},
};

} // namespace

int VORNNetLinkAggrGet(const char* name, VORNLINKAGGROPT* opt)
{
    if (name != nullptr && opt != nullptr) {
        ::syslog(LOG_INFO, "vornnetsdk: bond %s goes on to the switch as it is", name);
    }
    return -1;
}

int VORNNetLinkAggrSet(const VORNLINKAGGROPT* opt)
{
    constexpr int kLength = VORN_NAME_SIZE;
    ::syslog(LOG_ERR,
             "vornnetsdk: bond %.*s is not changed: this platform carries bonds as they are",
             kLength, opt == nullptr ? "of no name" : opt->szMaster);
    return -1;
}

VORN_LINK_AGGR_MODE VORNNetLinkAggrStringToMode(const char* text)
{
    if (text == nullptr) {
        return VORN_LINK_AGGR_NONE;
    }
    const auto* const found = std::find_if(kModes.begin(), kModes.end(), [&](const ModeName& each) {
        return std::strcmp(each.name, text) == 0;
    });
    return found == kModes.end() ? VORN_LINK_AGGR_NONE : found->mode;
}

const char* VORNNetLinkAggrModeToString(VORN_LINK_AGGR_MODE mode)
{
    const auto* const found = std::find_if(kModes.begin(), kModes.end(),
                                           [&](const ModeName& each) { return each.mode == mode; });
    return found == kModes.end() ? "unknown" : found->name;
}

int VORNNetLinkAggrOptSlsaveAdd(VORNLINKAGGROPT* opt, const char* slave)
{
    if (opt == nullptr || slave == nullptr || opt->nSlave < 0 ||
        opt->nSlave >= VORN_LINK_AGGR_SLAVES) {
        return -1;
    }
    const std::size_t length = std::strlen(slave);
    if (length == 0 || length >= VORN_NAME_SIZE) {
        return -1;
    }

    char* const slot = opt->rgszSlave[opt->nSlave];
    std::fill_n(slot, VORN_NAME_SIZE, '\0');
    std::copy_n(slave, length, slot);
    ++opt->nSlave;
    return 0;
}

int VORNNetBondIPConflict(const char* /*bond*/, char* /*conflict*/, int /*size*/,
                          unsigned int* /*out*/)
{
    return 0; // a bond that is never taken apart hands its address to nobody
}
