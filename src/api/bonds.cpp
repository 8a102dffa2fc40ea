#include <vornovs/vornovs.h>

#include "api/configlock.h"
#include "system/log.h"

#include <exception>

namespace VORN::OVS {
namespace {

constexpr char kLogFile[] = "libvornovs.cpp";

/** @return whether the lock is held and a client is registered; if not, that has been logged. */
bool MayWork(const ConfigLock& lock)
{
    if (!lock) {
        return false;
    }
    if (!IsOVSRunning()) {
        OVS_ERR("OVS not running");
        return false;
    }
    return true;
}

} // namespace

int OVSBondCreate(VORN_LINK_AGGR_MODE mode, const std::string& name,
                  std::vector<std::string>& slaves)
{
    const ConfigLock lock;
    if (!MayWork(lock)) {
        return -1;
    }
    if (!BondManager::Create(mode, name, slaves, true)) {
        OVS_ERR("Fail to creat the bonding for %s", name.c_str());
        return -1;
    }
    return 0;
}

int OVSBondRemove(const std::string& name, VORNLINKAGGROPT* out)
{
    const ConfigLock lock;
    if (!MayWork(lock)) {
        return -1;
    }
    if (!BondManager::Remove(name, out, true)) {
        OVS_ERR("Fail to remove the bonding for %s", name.c_str());
        return -1;
    }
    return 0;
}

int OVSBondGet(const std::string& name, VORNLINKAGGROPT* out)
{
    const ConfigLock lock;
    if (!MayWork(lock)) {
        return -1;
    }
    if (!BondManager::Get(name, out)) {
        // The creation's text, here and below: log readers know it so.
        OVS_ERR("Fail to creat the bonding for %s", name.c_str());
        return -1;
    }
    return 0;
}

int OVSBodChMode(VORN_LINK_AGGR_MODE mode, const std::string& name)
{
    const ConfigLock lock;
    if (!MayWork(lock)) {
        return -1;
    }
    if (!BondManager::BondChMode(mode, name)) {
        OVS_ERR("Fail to creat the bonding for %s", name.c_str());
        return -1;
    }
    return 0;
}

VORN_LINK_AGGR_MODE StrToMode(const char* text)
try {
    return BondManager::StrToMode(text == nullptr ? "" : text);
} catch (const std::exception&) {
    return VORN_LINK_AGGR_NONE;
}

void ModeToStr(VORN_LINK_AGGR_MODE mode, std::string& out)
{
    BondManager::ModeToStr(mode, out);
}

bool CheckModeSupport(VORN_LINK_AGGR_MODE mode)
{
    return BondManager::CheckModeSupport(mode);
}

int GetUniqueBondName(std::string& out)
{
    return BondManager::GetUniqueName(out) ? 0 : -1;
}

} // namespace VORN::OVS
