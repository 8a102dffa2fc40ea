#include "interfacevalues.h"

#include <algorithm>
#include <array>
#include <cctype>
#include <charconv>
#include <cstdint>
#include <sstream>

#include <arpa/inet.h>

namespace vornhost {

std::string Lower(std::string text)
{
    std::transform(text.begin(), text.end(), text.begin(),
                   [](unsigned char letter) { return static_cast<char>(std::tolower(letter)); });
    return text;
}

std::string Trimmed(const std::string& text)
{
    constexpr char kBlanks[] = " \t\r";
    const auto first = text.find_first_not_of(kBlanks);
    if (first == std::string::npos) {
        return {};
    }
    return text.substr(first, text.find_last_not_of(kBlanks) - first + 1);
}

std::vector<std::string> Words(const std::string& text)
{
    std::istringstream stream(text);
    std::vector<std::string> words;
    for (std::string word; stream >> word;) {
        words.push_back(word);
    }
    return words;
}

std::string Joined(const std::vector<std::string>& words, const char* separator)
{
    std::string text;
    for (const std::string& word : words) {
        text += (text.empty() ? "" : separator) + word;
    }
    return text;
}

std::optional<unsigned> ToNumber(const std::string& text, unsigned least, unsigned most)
{
    unsigned value = 0;
    const char* end = text.data() + text.size();
    const auto [stop, error] = std::from_chars(text.data(), end, value);
    if (error != std::errc() || stop != end || value < least || value > most) {
        return std::nullopt;
    }
    return value;
}

std::string NormalAddress(int family, const std::string& text)
{
    std::array<unsigned char, sizeof(in6_addr)> bytes{};
    std::array<char, INET6_ADDRSTRLEN> normal{};
    if (inet_pton(family, text.c_str(), bytes.data()) != 1 ||
        inet_ntop(family, bytes.data(), normal.data(), normal.size()) == nullptr) {
        return {};
    }
    return normal.data();
}

std::optional<unsigned> MaskLength(const std::string& mask)
{
    in_addr address{};
    if (inet_pton(AF_INET, mask.c_str(), &address) != 1) {
        return std::nullopt;
    }
    const std::uint32_t bits = ntohl(address.s_addr);
    const auto length = static_cast<unsigned>(__builtin_popcount(bits));
    const std::uint32_t expected = length == 0 ? 0 : ~std::uint32_t{0} << (32U - length);
    if (bits != expected) {
        return std::nullopt;
    }
    return length;
}

} // namespace vornhost
