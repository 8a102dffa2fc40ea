#include <vornovs/vornovs.h>

#include "system/log.h"

namespace VORN::OVS {
namespace {

constexpr char kLogFile[] = "libvornovs.cpp";

} // namespace

int OVSVlanGet(const std::string& interface, _tag_VLIB_VLAN* out)
{
    const int result = VlanManager::Get(interface, out);
    if (result < 0) {
        // The clearing's text: log readers know it so.
        OVS_ERR("Failed to clear the current valn tag of %s", interface.c_str());
    }
    return result;
}

int OVSVlanSet(const std::string& interface, const std::string& id)
{
    if (VlanManager::Set(interface, id) < 0) {
        OVS_ERR("Failed to set vlan %s into config of %s", id.c_str(), interface.c_str());
        return -1;
    }
    return 0;
}

int OVSVlanClear(const std::string& interface)
{
    if (VlanManager::Clear(interface) < 0) {
        OVS_ERR("Failed to clear the current valn tag of %s", interface.c_str());
        return -1;
    }
    return 0;
}

int OVSVlanCreate(const std::string& interface, const std::string& id)
{
    if (VlanManager::Create(interface, id) < 0) {
        OVS_ERR("Failed to Creat the vlan tag %s of %s", id.c_str(), interface.c_str());
        return -1;
    }
    return 0;
}

int OVSVlanRemove(const std::string& interface)
{
    if (VlanManager::Remove(interface) < 0) {
        OVS_ERR("Failed to remove the vlan tag of %s", interface.c_str());
        return -1;
    }
    return 0;
}

} // namespace VORN::OVS
