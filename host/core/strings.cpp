#include <algorithm>
#include <cstring>
#include <string_view>

#include <vornplatform/core.h>

namespace {

/** What every caller provides; the function is not told. */
constexpr size_t kDestinationSize = 1024;
constexpr std::string_view kWhiteSpace = " \t\n\v\f\r";

} // namespace

/** A text that does not fit is refused, and the destination is then empty. */
int VLIBCStrTrimSpace(const char* source, char* destination)
{
    if (source == nullptr || destination == nullptr) {
        return -1;
    }
    std::string_view text = source;
    text.remove_prefix(std::min(text.find_first_not_of(kWhiteSpace), text.size()));
    text = text.substr(0, text.find_last_not_of(kWhiteSpace) + 1);
    if (text.size() >= kDestinationSize) {
        destination[0] = '\0';
        return -1;
    }
    // The two may be one buffer.
    std::memmove(destination, text.data(), text.size());
    destination[text.size()] = '\0';
    return 0;
}
