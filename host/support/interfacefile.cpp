#include "interfacefile.h"

#include "interfacename.h"

namespace vornhost {

std::optional<KeyValueFile> LoadInterfaceFile(const std::string& interface)
{
    if (!IsInterfaceName(interface)) {
        return std::nullopt;
    }
    auto file = KeyValueFile::Load("/etc/sysconfig/network-scripts/ifcfg-" + interface);
    if (file && file->Get("DEVICE").value_or(interface) != interface) {
        return std::nullopt;
    }
    return file;
}

} // namespace vornhost
