#include "clientoptions.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cstdint>
#include <cstdio>
#include <sstream>

namespace vornhost {
namespace {

constexpr char kInterfaceWord[] = "interface ";
constexpr char kSeparator[] = "; ";
constexpr char kEthernetId[] = "01:";
constexpr unsigned kLeastMetric = 1000;
constexpr unsigned kMetricPerVlan = 100;
constexpr unsigned kVlanShift = 20;
constexpr size_t kTailDigits = 8;
constexpr int kHexadecimal = 16;

/** The last four bytes of a link address as a number; 0 when it is none. */
std::uint32_t TailOf(const std::string& mac)
{
    std::string digits = mac;
    std::erase(digits, ':');
    std::uint32_t number = 0;
    if (digits.size() >= kTailDigits) {
        const char* const end = digits.data() + digits.size();
        (void)std::from_chars(end - kTailDigits, end, number, kHexadecimal);
    }
    return number;
}

std::string Hexadecimal(std::uint32_t number)
{
    std::array<char, 11> text{};
    (void)std::snprintf(text.data(), text.size(), "0x%08x", number);
    return text.data();
}

void AddFamilies(const InterfaceFile& file, ClientOptions& options)
{
    const bool six = file.ipv6 && (file.ClientHearsRouters() || file.client.dhcp6 == true);
    if (!six) {
        options.emplace_back(kOnlyIPv4);
    } else if (!file.client.dhcp) {
        options.emplace_back(kOnlyIPv6);
    }
    if (six && !file.ClientHearsRouters()) {
        options.emplace_back("noipv6rs"); // the kernel does, or nobody
    }
}

void AddHostName(const FileClient& client, ClientOptions& options)
{
    if (!client.hostName) {
        options.emplace_back("hostname");
    } else if (!client.hostName->empty()) {
        options.push_back("hostname " + *client.hostName);
    }
}

void AddIdentity(const FileClient& client, const ClientPlace& place, ClientOptions& options)
{
    const std::uint32_t usual = TailOf(place.mac) ^ (place.vlan << kVlanShift);
    options.push_back("iaid " + Hexadecimal(client.iaid.value_or(usual)));
    const std::string id = client.id.value_or(kEthernetId + place.mac);
    if (!id.empty()) {
        options.push_back("clientid " + id);
    }
}

void AddRoutes(const InterfaceFile& file, const ClientPlace& place, ClientOptions& options)
{
    const unsigned usual = kLeastMetric + place.card + kMetricPerVlan * place.vlan;
    const auto metric = file.client.dhcp || !file.metric6 ? file.metric : file.metric6;
    options.push_back("metric " + std::to_string(metric.value_or(usual)));
    if (!file.client.defaultRoute) {
        options.emplace_back("nogateway");
    }
    if (!file.client.routes) {
        options.emplace_back("nooption classless_static_routes, static_routes");
    }
}

} // namespace

ClientOptions MakeClientOptions(const InterfaceFile& file, const ClientPlace& place)
{
    const FileClient& client = file.client;
    ClientOptions options{
        // What it put on the interface is the host's, whether the client runs or not.
        "persistent",
        "lastlease",
        "noipv4ll",
        "timeout 0",
        "nodelay",
        "script /usr/vorn/lib/vornovs-dhcp-event",
        std::string("nohook hostname") + (client.nameServers ? "" : ", resolv.conf"),
        "option domain_name_servers, domain_name, domain_search, ntp_servers",
        "option classless_static_routes",
        "option dhcp6_name_servers, dhcp6_domain_search",
        "require dhcp_server_identifier",
        client.duid.empty() ? "duid" : "duid " + client.duid,
    };
    AddFamilies(file, options);
    AddHostName(client, options);
    options.push_back(kInterfaceWord + place.interface);
    AddIdentity(client, place, options);
    AddRoutes(file, place, options);
    if (client.dhcp6) {
        options.emplace_back(*client.dhcp6 ? "ia_na" : "nodhcp6");
    }
    return options;
}

ClientOptions WithInterface(ClientOptions options, const std::string& interface)
{
    for (std::string& option : options) {
        if (option.rfind(kInterfaceWord, 0) == 0) {
            option = kInterfaceWord + interface;
        }
    }
    return options;
}

std::string ClientText(const ClientOptions& options)
{
    std::string text;
    for (const std::string& option : options) {
        text += (text.empty() ? "" : kSeparator) + option;
    }
    return text;
}

ClientOptions ParseClientText(const std::string& text)
{
    ClientOptions options;
    for (std::string::size_type at = 0; at < text.size();) {
        const auto end = std::min(text.find(kSeparator, at), text.size());
        options.push_back(text.substr(at, end - at));
        at = end + sizeof kSeparator - 1;
    }
    return options;
}

} // namespace vornhost
