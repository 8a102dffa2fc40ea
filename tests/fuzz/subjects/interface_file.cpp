/**
 * The configuration file of one interface, as the network program reads it. The text is the name of
 * the interface and then its file.
 */
#include "subject.h"
#include "text.h"

#include "support/interfacefile.h"
#include "support/interfacename.h"
#include "support/interfacevalues.h"

#include <algorithm>

#include <sys/socket.h>

namespace {

using fuzz::Expect;
using vornhost::InterfaceFile;
using vornhost::NormalAddress;

constexpr unsigned kMostVlan = 4095;

void ExpectAddress(int family, const std::string& address)
{
    Expect(!address.empty() && NormalAddress(family, address) == address,
           "what counts as an address is none: " + address);
}

/** Words of a command, each of which is to stay one. */
void ExpectWord(const std::string& word)
{
    Expect(!word.empty() && word.find(' ') == std::string::npos && !fuzz::HasControls(word),
           "what counts as a word is none: " + word);
}

void CheckAddressing(const InterfaceFile& file)
{
    for (const auto& address : file.addresses) {
        ExpectAddress(address.family, address.local);
        Expect(address.prefixLength <= (address.family == AF_INET ? 32U : 128U),
               "a prefix is too long");
    }
    if (!file.gateway.empty()) {
        ExpectAddress(AF_INET, file.gateway);
    }
    for (const std::string& address : {file.gateway6, file.token, file.linkLocal}) {
        if (!address.empty()) {
            ExpectAddress(AF_INET6, address);
        }
    }
    for (const std::string& server : file.nameServers) {
        ExpectAddress(server.find(':') == std::string::npos ? AF_INET : AF_INET6, server);
    }
    std::for_each(file.searchDomains.begin(), file.searchDomains.end(), ExpectWord);
}

void CheckRoute(const vornhost::Route& route)
{
    Expect(route.family == AF_INET || route.family == AF_INET6, "a route is of no family");
    Expect(route.nextHops.size() <= 1, "a route has several hops");
    for (const std::string& address : {route.destination, route.source}) {
        if (!address.empty()) {
            ExpectAddress(route.family, address);
        }
    }
    for (const auto& hop : route.nextHops) {
        Expect(hop.index == 0, "a hop of a file names an interface");
        if (!hop.gateway.empty()) {
            ExpectAddress(hop.gatewayFamily, hop.gateway);
        }
    }
}

void CheckLink(const InterfaceFile& file)
{
    Expect(!file.mtu || (*file.mtu >= 68 && *file.mtu <= 65535), "an MTU is out of bounds");
    Expect(!file.vlanId || *file.vlanId <= kMostVlan, "a tag is out of bounds");
    Expect(!file.vlan || file.vlan->id <= kMostVlan, "a VLAN is out of bounds");
    for (const auto& command : file.linkCommands) {
        Expect(command.size() > 1, "a command of ethtool sets nothing");
        std::for_each(command.begin(), command.end(), ExpectWord);
    }
    for (const auto& [name, value] : file.bondOptions) {
        Expect(!name.empty() && name.find('=') == std::string::npos, "an option has no name");
    }
}

void Run(std::string_view text)
{
    const std::string name = vornhost::InterfaceOfFileName("ifcfg-" + fuzz::TakeUpTo("\n", text));
    if (name.empty()) {
        return;
    }
    Expect(vornhost::IsInterfaceName(name), "the file's name is no interface's");
    const vornhost::ParsedFile parsed = vornhost::ParseInterfaceFile(name, std::string(text));
    CheckAddressing(parsed.file);
    std::for_each(parsed.file.routes.begin(), parsed.file.routes.end(), CheckRoute);
    CheckLink(parsed.file);
    Expect(parsed.file.name == name, "the file became another interface's");
    Expect(!parsed.file.whole || text.empty() || text.back() == '\n',
           "a file that may be being written counts as whole");
    for (const vornhost::Remark& remark : parsed.remarks) {
        Expect(remark.text.starts_with("ifcfg-" + name + ": "), "a remark names no file");
        Expect(remark.text.find('\n') == std::string::npos, "a remark is several lines");
    }
}

const fuzz::Subject kSubject("interface_file", Run);

} // namespace
