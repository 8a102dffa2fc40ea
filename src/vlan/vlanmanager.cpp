#include <vornovs/vornovs.h>

#include "state/ifcfg.h"
#include "system/handles.h"
#include "system/log.h"
#include "system/programs.h"

#include <vornplatform/core.h>

#include <sys/wait.h>

#include <array>
#include <cstdlib>
#include <exception>
#include <string_view>

namespace VORN::OVS {
namespace {

constexpr char kLogFile[] = "vlanmanager.cpp";

// The platform's file lock; it is released under another word than it is taken with.
constexpr int kLockWord = 0x806;
constexpr int kUnlockWord = 0x800;
constexpr int kLockSeconds = 5;
constexpr int kErrorLock = 0x400;
constexpr int kErrorUnlock = 0x500;

/** The platform's lock for edits of interface configuration files. */
class IfcfgLock {
public:
    IfcfgLock() : m_held(VLIBCFileLock(kLockWord, kLockSeconds) != -1)
    {
        if (!m_held) {
            VLIBCErrSetEx(kErrorLock, kLogFile, __LINE__);
        }
    }
    ~IfcfgLock()
    {
        if (m_held && VLIBCFileUnlock(kUnlockWord) == -1) {
            VLIBCErrSetEx(kErrorUnlock, kLogFile, __LINE__);
        }
    }
    IfcfgLock(const IfcfgLock&) = delete;
    IfcfgLock& operator=(const IfcfgLock&) = delete;

    explicit operator bool() const { return m_held; }

private:
    bool m_held;
};

int ExitCode(int waitStatus)
{
    return WIFEXITED(waitStatus) ? WEXITSTATUS(waitStatus) : -1;
}

} // namespace

int VlanManager::Get(const std::string& port, _tag_VLIB_VLAN* out)
try {
    CopyName(out->szIfName, port);
    CopyName(out->szRealName, port);

    Pipe pipe(VLIBCPopen(kSwitchTool, "rB", "get", "port", port.c_str(), "tag", nullptr));
    if (!pipe) {
        OVS_ERR("Fail to execute cmd /usr/bin/ovs-vsctlget port %s tag", port.c_str());
        return -1;
    }
    std::array<char, kNameBuffer> line{};
    if (std::fgets(line.data(), static_cast<int>(line.size()), pipe.Get()) == nullptr) {
        line.front() = '\0'; // no answer reads as tag 0 unless the tool says that it failed
    }
    const int status = pipe.Close();
    if (status != 0) {
        OVS_ERR("Execute cmd /usr/bin/ovs-vsctlget port %s tag failed, err=%d", port.c_str(),
                ExitCode(status));
        return -1;
    }

    if (std::string_view(line.data()).substr(0, 2) == "[]") {
        OVS_INFO("%s without any vlan tag", port.c_str());
        return 0;
    }
    out->vlanId = static_cast<int>(std::strtoul(line.data(), nullptr, 10));
    return 1;
} catch (const std::exception&) {
    return -1;
}

int VlanManager::Set(const std::string& port, const std::string& id)
try {
    const std::string tag = Fit(std::string("tag=").append(TextOf(id)), kNameBuffer);
    if (VLIBCExecl(kSwitchTool, kExecOptions, "set", "port", port.c_str(), tag.c_str(), nullptr) !=
        0) {
        OVS_ERR("set %s's vlan tag failed, tag ID = %s", port.c_str(), id.c_str());
        return -1;
    }
    return 0;
} catch (const std::exception&) {
    return -1;
}

int VlanManager::Clear(const std::string& port)
{
    if (VLIBCExec(kSwitchTool, "clear", "port", port.c_str(), "tag", nullptr) != 0) {
        OVS_ERR("clear %s's vlan tag failed", port.c_str());
        return -1;
    }
    return 0;
}

int VlanManager::Create(const std::string& port, const std::string& id)
try {
    {
        const IfcfgLock lock;
        if (!lock) {
            return -1;
        }
        const std::string ifcfgPath = IfcfgPath(port, kNameBuffer);
        if (VLIBCFileSetKeyValue(ifcfgPath.c_str(), kKeyVlanId, id.c_str(), 0) < 0) {
            OVS_ERR("Add OVS_VLAN_ID key failed");
        }
    }

    // The file rules: the network script sets the tag again, should the switch refuse it now.
    if (Set(port, id) < 0) {
        OVS_ERR("Set %s's vlan failed", port.c_str());
    }
    return 0;
} catch (const std::exception&) {
    return -1;
}

int VlanManager::Remove(const std::string& port)
try {
    {
        const IfcfgLock lock;
        if (!lock) {
            return -1;
        }
        const std::string ifcfgPath = IfcfgPath(port, kNameBuffer);
        if (VLIBCFileRemoveKey(ifcfgPath.c_str(), kKeyVlanId) < 0) {
            OVS_ERR("Remove OVS_VLAN_ID key failed");
        }
    }

    if (Clear(port) < 0) {
        OVS_ERR("clear %s's vlan failed", port.c_str());
    }
    return 0;
} catch (const std::exception&) {
    return -1;
}

} // namespace VORN::OVS
