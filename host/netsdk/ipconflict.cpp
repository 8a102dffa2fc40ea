#include "support/filestates.h"
#include "support/interfacefile.h"
#include "support/interfacename.h"
#include "support/settings.h"
#include "support/uplink.h"

#include <algorithm>
#include <arpa/inet.h>
#include <cstdio>
#include <exception>
#include <filesystem>
#include <optional>
#include <set>
#include <string>
#include <sys/socket.h>
#include <syslog.h>
#include <vector>
#include <vornplatform/netsdk.h>

namespace {

using vornhost::WantedAddress;

/** @return  nothing when there is no file that can be read. */
std::optional<std::vector<WantedAddress>> IPv4AddressesOf(const std::string& interface)
{
    const auto state = vornhost::ReadFileState(interface);
    if (!state || !state->text) {
        return std::nullopt;
    }
    auto addresses = vornhost::ConfiguredAddresses(vornhost::KeyValueFile::Parse(*state->text));
    std::erase_if(addresses, [](const WantedAddress& each) { return each.family != AF_INET; });
    return addresses;
}

/** The interfaces that have a bridge's file, in the order of their names. */
std::set<std::string> InterfacesWithBridgeFile()
{
    std::set<std::string> names;
    std::error_code ignored; // no folder: no files
    for (const auto& entry :
         std::filesystem::directory_iterator(vornhost::kConfigurationFolder, ignored)) {
        const std::string name = vornhost::InterfaceOfFileName(entry.path().filename().string());
        if (name.starts_with(vornhost::kBridgePrefix)) {
            names.insert(name.substr(vornhost::kBridgePrefixSize));
        }
    }
    return names;
}

bool LiesIn(const WantedAddress& address, const WantedAddress& subnet)
{
    in_addr one{};
    in_addr other{};
    if (inet_pton(AF_INET, address.local.c_str(), &one) != 1 ||
        inet_pton(AF_INET, subnet.local.c_str(), &other) != 1) {
        return false;
    }
    const unsigned rest = 32 - subnet.prefixLength;
    const std::uint64_t difference = ntohl(one.s_addr ^ other.s_addr);
    return difference >> rest == 0;
}

bool LieTogether(const std::vector<WantedAddress>& addresses,
                 const std::vector<WantedAddress>& subnets)
{
    return std::any_of(addresses.begin(), addresses.end(), [&](const WantedAddress& address) {
        return std::any_of(subnets.begin(), subnets.end(),
                           [&](const WantedAddress& subnet) { return LiesIn(address, subnet); });
    });
}

std::optional<std::vector<std::string>> Conflicts(const std::string& bond)
{
    const auto subnets = IPv4AddressesOf(bond);
    if (!subnets) {
        return std::nullopt;
    }
    // The first slave's bridge was the bond's model: its file says what the bond's says.
    const std::vector<std::string> slaves = vornhost::ListedSlaves(bond);
    std::vector<std::string> conflicts;
    for (const std::string& name : InterfacesWithBridgeFile()) {
        const std::string bridge = vornhost::kBridgePrefix + name;
        if (bridge == bond || name == bond || (!slaves.empty() && name == slaves[0])) {
            continue;
        }
        const auto addresses = IPv4AddressesOf(bridge);
        if (addresses && LieTogether(*addresses, *subnets)) {
            conflicts.push_back(name);
        }
    }
    return conflicts;
}

int Find(const std::string& bond, char* conflict, int size, unsigned int* out)
{
    const auto conflicts = Conflicts(bond);
    if (!conflicts) {
        ::syslog(LOG_ERR, "vornnetsdk: the file of bond %s cannot be read", bond.c_str());
        return -1;
    }
    if (conflicts->empty()) {
        return 0;
    }
    (void)std::snprintf(conflict, static_cast<std::size_t>(size), "%s", conflicts->front().c_str());
    if (out != nullptr) {
        *out = static_cast<unsigned int>(conflicts->size()); // how many there are
    }
    ::syslog(LOG_WARNING, "vornnetsdk: the address of %s lies in the subnet of bond %s",
             conflicts->front().c_str(), bond.c_str());
    return 1;
}

} // namespace

int VORNNetBondIPConflict(const char* bond, char* conflict, int size, unsigned int* out)
{
    if (bond == nullptr || conflict == nullptr || size <= 0) {
        return -1;
    }
    try {
        return Find(bond, conflict, size, out);
    } catch (const std::exception& error) {
        ::syslog(LOG_ERR, "vornnetsdk: cannot compare addresses with bond %s: %s", bond,
                 error.what());
        return -1;
    }
}
