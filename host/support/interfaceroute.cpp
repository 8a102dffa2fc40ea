#include "interfaceroute.h"

#include "interfacevalues.h"

#include <algorithm>
#include <array>
#include <map>
#include <sstream>
#include <string_view>

#include <arpa/inet.h>
#include <linux/rtnetlink.h>

namespace vornhost {
namespace {

constexpr unsigned kIPv6Metric = 1024;
constexpr char kDefault[] = "default";

int FamilyOf(const std::string& address)
{
    return address.find(':') == std::string::npos ? AF_INET : AF_INET6;
}

/** The network of an address, without the bits of the host. */
std::string NetworkOf(int family, const std::string& address, unsigned length)
{
    std::array<unsigned char, sizeof(in6_addr)> bytes{};
    std::array<char, INET6_ADDRSTRLEN> text{};
    if (inet_pton(family, address.c_str(), bytes.data()) != 1) {
        return {};
    }
    for (unsigned bit = length; bit < bytes.size() * 8; ++bit) {
        bytes.at(bit / 8) &= static_cast<unsigned char>(~(0x80U >> (bit % 8)));
    }
    (void)inet_ntop(family, bytes.data(), text.data(), text.size());
    return text.data();
}

class RouteParser {
public:
    explicit RouteParser(const std::string& text) : m_words(Words(text)) {}
    std::optional<Route> Parse();
    const std::string& Problem() const { return m_problem; }

private:
    bool Fail(const std::string& problem);
    std::string Next() { return m_at < m_words.size() ? m_words[m_at++] : std::string(); }
    void ReadType();
    bool ReadDestination();
    bool ReadOption(const std::string& word);
    bool ReadGateway();
    bool ReadNumber(const std::string& word, std::uint32_t& number);
    bool ReadTable();
    bool ReadScope();
    bool Settle();

