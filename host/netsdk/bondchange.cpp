#include "bondchange.h"

#include <cerrno>
#include <cstring>
#include <syslog.h>

namespace vornhost {

std::vector<std::string> NamesOf(const BondPlan& plan)
{
    std::vector<std::string> names{plan.name};
    names.insert(names.end(), plan.slaves.begin(), plan.slaves.end());
    return names;
}

std::vector<std::string> OrderApart(const BondPlan& plan)
{
    const std::vector<std::string> names = NamesOf(plan);
    return {names.rbegin(), names.rend()};
}

int Fail(const BondPlan& plan, const char* reason)
{
    ::syslog(LOG_ERR, "vornnetsdk: bond %s: %s", plan.name.c_str(), reason);
    return -1;
}

int FailWithReason(const BondPlan& plan, const char* what)
{
    ::syslog(LOG_ERR, "vornnetsdk: bond %s: %s: %s", plan.name.c_str(), what, std::strerror(errno));
    return -1;
}

} // namespace vornhost
