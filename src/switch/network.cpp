#include "switch/network.h"

#include "system/handles.h"
#include "system/log.h"
#include "system/pause.h"
#include "system/programs.h"

#include <vornplatform/core.h>

namespace VORN::OVS {
namespace {

constexpr char kLogFile[] = "ovsmanager.cpp";

constexpr char kWirelessService[] = "vornwifid";

} // namespace

StoppedNetwork::StoppedNetwork()
{
    if (VLIBCExecl(kNetworkScript, kExecOptions, "stop", nullptr) != 0) {
        OVS_ERR("Failed to stop the rc.network");
    }
    Pause(kSettleSeconds);
}

StoppedNetwork::~StoppedNetwork()
{
    if (m_stopped) {
        Start();
    }
}

void StoppedNetwork::Start()
{
    m_stopped = false;
    if (VLIBCExecl(kNetworkScript, kExecOptions, "start", nullptr) != 0) {
        OVS_ERR("Failed to start the rc.network");
    }
    // The wireless service holds on to the bridge that it found when it started.
    if (VLIBServiceIsRunning(kWirelessService) == 1 && VLIBServiceRestart(kWirelessService) < 0) {
        OVS_ERR("Filed to restart the vornwifid");
    }
}

} // namespace VORN::OVS
