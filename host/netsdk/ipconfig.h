/**
 * What the 72 bytes of an IP configuration hold. Callers zero the record and hand it from one
 * function of the platform to another unread, so the layout is the platform's own affair; the
 * version tells a record that was filled from one that was not.
 */
#ifndef VORNHOST_NETSDK_IPCONFIG_H
#define VORNHOST_NETSDK_IPCONFIG_H

#include <cstdint>

#include <vornplatform/records.h>

namespace vornhost {

constexpr std::uint32_t kIpConfigVersion = 1;

/** Which parts of the record are set. */
enum IpConfigFlag : std::uint32_t {
    kHasIPv4Address = 1,
    kHasIPv4Gateway = 2,
    kHasIPv6Address = 4,
    kHasIPv6Gateway = 8,
    kUsesDhcp = 16, /**< the interface's file has its IPv4 address assigned by a server */
};

/** The first address of each family and the default gateways, in network byte order. */
struct IpConfig {
    std::uint32_t version;
    std::uint32_t flags; /**< of IpConfigFlag */
    std::uint8_t ipv4Address[4];
    std::uint8_t ipv4Gateway[4];
    std::uint8_t ipv6Address[16];
    std::uint8_t ipv6Gateway[16];
    std::uint8_t ipv4PrefixLength;
    std::uint8_t ipv6PrefixLength;
    std::uint8_t unused[2];
    std::uint32_t mtu;
    char interface[VORN_NAME_SIZE]; /**< whose configuration it is */
};

static_assert(sizeof(IpConfig) == sizeof(VORNNETIPCONFIG), "the record's size is binary interface");

} // namespace vornhost

#endif
