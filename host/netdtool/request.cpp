#include "request.h"

#include "support/interfacename.h"

#include <CLI/CLI.hpp>
#include <algorithm>
#include <charconv>
#include <vector>

namespace vornhost {

namespace {

constexpr char kDescription[] =
    "Keeps the default gateways of the host's interfaces: one gateway an interface and\n"
    "address family. /etc/rc.network applies the records when it starts the network; this\n"
    "tool edits them and changes no route by itself.";

constexpr char kFooter[] =
    "Arguments:\n"
    "  --copy-gateway-info -4|-6 SOURCE TARGET\n"
    "  --del-gateway-info  -4|-6 INTERFACE\n"
    "  --set-gateway-info  -4|-6 INTERFACE GATEWAY [METRIC]\n"
    "  --list-gateway-info [-4|-6] [--json]\n"
    "\n"
    "After a copy the target has exactly what the source has: a source without a gateway\n"
    "takes the target's away. Nothing to copy or to delete is success, and nothing is\n"
    "written. Interfaces need not exist.\n"
    "\n"
    "Examples:\n"
    "  vornnetdtool --set-gateway-info -4 eth0 192.0.2.1\n"
    "  vornnetdtool --set-gateway-info -6 eth0 fe80::1 1024\n"
    "  vornnetdtool --copy-gateway-info -4 eth0 ovs_eth0\n"
    "\n"
    "Exit status:\n"
    "  0  done\n"
    "  1  the records cannot be read, locked or written; they are as they were\n"
    "  2  the command line is wrong; nothing was done\n"
    "\n"
    "Files:\n"
    "  /usr/vorn/etc/vornnetd/gateways.conf";

struct CommandLine {
    bool copy = false;
    bool remove = false;
    bool set = false;
    bool list = false;
    bool ipv4 = false;
    bool ipv6 = false;
    bool json = false;
    std::vector<std::string> words;
};

void Describe(CLI::App& app, CommandLine& line)
{
    app.name("vornnetdtool");
    app.footer(kFooter);
    app.set_version_flag("--version", "vornnetdtool " VORNOVS_VERSION);
    auto* const actions = app.add_option_group("Actions (exactly one)");
    actions->add_flag("--copy-gateway-info", line.copy, "Give an interface another one's gateway");
    actions->add_flag("--del-gateway-info", line.remove, "Forget the gateway of an interface");
    actions->add_flag("--set-gateway-info", line.set, "Record the gateway of an interface");
    actions->add_flag("--list-gateway-info", line.list, "Print the gateways");
    actions->require_option(1);
    auto* const ipv4 = app.add_flag("-4", line.ipv4, "IPv4");
    app.add_flag("-6", line.ipv6, "IPv6")->excludes(ipv4);
    app.add_flag("--json", line.json, "List as JSON");
    app.add_option("ARGUMENT", line.words, "As the action wants them");
}

GatewayAction ActionOf(const CommandLine& line)
{
    if (line.copy) {
        return GatewayAction::kCopy;
    }
    if (line.remove) {
        return GatewayAction::kRemove;
    }
    return line.set ? GatewayAction::kSet : GatewayAction::kList;
}

struct WordCount {
    std::size_t least;
    std::size_t most;
};

WordCount WordsOf(GatewayAction action)
{
    switch (action) {
    case GatewayAction::kCopy:
        return {2, 2};
    case GatewayAction::kRemove:
        return {1, 1};
    case GatewayAction::kSet:
        return {2, 3};
    case GatewayAction::kList:
        break;
    }
    return {0, 0};
}

std::string FillGateway(const std::vector<std::string>& words, GatewayRequest& request)
{
    const auto address = NormalGatewayAddress(*request.family, words[1]);
    if (!address) {
        return "'" + words[1] + "' is no gateway address of that family";
    }
    request.gateway.address = *address;
    if (words.size() < 3) {
        return "";
    }

    unsigned metric = 0;
    const char* const end = words[2].data() + words[2].size();
    const auto [stop, error] = std::from_chars(words[2].data(), end, metric);
    if (error != std::errc() || stop != end) {
        return "'" + words[2] + "' is no route metric";
    }
    request.gateway.metric = metric;
    return "";
}

// Checks the words and puts them into the request; the text says what is wrong, if anything.
std::string FillRequest(const CommandLine& line, GatewayRequest& request)
{
    request.action = ActionOf(line);
    request.json = line.json;
    if (line.ipv4 || line.ipv6) {
        request.family = line.ipv4 ? AddressFamily::kIPv4 : AddressFamily::kIPv6;
    } else if (request.action != GatewayAction::kList) {
        return "-4 or -6 is missing";
    }
    if (line.json && request.action != GatewayAction::kList) {
        return "--json is for listing";
    }

    const auto [least, most] = WordsOf(request.action);
    if (line.words.size() < least || line.words.size() > most) {
        return line.words.size() < least ? "too few arguments" : "too many arguments";
    }
    const std::size_t names = request.action == GatewayAction::kSet ? 1 : line.words.size();
    for (std::size_t index = 0; index < names; ++index) {
        if (!IsInterfaceName(line.words[index])) {
            return "'" + line.words[index] + "' is no interface name";
        }
    }

    request.interface = line.words.empty() ? "" : line.words[0];
    if (request.action == GatewayAction::kCopy) {
        request.target = line.words[1];
    }
    return request.action == GatewayAction::kSet ? FillGateway(line.words, request) : "";
}

/**
 * The arguments, the last one first. What follows an action and its family, as the library gives
 * them, is names, whatever they look like.
 */
std::vector<std::string> Reversed(int argc, const char* const argv[])
{
    std::vector<std::string> words(argv + std::min(argc, 1), argv + argc);
    const auto isFamily = [](const std::string& word) { return word == "-4" || word == "-6"; };
    if (words.size() > 2 && words[0].ends_with("-gateway-info") &&
        words[0] != "--list-gateway-info" && isFamily(words[1]) && words[2] != "--") {
        words.insert(words.begin() + 2, "--");
    }
    std::reverse(words.begin(), words.end());
    return words;
}

} // namespace

ParsedRequest ParseRequest(int argc, const char* const argv[])
{
    CLI::App app(kDescription);
    CommandLine line;
    Describe(app, line);
    ParsedRequest parsed;
    try {
        app.parse(Reversed(argc, argv));
    } catch (const CLI::CallForHelp&) {
        parsed.output = app.help();
        return parsed;
    } catch (const CLI::CallForVersion& version) {
        parsed.output = std::string(version.what()) + '\n';
        return parsed;
    } catch (const CLI::ParseError& error) {
        parsed.error = error.what();
        return parsed;
    }

    GatewayRequest request;
    parsed.error = FillRequest(line, request);
    if (parsed.error.empty()) {
        parsed.request = request;
    }
    return parsed;
}

} // namespace vornhost
