#include "adopt/dhclient.h"

#include <algorithm>
#include <ctime>
#include <sstream>

namespace vornovsctl {

namespace {

constexpr char kHexDigits[] = "0123456789abcdef";

std::string HexOf(const std::string& bytes)
{
    std::string text;
    for (const char byte : bytes) {
        const auto value = static_cast<unsigned char>(byte);
        text += text.empty() ? "" : ":";
        text += kHexDigits[value >> 4U];
        text += kHexDigits[value & 0xfU];
    }
    return text;
}

bool IsOctal(char letter)
{
    return letter >= '0' && letter <= '7';
}

/** The bytes of a text between quotes: others than printable ones stand there in octal digits. */
std::string Unescaped(const std::string& quoted)
{
    std::string bytes;
    for (std::size_t index = 0; index < quoted.size(); ++index) {
        if (quoted[index] != '\\' || index + 1 == quoted.size()) {
            bytes += quoted[index];
        } else if (index + 3 < quoted.size() && IsOctal(quoted[index + 1])) {
            bytes += static_cast<char>(std::stoi(quoted.substr(index + 1, 3), nullptr, 8));
            index += 3;
        } else {
            bytes += quoted[++index];
        }
    }
    return bytes;
}

/** Statements up to their semicolons or braces; what stands between quotes is no end. */
std::vector<std::string> StatementsOf(const std::string& text)
{
    std::vector<std::string> statements(1);
    bool quoted = false;
    bool comment = false;
    for (std::size_t index = 0; index < text.size(); ++index) {
        const char letter = text[index];
        if (comment) {
            comment = letter != '\n';
        } else if (quoted && letter == '\\' && index + 1 < text.size()) {
            statements.back() += text.substr(index++, 2);
        } else if (letter == '#' && !quoted) {
            comment = true;
        } else if (!quoted && (letter == ';' || letter == '{' || letter == '}')) {
            if (letter != ';') {
                statements.back() += letter;
            }
            statements.emplace_back();
        } else {
            quoted = (letter == '"') != quoted;
            const bool blank = !quoted && (letter == '\n' || letter == '\t' || letter == ' ');
            if (!blank || !statements.back().empty()) {
                statements.back() += blank ? ' ' : letter;
            }
        }
    }
    return statements;
}

std::vector<std::string> LeaseList(const std::string& text)
{
    std::vector<std::string> values;
    std::string part;
    std::istringstream stream(text);
    while (std::getline(stream, part, ',')) {
        part.erase(0, part.find_first_not_of(' '));
        values.push_back(part);
    }
    return values;
}

std::string WithoutQuotes(const std::string& text)
{
    const bool quoted = text.size() >= 2 && text.front() == '"' && text.back() == '"';
    return quoted ? Unescaped(text.substr(1, text.size() - 2)) : text;
}

/** "6 2026/11/21 08:56:47", in UTC, or "epoch 1795251407". */
std::int64_t MomentOf(const std::string& text)
{
    if (text.starts_with("epoch ")) {
        return std::strtoll(text.c_str() + 6, nullptr, 10);
    }
    std::tm time{};
    const std::size_t space = text.find(' ');
    if (space == std::string::npos ||
        strptime(text.c_str() + space + 1, "%Y/%m/%d %H:%M:%S", &time) == nullptr) {
        return 0;
    }
    return timegm(&time);
}

std::optional<std::string> After(const std::string& statement, const std::string& beginning)
{
    return statement.starts_with(beginning) ? std::optional(statement.substr(beginning.size()))
                                            : std::nullopt;
}

void ReadLeaseStatement(const std::string& statement, Lease& lease, std::int64_t& end)
{
    if (const auto address = After(statement, "fixed-address ")) {
        lease.address = *address;
    } else if (const auto mask = After(statement, "option subnet-mask ")) {
        lease.netmask = *mask;
    } else if (const auto routers = After(statement, "option routers ")) {
        lease.routers = LeaseList(*routers);
    } else if (const auto seconds = After(statement, "option dhcp-lease-time ")) {
        lease.seconds = static_cast<std::uint32_t>(std::strtoul(seconds->c_str(), nullptr, 10));
    } else if (const auto dns = After(statement, "option domain-name-servers ")) {
        lease.dns = LeaseList(*dns);
    } else if (const auto server = After(statement, "option dhcp-server-identifier ")) {
        lease.server = *server;
    } else if (const auto domain = After(statement, "option domain-name ")) {
        lease.domain = WithoutQuotes(*domain);
    } else if (const auto expiry = After(statement, "expire ")) {
        end = MomentOf(*expiry);
    }
}

} // namespace

DhclientState ParseDhclientLeases(const std::string& text, const std::string& interface)
{
    DhclientState state;
    Lease lease;
    std::string owner;
    std::int64_t end = 0;
    for (const std::string& statement : StatementsOf(text)) {
        if (statement.starts_with("lease")) {
            lease = Lease();
            owner.clear();
            end = 0;
        } else if (const auto duid = After(statement, "default-duid ")) {
            state.duid = HexOf(WithoutQuotes(*duid));
        } else if (const auto name = After(statement, "interface ")) {
            owner = WithoutQuotes(*name);
        } else if (const auto id = After(statement, "ia-na "); id && owner == interface) {
            state.iaid = id->substr(0, id->find(' '));
            std::erase(state.iaid, ':');
        } else if (statement == "}") {
            if (owner == interface && !lease.address.empty()) {
                lease.begin = end == 0 ? 0 : end - lease.seconds;
                state.lease = lease;
            }
        } else {
            ReadLeaseStatement(statement, lease, end);
        }
    }
    return state;
}

DhcpIdentity DhclientIdentity(const std::vector<std::string>& words,
                              const std::string& configuration, const std::string& duid,
                              const std::string& mac)
{
    DhcpIdentity identity;
    if (!duid.empty()) {
        identity.duid = duid;
    }
    identity.clientId = "none";
    const bool usesDuid = std::find(words.begin(), words.end(), "-i") != words.end();
    if (usesDuid && !duid.empty() && mac.size() >= 11) {
        // The association is the last four bytes of the link address.
        identity.clientId = "ff:" + mac.substr(mac.size() - 11) + ':' + duid;
    }
    identity.hostName = "none";
    identity.hostName6 = "none";
    for (const std::string& statement : StatementsOf(configuration)) {
        if (const auto id = After(statement, "send dhcp-client-identifier ")) {
            const std::string value = id->starts_with("= ") ? id->substr(2) : *id;
            identity.clientId = value;
            if (value.starts_with('"')) {
                identity.clientId = HexOf(WithoutQuotes(value));
            } else if (value == "hardware") {
                identity.clientId = "01:" + mac;
            }
        } else if (statement.starts_with("send fqdn.")) {
            identity.hostName6.reset();
        } else if (const auto name = After(statement, "send host-name ")) {
            const std::string value = name->starts_with("= ") ? name->substr(2) : *name;
            identity.hostName.reset();
            if (value.starts_with('"') && value != "\"<hostname>\"") {
                identity.hostName = WithoutQuotes(value);
            }
        }
    }
    return identity;
}

} // namespace vornovsctl
