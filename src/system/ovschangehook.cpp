#include <vornovs/vornovs.h>

namespace VORN::OVS {

OVSChangeHook::OVSChangeHook(const std::string& action)
    : vornnetsdk::hook::BaseHook("net", "net/ovs_change")
{
    (void)SetEnv("ACTION", action);
}

OVSChangeHook::~OVSChangeHook() = default;

} // namespace VORN::OVS
