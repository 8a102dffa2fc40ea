#include "bondchange.h"
#include "bondmodes.h"

#include "support/contains.h"
#include "support/interfacename.h"

#include <algorithm>
#include <cstring>
#include <exception>
#include <syslog.h>
#include <vornplatform/netsdk.h>

namespace {

using vornhost::BondPlan;

std::string Name(const char (&field)[VORN_NAME_SIZE])
{
    return {field, ::strnlen(field, VORN_NAME_SIZE)};
}

/** @return  the bond and the slaves of a record, no slaves when the record is wrong. */
BondPlan PlanOf(const VORNLINKAGGROPT& opt)
{
    BondPlan plan;
    plan.name = Name(opt.szMaster);
    plan.mode = vornhost::KernelModeName(opt.mode);
    const int count = std::clamp(opt.nSlave, 0, VORN_LINK_AGGR_SLAVES);
    for (int index = 0; index < count; ++index) {
        const std::string slave = Name(opt.rgszSlave[index]);
        if (!vornhost::IsInterfaceName(slave) || slave == plan.name ||
            vornhost::Contains(plan.slaves, slave)) {
            return {};
        }
        plan.slaves.push_back(slave);
    }
    return opt.nSlave == count && vornhost::IsInterfaceName(plan.name) ? plan : BondPlan{};
}

int Set(const VORNLINKAGGROPT& opt)
{
    BondPlan plan = PlanOf(opt);
    if (plan.name.empty()) {
        ::syslog(LOG_ERR, "vornnetsdk: the record of a bond names no bond or wrong slaves");
        return -1;
    }
    if (opt.mode == VORN_LINK_AGGR_NONE) {
        return vornhost::TakeBondApart(std::move(plan));
    }
    if (plan.mode.empty()) {
        return Fail(plan, "its mode is none of the kernel's");
    }
    return plan.slaves.empty() ? Fail(plan, "has no slaves") : vornhost::BuildBond(std::move(plan));
}

} // namespace

int VORNNetLinkAggrSet(const VORNLINKAGGROPT* opt)
{
    if (opt == nullptr) {
        return -1;
    }
    try {
        return Set(*opt);
    } catch (const std::exception& error) {
        ::syslog(LOG_ERR, "vornnetsdk: cannot change a bond: %s", error.what());
        return -1;
    }
}
