#include "hostmodel.h"

#include <algorithm>
#include <cstring>

namespace vornovsctl {

namespace {

template <typename Named>
const Named* FindNamed(const std::vector<Named>& list, const std::string& name)
{
    const auto found = std::find_if(list.begin(), list.end(),
                                    [&](const Named& each) { return each.name == name; });
    return found == list.end() ? nullptr : &*found;
}

} // namespace

bool Port::IsNegotiated() const
{
    return std::any_of(members.begin(), members.end(),
                       [](const Member& member) { return member.negotiated; });
}

const Port* Bridge::Find(const std::string& port) const
{
    return FindNamed(ports, port);
}

const Device* HostModel::Find(const std::string& device) const
{
    return FindNamed(devices, device);
}

bool HostModel::IsDrawnWithTheSwitch(const std::string& device) const
{
    if (!bridges) {
        return false;
    }
    return std::any_of(bridges->begin(), bridges->end(), [&](const Bridge& bridge) {
        return bridge.name == device ||
               std::any_of(bridge.ports.begin(), bridge.ports.end(), [&](const Port& port) {
                   return FindNamed(port.members, device) != nullptr;
               });
    });
}

bool ComesBefore(const std::string& one, const std::string& other)
{
    return strverscmp(one.c_str(), other.c_str()) < 0;
}

} // namespace vornovsctl
