#include "interfacename.h"

#include <algorithm>

namespace vornhost {

bool IsInterfaceName(std::string_view text)
{
    if (text.empty() || text.size() > kLongestInterfaceName || text == "." || text == "..") {
        return false;
    }
    if (text.front() == '-' || text.front() == '#') {
        return false;
    }
    return std::none_of(text.begin(), text.end(), [](char byte) {
        const auto value = static_cast<unsigned char>(byte);
        return value <= 0x20 || value == 0x7f || byte == '/' || byte == ':';
    });
}

} // namespace vornhost