    std::vector<std::string> m_words;
    size_t m_at = 0;
    Route m_route;
    NextHop m_hop;
    std::optional<unsigned> m_scope;
    std::string m_problem;
};

bool RouteParser::Fail(const std::string& problem)
{
    m_problem = problem;
    return false;
}

void RouteParser::ReadType()
{
    const std::map<std::string, unsigned> types{{"unicast", RTN_UNICAST},
                                                {"blackhole", RTN_BLACKHOLE},
                                                {"unreachable", RTN_UNREACHABLE},
                                                {"prohibit", RTN_PROHIBIT}};
    const auto type = m_words.empty() ? types.end() : types.find(m_words.front());
    if (type != types.end()) {
        m_route.type = type->second;
        ++m_at;
    }
}

bool RouteParser::ReadDestination()
{
    std::string text = Next();
    if (text == kDefault) {
        return true;
    }
    m_route.family = FamilyOf(text);
    const unsigned most = m_route.family == AF_INET ? 32 : 128;
    m_route.prefixLength = most;
    if (const auto slash = text.find('/'); slash != std::string::npos) {
        const auto length = ToNumber(text.substr(slash + 1), 0, most);
        if (!length) {
            return Fail("\"" + text + "\" is no prefix");
        }
        m_route.prefixLength = *length;
        text.resize(slash);
    }
    const std::string network = NetworkOf(m_route.family, text, m_route.prefixLength);
    if (network.empty()) {
        return Fail("\"" + text + "\" is no prefix");
    }
    m_route.destination = m_route.prefixLength == 0 ? std::string() : network;
    return true;
}

bool RouteParser::ReadGateway()
{
    std::string text = Next();
    if (text == "inet" || text == "inet6") {
        text = Next();
    }
    m_hop.gatewayFamily = FamilyOf(text);
    m_hop.gateway = NormalAddress(m_hop.gatewayFamily, text);
    if (m_route.family == 0) {
        m_route.family = m_hop.gatewayFamily;
    }
    return !m_hop.gateway.empty() || Fail("\"" + text + "\" is no address");
}

bool RouteParser::ReadNumber(const std::string& word, std::uint32_t& number)
{
    const auto read = ToNumber(Next(), 0, UINT32_MAX);
    number = read.value_or(0);
    return read || Fail(word + " is followed by no number");
}

bool RouteParser::ReadTable()
{
    const std::string text = Next();
    const auto number = ToNumber(text, 1, UINT32_MAX);
    m_route.table = text == "main" ? RT_TABLE_MAIN : number.value_or(0);
    return m_route.table != 0 || Fail("\"" + text + "\" is no number of a table");
}

bool RouteParser::ReadScope()
{
    const std::map<std::string, unsigned> scopes{
        {"global", RT_SCOPE_UNIVERSE}, {"link", RT_SCOPE_LINK}, {"host", RT_SCOPE_HOST}};
    const auto scope = scopes.find(Next());
    if (scope == scopes.end()) {
        return Fail("scope is followed by none");
    }
    m_scope = scope->second;
    return true;
}

bool RouteParser::ReadOption(const std::string& word)
{
    if (word == "via") {
        return ReadGateway();
    }
    if (word == "table") {
        return ReadTable();
    }
    if (word == "scope") {
        return ReadScope();
    }
    if (word == "metric") {
        return ReadNumber(word, m_route.priority);
    }
    if (word == "mtu") {
        RouteMetric& metric = m_route.metrics.emplace_back();
        metric.kind = RTAX_MTU;
        return ReadNumber(word, metric.value);
    }
    if (word == "src") {
        const std::string text = Next();
        m_route.source = NormalAddress(FamilyOf(text), text);
        return !m_route.source.empty() || Fail("\"" + text + "\" is no address");
    }
    if (word == "onlink") {
        m_hop.onLink = true;
        return true;
    }
    return word == "dev" ? !Next().empty() || Fail("dev is followed by nothing")
                         : Fail("\"" + word + "\" is not supported");
}

bool RouteParser::Settle()
{
    if (m_route.family == 0) {
        m_route.family = m_route.source.empty() ? AF_INET : FamilyOf(m_route.source);
    }
    const bool ipv4 = m_route.family == AF_INET;
    if ((!ipv4 && m_hop.gatewayFamily == AF_INET) ||
        (!m_route.source.empty() && FamilyOf(m_route.source) != m_route.family)) {
        return Fail("addresses of two families");
    }
    if (!ipv4 && m_route.priority == 0) {
        m_route.priority = kIPv6Metric; // the kernel knows no other one of 0
    }
    const bool hasHop = m_route.type == RTN_UNICAST;
    if (hasHop) {
        m_hop.gatewayFamily = m_hop.gateway.empty() ? m_route.family : m_hop.gatewayFamily;
        m_route.nextHops.push_back(m_hop);
    } else if (!m_hop.gateway.empty()) {
        return Fail("a route that leads nowhere has no gateway");
    }
    const bool direct = ipv4 && hasHop && m_hop.gateway.empty();
    m_route.scope = m_scope.value_or(direct ? RT_SCOPE_LINK : RT_SCOPE_UNIVERSE);
    return true;
}

std::optional<Route> RouteParser::Parse()
{
    m_route.table = RT_TABLE_MAIN;
    m_route.protocol = RTPROT_STATIC;
    ReadType();
    if (!ReadDestination()) {
        return std::nullopt;
    }
    while (m_at < m_words.size()) {
        if (!ReadOption(Next())) {
            return std::nullopt;
        }
    }
    return Settle() ? std::optional(m_route) : std::nullopt;
}

constexpr std::array<std::pair<std::string_view, std::string_view>, 16> kLinkOptions{
    {{"-s", "-s"},
     {"--change", "-s"},
     {"-K", "-K"},
     {"--features", "-K"},
     {"--offload", "-K"},
     {"-G", "-G"},
     {"--set-ring", "-G"},
     {"-C", "-C"},
     {"--coalesce", "-C"},
     {"-A", "-A"},
     {"--pause", "-A"},
     {"-L", "-L"},
     {"--set-channels", "-L"},
     {"--set-eee", "--set-eee"},
     {"--set-fec", "--set-fec"},
     {"--set-priv-flags", "--set-priv-flags"}}};

bool IsPlainWord(const std::string& word)
{
    return std::all_of(word.begin(), word.end(), [](unsigned char letter) {
        return std::isalnum(letter) != 0 ||
               std::string_view("_.:/-").find(static_cast<char>(letter)) != std::string_view::npos;
    });
}

std::optional<LinkCommand> ParseLinkCommand(const std::string& text)
{
    std::vector<std::string> words = Words(text);
    LinkCommand command{"-s"};
    if (!words.empty() && words.front().front() == '-') {
        const auto known = std::find_if(kLinkOptions.begin(), kLinkOptions.end(),
                                        [&](const auto& each) { return each.first == words[0]; });
        if (known == kLinkOptions.end() || words.size() < 2) {
            return std::nullopt;
        }
        command.front() = known->second;
        words.erase(words.begin(), words.begin() + 2); // the option and the interface
    }
    if (words.empty() || !std::all_of(words.begin(), words.end(), IsPlainWord)) {
        return std::nullopt;
    }
    command.insert(command.end(), words.begin(), words.end());
    return command;
}

} // namespace

std::optional<Route> ParseRoute(const std::string& text, std::string& problem)
{
    RouteParser parser(text);
    auto route = parser.Parse();
    problem = parser.Problem();
    return route;
}

std::optional<std::vector<LinkCommand>> ParseLinkCommands(const std::string& text)
{
    std::istringstream stream(text);
    std::vector<LinkCommand> commands;
    for (std::string part; std::getline(stream, part, ';');) {
        if (Trimmed(part).empty()) {
            continue;
        }
        const auto command = ParseLinkCommand(part);
        if (!command) {
            return std::nullopt;
        }
        commands.push_back(*command);
    }
    return commands;
}

} // namespace vornhost
