#include "recordingplatform/keyvaluemodel.h"

#include <algorithm>
#include <fstream>
#include <sstream>

namespace harness {

namespace {

std::optional<std::vector<std::string>> ReadLines(const std::string& path)
{
    std::ifstream file(path);
    if (!file) {
        return std::nullopt;
    }
    std::vector<std::string> lines;
    for (std::string line; std::getline(file, line);) {
        lines.push_back(line);
    }
    return lines;
}

bool WriteLines(const std::string& path, const std::vector<std::string>& lines)
{
    std::ofstream file(path);
    for (const std::string& line : lines) {
        file << line << '\n';
    }
    return file.good();
}

auto IsKey(const std::string& key)
{
    return [start = key + "="](const std::string& line) { return line.starts_with(start); };
}

} // namespace

bool CopyFile(const std::string& source, const std::string& target)
{
    const auto lines = ReadLines(source);
    return lines && WriteLines(target, *lines);
}

bool EditFile(const std::string& path, const KeyValues& set, const KeyValues& remove)
{
    std::vector<std::string> lines = ReadLines(path).value_or(std::vector<std::string>());
    for (const auto& [key, value] : set) {
        std::string line(key);
        line.append("=").append(value);
        const auto place = std::find_if(lines.begin(), lines.end(), IsKey(key));
        if (place != lines.end()) {
            *place = line;
        } else {
            lines.push_back(line);
        }
    }
    for (const auto& [key, value] : remove) {
        std::erase_if(lines, IsKey(key));
    }
    return WriteLines(path, lines);
}

std::optional<std::string> ReadKey(const std::string& path, const std::string& key)
{
    const std::vector<std::string> lines = ReadLines(path).value_or(std::vector<std::string>());
    const auto place = std::find_if(lines.begin(), lines.end(), IsKey(key));
    if (place == lines.end()) {
        return std::nullopt;
    }
    std::string value = place->substr(key.size() + 1);
    if (value.size() >= 2 && value.front() == '"' && value.back() == '"') {
        value = value.substr(1, value.size() - 2);
    }
    return value;
}

} // namespace harness
