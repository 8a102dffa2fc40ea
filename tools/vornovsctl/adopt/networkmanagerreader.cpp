#include "adopt/networkmanagerreader.h"

#include "wording.h"

#include <algorithm>
#include <array>
#include <sstream>
#include <string_view>
#include <support/interfacevalues.h>

namespace vornovsctl {

namespace {

using Values = std::map<std::string, std::string>;

constexpr unsigned kDefaultEthernetMetric = 100;

/** Lines "key:value"; a key may be numbered, "DHCP4.OPTION[2]". */
Values ProfileValues(const std::string& text)
{
    Values values;
    std::istringstream stream(text);
    for (std::string line; std::getline(stream, line);) {
        const std::size_t colon = line.find(':');
        if (colon != std::string::npos) {
            values[line.substr(0, colon)] = line.substr(colon + 1);
        }
    }
    return values;
}

/** The fields of a line between colons, of which those in values are marked. */
std::vector<std::string> FieldsOf(const std::string& line)
{
    std::vector<std::string> fields(1);
    for (std::size_t index = 0; index < line.size(); ++index) {
        if (line[index] == '\\' && index + 1 < line.size()) {
            fields.back() += line[++index];
        } else if (line[index] == ':') {
            fields.emplace_back();
        } else {
            fields.back() += line[index];
        }
    }
    return fields;
}

/** "a, b" or "a; b" or "a,b". */
std::vector<std::string> ProfileList(std::string text)
{
    std::replace(text.begin(), text.end(), ';', ',');
    std::istringstream stream(text);
    std::vector<std::string> list;
    for (std::string part; std::getline(stream, part, ',');) {
        part = vornhost::Trimmed(part);
        if (!part.empty()) {
            list.push_back(part);
        }
    }
    return list;
}

class ProfileReader {
public:
    ProfileReader(Values values, Wish& wish) : m_values(std::move(values)), m_wish(wish) {}

    void Read()
    {
        ReadConnection();
        ReadFamily(false);
        ReadFamily(true);
        ReadLink();
        ReadFeatures();
    }

private:
    std::string Get(const std::string& key) const
    {
        const auto value = m_values.find(key);
        return value == m_values.end() || value->second == "--" ? "" : value->second;
    }

    bool IsYes(const std::string& key) const { return Get(key) == "yes"; }

    void Refuse(const std::string& key)
    {
        m_wish.obstacles.push_back("profile " + Quoted(m_wish.origin) + ": " + key + '=' +
                                   Get(key) + " cannot be carried over");
    }

    void RefuseIfSet(const std::string& key, std::string_view harmless = "")
    {
        const std::string value = Get(key);
        if (!value.empty() && value != harmless) {
            Refuse(key);
        }
    }

    void ReadConnection()
    {
        constexpr std::array<std::string_view, 4> kTypes{"802-3-ethernet", "bond", "vlan", "veth"};
        m_wish.origin = Get("connection.id");
        if (std::find(kTypes.begin(), kTypes.end(), Get("connection.type")) == kTypes.end()) {
            Refuse("connection.type");
        }
        RefuseIfSet("connection.slave-type", "bond");
        RefuseIfSet("connection.secondaries");
        RefuseIfSet("802-1x.eap");
        if (!Get("connection.zone").empty()) {
            m_wish.remarks.push_back("its firewall zone " + Quoted(Get("connection.zone")) +
                                     " is the firewall's own matter from now on");
        }
    }

    void ReadMethod(bool ipv6)
    {
        const std::string key = ipv6 ? "ipv6.method" : "ipv4.method";
        const std::string method = Get(key);
        if (!ipv6) {
            m_wish.dhcp4 = method == "auto";
            if (method != "auto" && method != "manual" && method != "disabled" && !method.empty()) {
                Refuse(key);
            }
            return;
        }
        if (method == "auto") {
            m_wish.autoconf = true;
        } else if (method == "dhcp") {
            m_wish.autoconf = true;
            m_wish.dhcp6 = true;
        } else if (method == "manual" || method == "link-local") {
            m_wish.autoconf = false;
        } else if (method == "disabled") {
            m_wish.ipv6 = false;
        } else if (method != "ignore" && !method.empty()) {
            Refuse(key);
        }
    }

