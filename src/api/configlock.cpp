#include "api/configlock.h"

#include "system/log.h"

#include <vornplatform/core.h>

namespace VORN::OVS {
namespace {

constexpr char kLogFile[] = "libvornovs.cpp";

constexpr char kLockPath[] = "/tmp/ovs_config.lock";
constexpr int kLockExclusive = 1;
constexpr int kLockSeconds = 5;

} // namespace

ConfigLock::ConfigLock()
    : m_taken(VLIBCFileLockTimeByFile(kLockPath, kLockExclusive, kLockSeconds, &m_handle) >= 0)
{
    if (!m_taken) {
        OVS_ERR("Failed to lock%s", kLockPath);
        OVS_ERR("Failed to lock the file");
    }
}

ConfigLock::~ConfigLock()
{
    // By the handle alone: a failed attempt that left one behind is given back, too.
    if (m_handle != -1 && VLIBCFileUnlockByFile(m_handle) < 0) {
        OVS_ERR("Failed to unlock%s", kLockPath);
        OVS_ERR("Failed to unlock the file");
    }
}

} // namespace VORN::OVS
