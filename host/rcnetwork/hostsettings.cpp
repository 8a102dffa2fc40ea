#include "hostsettings.h"

#include "support/keyvaluefile.h"

#include <charconv>

namespace vornhost {

std::chrono::seconds HostSeconds(const std::string& key, unsigned usual, unsigned least)
{
    constexpr unsigned kMost = 3600;
    const auto settings = KeyValueFile::Load(kHostSettingsPath);
    const std::string text = settings ? settings->Get(key).value_or("") : "";
    unsigned seconds = 0;
    const auto [stop, error] = std::from_chars(text.data(), text.data() + text.size(), seconds);
    const bool usable = error == std::errc() && stop == text.data() + text.size() &&
                        seconds >= least && seconds <= kMost;
    return std::chrono::seconds(usable ? seconds : usual);
}

} // namespace vornhost
