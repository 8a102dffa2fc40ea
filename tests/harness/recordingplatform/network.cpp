// Interfaces, VLANs, links and bonds.
#include "recordingplatform/recorder.h"

#include <vornplatform/netsdk.h>
#include <vornplatform/sdk.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstring>

using harness::CallText;
using harness::Expect;
using harness::PlatformCall;
using harness::Recorder;
using harness::Text;

namespace {

constexpr int kInterfaceCapacity = 32;
constexpr int kConvertible = 2;
constexpr int kConflictSize = 32;
constexpr int kSpeed = 1000;

constexpr std::array<const char*, 9> kModeNames{
    "none",        "balance-rr",        "802.3ad",         "balance-xor",    "active-backup",
    "balance-alb", "ovs-active-backup", "ovs-balance-slb", "ovs-balance-tcp"};

void ExpectZeroed(const char* function, const void* record, std::size_t size)
{
    const auto* const bytes = static_cast<const unsigned char*>(record);
    if (std::any_of(bytes, bytes + size, [](unsigned char byte) { return byte != 0; })) {
        ADD_FAILURE() << function << ": the record is not zeroed";
    }
}

/** A record's name field; the test fails when it has no end. */
std::string Name(const char* function, const char (&field)[VORN_NAME_SIZE])
{
    const void* const end = std::memchr(field, '\0', VORN_NAME_SIZE);
    if (end == nullptr) {
        ADD_FAILURE() << function << ": a name field has no end";
        return {field, VORN_NAME_SIZE};
    }
    return field;
}

} // namespace

int VLIBNetGetInterfaceInfo(VLIBNETIFINFO* entries, int capacity, int selector)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBNetGetInterfaceInfo");
    Expect("VLIBNetGetInterfaceInfo", "capacity", capacity, kInterfaceCapacity);
    Expect("VLIBNetGetInterfaceInfo", "selector", selector, kConvertible);
    const std::optional<int> answer = recorder.Call("VLIBNetGetInterfaceInfo");
    if (answer && *answer <= 0) {
        return *answer;
    }

    // What the platform leaves unfilled is no name.
    std::memset(entries, 0xA5, sizeof(VLIBNETIFINFO) * static_cast<std::size_t>(capacity));
    int count = 0;
    for (const std::string& name : recorder.m_interfaces) {
        VLIBNETIFINFO& entry = entries[count];
        entry.szIfName[name.copy(entry.szIfName, VORN_NAME_SIZE - 1)] = '\0';
        ++count;
    }
    return answer.value_or(count);
}

int VLIBNetBridgeIfIsMaster(const char* name)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBNetBridgeIfIsMaster");
    return recorder
        .Call(CallText("VLIBNetBridgeIfIsMaster", {Text("VLIBNetBridgeIfIsMaster", name)}))
        .value_or(0);
}

int VLIBNetVlanGet(const char* name, _tag_VLIB_VLAN* vlan)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBNetVlanGet");
    const std::string interface = Text("VLIBNetVlanGet", name);
    const std::optional<int> answer = recorder.Call(CallText("VLIBNetVlanGet", {interface}));
    const auto found = recorder.m_vlans.find(interface);
    if (found != recorder.m_vlans.end()) {
        *vlan = found->second;
    }
    return answer.value_or(static_cast<int>(found != recorder.m_vlans.end()));
}

int VLIBNetVlanCreate(const char* parent, int vlanId, const VORNNETIPCONFIG* ipConfig)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBNetVlanCreate");
    std::array<char, sizeof(VORNNETIPCONFIG)> owner{};
    std::memcpy(owner.data(), ipConfig, owner.size() - 1);
    return recorder
        .Call(CallText("VLIBNetVlanCreate",
                       {Text("VLIBNetVlanCreate", parent), std::to_string(vlanId), owner.data()}))
        .value_or(0);
}

int VLIBNetVlanRemove(const char* name)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBNetVlanRemove");
    return recorder.Call(CallText("VLIBNetVlanRemove", {Text("VLIBNetVlanRemove", name)}))
        .value_or(0);
}

int VLIBNetOVSIfIsMaster(const char* name)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBNetOVSIfIsMaster");
    return recorder.Call(CallText("VLIBNetOVSIfIsMaster", {Text("VLIBNetOVSIfIsMaster", name)}))
        .value_or(1);
}

int VORNNetGetEthInfo(VORNNETETHINFO* info, const char* name)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VORNNetGetEthInfo");
    const std::string interface = Text("VORNNetGetEthInfo", name);
    const std::optional<int> answer = recorder.Call(CallText("VORNNetGetEthInfo", {interface}));

    std::memset(info, 0xA5, sizeof(*info));
    info->speed = kSpeed;
    const auto link = recorder.m_links.find(interface);
    if (link != recorder.m_links.end()) {
        const std::vector<int>& speeds = link->second.speeds;
        info->speed = speeds[std::min(link->second.asked, speeds.size() - 1)];
        ++link->second.asked;
    }
    return answer.value_or(0);
}

