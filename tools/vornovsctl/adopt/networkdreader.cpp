#include "adopt/networkdreader.h"

#include "adopt/networkdsections.h"
#include "answer.h"

#include <array>
#include <ctime>
#include <sstream>
#include <support/interfacevalues.h>

namespace vornovsctl {

namespace {

constexpr char kRunFolder[] = "/run/systemd/netif/";

/** The lines "KEY=value" of its state files. */
std::map<std::string, std::string> StateValues(const std::string& text)
{
    std::map<std::string, std::string> values;
    std::istringstream stream(text);
    for (std::string line; std::getline(stream, line);) {
        const std::size_t sign = line.find('=');
        if (sign != std::string::npos) {
            values[line.substr(0, sign)] = line.substr(sign + 1);
        }
    }
    return values;
}

std::string WithColons(const std::string& digits)
{
    std::string text;
    for (std::size_t index = 0; index + 1 < digits.size(); index += 2) {
        text += (text.empty() ? "" : ":") + digits.substr(index, 2);
    }
    return text;
}

std::string FileName(const std::string& path)
{
    return path.substr(path.rfind('/') + 1);
}

/** "DUID-EN/Vendor:0000ab11..." as bytes with the code of its kind. */
std::string DuidOf(const std::string& text)
{
    const std::size_t colon = text.find(':');
    if (colon == std::string::npos) {
        return "";
    }
    const std::string kind = text.substr(0, colon);
    const std::string code = kind == "DUID-LLT"         ? "0001"
                             : kind == "DUID-EN/Vendor" ? "0002"
                             : kind == "DUID-LL"        ? "0003"
                             : kind == "UUID"           ? "0004"
                                                        : "";
    return code.empty() ? "" : WithColons(code + text.substr(colon + 1));
}

/** The lease and, in it, how it introduced itself. */
void ReadLease(const HostView& host, const std::string& index, Wish& wish)
{
    const auto text = host.Text(kRunFolder + ("leases/" + index));
    if (!text) {
        return;
    }
    const auto values = StateValues(*text);
    const auto get = [&](const char* key) {
        const auto value = values.find(key);
        return value == values.end() ? std::string() : value->second;
    };
    Lease lease;
    lease.address = get("ADDRESS");
    lease.netmask = get("NETMASK");
    lease.server = get("SERVER_ADDRESS");
    lease.routers = vornhost::Words(get("ROUTER"));
    lease.dns = vornhost::Words(get("DNS"));
    lease.domain = get("DOMAINNAME");
    lease.seconds = static_cast<std::uint32_t>(std::strtoul(get("LIFETIME").c_str(), nullptr, 10));
    wish.lease = lease;
    if (const std::string id = get("CLIENTID"); !id.empty()) {
        wish.identity.clientId = WithColons(id);
        constexpr std::size_t kDuidAt = 10; // behind the kind and the association
        if (id.starts_with("ff") && id.size() > kDuidAt) {
            wish.identity.duid = WithColons(id.substr(kDuidAt));
            wish.identity.iaid = id.substr(2, 8);
        }
    }
}

void ReadState(const HostView& host, Wish& wish)
{
    const vornhost::Link* const link = host.live.Find(wish.name);
    if (link == nullptr) {
        return;
    }
    const std::string index = std::to_string(link->index);
    if (wish.dhcp4) {
        ReadLease(host, index, wish);
    }
    const auto values = StateValues(host.Text(kRunFolder + ("links/" + index)).value_or(""));
    if (const auto duid = values.find("DHCP6_CLIENT_DUID"); duid != values.end()) {
        wish.identity.duid = DuidOf(duid->second);
    }
    if (const auto iaid = values.find("DHCP6_CLIENT_IAID"); iaid != values.end()) {
        std::string digits = iaid->second.substr(iaid->second.find('x') + 1);
        wish.identity.iaid = std::string(digits.size() < 8 ? 8 - digits.size() : 0, '0') + digits;
    }
}

} // namespace

std::map<std::string, NetworkdLink> ReadNetworkdLinks(const HostView& host)
{
    std::map<std::string, NetworkdLink> managed;
    const auto text = host.run({"networkctl", "--json=short", "list"});
    if (!text) {
        return managed;
    }
    const Json list = Json::parse(*text, nullptr, false);
    if (!list.is_object() || !list.contains("Interfaces")) {
        return managed;
    }
    for (const Json& link : list["Interfaces"]) {
        const std::string state = link.value("AdministrativeState", "");
        const std::string file = link.value("NetworkFile", "");
        if (state != "unmanaged" && !file.empty()) {
            managed[link.value("Name", "")] = {file, state != "configuring" && state != "pending"};
        }
    }
    return managed;
}

std::vector<std::string> FilesOfNetwork(const HostView& host, const std::string& networkFile)
{
    // Of drop-ins of one name the one in the first of these folders counts.
    constexpr std::array kFolders{"/etc/systemd/network/", "/run/systemd/network/",
                                  "/usr/local/lib/systemd/network/", "/usr/lib/systemd/network/",
                                  "/lib/systemd/network/"};
    std::map<std::string, std::string> dropIns;
    for (const char* folder : kFolders) {
        for (const std::string& path : host.Find(folder + FileName(networkFile) + ".d/*.conf")) {
            dropIns.emplace(FileName(path), path);
        }
    }
    std::vector<std::string> files{networkFile};
    for (const auto& [name, path] : dropIns) {
        files.push_back(path);
    }
    return files;
}

Wish ReadNetworkd(const HostView& host, const std::string& name, const std::string& networkFile)
{
    Wish wish;
    wish.name = name;
    wish.manager = Manager::kNetworkd;
    wish.origin = networkFile;
    for (const std::string& path : FilesOfNetwork(host, networkFile)) {
        const auto text = host.Text(path);
        if (!text) {
            wish.obstacles.push_back(path + ": cannot be read");
            continue;
        }
        for (const IniSection& section : ParseIni(*text)) {
            TakeNetworkdSection(section, path, wish);
        }
    }
    // Unless it is told otherwise it listens to routers, on behalf of the kernel.
    if (wish.ipv6 && !wish.autoconf) {
        wish.autoconf = true;
    }
    ReadState(host, wish);
    return wish;
}

} // namespace vornovsctl
