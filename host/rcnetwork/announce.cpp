#include "announce.h"

#include "support/descriptor.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdint>

#include <arpa/inet.h>
#include <linux/if_packet.h>
#include <net/ethernet.h>
#include <net/if.h>
#include <netinet/icmp6.h>
#include <sys/ioctl.h>
#include <sys/socket.h>

namespace vornhost {
namespace {

constexpr std::uint8_t kReverseRequest = 3;

struct ReverseArp {
    std::uint16_t hardware = htons(1); // Ethernet
    std::uint16_t protocol = htons(ETHERTYPE_IP);
    std::uint8_t hardwareLength = ETH_ALEN;
    std::uint8_t protocolLength = 4;
    std::array<std::uint8_t, 2> operation{0, kReverseRequest};
    std::array<std::uint8_t, ETH_ALEN> sender{};
    std::array<std::uint8_t, 4> senderAddress{};
    std::array<std::uint8_t, ETH_ALEN> target{};
    std::array<std::uint8_t, 4> targetAddress{};
    std::array<std::uint8_t, 18> padding{}; // to the least length of a frame
};

} // namespace

bool Announce(const std::string& interface)
{
    const Descriptor link(socket(AF_PACKET, SOCK_DGRAM | SOCK_CLOEXEC, 0));
    ifreq request{};
    interface.copy(request.ifr_name, IFNAMSIZ - 1);
    if (!link || ioctl(link.Get(), SIOCGIFHWADDR, &request) != 0) {
        return false;
    }
    ReverseArp frame;
    std::copy_n(request.ifr_hwaddr.sa_data, ETH_ALEN, frame.sender.begin());
    frame.target = frame.sender;
    if (ioctl(link.Get(), SIOCGIFINDEX, &request) != 0) {
        return false;
    }
    sockaddr_ll everybody{};
    everybody.sll_family = AF_PACKET;
    everybody.sll_protocol = htons(ETHERTYPE_REVARP);
    everybody.sll_ifindex = request.ifr_ifindex;
    everybody.sll_halen = ETH_ALEN;
    std::fill_n(everybody.sll_addr, ETH_ALEN, 0xff);
    return sendto(link.Get(), &frame, sizeof frame, 0, reinterpret_cast<sockaddr*>(&everybody),
                  sizeof everybody) == static_cast<ssize_t>(sizeof frame);
}

bool SolicitRouters(const std::string& interface)
{
    // One of any hop limit but the greatest comes from another segment.
    constexpr int kMostHops = 255;
    const Descriptor link(socket(AF_INET6, SOCK_RAW | SOCK_CLOEXEC, IPPROTO_ICMPV6));
    const int index = static_cast<int>(if_nametoindex(interface.c_str()));
    if (!link || index == 0 ||
        setsockopt(link.Get(), IPPROTO_IPV6, IPV6_MULTICAST_IF, &index, sizeof index) != 0 ||
        setsockopt(link.Get(), IPPROTO_IPV6, IPV6_MULTICAST_HOPS, &kMostHops, sizeof kMostHops) !=
            0) {
        return false;
    }
    nd_router_solicit message{};
    message.nd_rs_type = ND_ROUTER_SOLICIT;
    sockaddr_in6 routers{};
    routers.sin6_family = AF_INET6;
    routers.sin6_scope_id = static_cast<std::uint32_t>(index);
    (void)inet_pton(AF_INET6, "ff02::2", &routers.sin6_addr);
    return sendto(link.Get(), &message, sizeof message, 0, reinterpret_cast<sockaddr*>(&routers),
                  sizeof routers) == static_cast<ssize_t>(sizeof message);
}

} // namespace vornhost