    void ReadFamily(bool ipv6)
    {
        const std::string family = ipv6 ? "ipv6." : "ipv4.";
        ReadMethod(ipv6);
        for (const std::string& address : ProfileList(Get(family + "addresses"))) {
            (ipv6 ? m_wish.addresses6 : m_wish.addresses4).push_back(address);
        }
        (ipv6 ? m_wish.gateway6 : m_wish.gateway4) = Get(family + "gateway");
        if (const auto metric = vornhost::ToNumber(Get(family + "route-metric"), 0, UINT32_MAX)) {
            (ipv6 ? m_wish.metric6 : m_wish.metric4) = metric;
        }
        for (const std::string& server : ProfileList(Get(family + "dns"))) {
            m_wish.dns.push_back(server);
        }
        for (const std::string& domain : ProfileList(Get(family + "dns-search"))) {
            m_wish.search.push_back(domain);
        }
        for (const std::string& route : ProfileList(Get(family + "routes"))) {
            ReadRoute(family + "routes", route);
        }
        ReadPolicy(family, ipv6);
        RefuseIfSet(family + "route-table", "0");
        RefuseIfSet(family + "routing-rules");
        RefuseIfSet(family + "dhcp-vendor-class-identifier");
        RefuseIfSet(family + "dhcp-reject-servers");
        if (!ipv6) {
            RefuseIfSet("ipv4.link-local", "0");
        }
    }

    void ReadPolicy(const std::string& family, bool ipv6)
    {
        const bool automatic = Get(family + "method") == "auto" || Get(family + "method") == "dhcp";
        if (IsYes(family + "ignore-auto-dns")) {
            m_wish.peerDns = false;
        }
        if (automatic && IsYes(family + "ignore-auto-routes")) {
            m_wish.peerRoutes = false;
        }
        if (automatic && IsYes(family + "never-default")) {
            m_wish.defaultRoute = false;
        }
        if (Get(family + "dhcp-send-hostname") == "no" && !ipv6) {
            m_wish.identity.hostName = "none";
        }
        for (const char* key : {"dhcp-fqdn", "dhcp-hostname"}) {
            if (const std::string name = Get(family + key); !name.empty()) {
                m_wish.identity.hostName = name;
            }
        }
        if (ipv6) {
            const std::string privacy = Get("ipv6.ip6-privacy").substr(0, 1);
            m_wish.privacy = privacy == "2"   ? "rfc3041"
                             : privacy == "1" ? "1"
                             : privacy == "0" ? "no"
                                              : "";
        }
    }

    /** "198.51.100.0/24 192.0.2.9 50 table=100": destination, router, metric, further words. */
    void ReadRoute(const std::string& key, const std::string& text)
    {
        std::istringstream stream(text);
        std::string word;
        std::string route;
        stream >> route;
        while (stream >> word) {
            const std::size_t sign = word.find('=');
            const std::string name = word.substr(0, sign);
            if (sign != std::string::npos) {
                const std::string value = word.substr(sign + 1);
                if (name == "table" || name == "src") {
                    route.append(" ").append(name).append(" ").append(value);
                } else if (name == "onlink") {
                    route += value == "true" ? " onlink" : "";
                } else {
                    Refuse(key);
                }
            } else if (word.find_first_of(".:") != std::string::npos) {
                route += " via " + word;
            } else {
                route += " metric " + word;
            }
        }
        m_wish.routes.push_back(route);
    }

    void ReadLink()
    {
        const std::string ethernet = "802-3-ethernet.";
        m_wish.mtu = vornhost::ToNumber(Get(ethernet + "mtu"), 68, 65535);
        const std::string mac = vornhost::Lower(Get(ethernet + "cloned-mac-address"));
        if (mac.find(':') != std::string::npos) {
            m_wish.mac = mac;
        } else if (mac == "random" || mac.starts_with("stable")) {
            Refuse(ethernet + "cloned-mac-address");
        }
        std::string forced;
        if (const std::string speed = Get(ethernet + "speed"); !speed.empty() && speed != "0") {
            forced = "speed " + speed + " duplex " + Get(ethernet + "duplex") + " autoneg " +
                     (IsYes(ethernet + "auto-negotiate") ? "on" : "off");
        }
        const std::string wake = Get(ethernet + "wake-on-lan");
        if (wake.find("magic") != std::string::npos) {
            forced += forced.empty() ? "wol g" : " wol g";
        } else if (!wake.empty() && wake.find("default") == std::string::npos &&
                   wake.find("ignore") == std::string::npos) {
            Refuse(ethernet + "wake-on-lan");
        }
        m_wish.ethtool = forced;
        m_wish.vlanId = vornhost::ToNumber(Get("vlan.id"), 1, 4094).value_or(0);
    }

