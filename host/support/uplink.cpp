#include "uplink.h"

#include "interfacefile.h"

#include <algorithm>
#include <iterator>
#include <sstream>

namespace vornhost {

std::vector<std::string> ListedSlaves(const std::string& bridge)
{
    const auto file = LoadInterfaceFile(bridge);
    std::istringstream words(file ? file->Get("SLAVE_LIST").value_or("") : "");
    return {std::istream_iterator<std::string>(words), std::istream_iterator<std::string>()};
}

const SwitchPort* FindUplinkByFile(const SwitchBridge& bridge)
{
    std::vector<std::string> slaves = ListedSlaves(bridge.name);
    std::sort(slaves.begin(), slaves.end());
    for (const SwitchPort& port : bridge.ports) {
        if (port.bond && !slaves.empty() && port.interfaces == slaves) {
            return &port;
        }
    }
    const auto file = LoadInterfaceFile(bridge.name);
    return FindUplink(bridge, file ? file->Get("PRIMARY").value_or("") : "");
}

} // namespace vornhost
