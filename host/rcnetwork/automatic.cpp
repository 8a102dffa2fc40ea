#include "automatic.h"

#include "hold.h"
#include "hostsettings.h"
#include "inputs.h"
#include "report.h"
#include "runs.h"

#include "support/atomicfile.h"
#include "support/netlink.h"
#include "support/runlock.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <thread>

#include <unistd.h>

namespace vornhost {
namespace {

using std::chrono::seconds;
using Clock = std::chrono::steady_clock;

constexpr char kBootMark[] = "/run/vornovs/network.boot";
/** The lock that the library holds while it edits files, as it is called below /run. */
constexpr char kConfigurationLock[] = "file!tmp!ovs_config.lock";
constexpr char kDeviceManager[] = "/run/udev/control";
constexpr char kDeviceRecord[] = "/run/udev/data/n";
constexpr std::chrono::milliseconds kBetweenLooks{100};
/** Far more than a conversion takes: somebody has left a hold and not its holder. */
constexpr seconds kConversionLimit{300};

/** An interface can be renamed until udev has done its part. */
bool IsReady(const Link& link)
{
    return ::access(kDeviceManager, F_OK) != 0 ||
           ::access((kDeviceRecord + std::to_string(link.index)).c_str(), F_OK) == 0;
}

std::set<std::string> Missing(std::set<std::string> names)
{
    for (const Link& link : ReadLinks()) {
        if (IsReady(link)) {
            names.erase(link.name);
        }
    }
    return names;
}

void WaitForInterfaces(seconds limit)
{
    std::vector<Remark> remarks; // said by the run that follows
    const auto files = ReadInterfaceFiles(remarks);
    const std::set<std::string> needed = files ? NeededInterfaces(*files) : std::set<std::string>();
    const auto deadline = Clock::now() + limit;
    std::set<std::string> missing = Missing(needed);
    while (!missing.empty() && Clock::now() < deadline) {
        std::this_thread::sleep_for(kBetweenLooks);
        missing = Missing(needed);
    }
    for (const std::string& name : missing) {
        Say({Severity::kWarning, name + " has not appeared; the others go on without it"});
    }
}

void WaitForConversion()
{
    const auto deadline = Clock::now() + kConversionLimit;
    while (ConversionRuns() && Clock::now() < deadline) {
        std::this_thread::sleep_for(kBetweenLooks);
    }
}

bool StartLocked(const Request& request)
{
    const Descriptor lock = TakeNetworkLock();
    return lock && Start(request);
}

} // namespace

bool ConfigurationIsLocked()
{
    return !TakeRunLock(kConfigurationLock, LockDeadlineIn(0)) && errno == EWOULDBLOCK;
}

bool ConversionRuns()
{
    return IsHeld() || ConfigurationIsLocked();
}

std::set<std::string> NeededInterfaces(const std::map<std::string, InterfaceFile>& files)
{
    std::set<std::string> needed;
    std::set<std::string> made;
    for (const auto& [name, file] : files) {
        if (!file.master.empty()) {
            made.insert(file.master);
        }
        if (file.bond || file.linuxBridge || file.vlan) {
            made.insert(name);
        }
        if (!file.onBoot) {
            continue;
        }
        if (file.use == FileUse::kPlain) {
            needed.insert(name);
        } else if (file.use == FileUse::kBridge && !file.slaveList.empty()) {
            made.insert(PlainOf(name));
            needed.insert(file.slaveList.begin(), file.slaveList.end());
        }
        if (file.use == FileUse::kPlain && file.vlan) {
            needed.insert(file.vlan->parent);
        }
    }
    for (const std::string& name : made) {
        needed.erase(name);
    }
    return needed;
}

bool StartAtBoot(const Request& request)
{
    constexpr unsigned kUsualSeconds = 10;
    // Until now nothing of the host can be reached. A switch that takes longer is followed later.
    constexpr unsigned kUsualSwitchSeconds = 20;
    {
        // From now on an interface that appears is brought up by itself, after this run.
        const Descriptor lock = TakeNetworkLock();
        if (lock && !ReplaceFile(kBootMark, "", kPrivateFile)) {
            Say({Severity::kWarning,
                 std::string("cannot write ") + kBootMark + ": " + std::strerror(errno)});
        }
    }
    WaitForInterfaces(HostSeconds("DEVICE_SECONDS", kUsualSeconds, 0));
    Request start = request;
    start.servicePatience = HostSeconds("SWITCH_SECONDS", kUsualSwitchSeconds, 1);
    return StartLocked(start);
}

bool StartAppeared(const std::string& interface)
{
    WaitForConversion();
    std::vector<Remark> remarks; // said by those that asked for all of it
    const auto files = ReadInterfaceFiles(remarks);
    const auto file =
        files ? files->find(interface) : std::map<std::string, InterfaceFile>::const_iterator();
    if (!files || file == files->end() || !file->second.onBoot) {
        return true;
    }
    Request request;
    request.names = {PlainOf(interface)};
    return StartLocked(request);
}

} // namespace vornhost
