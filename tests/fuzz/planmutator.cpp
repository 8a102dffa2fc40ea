/**
 * Changes hosts on paper by their parts: a change of single bytes mostly makes one that cannot be
 * read.
 */
#include <algorithm>
#include <array>
#include <cstdint>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include <nlohmann/json.hpp>

extern "C" std::size_t LLVMFuzzerMutate(std::uint8_t* data, std::size_t size, std::size_t most);

namespace {

using Json = nlohmann::json;

constexpr std::array kLines{"TYPE=OVS",
                            "TYPE=Bond",
                            "TYPE=Bridge",
                            "PRIMARY=eth0",
                            "BRIDGE=ovs_eth0",
                            "BRIDGE=br0",
                            "SLAVE=yes",
                            "MASTER=bond0",
                            "SLAVE_LIST=\"eth0 eth1 \"",
                            "BONDING_OPTS=\"bond_mode=balance-slb lacp=off\"",
                            "BONDING_OPTS=\"mode=active-backup miimon=100\"",
                            "ONBOOT=no",
                            "BOOTPROTO=dhcp",
                            "IPADDR=192.0.2.5",
                            "PREFIX=24",
                            "IPV6ADDR=2001:db8::5/64",
                            "GATEWAY=192.0.2.1",
                            "MTU=9000",
                            "OVS_VLAN_ID=5",
                            "OVS_VLAN_ID=4094",
                            "PHYSDEV=eth0",
                            "VLAN_ID=5",
                            "ROUTE0=\"198.51.100.0/24 via 192.0.2.9\"",
                            "ETHTOOL_OPTS=\"-K eth0 tso off\"",
                            "IPV6_AUTOCONF=yes",
                            "DNS1=192.0.2.53"};
/** What a link, an address, a route, a port of the switch or a record may have, and seldom has. */
constexpr std::array kParts{R"({"valid": 60, "preferred": 0})",
                            R"({"flags": 512})",
                            R"({"peer": "192.0.2.9"})",
                            R"({"metric": 100})",
                            R"({"kind": "vlan", "vlan": 5, "parent": 2})",
                            R"({"kind": "bond"})",
                            R"({"kind": "bridge"})",
                            R"({"master": 4})",
                            R"({"up": false})",
                            R"({"type": 7})",
                            R"({"ours": false})",
                            R"({"tag": 5})",
                            R"({"made": true})",
                            R"({"client": true})"};
constexpr std::array kNames{"eth0", "eth1", "eth2", "bond0", "ovs_eth0", "ovs_bond0", "eth0.5"};

class Mutation {
public:
    Mutation(Json& host, unsigned seed) : m_host(host), m_random(seed) {}

    void Run()
    {
        Collect(m_host);
        Json& node = *m_nodes[Below(m_nodes.size())];
        if (node.is_string()) {
            ChangeText(node);
        } else if (node.is_number()) {
            node = Below(2) == 0 ? node.get<std::int64_t>() + 1 - 2 * static_cast<int>(Below(2))
                                 : static_cast<std::int64_t>(Below(6));
        } else if (node.is_boolean()) {
            node = !node.get<bool>();
        } else {
            ChangeGroup(node);
        }
    }

private:
    std::size_t Below(std::size_t bound) { return m_random() % bound; }

    void Collect(Json& node)
    {
        m_nodes.push_back(&node);
        if (node.is_structured()) {
            for (Json& child : node) {
                Collect(child);
            }
        }
    }

    Json Other(Json::value_t kind)
    {
        std::vector<const Json*> others;
        std::copy_if(m_nodes.begin(), m_nodes.end(), std::back_inserter(others),
                     [&](const Json* node) { return node->type() == kind; });
        return others.empty() ? Json() : *others[Below(others.size())];
    }

    void ChangeGroup(Json& node)
    {
        if (node.empty() || Below(3) == 0) {
            node = Other(node.type());
            return;
        }
        const auto at = std::next(node.begin(), static_cast<std::ptrdiff_t>(Below(node.size())));
        if (Below(2) == 0) {
            node.erase(at);
        } else if (node.is_array()) {
            node.push_back(*at);
        } else if (Below(2) == 0) {
            node.update(Json::parse(kParts[Below(kParts.size())]));
        } else {
            node[kNames[Below(kNames.size())]] = *at;
        }
    }

    void ChangeText(Json& node)
    {
        auto text = node.get<std::string>();
        if (text.find('\n') != std::string::npos) {
            node = WithOtherLine(text);
        } else if (Below(3) == 0) {
            node = kNames[Below(kNames.size())];
        } else if (Below(2) == 0) {
            node = Other(Json::value_t::string);
        } else {
            node = WithOtherBytes(text);
        }
    }

    static std::string WithOtherBytes(std::string text)
    {
        constexpr std::size_t kRoom = 32;
        const std::size_t size = text.size();
        text.resize(size + kRoom);
        text.resize(
            LLVMFuzzerMutate(reinterpret_cast<std::uint8_t*>(text.data()), size, text.size()));
        return text;
    }

    std::string WithOtherLine(const std::string& text)
    {
        const std::size_t begin = text.rfind('\n', Below(text.size())) + 1;
        const std::size_t end = std::min(text.find('\n', begin), text.size());
        std::string line = text.substr(begin, end - begin);
        const std::size_t way = Below(4);
        if (way == 0) {
            return text.substr(0, begin) + text.substr(std::min(end + 1, text.size()));
        }
        if (way == 1) {
            line = WithOtherBytes(line);
        } else {
            const std::string added = kLines[Below(kLines.size())];
            line = way == 2 ? added : line + "\n" + added;
        }
        return text.substr(0, begin) + line + text.substr(end);
    }

    Json& m_host;
    std::mt19937 m_random;
    std::vector<Json*> m_nodes;
};

Json Parse(const std::uint8_t* data, std::size_t size)
{
    return Json::parse(data, data + size, nullptr, false);
}

/** @return the size; 0: it does not fit. */
std::size_t Write(const Json& host, std::uint8_t* data, std::size_t most)
{
    const std::string text = host.dump(1, ' ', false, Json::error_handler_t::replace);
    if (text.size() > most) {
        return 0;
    }
    std::memcpy(data, text.data(), text.size());
    return text.size();
}

} // namespace

extern "C" std::size_t LLVMFuzzerCustomMutator(std::uint8_t* data, std::size_t size,
                                               std::size_t most, unsigned seed)
{
    constexpr unsigned kMostChanges = 4;
    Json host = Parse(data, size);
    if (host.is_discarded() || !host.is_object() || seed % 64 == 0) {
        return LLVMFuzzerMutate(data, size, most);
    }
    for (unsigned change = 0; change <= seed % kMostChanges; ++change) {
        Mutation(host, seed + change).Run();
    }
    const std::size_t written = Write(host, data, most);
    return written > 0 ? written : size;
}

/** The one's host with a part of the other's. */
extern "C" std::size_t LLVMFuzzerCustomCrossOver(const std::uint8_t* one, std::size_t oneSize,
                                                 const std::uint8_t* two, std::size_t twoSize,
                                                 std::uint8_t* out, std::size_t most, unsigned seed)
{
    Json host = Parse(one, oneSize);
    const Json other = Parse(two, twoSize);
    if (!host.is_object() || !other.is_object() || other.empty()) {
        return 0;
    }
    const auto part = std::next(other.begin(), static_cast<std::ptrdiff_t>(seed % other.size()));
    host[part.key()] = part.value();
    return Write(host, out, most);
}
