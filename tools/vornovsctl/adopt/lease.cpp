#include "adopt/lease.h"

#include <algorithm>
#include <arpa/inet.h>

namespace vornovsctl {

namespace {

constexpr std::size_t kHeaderSize = 236;
constexpr std::size_t kHardwareAddressAt = 28;
constexpr std::size_t kYourAddressAt = 16;
constexpr char kMagic[] = "\x63\x82\x53\x63";
constexpr unsigned kLongestOption = 255;
constexpr std::size_t kAddressSize = 4;

enum OptionCode : unsigned char {
    kNetmask = 1,
    kRouters = 3,
    kDns = 6,
    kDomain = 15,
    kLeaseTime = 51,
    kMessageType = 53,
    kServer = 54,
    kEnd = 255
};
constexpr char kAck = 5;

std::string BytesOf(const std::string& address)
{
    in_addr bytes{};
    if (inet_pton(AF_INET, address.c_str(), &bytes) != 1) {
        return "";
    }
    return {reinterpret_cast<const char*>(&bytes), kAddressSize};
}

void AddOption(OptionCode code, const std::string& value, std::string& packet)
{
    if (!value.empty() && value.size() <= kLongestOption) {
        packet += static_cast<char>(code);
        packet += static_cast<char>(value.size());
        packet += value;
    }
}

std::string ListOf(const std::vector<std::string>& addresses)
{
    std::string bytes;
    for (const std::string& address : addresses) {
        bytes += BytesOf(address);
    }
    return bytes;
}

std::string Number(std::uint32_t value)
{
    const std::uint32_t ordered = htonl(value);
    return {reinterpret_cast<const char*>(&ordered), sizeof ordered};
}

enum Option6 : std::uint16_t { kClientId6 = 1, kServerId6 = 2, kAssociation = 3, kAddress6 = 5 };
constexpr char kReply6 = 7;
constexpr std::uint32_t kSoon = 5;
constexpr std::uint32_t kSoonAfter = 8;
constexpr char kNoServer[] = "00:03:00:01:00:00:00:00:00:00";

std::string Short(std::size_t value)
{
    return {static_cast<char>(value >> 8U), static_cast<char>(value & 0xffU)};
}

std::string FromHex(const std::string& text)
{
    std::string bytes;
    std::string digits = text;
    std::erase(digits, ':');
    for (std::size_t index = 0; index + 1 < digits.size(); index += 2) {
        bytes += static_cast<char>(std::stoi(digits.substr(index, 2), nullptr, 16));
    }
    return bytes;
}

std::string OptionOf6(Option6 code, const std::string& value)
{
    return Short(code) + Short(value.size()) + value;
}

} // namespace

std::optional<std::string> AnswerOf6(const Lease6& lease)
{
    in6_addr address{};
    if (inet_pton(AF_INET6, lease.address.c_str(), &address) != 1 || lease.duid.empty() ||
        lease.iaid.size() != 8 || lease.validSeconds == 0) {
        return std::nullopt;
    }
    const std::string bytes(reinterpret_cast<const char*>(&address), sizeof address);
    const std::string given = bytes + Number(lease.preferredSeconds) + Number(lease.validSeconds);
    const std::string association =
        FromHex(lease.iaid) + Number(kSoon) + Number(kSoonAfter) + OptionOf6(kAddress6, given);
    return kReply6 + std::string(3, '\0') + OptionOf6(kClientId6, FromHex(lease.duid)) +
           OptionOf6(kServerId6, FromHex(kNoServer)) + OptionOf6(kAssociation, association);
}

std::optional<std::array<unsigned char, 6>> MacBytes(const std::string& mac)
{
    constexpr std::size_t kWidth = 3; // two digits and a colon
    std::array<unsigned char, 6> bytes{};
    const bool digits = mac.find_first_not_of("0123456789abcdefABCDEF:") == std::string::npos;
    if (!digits || mac.size() != bytes.size() * kWidth - 1) {
        return std::nullopt;
    }
    const std::string packed = FromHex(mac);
    if (packed.size() != bytes.size()) {
        return std::nullopt;
    }
    std::copy(packed.begin(), packed.end(), bytes.begin());
    return bytes;
}

std::optional<std::string> AnswerOf(const Lease& lease, const std::string& mac)
{
    const auto hardware = MacBytes(mac);
    const std::string address = BytesOf(lease.address);
    const std::string server = BytesOf(lease.server);
    if (address.empty() || server.empty() || BytesOf(lease.netmask).empty() || lease.seconds == 0 ||
        !hardware) {
        return std::nullopt;
    }
    std::string packet(kHeaderSize, '\0');
    packet[0] = 2; // an answer, over Ethernet with addresses of six bytes
    packet[1] = 1;
    packet[2] = static_cast<char>(hardware->size());
    packet.replace(kYourAddressAt, kAddressSize, address);
    for (std::size_t index = 0; index < hardware->size(); ++index) {
        packet[kHardwareAddressAt + index] = static_cast<char>((*hardware)[index]);
    }
    packet += kMagic;
    AddOption(kMessageType, std::string(1, kAck), packet);
    AddOption(kServer, server, packet);
    AddOption(kLeaseTime, Number(lease.seconds), packet);
    AddOption(kNetmask, BytesOf(lease.netmask), packet);
    AddOption(kRouters, ListOf(lease.routers), packet);
    AddOption(kDns, ListOf(lease.dns), packet);
    AddOption(kDomain, lease.domain, packet);
    packet += static_cast<char>(kEnd);
    return packet;
}

} // namespace vornovsctl
