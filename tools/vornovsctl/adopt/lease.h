/**
 * A lease of an IPv4 address that another client has got, for ours to go on with.
 */
#ifndef VORNOVSCTL_ADOPT_LEASE_H
#define VORNOVSCTL_ADOPT_LEASE_H

#include <array>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace vornovsctl {

struct Lease {
    std::string address;
    std::string netmask;
    std::string server;
    std::vector<std::string> routers;
    std::vector<std::string> dns;
    std::string domain;
    std::uint32_t seconds = 0; /**< how long it is good from its beginning on */
    std::int64_t begin = 0;    /**< seconds since 1970; 0: not known */

    bool operator==(const Lease&) const = default;
};

/**
 * The server's answer that granted the lease, as it came over the wire: what a client keeps.
 * @param mac  the interface's link address.
 * @return  nothing when the lease says too little.
 */
std::optional<std::string> AnswerOf(const Lease& lease, const std::string& mac);

/** @return the bytes of a link address; nothing when the text is none. */
std::optional<std::array<unsigned char, 6>> MacBytes(const std::string& mac);

/** A lease of an IPv6 address. */
struct Lease6 {
    std::string address;
    std::string duid; /**< the client's, hex with colons */
    std::string iaid; /**< eight hex digits */
    std::uint32_t preferredSeconds = 0;
    std::uint32_t validSeconds = 0;

    bool operator==(const Lease6&) const = default;
};

/**
 * The same for IPv6. Managers do not tell which server it was, so the client is to ask all of them
 * soon, as it does when its server does not answer.
 */
std::optional<std::string> AnswerOf6(const Lease6& lease);

} // namespace vornovsctl

#endif
