/**
 * The syntax of /etc/network/interfaces: reading it, and commenting out what belongs to some
 * interfaces so that it can come back as it was.
 */
#ifndef VORNOVSCTL_ADOPT_INTERFACESFILE_H
#define VORNOVSCTL_ADOPT_INTERFACESFILE_H

#include <functional>
#include <map>
#include <set>
#include <string>
#include <utility>
#include <vector>

namespace vornovsctl {

/** One "iface" paragraph. */
struct InterfaceStanza {
    std::string name;
    std::string family; /**< "inet", "inet6"; empty where the paragraph is nothing but a template */
    std::string method; /**< "static", "dhcp", "auto", "manual"... */
    std::string path;   /**< the file that it stands in */
    std::vector<std::pair<std::string, std::string>> options; /**< those inherited first */

    bool operator==(const InterfaceStanza&) const = default;
};

/** Everything that ifupdown is told. */
struct InterfacesConfig {
    std::vector<InterfaceStanza> stanzas;
    std::map<std::string, std::set<std::string>> classes; /**< "auto", "hotplug": the interfaces */
    std::vector<std::string> paths;                       /**< the files, as they are read */
    std::set<std::string> mapped;                         /**< patterns of "mapping" paragraphs */

    bool Has(const std::string& interface) const;
    bool IsBroughtUp(const std::string& interface) const;
};

/** @return the text of a file; nothing: there is none. */
using ReadText = std::function<std::string(const std::string& path)>;
/** @return the files that a pattern of a shell stands for, sorted. */
using FindFiles = std::function<std::vector<std::string>(const std::string& pattern)>;

InterfacesConfig ReadInterfacesConfig(const std::string& path, const ReadText& readText,
                                      const FindFiles& findFiles);

/** Comments out what a file says of these interfaces. */
std::string WithoutInterfaces(const std::string& text, const std::set<std::string>& names);

/** Brings back everything that was commented out, whatever else was edited since. */
std::string WithInterfacesAgain(const std::string& text);

} // namespace vornovsctl

#endif
