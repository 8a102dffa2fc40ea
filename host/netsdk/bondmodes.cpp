#include "bondmodes.h"

#include <algorithm>
#include <array>
#include <cstring>
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

bool IsOfKernel(VORN_LINK_AGGR_MODE mode)
{
    return mode >= VORN_LINK_AGGR_BALANCE_RR && mode <= VORN_LINK_AGGR_BALANCE_ALB;
}

} // namespace

namespace vornhost {

VORN_LINK_AGGR_MODE KernelModeNumber(const std::string& name)
{
    const VORN_LINK_AGGR_MODE mode = VORNNetLinkAggrStringToMode(name.c_str());
    return IsOfKernel(mode) ? mode : VORN_LINK_AGGR_NONE;
}

std::string KernelModeName(VORN_LINK_AGGR_MODE mode)
{
    return IsOfKernel(mode) ? VORNNetLinkAggrModeToString(mode) : "";
}

std::string ModeAfterSwitch(const std::string& name)
{
    const bool balances = name == "balance-rr" || name == "balance-alb";
    return balances ? "balance-xor" : name;
}

} // namespace vornhost

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
