#include "adopt/ifupdownreader.h"

#include "adopt/dhclient.h"
#include "adopt/upcommands.h"
#include "wording.h"

#include <algorithm>
#include <array>
#include <sstream>
#include <string_view>
#include <support/contains.h>
#include <support/interfacevalues.h>
#include <sys/socket.h>

namespace vornovsctl {

namespace {

constexpr char kDhclientFolder[] = "/var/lib/dhcp/";
constexpr char kClientConfiguration[] = "/etc/dhcp/dhclient.conf";

class StanzaReader {
public:
    StanzaReader(const HostView& host, const InterfaceStanza& stanza, Wish& wish)
        : m_host(host), m_stanza(stanza), m_wish(wish), m_ipv6(stanza.family == "inet6")
    {
    }

    void Read()
    {
        ReadMethod();
        for (const auto& [name, value] : m_stanza.options) {
            if (!TakeAddressing(name, value) && !TakeResolver(name, value) &&
                !TakeLink(name, value) && !TakeCommand(name, value) && !IsWithoutEffect(name)) {
                Refuse("its option " + Quoted(name) + " cannot be carried over");
            }
        }
        FinishAddress();
    }

private:
    void Refuse(const std::string& reason)
    {
        m_wish.obstacles.push_back(m_stanza.path + ": " + reason);
    }

    void ReadMethod()
    {
        constexpr std::array<std::string_view, 5> kMethods{"static", "manual", "dhcp", "auto",
                                                           "loopback"};
        const std::string& method = m_stanza.method;
        if ((m_stanza.family != "inet" && !m_ipv6) || !vornhost::Contains(kMethods, method) ||
            (!m_ipv6 && method == "auto")) {
            Refuse("its method " + Quoted(m_stanza.family + ' ' + method) +
                   " cannot be carried over");
        }
        if (m_ipv6 && method == "dhcp") {
            m_wish.dhcp6 = true;
            ReadClient("dhclient6.");
        } else if (method == "dhcp") {
            m_wish.dhcp4 = true;
            ReadClient("dhclient.");
        }
    }

    /** What the client has been saying to the server is in its files and on its command line. */
    void ReadClient(const std::string& prefix)
    {
        const std::string& name = m_wish.name;
        const auto leases = m_host.Text(kDhclientFolder + prefix + name + ".leases").value_or("");
        const auto state = ParseDhclientLeases(leases, name);
        const auto* const link = m_host.live.Find(name);
        // The one that was started last ran with these words, and ifupdown always uses the same.
        const DhcpIdentity identity =
            DhclientIdentity({"-i"}, m_host.Text(kClientConfiguration).value_or(""), state.duid,
                             link == nullptr ? "" : link->mac);
        if (!state.duid.empty()) {
            m_wish.identity.duid = state.duid;
        }
        if (m_ipv6) {
            if (!state.iaid.empty()) {
                m_wish.identity.iaid = state.iaid;
            }
            if (!m_wish.dhcp4) {
                m_wish.identity.hostName = identity.hostName6;
            } else if (identity.hostName6 && !identity.hostName) {
                m_wish.remarks.emplace_back("servers of IPv6 will be told the host's name as well");
            }
            return;
        }
        m_wish.identity.clientId = identity.clientId;
        m_wish.identity.hostName = identity.hostName;
        m_wish.lease = state.lease;
    }

    bool TakeAddressing(const std::string& name, const std::string& value)
    {
        if (name == "address") {
            m_address = value;
        } else if (name == "netmask") {
            m_netmask = value;
        } else if (name == "gateway") {
            if (value != "none") {
                (m_ipv6 ? m_wish.gateway6 : m_wish.gateway4) = value;
            }
        } else if (name == "metric") {
            (m_ipv6 ? m_wish.metric6 : m_wish.metric4) = vornhost::ToNumber(value, 0, UINT32_MAX);
        } else if (name == "privext") {
            m_wish.privacy = value == "2" ? "rfc3041" : value == "1" ? "1" : "no";
        } else if (name == "dhcp" && m_ipv6) {
            m_wish.dhcp6 = value == "1" ? m_wish.dhcp6 : std::optional(false);
        } else if (name == "hostname") {
            m_wish.identity.hostName = value;
        } else if (name == "request_prefix") {
            return value == "0";
        } else if (name == "scope") {
            return value == "global";
        } else {
            return false;
        }
        return true;
    }

