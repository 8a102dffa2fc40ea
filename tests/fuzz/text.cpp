#include "text.h"

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>

namespace fuzz {

std::string TakeUpTo(std::string_view separator, std::string_view& text)
{
    const std::size_t end = text.find(separator);
    const std::string taken(text.substr(0, end));
    text.remove_prefix(end == std::string_view::npos ? text.size() : end + separator.size());
    return taken;
}

std::vector<std::string> LinesOf(std::string_view text)
{
    std::vector<std::string> lines;
    while (!text.empty()) {
        const std::size_t feed = text.find('\n');
        const std::size_t size = feed == std::string_view::npos ? text.size() : feed + 1;
        lines.emplace_back(text.substr(0, size));
        text.remove_prefix(size);
    }
    return lines;
}

std::string Content(std::string_view line)
{
    for (const char end : {'\n', '\r'}) {
        if (line.ends_with(end)) {
            line.remove_suffix(1);
        }
    }
    return std::string(line);
}

std::vector<std::string> WordsOf(std::string_view text)
{
    std::vector<std::string> words;
    for (;;) {
        text.remove_prefix(std::min(text.find_first_not_of(' '), text.size()));
        if (text.empty()) {
            return words;
        }
        words.emplace_back(text.substr(0, text.find(' ')));
        text.remove_prefix(words.back().size());
    }
}

std::vector<std::string> Order(std::string_view line, std::size_t words)
{
    std::vector<std::string> order = WordsOf(line);
    order.resize(std::max(words, order.size()));
    return order;
}

bool HasControls(std::string_view text)
{
    return std::any_of(text.begin(), text.end(), [](char letter) {
        const auto byte = static_cast<unsigned char>(letter);
        return byte < ' ' || byte == 0x7f;
    });
}

std::string ReadFile(const std::string& path)
{
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

void WriteFile(const std::string& path, std::string_view text)
{
    std::ofstream(path, std::ios::binary) << text;
}

bool Exists(const std::string& path)
{
    return std::filesystem::exists(path);
}

std::vector<std::string> EntriesOf(const std::string& folder)
{
    std::vector<std::string> entries;
    for (const auto& entry : std::filesystem::directory_iterator(folder)) {
        entries.push_back(entry.path().filename());
    }
    std::sort(entries.begin(), entries.end());
    return entries;
}

void MakeEmptyFolder(const std::string& folder)
{
    std::filesystem::create_directories(folder);
    for (const auto& entry : std::filesystem::directory_iterator(folder)) {
        std::filesystem::remove_all(entry.path());
    }
}

} // namespace fuzz
