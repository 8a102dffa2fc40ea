/**
 * What the tests put on their host and look at.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_HOST_FILES_H
#define VORNOVS_TESTS_RELIABILITY_HOST_FILES_H

#include <map>
#include <string>

#include <sys/types.h>

namespace reliability {

constexpr char kConfigurationFolder[] = "/etc/sysconfig/network-scripts";
constexpr char kStateFolder[] = "/usr/vorn/etc/vornovs";
constexpr char kGatewayPath[] = "/usr/vorn/etc/vornnetd/gateways.conf";

/** The path of an interface's configuration file. */
std::string IfcfgPath(const std::string& interface);

/** Makes a file and the folders above it. */
void WriteFile(const std::string& path, const std::string& text, mode_t mode = 0644);

/** @return the file's text, "(none)" when there is no such file. */
std::string ReadFile(const std::string& path);

/** Removes everything in a folder. */
void Empty(const std::string& folder);

/** Every entry below a folder, without crossing into what is mounted there: what it is. */
using Tree = std::map<std::string, std::string>;

/** @return  the tree: of a file mode, owner and text, of a link its target. */
Tree ReadTree(const std::string& folder);

/** @return  the paths that are not the same in both, one a line with what became of each. */
std::map<std::string, std::string> Differences(const Tree& before, const Tree& after);

} // namespace reliability

#endif
