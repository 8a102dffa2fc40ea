#include "fakelibrary.h"

#include <vornovs/vornovs.h>

#include <algorithm>
#include <array>
#include <csignal>
#include <fstream>
#include <sys/syscall.h>
#include <unistd.h>
#include <vornplatform/core.h>
#include <vornplatform/netsdk.h>
#include <vornplatform/sdk.h>

namespace unit {

FakeHost& Host()
{
    static FakeHost host;
    return host;
}

namespace {

std::optional<unsigned>& User()
{
    static std::optional<unsigned> user;
    return user;
}

int Act(const std::string& call)
{
    Host().calls.push_back(call);
    struct sigaction now {};
    (void)sigaction(SIGINT, nullptr, &now);
    Host().interruptible = now.sa_handler != SIG_IGN;
    return Host().act(Host());
}

std::string WithModes(std::string call, const std::map<std::string, std::string>& bondModes)
{
    for (const auto& [bond, mode] : bondModes) {
        call.append(" ").append(bond).append("=").append(mode);
    }
    return call;
}

std::string WithNames(std::string call, const std::vector<std::string>& names)
{
    for (const std::string& name : names) {
        call.append(" ").append(name);
    }
    return call;
}

void Fill(const std::string& name, const FakeBond& bond, VORNLINKAGGROPT& record)
{
    record = {};
    name.copy(record.szMaster, VORN_NAME_SIZE - 1);
    record.mode = bond.mode;
    for (const std::string& slave : bond.slaves) {
        slave.copy(record.rgszSlave[record.nSlave++], VORN_NAME_SIZE - 1);
    }
}

constexpr std::array kModes{"none",           "balance-rr",  "802.3ad",           "balance-xor",
                            "active-backup",  "balance-alb", "ovs-active-backup", "ovs-balance-slb",
                            "ovs-balance-tcp"};

} // namespace

void PlayUser(std::optional<unsigned> user)
{
    User() = user;
}

} // namespace unit

// The test's sandbox asks as well, before any test runs.
extern "C" uid_t geteuid() noexcept
{
    return unit::User().value_or(static_cast<unsigned>(syscall(SYS_geteuid)));
}

int VLIBCFileLockTimeByFile(const char* path, int mode, int seconds, int* handle)
{
    *handle = 7;
    unit::Host().calls.push_back(unit::WithNames(
        "VLIBCFileLockTimeByFile", {path, std::to_string(mode), std::to_string(seconds)}));
    return unit::Host().lockResult;
}

int VLIBCFileUnlockByFile(int handle)
{
    unit::Host().calls.push_back("VLIBCFileUnlockByFile " + std::to_string(handle));
    return 0;
}

int VORNNetLinkAggrOptSlsaveAdd(VORNLINKAGGROPT* opt, const char* slave)
{
    std::string(slave).copy(opt->rgszSlave[opt->nSlave++], VORN_NAME_SIZE - 1);
    return 0;
}

int VORNNetLinkAggrSet(const VORNLINKAGGROPT* opt)
{
    const std::vector<std::string> slaves(opt->rgszSlave, opt->rgszSlave + opt->nSlave);
    return unit::Act(unit::WithNames(
        "VORNNetLinkAggrSet " + std::to_string(opt->mode) + ' ' + opt->szMaster, slaves));
}

int VORNNetIFGetIPConfig(const char* name, VORNNETIPCONFIG* /*ipConfig*/)
{
    return unit::Host().devices.contains(name) ? 0 : -1;
}

int VLIBNetVlanCreate(const char* parent, int vlanId, const VORNNETIPCONFIG* /*ipConfig*/)
{
    return unit::Act(unit::WithNames("VLIBNetVlanCreate", {parent, std::to_string(vlanId)}));
}