    bool TakeResolver(const std::string& name, const std::string& value)
    {
        if (name == "dns-nameservers" || name == "dns-nameserver") {
            Append(value, m_wish.dns);
        } else if (name == "dns-search" || name == "dns-domain") {
            Append(value, m_wish.search);
        } else {
            return false;
        }
        return true;
    }

    static void Append(const std::string& value, std::vector<std::string>& list)
    {
        for (const std::string& word : vornhost::Words(value)) {
            if (std::find(list.begin(), list.end(), word) == list.end()) {
                list.push_back(word);
            }
        }
    }

    bool TakeLink(const std::string& name, const std::string& value)
    {
        const auto ethtool = [&](const std::string& text) {
            m_wish.ethtool += (m_wish.ethtool.empty() ? "" : "; ") + text;
        };
        if (name == "mtu") {
            m_wish.mtu = vornhost::ToNumber(value, 68, 65535);
        } else if (name == "hwaddress") {
            const std::vector<std::string> words = vornhost::Words(value);
            m_wish.mac = words.empty() ? "" : vornhost::Lower(words.back());
        } else if (name == "link-speed" || name == "link-duplex") {
            ethtool(name.substr(5) + ' ' + value);
        } else if (name == "ethernet-autoneg" || name == "ethernet-wol") {
            ethtool(name.substr(9) + ' ' + value);
        } else if (name.starts_with("offload-")) {
            ethtool("-K " + m_wish.name + ' ' + name.substr(8) + ' ' + value);
        } else {
            // What a bond or a VLAN is made of is read from the kernel.
            return name.starts_with("bond-") || name.starts_with("bond_") ||
                   name.starts_with("vlan") || name == "slaves";
        }
        return true;
    }

    bool TakeCommand(const std::string& name, const std::string& value)
    {
        if (name == "up" || name == "post-up" || name == "pre-up") {
            if (!TakeUpCommand(value, m_wish)) {
                Refuse("its command " + Quoted(name + ' ' + value) + " cannot be carried over");
            }
            return true;
        }
        if (name != "down" && name != "pre-down" && name != "post-down") {
            return false;
        }
        if (!IsMereDownCommand(value)) {
            Refuse("its command " + Quoted(name + ' ' + value) + " cannot be carried over");
        }
        return true;
    }

    static bool IsWithoutEffect(std::string_view name)
    {
        constexpr std::array<std::string_view, 12> kNames{
            "broadcast",    "network",      "accept_ra",   "autoconf",
            "dad-attempts", "dad-interval", "ll-attempts", "ll-interval",
            "ip-forward",   "leasetime",    "leasehours",  "pre-up-delay"};
        return vornhost::Contains(kNames, name);
    }

    void FinishAddress()
    {
        if (m_address.empty()) {
            return;
        }
        std::string text = m_address;
        if (text.find('/') == std::string::npos) {
            const auto length = m_netmask.find('.') != std::string::npos
                                    ? vornhost::MaskLength(m_netmask)
                                    : vornhost::ToNumber(m_netmask, 0, 128);
            if (!length) {
                Refuse("the address " + Quoted(text) + " has no netmask");
                return;
            }
            text += '/' + std::to_string(*length);
        }
        (m_ipv6 ? m_wish.addresses6 : m_wish.addresses4).push_back(text);
    }

    const HostView& m_host;
    const InterfaceStanza& m_stanza;
    Wish& m_wish;
    bool m_ipv6;
    std::string m_address;
    std::string m_netmask;
};

} // namespace

InterfacesConfig ReadInterfaces(const HostView& host)
{
    return ReadInterfacesConfig(
        kInterfacesPath, [&](const std::string& path) { return host.Text(path).value_or(""); },
        [&](const std::string& pattern) { return host.Find(pattern); });
}

Wish ReadIfupdown(const HostView& host, const InterfacesConfig& config, const std::string& name)
{
    Wish wish;
    wish.name = name;
    wish.manager = Manager::kIfupdown;
    if (config.mapped.contains(name)) {
        wish.obstacles.push_back(std::string(kInterfacesPath) +
                                 ": a 'mapping' decides what it is to have");
    }
    for (const InterfaceStanza& stanza : config.stanzas) {
        if (stanza.name == name) {
            wish.origin = wish.origin.empty() ? stanza.path : wish.origin;
            StanzaReader(host, stanza, wish).Read();
        }
    }
    return wish;
}

} // namespace vornovsctl
