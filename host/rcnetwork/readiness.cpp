#include "readiness.h"

#include "support/netlink.h"
#include "support/switchdatabase.h"

#include <algorithm>
#include <chrono>
#include <fstream>
#include <functional>
#include <thread>

namespace vornhost {
namespace {

using std::chrono::milliseconds;

constexpr char kInterfaces[] = "/sys/class/net/";
constexpr milliseconds kLinkDeadline{5000};
constexpr milliseconds kPartnerDeadline{10000};
constexpr milliseconds kAskAgain{10};
/** Three seconds until a partner expects nothing any more, and as long until it acts on that. */
constexpr milliseconds kAloneTime{6500};
constexpr milliseconds kDatabaseLimit{5000};

std::string FirstWord(const std::string& path)
{
    std::ifstream file(path);
    std::string word;
    file >> word;
    return word;
}

bool HasCarrier(const std::string& name)
{
    const auto links = ReadLinks();
    return std::any_of(links.begin(), links.end(),
                       [&](const Link& link) { return link.name == name && link.carrier; });
}

bool IsInUse(const std::string& member)
{
    return FirstWord(kInterfaces + member + "/bonding_slave/mii_status") == "up";
}

bool HasNegotiated(const std::string& bridge, const std::string& port)
{
    const auto bridges = ReadSwitch(kDatabaseLimit);
    return bridges && std::any_of(bridges->begin(), bridges->end(), [&](const SwitchBridge& each) {
               const SwitchPort* found = each.FindPort(port);
               return each.name == bridge && found != nullptr && found->negotiated;
           });
}

bool WaitUntil(const std::function<bool()>& condition, milliseconds limit)
{
    const auto deadline = std::chrono::steady_clock::now() + limit;
    while (!condition()) {
        if (std::chrono::steady_clock::now() >= deadline) {
            return false;
        }
        std::this_thread::sleep_for(kAskAgain);
    }
    return true;
}

} // namespace

bool WaitFor(const std::vector<std::string>& what)
{
    const std::string& kind = what.at(0);
    const std::string& name = what.at(1);
    if (kind == "link") {
        return WaitUntil([&] { return HasCarrier(name); }, kLinkDeadline);
    }
    if (kind == "member") {
        return WaitUntil([&] { return IsInUse(name); }, kLinkDeadline);
    }
    if (kind == "switch") {
        return WaitUntil([&] { return HasNegotiated(name, what.at(2)); }, kPartnerDeadline);
    }
    std::this_thread::sleep_for(kAloneTime);
    return true;
}

} // namespace vornhost
