#include <vornovs/vornovs.h>

#include "state/ifcfg.h"
#include "system/handles.h"
#include "system/log.h"
#include "system/programs.h"

#include <vornplatform/core.h>
#include <vornplatform/netsdk.h>

#include <array>
#include <exception>

namespace VORN::OVS {
namespace {

constexpr char kLogFile[] = "bondmanager.cpp";

// One table for both directions, indexed by mode - 1.
constexpr std::array kConvertedModes = {
    VORN_LINK_AGGR_OVS_BALANCE_SLB, VORN_LINK_AGGR_OVS_BALANCE_TCP,
    VORN_LINK_AGGR_OVS_BALANCE_SLB, VORN_LINK_AGGR_OVS_ACTIVE_BACKUP,
    VORN_LINK_AGGR_OVS_BALANCE_SLB, VORN_LINK_AGGR_ACTIVE_BACKUP,
    VORN_LINK_AGGR_BALANCE_XOR,     VORN_LINK_AGGR_8023AD,
};

constexpr int kUniqueNames = 10;

} // namespace

VORN_LINK_AGGR_MODE BondManager::StrToMode(const std::string& text)
{
    return VORNNetLinkAggrStringToMode(text.c_str());
}

void BondManager::ModeToStr(VORN_LINK_AGGR_MODE mode, std::string& out)
try {
    out = VORNNetLinkAggrModeToString(mode);
} catch (const std::exception&) {
    out.clear();
}

void BondManager::ModeToBondOPT(VORN_LINK_AGGR_MODE mode, std::string& out)
try {
    // The quotes are part of the value: the line format adds none.
    switch (mode) {
    case VORN_LINK_AGGR_OVS_ACTIVE_BACKUP:
        out = R"("bond_mode=active-backup lacp=off")";
        break;
    case VORN_LINK_AGGR_OVS_BALANCE_SLB:
        out = R"("bond_mode=balance-slb lacp=off")";
        break;
    case VORN_LINK_AGGR_OVS_BALANCE_TCP:
        out = R"("bond_mode=balance-tcp lacp=active")";
        break;
    default:
        out.clear();
        break;
    }
} catch (const std::exception&) {
    out.clear();
}

bool BondManager::CheckModeSupport(VORN_LINK_AGGR_MODE mode)
{
    return mode >= VORN_LINK_AGGR_OVS_ACTIVE_BACKUP && mode <= VORN_LINK_AGGR_OVS_BALANCE_TCP;
}

VORN_LINK_AGGR_MODE BondManager::DefaultModeConvert(VORN_LINK_AGGR_MODE mode)
{
    // Unsigned: 0 and everything negative land beyond the table's end.
    const std::size_t index = static_cast<unsigned int>(mode) - 1U;
    return index < kConvertedModes.size() ? kConvertedModes[index] : VORN_LINK_AGGR_NONE;
}

bool BondManager::Get(const std::string& name, VORNLINKAGGROPT* out)
{
    if (VORNNetLinkAggrGet(name.c_str(), out) < 0) {
        OVS_ERR("Failed to get the OVS bonding of %s", name.c_str());
        return false;
    }
    return true;
}

bool BondManager::BondChMode(VORN_LINK_AGGR_MODE mode, const std::string& name)
try {
    const std::string ifcfgPath = IfcfgPath(name);

    SzHash update;
    if (!update) {
        OVS_ERR("Failed to alloc the hash pshBondUpdate");
        return false;
    }
    std::string text;
    ModeToStr(mode, text);
    update.Set(kKeyBondMode, text.c_str());
    ModeToBondOPT(mode, text);
    update.Set(kKeyBondingOpts, text.c_str());
    if (VLIBCFileSetKeys(ifcfgPath.c_str(), update.Get(), nullptr, kLineFormat) < 0) {
        OVS_ERR("Failed to set the key-value to %s", ifcfgPath.c_str());
        return false;
    }

    if (VLIBCExecl(kNetworkScript, kExecOptions, "set-ovs-bond", name.c_str(), nullptr) != 0) {
        OVS_ERR("Failed to change the OVS bonding mode");
    }
    return true;
} catch (const std::exception&) {
    return false;
}

bool BondManager::GetUniqueName(std::string& out)
{
    for (int number = 0; number < kUniqueNames; ++number) {
        // Short enough to need no memory of its own.
        const std::string candidate = {
            'o', 'v', 's', '_', 'b', 'o', 'n', 'd', static_cast<char>('0' + number)};
        if (!IsInterfaceExist(candidate)) {
            out = candidate;
            break;
        }
    }
    return true; // also with every name in use: the output then shows it, by being what it was
}

} // namespace VORN::OVS
