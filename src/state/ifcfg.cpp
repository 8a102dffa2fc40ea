#include "state/ifcfg.h"

#include <string_view>

namespace VORN::OVS {
namespace {

constexpr std::string_view kBridgePrefix = "ovs_";
constexpr std::string_view kWhiteSpace = " \t\n\v\f\r";

} // namespace

std::string Fit(std::string text, std::size_t buffer)
{
    if (text.size() >= buffer) {
        text.resize(buffer - 1);
    }
    return text;
}

std::string BridgeName(const std::string& name, std::size_t buffer)
{
    return Fit(std::string(kBridgePrefix).append(TextOf(name)), buffer);
}

std::string PlainName(const std::string& bridge, std::size_t buffer)
{
    const std::string_view text = TextOf(bridge);
    if (text.substr(0, kBridgePrefix.size()) != kBridgePrefix) {
        return {};
    }
    return Fit(FirstWord(text.substr(kBridgePrefix.size())), buffer);
}

std::string FirstWord(std::string_view text)
{
    const auto begin = text.find_first_not_of(kWhiteSpace);
    if (begin == std::string_view::npos) {
        return {};
    }
    const auto end = text.find_first_of(kWhiteSpace, begin);
    return std::string(text.substr(begin, end - begin));
}

std::string IfcfgPath(const std::string& name, std::size_t buffer)
{
    return Fit(std::string(kIfcfgPrefix).append(TextOf(name)), buffer);
}

} // namespace VORN::OVS
