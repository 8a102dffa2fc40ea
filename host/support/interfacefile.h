/**
 * The configuration file of one interface, "ifcfg-NAME": parsed, never run.
 */
#ifndef VORNHOST_SUPPORT_INTERFACEFILE_H
#define VORNHOST_SUPPORT_INTERFACEFILE_H

#include "interfaceroute.h"
#include "keyvaluefile.h"
#include "remark.h"

#include <optional>
#include <string>
#include <vector>

namespace vornhost {

/** What a file is good for. */
enum class FileUse {
    kNone,      ///< There is no such file.
    kPlain,     ///< It describes a plain interface.
    kBridge,    ///< It describes the switch bridge that stands for the interface in "primary".
    kLeaveAlone ///< Unreadable, half written or not supported: what is live stays as it is.
};

/** An address that a file asks for. */
struct WantedAddress {
    int family = 0;
    std::string local;
    unsigned prefixLength = 0;

    bool operator==(const WantedAddress&) const = default;
};

/** The VLAN that an interface of its own stands for. */
struct FileVlan {
    std::string parent;
    unsigned id = 0;

    bool operator==(const FileVlan&) const = default;
};

/** What is asked of servers and routers, and as whom. */
struct FileClient {
    bool dhcp = false;                   ///< An IPv4 address from a server.
    std::optional<bool> dhcp6;           ///< IPv6 addresses from a server; nothing: as routers say.
    std::optional<std::string> id;       ///< Hex with colons; empty: none is sent.
    std::optional<std::string> hostName; ///< Empty: none is sent; nothing: the host's.
    std::string duid;                    ///< Hex with colons; empty: the one that the host keeps.
    std::optional<std::uint32_t> iaid;
    bool nameServers = true;  ///< Whether servers and routers say who resolves names...
    bool routes = true;       ///< ...and which routes there are...
    bool defaultRoute = true; ///< ...and a default route.

    bool operator==(const FileClient&) const = default;
};

/** What one file asks for. */
struct InterfaceFile {
    std::string name;
    FileUse use = FileUse::kNone;
    /** To be left alone while anything of it is live: its bridge's file, which is no more, was
        copied over it and not edited yet. */
    bool fromBridge = false;
    std::string primary;                  ///< The plain interface of a bridge file.
    std::string bridge;                   ///< The bridge that a plain file names.
    bool slave = false;                   ///< A member of a bond, or the bridge of one.
    std::string master;                   ///< The bond of a plain file.
    bool bond = false;                    ///< A plain file that says of itself to be a bond's.
    bool linuxBridge = false;             ///< A plain file of a bridge of the kernel.
    bool stp = false;                     ///< Whether that keeps loops away...
    std::optional<unsigned> forwardDelay; ///< ...and the seconds a port listens before it forwards.
    std::vector<std::string> slaveList;   ///< The members of the switch bond of a bridge file.
    /** BONDING_OPTS in its order: options of the kernel's bond or columns of the switch's. */
    std::vector<std::pair<std::string, std::string>> bondOptions;
    std::optional<FileVlan> vlan; ///< Of a plain file.
    /** Why the addressing cannot be given to the interface, which only a member does without. */
    std::string onlyAsMember;
    bool onBoot = true;
    bool whole = true; ///< No value was refused: what is missing here is really not wanted.
    std::optional<unsigned> mtu;
    std::optional<unsigned> metric;  ///< Of default routes...
    std::optional<unsigned> metric6; ///< ...and of those of IPv6, where they have their own.
    std::optional<unsigned> vlanId;  ///< The tag of the switch's port that carries the addresses.
    bool ipv6 = true;
    /** Whether IPv6 addresses are taken from routers; nothing: as the kernel is set to. */
    std::optional<bool> autoconf;
    std::string token;               ///< The interface's half of addresses that the kernel makes.
    std::string linkLocal;           ///< Instead of the one that is made of the link address.
    std::optional<unsigned> privacy; ///< Temporary addresses, as the kernel numbers it.
    FileClient client;
    std::string requiredMac; ///< The interface must have this link address.
    std::vector<WantedAddress> addresses;
    std::string gateway;
    std::string gateway6;
    std::vector<Route> routes; ///< Their hops have no index.
    std::vector<std::string> nameServers;
    std::vector<std::string> searchDomains;
    std::vector<LinkCommand> linkCommands; ///< For the card.

    /** Whether the DHCP client is to run: for either family or for routers' advertisements. */
    bool UsesClient() const;
    /** Whether that makes the addresses out of what routers say. */
    bool ClientHearsRouters() const;
};

/** A parsed file and what there is to say about it. */
struct ParsedFile {
    InterfaceFile file;
    std::vector<Remark> remarks;
};

/** The folder of the configuration files. */
constexpr char kConfigurationFolder[] = "/etc/sysconfig/network-scripts";

/**
 * Reads the keys of an interface's configuration file.
 * @return  nothing when there is none, it cannot be read, or its DEVICE says that it is another
 *          interface's; a copy of the interface's own bridge's file counts as the interface's.
 */
std::optional<KeyValueFile> LoadInterfaceFile(const std::string& interface);

/**
 * Tells the interface that a file of the configuration folder describes.
 * @return  empty for everything that is no such file: backups, temporary and foreign files.
 */
std::string InterfaceOfFileName(const std::string& fileName);

/**
 * Parses the text of the file of one interface. A value that cannot be one is refused with a
 * remark that names file, key and value; the rest of the file counts.
 */
ParsedFile ParseInterfaceFile(const std::string& name, const std::string& text);

} // namespace vornhost

#endif
