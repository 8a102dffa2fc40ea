/**
 * The gateway records of the host: one gateway an interface and address family, in one file that
 * the gateway tool edits and the network program applies.
 *
 * One record a line, "eth0 inet 192.0.2.1" or "eth0 inet6 fe80::1 metric 1024". Empty lines, lines
 * that begin with "#" and lines that are no record are left as they are. Of several records of one
 * interface and family the last one counts.
 */
#ifndef VORNHOST_SUPPORT_GATEWAYSTORE_H
#define VORNHOST_SUPPORT_GATEWAYSTORE_H

#include "descriptor.h"

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace vornhost {

/** Where the records of the host are kept. */
constexpr char kGatewayStorePath[] = "/usr/vorn/etc/vornnetd/gateways.conf";

enum class AddressFamily { kIPv4, kIPv6 };

/** A default gateway. */
struct Gateway {
    std::string address;            /**< in the family's usual notation, without a zone */
    std::optional<unsigned> metric; /**< of the default route; none: the interface's own */

    bool operator==(const Gateway&) const = default;
};

/** A gateway and whose it is. */
struct GatewayRecord {
    std::string interface;
    AddressFamily family = AddressFamily::kIPv4;
    Gateway gateway;

    bool operator==(const GatewayRecord&) const = default;
};

/**
 * Brings an address into its usual notation.
 * @return  nothing when the text is no address of the family, or one that can be no gateway: the
 *          unspecified address, loopback, multicast and broadcast addresses.
 */
std::optional<std::string> NormalGatewayAddress(AddressFamily family, const std::string& text);

/** The records of one file, read at once and written at once. */
class GatewayStore {
public:
    /**
     * Reads the records.
     * @return  an empty store when there is no such file; nothing when it cannot be read.
     */
    static std::optional<GatewayStore> Load(const std::string& path = kGatewayStorePath);

    /** Takes the records from a text, as Load() does from a file's. */
    static GatewayStore Parse(std::string_view text);

    /** @return  the gateway of that interface and family, if it has one. */
    std::optional<Gateway> Find(const std::string& interface, AddressFamily family) const;

    /** @return  every record that counts, in the file's order. */
    std::vector<GatewayRecord> Records() const;

    /**
     * Records a gateway in the place of the interface's former one.
     * @return  false, and nothing is changed: the name or the address cannot be one.
     */
    bool Set(const std::string& interface, AddressFamily family, const Gateway& gateway);

    /** Removes a record. @return  whether there was one. */
    bool Remove(const std::string& interface, AddressFamily family);

    /**
     * Makes the target's record equal to the source's: a source without one takes the target's
     * away.
     * @return  false, and nothing is changed: the target's name cannot be one.
     */
    bool Copy(const std::string& source, const std::string& target, AddressFamily family);

    /**
     * Brings the file to what the store holds: replaced as a whole, removed when nothing is left to
     * write, untouched when it holds that already. Whoever loads, changes and saves holds a
     * GatewayStoreLock meanwhile.
     * @return  false, and the file is as it was: it could not be written (errno says why).
     */
    bool Save(const std::string& path = kGatewayStorePath);

    /** @return  the file's text as Save() would write it. */
    std::string Text() const;

private:
    struct Line {
        std::string text;
        std::optional<GatewayRecord> record;
    };

    std::vector<Line> m_lines;
    std::string m_savedText;
};

/** Keeps other processes from editing the records while it lives; free when its owner dies. */
class GatewayStoreLock {
public:
    /** Waits until the lock is free. */
    explicit GatewayStoreLock(const std::string& path = "/run/vornovs/gateways.lock");

    /** @return  whether the lock was taken (errno says why not). */
    bool Held() const { return static_cast<bool>(m_file); }

private:
    Descriptor m_file;
};

} // namespace vornhost

#endif