int VORNNetIFGetIPConfig(const char* name, VORNNETIPCONFIG* ipConfig)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VORNNetIFGetIPConfig");
    const std::string interface = Text("VORNNetIFGetIPConfig", name);
    const std::optional<int> answer = recorder.Call(CallText("VORNNetIFGetIPConfig", {interface}));
    ExpectZeroed("VORNNetIFGetIPConfig", ipConfig, sizeof(*ipConfig));

    // The configuration says whose it is, so that a call handed another one's shows.
    const std::string content = "ip-of-" + interface;
    std::memcpy(ipConfig, content.c_str(), std::min(content.size(), sizeof(*ipConfig) - 1));
    return answer.value_or(0);
}

int VORNNetLinkAggrGet(const char* name, VORNLINKAGGROPT* opt)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VORNNetLinkAggrGet");
    const std::string bond = Text("VORNNetLinkAggrGet", name);
    const std::optional<int> answer = recorder.Call(CallText("VORNNetLinkAggrGet", {bond}));
    ExpectZeroed("VORNNetLinkAggrGet", opt, sizeof(*opt));
    const auto found = recorder.m_bonds.find(bond);
    if (found != recorder.m_bonds.end()) {
        *opt = found->second;
    }
    return answer.value_or(found != recorder.m_bonds.end() ? 0 : -1);
}

int VORNNetLinkAggrSet(const VORNLINKAGGROPT* opt)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VORNNetLinkAggrSet");
    std::vector<std::string> words{Name("VORNNetLinkAggrSet", opt->szMaster),
                                   "mode=" + std::to_string(static_cast<int>(opt->mode))};
    for (int i = 0; i < std::min(opt->nSlave, VORN_LINK_AGGR_SLAVES); ++i) {
        words.push_back(Name("VORNNetLinkAggrSet", opt->rgszSlave[i]));
    }
    return recorder.Call(CallText("VORNNetLinkAggrSet", words)).value_or(0);
}

VORN_LINK_AGGR_MODE VORNNetLinkAggrStringToMode(const char* text)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VORNNetLinkAggrStringToMode");
    const std::string name = Text("VORNNetLinkAggrStringToMode", text);
    const std::optional<int> answer =
        recorder.Call(CallText("VORNNetLinkAggrStringToMode", {name}));
    const auto* const found = std::find(kModeNames.begin(), kModeNames.end(), name);
    const int mode =
        found == kModeNames.end() ? 0 : static_cast<int>(std::distance(kModeNames.begin(), found));
    return static_cast<VORN_LINK_AGGR_MODE>(answer.value_or(mode));
}

const char* VORNNetLinkAggrModeToString(VORN_LINK_AGGR_MODE mode)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VORNNetLinkAggrModeToString");
    const int value = static_cast<int>(mode);
    (void)recorder.Call(CallText("VORNNetLinkAggrModeToString", {std::to_string(value)}));
    const bool known = value >= 0 && value < static_cast<int>(kModeNames.size());
    return known ? kModeNames[static_cast<std::size_t>(value)] : "unknown";
}

int VORNNetLinkAggrOptSlsaveAdd(VORNLINKAGGROPT* opt, const char* slave)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VORNNetLinkAggrOptSlsaveAdd");
    const std::string name = Text("VORNNetLinkAggrOptSlsaveAdd", slave);
    const int result = recorder.Call(CallText("VORNNetLinkAggrOptSlsaveAdd", {name})).value_or(0);
    if (result >= 0 && opt->nSlave < VORN_LINK_AGGR_SLAVES) {
        char(&field)[VORN_NAME_SIZE] = opt->rgszSlave[opt->nSlave];
        field[name.copy(field, VORN_NAME_SIZE - 1)] = '\0';
        if (recorder.m_fillNamesWhole) {
            name.copy(field, VORN_NAME_SIZE);
        }
        ++opt->nSlave;
    }
    return result;
}

int VORNNetBondIPConflict(const char* bond, char* conflict, int size, unsigned int* out)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VORNNetBondIPConflict");
    Expect("VORNNetBondIPConflict", "size", size, kConflictSize);
    ExpectZeroed("VORNNetBondIPConflict", conflict, kConflictSize);
    const std::string name = Text("VORNNetBondIPConflict", bond);
    const std::optional<int> answer = recorder.Call(CallText("VORNNetBondIPConflict", {name}));
    const auto found = recorder.m_conflicts.find(name);
    if (found != recorder.m_conflicts.end()) {
        // Filled to its last byte a buffer has no end.
        found->second.copy(conflict, kConflictSize);
    }
    *out = 0x5A5A;
    return answer.value_or(static_cast<int>(found != recorder.m_conflicts.end()));
}
