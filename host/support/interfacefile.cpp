#include "interfacefile.h"

#include "interfacename.h"

namespace vornhost {
namespace {

bool IsFileOf(const KeyValueFile& file, const std::string& interface)
{
    const std::string device = file.Get("DEVICE").value_or(interface);
    if (device == interface) {
        return true;
    }
    // A conversion back that was cut short has copied the bridge's file over the interface's and
    // not edited it yet; were it not the interface's, nothing could finish the way home.
    return device == "ovs_" + interface && file.Get("PRIMARY") == interface;
}

} // namespace

std::optional<KeyValueFile> LoadInterfaceFile(const std::string& interface)
{
    if (!IsInterfaceName(interface)) {
        return std::nullopt;
    }
    auto file = KeyValueFile::Load("/etc/sysconfig/network-scripts/ifcfg-" + interface);
    if (file && !IsFileOf(*file, interface)) {
        return std::nullopt;
    }
    return file;
}

} // namespace vornhost