namespace VORN::OVS {

using unit::Act;
using unit::Host;

int Register(const std::string& name, const std::map<std::string, std::string>& bondModes)
{
    return Act(unit::WithModes("Register " + name, bondModes));
}

int UnRegister(const std::string& name, const std::map<std::string, std::string>& bondModes)
{
    return Act(unit::WithModes("UnRegister " + name, bondModes));
}

void OVSSetDefault()
{
    (void)Act("OVSSetDefault");
}

bool IsDaemonAlive()
{
    return Host().switchRuns;
}

bool StartOVSDaemon()
{
    return Act("StartOVSDaemon") == 0;
}

bool StopOVSBaemon()
{
    return Act("StopOVSBaemon") == 0;
}

bool StartNetwork(const std::vector<std::string>& names)
{
    return Act(unit::WithNames("StartNetwork", names)) == 0;
}

bool StopNetwork(const std::vector<std::string>& names)
{
    return Act(unit::WithNames("StopNetwork", names)) == 0;
}

bool IsInterfaceExist(const std::string& name)
{
    return Host().devices.contains(name);
}

int CopyGatewayInfo(const char* from, const char* to)
{
    return Act(unit::WithNames("CopyGatewayInfo", {from, to}));
}

int RemoveGateWayInfo(const char* name)
{
    return Act(unit::WithNames("RemoveGateWayInfo", {name}));
}

int RemoveInterface(const std::string& bridge)
{
    return Act("RemoveInterface " + bridge);
}

int AddInterface(const std::string& name)
{
    return Act("AddInterface " + name);
}

int ListInterface(std::set<std::string>& bridges)
{
    if (!Host().clients || !Host().bridges) {
        return -1;
    }
    if (!Host().clients->empty()) {
        bridges = *Host().bridges;
    }
    return 0;
}

int AttachPort(const std::string& bridge, const std::string& port)
{
    return Act(unit::WithNames("AttachPort", {bridge, port}));
}

int DetachPort(const std::string& bridge, const std::string& port)
{
    return Act(unit::WithNames("DetachPort", {bridge, port}));
}

int OVSBondCreate(VORN_LINK_AGGR_MODE mode, const std::string& name,
                  std::vector<std::string>& slaves)
{
    return Act(unit::WithNames("OVSBondCreate " + std::to_string(mode) + ' ' + name, slaves));
}

int OVSBondRemove(const std::string& name, VORNLINKAGGROPT* out)
{
    const unit::FakeBond bond = Host().bonds[name];
    const int result = Act("OVSBondRemove " + name);
    unit::Fill(name, bond, *out);
    return result;
}

int OVSBondGet(const std::string& name, VORNLINKAGGROPT* out)
{
    const auto bond = Host().bonds.find(name);
    if (bond == Host().bonds.end()) {
        return -1;
    }
    unit::Fill(name, bond->second, *out);
    return 0;
}

int OVSBodChMode(VORN_LINK_AGGR_MODE mode, const std::string& name)
{
    return Act("OVSBodChMode " + std::to_string(mode) + ' ' + name);
}

int OVSVlanGet(const std::string& interface, _tag_VLIB_VLAN* out)
{
    const auto tag = Host().tags.find(interface);
    if (tag == Host().tags.end()) {
        return -1;
    }
    if (tag->second == 0) {
        return 0;
    }
    out->vlanId = tag->second;
    return 1;
}

int OVSVlanSet(const std::string& interface, const std::string& id)
{
    return Act(unit::WithNames("OVSVlanSet", {interface, id}));
}

int OVSVlanClear(const std::string& interface)
{
    return Act("OVSVlanClear " + interface);
}

int OVSVlanCreate(const std::string& interface, const std::string& id)
{
    return Act(unit::WithNames("OVSVlanCreate", {interface, id}));
}

int OVSVlanRemove(const std::string& interface)
{
    return Act("OVSVlanRemove " + interface);
}

VORN_LINK_AGGR_MODE StrToMode(const char* text)
{
    const auto* const found =
        std::find(unit::kModes.begin() + 1, unit::kModes.end(), std::string(text));
    return found == unit::kModes.end()
               ? VORN_LINK_AGGR_NONE
               : static_cast<VORN_LINK_AGGR_MODE>(found - unit::kModes.begin());
}

void ModeToStr(VORN_LINK_AGGR_MODE mode, std::string& out)
{
    out = mode > 0 && mode < static_cast<int>(unit::kModes.size())
              ? unit::kModes[static_cast<std::size_t>(mode)]
              : "unknown";
}

bool CheckModeSupport(VORN_LINK_AGGR_MODE mode)
{
    return mode >= VORN_LINK_AGGR_OVS_ACTIVE_BACKUP && mode <= VORN_LINK_AGGR_OVS_BALANCE_TCP;
}

int GetUniqueBondName(std::string& out)
{
    for (int number = 0; number < 10; ++number) {
        const std::string name = "ovs_bond" + std::to_string(number);
        if (!Host().devices.contains(name)) {
            out = name;
            break;
        }
    }
    return Host().freeNameResult;
}

OVSRegConf::OVSRegConf() = default;
OVSRegConf::~OVSRegConf() = default;

int OVSRegConf::LoadFromConfig()
{
    if (!Host().clients) {
        return -1;
    }
    m_names = *Host().clients;
    return 0;
}

int OVSRegConf::GetRegNames(std::set<std::string>& out)
{
    out.insert(m_names.begin(), m_names.end());
    return static_cast<int>(out.size());
}

OVSIfsConf::OVSIfsConf(std::string path) : m_path(std::move(path)) {}
OVSIfsConf::~OVSIfsConf() = default;

// Of this list the command line reads the file itself.
int OVSIfsConf::Remove(const std::string& name)
{
    Host().calls.push_back("OVSIfsConf::Remove " + name);
    std::ifstream file(m_path);
    for (std::string line; std::getline(file, line);) {
        m_names.insert(line);
    }
    m_names.erase(name);
    std::ofstream changed(m_path);
    for (const std::string& each : m_names) {
        changed << each << '\n';
    }
    return 0;
}

OVSManager::OVSManager() = default;
OVSManager::~OVSManager() = default;

int OVSManager::GetSwitchList(std::set<std::string>& bridges)
{
    if (!Host().switchRuns) {
        Host().calls.emplace_back("the services are started");
    }
    bridges = Host().bridges.value_or(std::set<std::string>());
    return Host().bridges ? 0 : -1;
}

VORN_LINK_AGGR_MODE BondManager::DefaultModeConvert(VORN_LINK_AGGR_MODE mode)
{
    constexpr std::array kOther{7, 8, 7, 6, 7, 4, 3, 2};
    return static_cast<VORN_LINK_AGGR_MODE>(kOther.at(static_cast<std::size_t>(mode - 1)));
}

} // namespace VORN::OVS
