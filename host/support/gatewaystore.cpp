#include "gatewaystore.h"

#include "atomicfile.h"
#include "interfacename.h"
#include "keyvaluefile.h"

#include <algorithm>
#include <arpa/inet.h>
#include <cerrno>
#include <charconv>
#include <fcntl.h>
#include <filesystem>
#include <memory>
#include <netinet/in.h>
#include <sstream>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>

namespace vornhost {

namespace {

constexpr char kIPv4Word[] = "inet";
constexpr char kIPv6Word[] = "inet6";

std::optional<std::string> ReadWholeFile(const std::string& path)
{
    const auto file = KeyValueFile::Load(path); // which no FIFO in its place holds up
    if (!file) {
        return errno == ENOENT ? std::optional<std::string>("") : std::nullopt;
    }
    return file->Text();
}

std::optional<unsigned> ParseMetric(const std::string& text)
{
    unsigned metric = 0;
    const char* const end = text.data() + text.size();
    const auto [stop, error] = std::from_chars(text.data(), end, metric);
    return error == std::errc() && stop == end ? std::optional<unsigned>(metric) : std::nullopt;
}

std::optional<GatewayRecord> ParseRecord(const std::string& line)
{
    std::istringstream words(line);
    GatewayRecord record;
    std::string family;
    std::string address;
    if (!(words >> record.interface >> family >> address) || !IsInterfaceName(record.interface) ||
        (family != kIPv4Word && family != kIPv6Word)) {
        return std::nullopt;
    }

    record.family = family == kIPv4Word ? AddressFamily::kIPv4 : AddressFamily::kIPv6;
    const auto normal = NormalGatewayAddress(record.family, address);
    if (!normal) {
        return std::nullopt;
    }
    record.gateway.address = *normal;

    std::string word;
    if (words >> word) {
        std::string value;
        std::string rest;
        if (word != "metric" || !(words >> value) || (words >> rest)) {
            return std::nullopt;
        }
        record.gateway.metric = ParseMetric(value);
        if (!record.gateway.metric) {
            return std::nullopt;
        }
    }
    return record;
}

std::string FormatRecord(const GatewayRecord& record)
{
    std::string line = record.interface;
    line += ' ';
    line += record.family == AddressFamily::kIPv4 ? kIPv4Word : kIPv6Word;
    line += ' ' + record.gateway.address;
    if (record.gateway.metric) {
        line += " metric " + std::to_string(*record.gateway.metric);
    }
    return line;
}

bool CanBeGateway(const in_addr& address)
{
    const std::uint32_t value = ntohl(address.s_addr);
    return value >> 24 != 0 && value >> 24 != IN_LOOPBACKNET && !IN_MULTICAST(value) &&
           value != INADDR_BROADCAST;
}

bool CanBeGateway(const in6_addr& address)
{
    return !IN6_IS_ADDR_UNSPECIFIED(&address) && !IN6_IS_ADDR_LOOPBACK(&address) &&
           !IN6_IS_ADDR_MULTICAST(&address);
}

template <typename Address>
std::optional<std::string> NormalGateway(int family, const std::string& text)
{
    Address address{};
    char normal[INET6_ADDRSTRLEN] = {};
    if (inet_pton(family, text.c_str(), &address) != 1 || !CanBeGateway(address) ||
        inet_ntop(family, &address, normal, sizeof(normal)) == nullptr) {
        return std::nullopt;
    }
    return normal;
}

// The folder of locks and other state that a restart of the host may forget; root's alone.
bool MakeRuntimeFolder(const std::filesystem::path& folder)
{
    return mkdir(folder.c_str(), 0700) == 0 || errno == EEXIST;
}

bool LockFile(int file)
{
    int result = 0;
    do {
        result = flock(file, LOCK_EX);
    } while (result != 0 && errno == EINTR);
    return result == 0;
}

} // namespace

std::optional<std::string> NormalGatewayAddress(AddressFamily family, const std::string& text)
{
    return family == AddressFamily::kIPv4 ? NormalGateway<in_addr>(AF_INET, text)
                                          : NormalGateway<in6_addr>(AF_INET6, text);
}

std::optional<GatewayStore> GatewayStore::Load(const std::string& path)
{
    const auto text = ReadWholeFile(path);
    return text ? std::optional<GatewayStore>(Parse(*text)) : std::nullopt;
}

GatewayStore GatewayStore::Parse(std::string_view text)
{
    GatewayStore store;
    store.m_savedText = text;
    std::istringstream lines(store.m_savedText);
    for (std::string line; std::getline(lines, line);) {
        store.m_lines.push_back({line, ParseRecord(line)});
    }
    return store;
}

std::optional<Gateway> GatewayStore::Find(const std::string& interface, AddressFamily family) const
{
    const auto found = std::find_if(m_lines.rbegin(), m_lines.rend(), [&](const Line& line) {
        return line.record && line.record->interface == interface && line.record->family == family;
    });
    return found == m_lines.rend() ? std::nullopt : std::optional<Gateway>(found->record->gateway);
}

std::vector<GatewayRecord> GatewayStore::Records() const
{
    std::vector<GatewayRecord> records;
    for (const Line& line : m_lines) {
        if (!line.record) {
            continue;
        }
        std::erase_if(records, [&](const GatewayRecord& earlier) {
            return earlier.interface == line.record->interface &&
                   earlier.family == line.record->family;
        });
        records.push_back(*line.record);
    }
    return records;
}

bool GatewayStore::Set(const std::string& interface, AddressFamily family, const Gateway& gateway)
{
    const auto address = NormalGatewayAddress(family, gateway.address);
    if (!IsInterfaceName(interface) || !address) {
        return false;
    }

    const GatewayRecord record{interface, family, {*address, gateway.metric}};
    if (Find(interface, family) == record.gateway) {
        return true; // also when it is written in a way of its own
    }

    const Line written{FormatRecord(record), record};
    const auto place = std::find_if(m_lines.begin(), m_lines.end(), [&](const Line& line) {
        return line.record && line.record->interface == interface && line.record->family == family;
    });
    const auto position = place - m_lines.begin();
    (void)Remove(interface, family);
    m_lines.insert(m_lines.begin() + position, written);
    return true;
}

bool GatewayStore::Remove(const std::string& interface, AddressFamily family)
{
    return std::erase_if(m_lines, [&](const Line& line) {
               return line.record && line.record->interface == interface &&
                      line.record->family == family;
           }) > 0;
}

bool GatewayStore::Copy(const std::string& source, const std::string& target, AddressFamily family)
{
    if (!IsInterfaceName(target)) {
        return false;
    }
    if (const auto gateway = Find(source, family)) {
        return Set(target, family, *gateway);
    }
    (void)Remove(target, family);
    return true;
}

bool GatewayStore::Save(const std::string& path)
{
    const std::string text = Text();
    if (text == m_savedText) {
        return true;
    }

    if (text.empty()) {
        if (unlink(path.c_str()) != 0 && errno != ENOENT) {
            return false;
        }
    } else {
        std::error_code ignored; // the write says what is wrong with the folder
        std::filesystem::create_directories(std::filesystem::path(path).parent_path(), ignored);
        if (!ReplaceFile(path, text, 0644)) {
            return false;
        }
    }
    m_savedText = text;
    return true;
}

std::string GatewayStore::Text() const
{
    std::string text;
    for (const Line& line : m_lines) {
        text += line.text + '\n';
    }
    // A last line without its end is nothing to rewrite the file for.
    return text == m_savedText + '\n' ? m_savedText : text;
}

GatewayStoreLock::GatewayStoreLock(const std::string& path)
{
    if (!MakeRuntimeFolder(std::filesystem::path(path).parent_path())) {
        return;
    }
    Descriptor file(open(path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW, 0600));
    if (file && LockFile(file.Get())) {
        m_file = std::move(file);
    }
}

} // namespace vornhost
