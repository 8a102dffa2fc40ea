#include "announce.h"

#include "support/descriptor.h"
#include "support/netlink.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdint>
#include <fstream>

#include <arpa/inet.h>
#include <linux/if_addr.h>
#include <linux/if_packet.h>
#include <net/ethernet.h>
#include <net/if.h>
#include <netinet/icmp6.h>
#include <netinet/in.h>
#include <sys/ioctl.h>
#include <sys/socket.h>

namespace vornhost {
namespace {

constexpr std::uint8_t kRequest = 1;
constexpr std::uint8_t kReverseRequest = 3;
constexpr char kAllNodes[] = "ff02::1";
constexpr int kHopsOfNeighbours = 255;

using Mac = std::array<std::uint8_t, ETH_ALEN>;

struct Arp {
    std::uint16_t hardware = htons(1); // Ethernet
    std::uint16_t protocol = htons(ETHERTYPE_IP);
    std::uint8_t hardwareLength = ETH_ALEN;
    std::uint8_t protocolLength = 4;
    std::array<std::uint8_t, 2> operation{0, kReverseRequest};
    Mac sender{};
    std::array<std::uint8_t, 4> senderAddress{};
    Mac target{};
    std::array<std::uint8_t, 4> targetAddress{};
    std::array<std::uint8_t, 18> padding{}; // to the least length of a frame
};

/** The link address follows as the one option. */
struct Advertisement {
    nd_neighbor_advert head{};
    std::uint8_t option = ND_OPT_TARGET_LINKADDR;
    std::uint8_t length = 1; // in units of eight bytes
    Mac mac{};
};

class Announcer {
public:
    bool Open(const std::string& interface);
    bool TellPlace() const;
    bool TellAddress4(const Address& address) const;
    bool TellAddress6(const Address& address) const;
    int Index() const { return m_index; }

private:
    bool Send(const Arp& frame, std::uint16_t protocol) const;

    Descriptor m_link;
    int m_index = 0;
    Mac m_mac{};
    bool m_router = false;
};

bool Announcer::Open(const std::string& interface)
{
    m_link.Reset(socket(AF_PACKET, SOCK_DGRAM | SOCK_CLOEXEC, 0));
    ifreq request{};
    interface.copy(request.ifr_name, IFNAMSIZ - 1);
    if (!m_link || ioctl(m_link.Get(), SIOCGIFHWADDR, &request) != 0) {
        return false;
    }
    std::copy_n(request.ifr_hwaddr.sa_data, ETH_ALEN, m_mac.begin());
    if (ioctl(m_link.Get(), SIOCGIFINDEX, &request) != 0) {
        return false;
    }
    m_index = request.ifr_ifindex;
    std::ifstream forwarding("/proc/sys/net/ipv6/conf/" + interface + "/forwarding");
    m_router = forwarding.get() == '1';
    return true;
}

bool Announcer::Send(const Arp& frame, std::uint16_t protocol) const
{
    sockaddr_ll everybody{};
    everybody.sll_family = AF_PACKET;
    everybody.sll_protocol = htons(protocol);
    everybody.sll_ifindex = m_index;
    everybody.sll_halen = ETH_ALEN;
    std::fill_n(everybody.sll_addr, ETH_ALEN, 0xff);
    return sendto(m_link.Get(), &frame, sizeof frame, 0, reinterpret_cast<sockaddr*>(&everybody),
                  sizeof everybody) == static_cast<ssize_t>(sizeof frame);
}

bool Announcer::TellPlace() const
{
    Arp frame;
    frame.sender = m_mac;
    frame.target = m_mac;
    return Send(frame, ETHERTYPE_REVARP);
}

bool Announcer::TellAddress4(const Address& address) const
{
    Arp frame;
    frame.operation.back() = kRequest;
    frame.sender = m_mac;
    if (inet_pton(AF_INET, address.local.c_str(), frame.senderAddress.data()) != 1) {
        return true;
    }
    frame.targetAddress = frame.senderAddress;
    return Send(frame, ETHERTYPE_ARP);
}

bool Announcer::TellAddress6(const Address& address) const
{
    const Descriptor link(socket(AF_INET6, SOCK_RAW | SOCK_CLOEXEC, IPPROTO_ICMPV6));
    sockaddr_in6 source{};
    source.sin6_family = AF_INET6;
    source.sin6_scope_id = static_cast<std::uint32_t>(m_index);
    sockaddr_in6 everybody = source;
    if (!link || inet_pton(AF_INET6, address.local.c_str(), &source.sin6_addr) != 1 ||
        inet_pton(AF_INET6, kAllNodes, &everybody.sin6_addr) != 1 ||
        setsockopt(link.Get(), IPPROTO_IPV6, IPV6_MULTICAST_HOPS, &kHopsOfNeighbours,
                   sizeof kHopsOfNeighbours) != 0 ||
        bind(link.Get(), reinterpret_cast<const sockaddr*>(&source), sizeof source) != 0) {
        return false;
    }
    Advertisement message;
    message.head.nd_na_type = ND_NEIGHBOR_ADVERT;
    message.head.nd_na_target = source.sin6_addr;
    // Without the flag neighbours would take a router for one that it is no longer.
    message.head.nd_na_flags_reserved =
        ND_NA_FLAG_OVERRIDE | (m_router ? ND_NA_FLAG_ROUTER : std::uint32_t{0});
    message.mac = m_mac;
    return sendto(link.Get(), &message, sizeof message, 0,
                  reinterpret_cast<const sockaddr*>(&everybody),
                  sizeof everybody) == static_cast<ssize_t>(sizeof message);
}

} // namespace

bool Announce(const std::string& interface)
{
    constexpr std::uint32_t kNotInUse = IFA_F_TENTATIVE | IFA_F_DADFAILED;
    Announcer announcer;
    if (!announcer.Open(interface) || !announcer.TellPlace()) {
        return false;
    }
    const auto addresses = ReadAddresses();
    bool told = addresses.has_value();
    for (const Address& address : addresses.value_or(std::vector<Address>())) {
        if (address.index == announcer.Index() && (address.flags & kNotInUse) == 0) {
            told = (address.family == AF_INET ? announcer.TellAddress4(address)
                                              : announcer.TellAddress6(address)) &&
                   told;
        }
    }
    return told;
}

bool SolicitRouters(const std::string& interface)
{
    const Descriptor link(socket(AF_INET6, SOCK_RAW | SOCK_CLOEXEC, IPPROTO_ICMPV6));
    const int index = static_cast<int>(if_nametoindex(interface.c_str()));
    if (!link || index == 0 ||
        setsockopt(link.Get(), IPPROTO_IPV6, IPV6_MULTICAST_IF, &index, sizeof index) != 0 ||
        setsockopt(link.Get(), IPPROTO_IPV6, IPV6_MULTICAST_HOPS, &kHopsOfNeighbours,
                   sizeof kHopsOfNeighbours) != 0) {
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
