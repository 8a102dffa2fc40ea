#include "announcer.h"

#include "alone.h"
#include "announce.h"
#include "report.h"

#include <chrono>
#include <thread>

namespace vornhost {
namespace {

constexpr std::chrono::seconds kFirstPause{1};
constexpr std::chrono::seconds kLongestPause{8};

} // namespace

void KeepAnnouncing(const std::string& interface)
{
    if (!StartAlone("vornovs-announce@" + interface + ".service", {kAnnounceVerb, interface})) {
        Say({Severity::kWarning, "nobody will announce " + interface + " again"});
    }
}

void AnnounceForAWhile(const std::string& interface)
{
    for (auto pause = kFirstPause; pause <= kLongestPause; pause *= 2) {
        std::this_thread::sleep_for(pause);
        if (!Announce(interface)) {
            return;
        }
    }
}

} // namespace vornhost