    /** "ethtool.feature-tso" and others, which are listed only where they are set. */
    void ReadFeatures()
    {
        for (const auto& [key, value] : m_values) {
            if (key.starts_with("ethtool.feature-")) {
                m_wish.ethtool += (m_wish.ethtool.empty() ? "" : "; ") + ("-K " + m_wish.name) +
                                  ' ' + key.substr(16) + ' ' + value;
            } else if (key.starts_with("ethtool.") || key.starts_with("tc.") ||
                       key.starts_with("sriov.") || key.starts_with("dcb.") ||
                       key.starts_with("hostname.")) {
                RefuseIfSet(key);
            }
        }
    }

    Values m_values;
    Wish& m_wish;
};

/** What its DHCP clients say of themselves and have got, "DHCP4.OPTION[2]:name = value". */
void ReadOptions(const HostView& host, Wish& wish)
{
    const auto text =
        host.run({"nmcli", "-t", "-f", "DHCP4.OPTION,DHCP6.OPTION", "device", "show", wish.name});
    Values options;
    for (const auto& [key, value] : ProfileValues(text.value_or(""))) {
        const std::size_t sign = value.find(" = ");
        if (sign != std::string::npos) {
            options[key.substr(0, 5) + '.' + value.substr(0, sign)] = value.substr(sign + 3);
        }
    }
    const auto words = [&](const char* key) {
        std::istringstream stream(options[key]);
        std::vector<std::string> list;
        for (std::string word; stream >> word;) {
            list.push_back(word);
        }
        return list;
    };
    if (!options["DHCP4.ip_address"].empty()) {
        Lease lease;
        lease.address = options["DHCP4.ip_address"];
        lease.netmask = options["DHCP4.subnet_mask"];
        lease.server = options["DHCP4.dhcp_server_identifier"];
        lease.routers = words("DHCP4.routers");
        lease.dns = words("DHCP4.domain_name_servers");
        lease.domain = options["DHCP4.domain_name"];
        lease.seconds =
            vornhost::ToNumber(options["DHCP4.dhcp_lease_time"], 0, UINT32_MAX).value_or(0);
        const std::int64_t end = std::strtoll(options["DHCP4.expiry"].c_str(), nullptr, 10);
        lease.begin = end == 0 ? 0 : end - lease.seconds;
        wish.lease = lease;
    }
    if (const std::string id = options["DHCP4.dhcp_client_identifier"]; !id.empty()) {
        wish.identity.clientId = id;
    }
    if (const std::string duid = options["DHCP6.dhcp6_client_id"]; !duid.empty()) {
        wish.identity.duid = duid;
    }
    if (std::string iaid = options["DHCP6.iaid"]; !iaid.empty()) {
        std::erase(iaid, ':');
        wish.identity.iaid = iaid;
    }
}

} // namespace

std::map<std::string, NetworkManagerDevice> ReadNetworkManagerDevices(const HostView& host)
{
    std::map<std::string, NetworkManagerDevice> devices;
    const auto text =
        host.run({"nmcli", "-t", "-e", "yes", "-f", "DEVICE,STATE,CON-UUID", "device"});
    std::istringstream stream(text.value_or(""));
    for (std::string line; std::getline(stream, line);) {
        const std::vector<std::string> fields = FieldsOf(line);
        if (fields.size() != 3 || fields[2].empty() ||
            fields[1].find("externally") != std::string::npos) {
            continue;
        }
        const bool settled = fields[1].starts_with("connected");
        if (settled || fields[1].starts_with("connecting")) {
            devices[fields[0]] = {fields[2], settled};
        }
    }
    return devices;
}

Wish ReadNetworkManager(const HostView& host, const std::string& name, const std::string& uuid)
{
    Wish wish;
    wish.name = name;
    wish.manager = Manager::kNetworkManager;
    const auto text = host.run({"nmcli", "-t", "connection", "show", uuid});
    if (!text) {
        wish.obstacles.push_back("NetworkManager does not tell of its profile " + uuid);
        return wish;
    }
    ProfileReader(ProfileValues(*text), wish).Read();
    // It gives default routes a metric even where nobody asks for one.
    if (!wish.metric4 && (wish.dhcp4 || !wish.gateway4.empty())) {
        wish.metric4 = kDefaultEthernetMetric;
    }
    if (!wish.metric6 && (wish.autoconf.value_or(false) || !wish.gateway6.empty())) {
        wish.metric6 = kDefaultEthernetMetric;
    }
    ReadOptions(host, wish);
    return wish;
}

} // namespace vornovsctl
