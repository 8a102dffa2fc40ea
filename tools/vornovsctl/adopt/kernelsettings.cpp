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

/** As "ip link set" calls the values of addr_gen_mode. */
constexpr std::array kAddressModes{"eui64", "none", "stable_secret", "random"};

std::string ValueOf(const HostView& host, const std::string& path)
{
    const std::string text = host.Text(kFolder + path).value_or("");
    return text.substr(0, text.find('\n'));
}

/**
 * Written as a file it would have the kernel begin with IPv6 on the interface, which on a member of
 * a bond nobody does.
 */
void SetAddressMode(const std::string& interface, const std::string& value, Hands& hands)
{
    for (std::size_t mode = 0; mode < kAddressModes.size(); ++mode) {
        if (value == std::to_string(mode)) {
            (void)hands.Run(
                {"ip", "link", "set", "dev", interface, "addrgenmode", kAddressModes.at(mode)});
        }
    }
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
        const vornhost::Link* const link = host.live.Find(interface.name);
        const bool isMember = link != nullptr && link->master != 0;
        for (const auto& [path, value] : interface.settings) {
            const std::string now = ValueOf(host, path);
            if (now.empty() || now == value) {
                continue;
            }
            if (isMember && path.ends_with("/addr_gen_mode")) {
                SetAddressMode(interface.name, value, hands);
            } else {
                (void)hands.Run(
                    {"sysctl", "-q", "-w", std::string(path).append("=").append(value)});
            }
        }
    }
}

} // namespace vornovsctl
