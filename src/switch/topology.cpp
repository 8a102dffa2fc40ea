#include "switch/topology.h"

#include "state/ifcfg.h"
#include "system/log.h"

#include <vornplatform/core.h>

namespace VORN::OVS {
namespace {

constexpr char kLogFile[] = "ovsmanager.cpp";

constexpr char kSettingsPath[] = "/etc/vorninfo.conf";

} // namespace

bool IsBridgeTopology()
{
    return VLIBCFileCheckKeyValue(kSettingsPath, "support_net_topology", "yes", 0) == 1 &&
           VLIBCFileCheckKeyValue(kSettingsPath, "net_topology", "bridge", 0) == 1;
}

void SetTopologyKey(const char* interface, const char* key, const char* value)
{
    const std::string ifcfgPath = IfcfgPath(interface);
    if (VLIBCFileSetKeyValue(ifcfgPath.c_str(), key, value, 0) > 0) {
        OVS_ERR("Failed to set key %s in %s", key, ifcfgPath.c_str());
    }
}

} // namespace VORN::OVS
