/**
 * Files of sections and keys, as systemd-networkd and NetworkManager have them.
 */
#ifndef VORNOVSCTL_ADOPT_INIFILE_H
#define VORNOVSCTL_ADOPT_INIFILE_H

#include <string>
#include <utility>
#include <vector>

namespace vornovsctl {

struct IniSection {
    std::string name;
    std::vector<std::pair<std::string, std::string>> keys; /**< in their order, several of a name */

    /** @return the last value of a key; empty: it has none. */
    std::string Get(const std::string& key) const;

    bool operator==(const IniSection&) const = default;
};

/** The sections in their order; one of a name may come several times. */
std::vector<IniSection> ParseIni(const std::string& text);

} // namespace vornovsctl

#endif
