#include "unit.h"

#include <algorithm>
#include <support/interfacename.h>

namespace vornhost {
namespace {

constexpr char kBondSuffix[] = "-bond";

} // namespace

std::string BridgeOf(const std::string& plainName)
{
    return kBridgePrefix + plainName;
}

std::string PlainOf(const std::string& name)
{
    return name.rfind(kBridgePrefix, 0) == 0 ? name.substr(kBridgePrefixSize) : name;
}

std::vector<std::string> Unit::ForeignPorts() const
{
    std::vector<std::string> ports;
    if (switchBridge != nullptr) {
        for (const SwitchPort& each : switchBridge->ports) {
            if (each.name != name && each.name != bridge && !each.marked) {
                ports.push_back(each.name);
            }
        }
    }
    return ports;
}

bool Unit::BridgeStays() const
{
    return target == Target::kSwitch || switchBridge == nullptr || !switchBridge->marked ||
           !ForeignPorts().empty();
}

const Source* Unit::SourceOf(int index) const
{
    const auto found = std::find_if(sources.begin(), sources.end(), [&](const Source& source) {
        return source.link->index == index;
    });
    return found == sources.end() ? nullptr : &*found;
}

std::vector<const Link*> Unit::Ports() const
{
    if (kind == UnitKind::kSwitchBond || (IsGroup() && port == nullptr)) {
        return members;
    }
    return port == nullptr ? std::vector<const Link*>() : std::vector{port};
}

/** The port that holds the members; a bridge of the same name has a port of its own. */
std::string Unit::BondPort() const
{
    return bridge == name ? name + kBondSuffix : name;
}

} // namespace vornhost
