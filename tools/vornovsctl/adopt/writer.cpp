#include "adopt/writer.h"

#include <support/interfacefile.h>
#include <support/interfacevalues.h>
#include <support/keyvaluefile.h>

namespace vornovsctl {

namespace {

constexpr unsigned kKernelMetric6 = 1024;

class FileWriter {
public:
    explicit FileWriter(const Wish& wish) : m_wish(wish) {}

    std::string Text()
    {
        Set("DEVICE", m_wish.name);
        Set("ONBOOT", "yes");
        WriteKind();
        WriteLink();
        if (m_wish.master.empty()) {
            WriteIpv4();
            WriteIpv6();
            WriteClient();
            WriteResolver();
            WriteRoutes();
        }
        return m_file.Text();
    }

private:
    void Set(const std::string& key, const std::string& value) { (void)m_file.Set(key, value); }

    void SetIf(const std::string& key, const std::string& value)
    {
        if (!value.empty()) {
            Set(key, value);
        }
    }

    void SetIf(const std::string& key, const std::optional<bool>& value)
    {
        if (value) {
            Set(key, *value ? "yes" : "no");
        }
    }

    void SetIf(const std::string& key, const std::optional<unsigned>& value)
    {
        if (value) {
            Set(key, std::to_string(*value));
        }
    }

    void SetQuoted(const std::string& key, const std::string& value)
    {
        if (!value.empty()) {
            Set(key, '"' + value + '"');
        }
    }

    void WriteKind()
    {
        if (m_wish.kind == WishKind::kBond) {
            Set("TYPE", "Bond");
            SetQuoted("BONDING_OPTS", m_wish.bond.Text());
        } else if (m_wish.kind == WishKind::kVlan) {
            Set("VLAN", "yes");
            Set("PHYSDEV", m_wish.parent);
            Set("VLAN_ID", std::to_string(m_wish.vlanId));
        }
        if (!m_wish.master.empty()) {
            Set("MASTER", m_wish.master);
            Set("SLAVE", "yes");
        }
    }

    void WriteLink()
    {
        SetIf("MTU", m_wish.mtu);
        SetIf("MACADDR", m_wish.mac);
        SetQuoted("ETHTOOL_OPTS", m_wish.ethtool);
    }

    void WriteIpv4()
    {
        Set("BOOTPROTO", m_wish.dhcp4 ? "dhcp" : "none");
        unsigned count = 0;
        for (const std::string& address : m_wish.addresses4) {
            const std::string number = count == 0 ? "" : std::to_string(count);
            const std::size_t slash = address.find('/');
            Set("IPADDR" + number, address.substr(0, slash));
            Set("PREFIX" + number, slash == std::string::npos ? "32" : address.substr(slash + 1));
            ++count;
        }
        SetIf("GATEWAY", m_wish.gateway4);
        // The kernel's own default needs no word, but a client would choose another one.
        if (m_wish.metric4.value_or(0) != 0 || m_wish.dhcp4) {
            SetIf("METRIC", m_wish.metric4);
        }
    }

    void WriteIpv6()
    {
        if (!m_wish.ipv6) {
            Set("IPV6INIT", "no");
            return;
        }
        SetIf("IPV6_AUTOCONF", m_wish.autoconf);
        SetIf("DHCPV6C", m_wish.dhcp6);
        if (!m_wish.addresses6.empty()) {
            Set("IPV6INIT", "yes");
            Set("IPV6ADDR", m_wish.addresses6.front());
            SetQuoted("IPV6ADDR_SECONDARIES",
                      vornhost::Joined({m_wish.addresses6.begin() + 1, m_wish.addresses6.end()}));
        }
        SetIf("IPV6_DEFAULTGW", m_wish.gateway6);
        // The kernel's own default needs no word, but a client would choose another one.
        if (m_wish.metric6.value_or(kKernelMetric6) != kKernelMetric6 || m_wish.autoconf == true) {
            SetIf("IPV6_METRIC", m_wish.metric6);
        }
        SetIf("IPV6_TOKEN", m_wish.token);
        SetIf("IPV6_LINKLOCAL", m_wish.linkLocal);
        SetIf("IPV6_PRIVACY", m_wish.privacy);
    }

    void WriteClient()
    {
        if (!m_wish.IsDynamic()) {
            return;
        }
        const DhcpIdentity& identity = m_wish.identity;
        if (m_wish.dhcp4) {
            SetIf("DHCP_CLIENT_ID", identity.clientId.value_or(""));
        }
        SetIf("DHCP_HOSTNAME", identity.hostName.value_or(""));
        SetIf("DHCPV6_DUID", identity.duid.value_or(""));
        SetIf("DHCP_IAID", identity.iaid.value_or(""));
        SetIf("PEERROUTES", m_wish.peerRoutes);
        SetIf("DEFROUTE", m_wish.defaultRoute);
    }

    void WriteResolver()
    {
        SetIf("PEERDNS", m_wish.peerDns);
        unsigned count = 0;
        for (const std::string& server : m_wish.dns) {
            Set("DNS" + std::to_string(++count), server);
        }
        SetQuoted("DOMAIN", vornhost::Joined(m_wish.search));
    }

    void WriteRoutes()
    {
        unsigned count = 0;
        for (const std::string& route : m_wish.routes) {
            SetQuoted("ROUTE" + std::to_string(count++), route);
        }
    }

    const Wish& m_wish;
    vornhost::KeyValueFile m_file;
};

} // namespace

std::string FilePathOf(const std::string& interface)
{
    return std::string(vornhost::kConfigurationFolder) + "/ifcfg-" + interface;
}

std::string FileTextOf(const Wish& wish)
{
    return FileWriter(wish).Text();
}

std::vector<std::string> FaultsOf(const Wish& wish, const std::string& text)
{
    std::vector<std::string> faults;
    for (const vornhost::Remark& remark : vornhost::ParseInterfaceFile(wish.name, text).remarks) {
        faults.push_back(remark.text);
    }
    return faults;
}

} // namespace vornovsctl
