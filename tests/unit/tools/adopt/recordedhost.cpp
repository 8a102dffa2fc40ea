#include "adopt/recordedhost.h"

#include <atomic>
#include <filesystem>
#include <fstream>
#include <gtest/gtest.h>
#include <linux/if_addr.h>
#include <linux/if_arp.h>
#include <linux/rtnetlink.h>
#include <sstream>
#include <stdexcept>
#include <sys/socket.h>
#include <unistd.h>

namespace unit {

namespace {

std::string TextOf(const std::filesystem::path& path)
{
    std::ifstream file(path);
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

int FamilyOf(const std::string& address)
{
    return address.find(':') == std::string::npos ? AF_INET : AF_INET6;
}

} // namespace

RecordedHost::RecordedHost()
{
    static std::atomic<int> number{0};
    view.root = "/tmp/recorded-" + std::to_string(getpid()) + '-' + std::to_string(++number);
    std::filesystem::create_directories(view.root);
    view.run = [this](const std::vector<std::string>& argv) -> std::optional<std::string> {
        std::string line;
        for (const std::string& word : argv) {
            line += (line.empty() ? "" : " ") + word;
        }
        const auto answer = m_answers.find(line);
        return answer == m_answers.end() ? std::nullopt : std::optional(answer->second);
    };
}

RecordedHost::~RecordedHost()
{
    std::error_code ignored;
    std::filesystem::remove_all(view.root, ignored);
}

void RecordedHost::Write(const std::string& path, const std::string& text) const
{
    std::filesystem::create_directories(std::filesystem::path(view.root + path).parent_path());
    std::ofstream(view.root + path) << text;
}

std::string RecordedHost::Read(const std::string& path) const
{
    return std::filesystem::exists(view.root + path) ? TextOf(view.root + path) : "(none)";
}

std::map<std::string, std::string> RecordedHost::Files() const
{
    std::map<std::string, std::string> files;
    for (const auto& entry : std::filesystem::recursive_directory_iterator(view.root)) {
        if (entry.is_regular_file()) {
            files[entry.path().string().substr(view.root.size())] = TextOf(entry.path());
        }
    }
    return files;
}

void RecordedHost::Answer(const std::string& commandLine, const std::string& text)
{
    m_answers[commandLine] = text;
}

int RecordedHost::AddLink(const std::string& name, const std::string& mac, const std::string& kind)
{
    vornhost::Link link;
    link.index = static_cast<int>(view.live.links.size()) + 2;
    link.name = name;
    link.mac = mac;
    link.kind = kind;
    link.mtu = 1500;
    link.type = ARPHRD_ETHER;
    link.up = true;
    link.carrier = true;
    view.live.links.push_back(link);
    return link.index;
}

vornhost::Link& RecordedHost::Link(const std::string& name)
{
    for (vornhost::Link& link : view.live.links) {
        if (link.name == name) {
            return link;
        }
    }
    throw std::runtime_error("no link " + name);
}

void RecordedHost::AddAddress(const std::string& interface, const std::string& address,
                              unsigned prefixLength, bool lasting)
{
    vornhost::Address entry;
    entry.index = Link(interface).index;
    entry.family = FamilyOf(address);
    entry.local = address;
    entry.prefixLength = prefixLength;
    entry.scope = address.starts_with("fe80:") ? RT_SCOPE_LINK : RT_SCOPE_UNIVERSE;
    entry.flags = lasting ? IFA_F_PERMANENT : 0;
    entry.validSeconds = lasting ? UINT32_MAX : 500;
    view.live.addresses.push_back(entry);
}

void RecordedHost::AddDefaultRoute(const std::string& interface, const std::string& gateway,
                                   unsigned metric)
{
    vornhost::Route route;
    route.family = FamilyOf(gateway);
    route.table = RT_TABLE_MAIN;
    route.protocol = RTPROT_STATIC;
    route.priority = metric;
    vornhost::NextHop hop;
    hop.index = Link(interface).index;
    hop.gateway = gateway;
    hop.gatewayFamily = route.family;
    route.nextHops.push_back(hop);
    view.live.routes.push_back(route);
}

std::string Recorded(const std::string& name)
{
    const std::string path = std::string(VORNOVS_TEST_DATA) + "/adopt/" + name;
    if (!std::filesystem::exists(path)) {
        ADD_FAILURE() << "there is no " << path;
    }
    return TextOf(path);
}

} // namespace unit
