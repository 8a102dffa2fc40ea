#include "tagdevice.h"

namespace vornhost {

std::string TagDeviceName(int parentIndex, unsigned vlanId)
{
    return "tag" + std::to_string(parentIndex) + '.' + std::to_string(vlanId);
}

bool IsTagDevice(const Link& link)
{
    return link.kind == "vlan" && link.vlanId >= 0 &&
           link.name == TagDeviceName(link.parent, static_cast<unsigned>(link.vlanId));
}

} // namespace vornhost
