#include "support/netlink.h"
#include "support/switchdatabase.h"
#include "support/uplink.h"

#include <algorithm>
#include <exception>
#include <syslog.h>
#include <vornplatform/sdk.h>

namespace {

constexpr int kNotOfTheSwitch = -1;

enum SwitchMaster : int { kNeither = 0, kPlainInterface = 1, kBond = 2 };

// The order of the answers: a failure is never taken for "no bridge".
int BridgeIfIsMaster(const std::string& name)
{
    const auto links = vornhost::ReadLinks();
    if (links.empty()) {
        ::syslog(LOG_ERR, "vornsdk: the kernel does not list its interfaces");
        return -1;
    }
    return std::any_of(links.begin(), links.end(), [&](const vornhost::Link& link) {
        return link.name == name && link.kind == "bridge";
    });
}

int SwitchIfIsMaster(const std::string& name)
{
    const auto bridges = vornhost::ReadSwitch();
    if (!bridges) {
        ::syslog(LOG_ERR, "vornsdk: the switch's database does not tell what %s is", name.c_str());
        return kNotOfTheSwitch;
    }

    const auto bridge =
        std::find_if(bridges->begin(), bridges->end(),
                     [&](const vornhost::SwitchBridge& each) { return each.name == name; });
    if (bridge == bridges->end()) {
        return kNotOfTheSwitch;
    }
    const vornhost::SwitchPort* const uplink = vornhost::FindUplinkByFile(*bridge);
    if (uplink == nullptr) {
        return kNeither;
    }
    return uplink->bond ? kBond : kPlainInterface;
}

} // namespace

int VLIBNetBridgeIfIsMaster(const char* name)
{
    if (name == nullptr) {
        return -1;
    }
    try {
        return BridgeIfIsMaster(name);
    } catch (const std::exception& error) {
        ::syslog(LOG_ERR, "vornsdk: cannot tell what %s is: %s", name, error.what());
        return -1;
    }
}

int VLIBNetOVSIfIsMaster(const char* name)
{
    if (name == nullptr) {
        return kNotOfTheSwitch;
    }
    try {
        return SwitchIfIsMaster(name);
    } catch (const std::exception& error) {
        ::syslog(LOG_ERR, "vornsdk: cannot tell what %s is: %s", name, error.what());
        return kNotOfTheSwitch;
    }
}
