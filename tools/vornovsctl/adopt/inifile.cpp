#include "adopt/inifile.h"

#include <sstream>
#include <support/interfacevalues.h>

namespace vornovsctl {

std::string IniSection::Get(const std::string& key) const
{
    std::string value;
    for (const auto& [each, text] : keys) {
        value = each == key ? text : value;
    }
    return value;
}

std::vector<IniSection> ParseIni(const std::string& text)
{
    std::vector<IniSection> sections;
    std::istringstream stream(text);
    std::string line;
    std::string pending;
    while (std::getline(stream, line)) {
        line = vornhost::Trimmed(line);
        if (line.empty() || line.front() == '#' || line.front() == ';') {
            continue;
        }
        line.insert(0, pending);
        pending.clear();
        if (line.ends_with('\\')) {
            pending = line.substr(0, line.size() - 1) + ' ';
        } else if (line.front() == '[' && line.back() == ']') {
            sections.push_back({line.substr(1, line.size() - 2), {}});
        } else if (const std::size_t sign = line.find('=');
                   sign != std::string::npos && !sections.empty()) {
            sections.back().keys.emplace_back(vornhost::Trimmed(line.substr(0, sign)),
                                              vornhost::Trimmed(line.substr(sign + 1)));
        }
    }
    return sections;
}

} // namespace vornovsctl
