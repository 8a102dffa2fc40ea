#include "tagdevice.h"

namespace vornhost {

namespace {

constexpr char kPrefix[] = "tag";

} // namespace

std::string TagDeviceName(int parentIndex, unsigned vlanId)
{
    return kPrefix + std::to_string(parentIndex) + '.' + std::to_string(vlanId);
}

bool IsTagDevice(const Link& link)
{
    return link.kind == "vlan" && IsTagDeviceName(link.name, link.vlanId);
}

bool IsTagDeviceName(const std::string& name, int vlanId)
{
    const auto number = name.find_first_not_of("0123456789", sizeof kPrefix - 1);
    return name.rfind(kPrefix, 0) == 0 && number != std::string::npos &&
           number > sizeof kPrefix - 1 && name.substr(number) == "." + std::to_string(vlanId);
}

} // namespace vornhost
