/**
 * What may be the name of a network interface.
 */
#ifndef VORNHOST_SUPPORT_INTERFACENAME_H
#define VORNHOST_SUPPORT_INTERFACENAME_H

#include <cstddef>
#include <string_view>

namespace vornhost {

/** Longest interface name in bytes, the terminator not counted. */
constexpr std::size_t kLongestInterfaceName = 15;

/** What the name of an interface's bridge begins with. */
constexpr char kBridgePrefix[] = "ovs_";
constexpr std::size_t kBridgePrefixSize = sizeof kBridgePrefix - 1;

/**
 * Tells whether a text can stand for an interface in a file, a path and an argument vector: 1 to 15
 * bytes, none of them a blank, a control character, a slash or a colon; neither "." nor ".."; and
 * no leading minus sign or hash mark, which would make an option or a comment of it.
 */
bool IsInterfaceName(std::string_view text);

} // namespace vornhost

#endif
