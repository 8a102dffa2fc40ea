#include "switch/waitforlink.h"

#include "system/log.h"
#include "system/pause.h"

#include <vornplatform/netsdk.h>

namespace VORN::OVS {
namespace {

constexpr char kLogFile[] = "ovsmanager.cpp";

constexpr int kTries = 8;
constexpr int kLinkDown = -1;

} // namespace

std::optional<int> WaitForLink(const std::string& name, int retryPriority)
{
    for (int tryNumber = 0; tryNumber < kTries; ++tryNumber) {
        VORNNETETHINFO info{};
        if (VORNNetGetEthInfo(&info, name.c_str()) == 0 && info.speed != kLinkDown) {
            return info.speed;
        }
        OVS_LOG(retryPriority, "%s not ready, retry(%d)", name.c_str(), tryNumber);
        Pause(1);
    }
    return std::nullopt;
}

} // namespace VORN::OVS
