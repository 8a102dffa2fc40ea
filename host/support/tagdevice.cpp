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
    const auto number = link.name.find_first_not_of("0123456789", sizeof kPrefix - 1);
    return link.kind == "vlan" && link.name.rfind(kPrefix, 0) == 0 && number != std::string::npos &&
           number > sizeof kPrefix - 1 &&
           link.name.substr(number) == "." + std::to_string(link.vlanId);
}

} // namespace vornhost
