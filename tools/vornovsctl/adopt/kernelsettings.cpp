#include "adopt/kernelsettings.h"

#include <array>

namespace vornovsctl {

namespace {

constexpr char kFolder[] = "/proc/sys/";

struct Setting {
    const char* family;
    const char* name;
};

constexpr std::array<Setting, 6> kSettings{{{"ipv4", "promote_secondaries"},
                                            {"ipv6", "accept_ra"},
                                            {"ipv6", "autoconf"},
                                            {"ipv6", "ra_defrtr_metric"},
                                            {"ipv6", "use_tempaddr"},
                                            {"ipv6", "addr_gen_mode"}}};

std::string ValueOf(const HostView& host, const std::string& path)
{
    const std::string text = host.Text(kFolder + path).value_or("");
    return text.substr(0, text.find('\n'));
}

} // namespace

std::map<std::string, std::string> KernelSettingsOf(const HostView& host,
                                                    const std::string& interface)
{
    std::map<std::string, std::string> settings;
    for (const Setting& setting : kSettings) {
        const std::string path =
            std::string("net/") + setting.family + "/conf/" + interface + '/' + setting.name;
        if (const std::string value = ValueOf(host, path); !value.empty()) {
            settings[path] = value;
        }
    }
    return settings;
}

void RestoreKernelSettings(const HostView& host, const AdoptionRecord& record,
                           const std::set<std::string>& names, Hands& hands)
{
    for (const AdoptedInterface& interface : record.interfaces) {
        if (!names.contains(interface.name)) {
            continue;
        }
        for (const auto& [path, value] : interface.settings) {
            const std::string now = ValueOf(host, path);
            if (!now.empty() && now != value) {
                (void)hands.Run(
                    {"sysctl", "-q", "-w", std::string(path).append("=").append(value)});
            }
        }
    }
}

} // namespace vornovsctl
