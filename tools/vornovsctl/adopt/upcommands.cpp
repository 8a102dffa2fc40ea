#include "adopt/upcommands.h"

#include <algorithm>

#include <sstream>
#include <string_view>
#include <support/interfacevalues.h>

namespace vornovsctl {

namespace {

using Words = std::vector<std::string>;

Words WordsOf(std::string command, const std::string& interface)
{
    for (const std::string_view variable : {"${IFACE}", "$IFACE", "\"", "'"}) {
        for (std::size_t at = 0; (at = command.find(variable, at)) != std::string::npos;) {
            command.replace(at, variable.size(), variable[0] == '$' ? interface : "");
        }
    }
    std::istringstream stream(command);
    Words words;
    for (std::string word; stream >> word;) {
        words.push_back(word);
    }
    // Whether a failure counts makes no difference to what it is for.
    if (words.size() >= 2 && words[words.size() - 2] == "||" &&
        (words.back() == "true" || words.back() == ":" || words.back() == "/bin/true")) {
        words.resize(words.size() - 2);
    }
    if (!words.empty()) {
        words[0] = words[0].substr(words[0].rfind('/') + 1);
    }
    return words;
}

bool IsOneOf(const std::string& word, std::initializer_list<std::string_view> list)
{
    return std::find(list.begin(), list.end(), word) != list.end();
}

bool HasShellSigns(const Words& words)
{
    return std::any_of(words.begin(), words.end(), [](const std::string& word) {
        return word.find_first_of("|&;<>`$()*?[]{}\\~#") != std::string::npos;
    });
}

/** "via 192.0.2.9 dev eth0 metric 5" behind a destination, as our file says it. */
bool TakeRouteWords(const Words& words, std::size_t from, const std::string& interface,
                    std::string& route)
{
    for (std::size_t index = from; index < words.size(); ++index) {
        const std::string& word = words[index];
        if (word == "onlink") {
            route += " onlink";
            continue;
        }
        if (index + 1 == words.size()) {
            return false;
        }
        const std::string& value = words[++index];
        if (word == "dev") {
            if (value != interface) {
                return false;
            }
        } else if (IsOneOf(word, {"via", "metric", "src", "table"})) {
            route.append(" ").append(word).append(" ").append(value);
        } else if (word == "proto" || (word == "scope" && value == "link")) {
            continue; // what it would be anyway, or what is only a mark
        } else {
            return false;
        }
    }
    return true;
}

bool TakeIpRoute(const Words& words, Wish& wish)
{
    std::size_t at = 1;
    bool ipv6 = false;
    while (at < words.size() && words[at].starts_with('-')) {
        ipv6 = ipv6 || words[at] == "-6";
        if (!IsOneOf(words[at], {"-4", "-6"})) {
            return false;
        }
        ++at;
    }
    if (at + 2 >= words.size() || !IsOneOf(words[at], {"route", "r", "ro", "rou"}) ||
        !IsOneOf(words[at + 1], {"add", "a", "append", "replace", "change"})) {
        return false;
    }
    at += 2;
    std::string route;
    if (IsOneOf(words[at], {"unreachable", "blackhole", "prohibit"})) {
        route = words[at++] + ' ';
    }
    if (at == words.size()) {
        return false;
    }
    std::string destination = words[at] == "default" && ipv6 ? "::/0" : words[at];
    if (!TakeRouteWords(words, at + 1, wish.name, route)) {
        return false;
    }
    if (route.starts_with("unreachable ") || route.starts_with("blackhole ") ||
        route.starts_with("prohibit ")) {
        const std::size_t space = route.find(' ');
        wish.routes.push_back(route.substr(0, space + 1) + destination + route.substr(space + 1));
    } else {
        wish.routes.push_back(destination + route);
    }
    return true;
}

/** The route command of old: "route add -net 198.51.100.0 netmask 255.255.255.0 gw 192.0.2.9". */
bool TakeOldRoute(const Words& words, Wish& wish)
{
    if (words.size() < 3 || words[1] != "add") {
        return false;
    }
    std::string destination;
    std::string rest;
    bool host = false;
    for (std::size_t index = 2; index < words.size(); ++index) {
        const std::string& word = words[index];
        if (word == "-net" || word == "-host") {
            host = word == "-host";
            continue;
        }
        if (destination.empty()) {
            destination = word;
            continue;
        }
        if (index + 1 == words.size()) {
            return false;
        }
        const std::string& value = words[++index];
        if (word == "gw" || word == "metric") {
            rest.append(word == "gw" ? " via " : " metric ").append(value);
        } else if (word == "netmask") {
            const auto length = vornhost::MaskLength(value);
            destination += length ? '/' + std::to_string(*length) : "";
        } else if (word != "dev" || value != wish.name) {
            return false;
        }
    }
    destination += host && destination.find('/') == std::string::npos ? "/32" : "";
    if (destination.empty() || rest.empty()) {
        return false;
    }
    wish.routes.push_back(destination + rest);
    return true;
}

/** What brings the link up, or sets its MTU, stands in the file anyway. */
bool TakeLink(const Words& words, Wish& wish)
{
    std::size_t at = 3;
    if (words.size() < 4 || !IsOneOf(words[1], {"link", "l"}) || words[2] != "set") {
        return false;
    }
    at += words[3] == "dev" ? 1U : 0U;
    if (at >= words.size() || words[at] != wish.name) {
        return false;
    }
    for (++at; at < words.size(); ++at) {
        if (words[at] == "up") {
            continue;
        }
        if (words[at] != "mtu" || at + 1 == words.size()) {
            return false;
        }
        wish.mtu = vornhost::ToNumber(words[++at], 68, 65535);
    }
    return true;
}

bool TakeEthtool(const Words& words, Wish& wish)
{
    if (words.size() < 4 || words[2] != wish.name) {
        return false;
    }
    std::string options;
    for (std::size_t index = words[1] == "-s" ? 3 : 1; index < words.size(); ++index) {
        options += (options.empty() ? "" : " ") + words[index];
    }
    wish.ethtool += (wish.ethtool.empty() ? "" : "; ") + options;
    return IsOneOf(words[1], {"-s", "-K", "--offload", "-G", "-C", "-A"});
}

} // namespace

bool TakeUpCommand(const std::string& command, Wish& wish)
{
    const Words words = WordsOf(command, wish.name);
    if (words.empty() || words[0] == "true" || words[0] == ":") {
        return true;
    }
    if (HasShellSigns(words)) {
        return false;
    }
    if (words[0] == "ip") {
        return TakeIpRoute(words, wish) || TakeLink(words, wish);
    }
    if (words[0] == "route") {
        return TakeOldRoute(words, wish);
    }
    if (words[0] == "ethtool") {
        return TakeEthtool(words, wish);
    }
    return words == Words{"ifconfig", wish.name, "up"};
}

bool IsMereDownCommand(const std::string& command)
{
    const Words words = WordsOf(command, "");
    const auto has = [&](std::string_view word) {
        return std::find(words.begin(), words.end(), word) != words.end();
    };
    return words.empty() ||
           (IsOneOf(words[0], {"ip", "route"}) && (has("del") || has("delete") || has("down")));
}

} // namespace vornovsctl
