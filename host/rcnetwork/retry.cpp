#include "retry.h"

#include "alone.h"
#include "automatic.h"
#include "inputs.h"
#include "report.h"
#include "runs.h"

#include "support/atomicfile.h"
#include "support/runlock.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fstream>
#include <sstream>
#include <thread>

#include <nlohmann/json.hpp>
#include <unistd.h>

namespace vornhost {
namespace {

using Json = nlohmann::json;
using Clock = std::chrono::steady_clock;

constexpr char kWaitingPath[] = "/run/vornovs/network.waiting";
constexpr char kRetryLock[] = "retry.lock";
constexpr std::chrono::seconds kBetweenTries{1};
/** A switch that runs and does not carry what it shall makes every attempt a short outage. */
constexpr std::chrono::seconds kFirstPause{15};
constexpr std::chrono::seconds kLongestPause{600};

void Write(const std::set<std::string>& names)
{
    if (names.empty()) {
        (void)::unlink(kWaitingPath);
    } else if (!ReplaceFile(kWaitingPath, Json(names).dump() + "\n", kPrivateFile)) {
        Say({Severity::kError,
             std::string("cannot write ") + kWaitingPath + ": " + std::strerror(errno)});
    }
}

bool NobodyTries()
{
    return static_cast<bool>(TakeRunLock(kRetryLock, LockDeadlineIn(0)));
}

void Try(const std::set<std::string>& names)
{
    const Descriptor lock = TakeNetworkLock();
    if (!lock) {
        return;
    }
    Say({Severity::kNotice, "trying again to bring the network to the switch"});
    Request request;
    request.names = names;
    if (Start(request)) {
        Say({Severity::kNotice, "the switch carries the network now"});
    }
}

} // namespace

std::set<std::string> WaitingForSwitch()
{
    std::ifstream file(kWaitingPath);
    std::ostringstream text;
    text << file.rdbuf();
    try {
        return Json::parse(text.str()).get<std::set<std::string>>();
    } catch (const std::exception&) {
        return {};
    }
}

void MindRetry(const std::set<std::string>& concerned, const std::set<std::string>& withoutSwitch)
{
    const std::set<std::string> former = WaitingForSwitch();
    std::set<std::string> waiting = withoutSwitch;
    std::copy_if(
        former.begin(), former.end(), std::inserter(waiting, waiting.end()),
        [&](const std::string& name) { return !concerned.empty() && !concerned.contains(name); });
    if (waiting != former) {
        Write(waiting);
    }
    if (!waiting.empty() && NobodyTries() &&
        !StartAlone("vornovs-network-retry.service", {kRetryVerb})) {
        Say({Severity::kError, "nobody will try again to bring the network to the switch"});
    }
}

void RetryUntilDone()
{
    const Descriptor lock = TakeRunLock(kRetryLock, LockDeadlineIn(0));
    if (!lock) {
        return;
    }
    auto pause = kFirstPause;
    auto next = Clock::now() + pause;
    std::string tried = SwitchProcesses();
    for (auto names = WaitingForSwitch(); !names.empty(); names = WaitingForSwitch()) {
        std::this_thread::sleep_for(kBetweenTries);
        const std::string processes = SwitchProcesses();
        if ((Clock::now() < next && (processes.empty() || processes == tried)) ||
            ConversionRuns()) {
            continue;
        }
        Try(names);
        tried = SwitchProcesses();
        pause = std::min(2 * pause, kLongestPause);
        next = Clock::now() + pause;
    }
}

} // namespace vornhost
