#include "fakelibrary.h"

#include <vornovs/vornovs.h>

#include <csignal>
#include <unistd.h>

namespace unit {

FakeHost& Host()
{
    static FakeHost host;
    return host;
}

namespace {

int Act(const std::string& what, const std::map<std::string, std::string>& bondModes)
{
    std::string call = what;
    for (const auto& [bond, mode] : bondModes) {
        call.append(" ").append(bond).append("=").append(mode);
    }
    Host().calls.push_back(call);
    struct sigaction now {};
    (void)sigaction(SIGINT, nullptr, &now);
    Host().interruptible = now.sa_handler != SIG_IGN;
    return Host().act(Host());
}

} // namespace
} // namespace unit

extern "C" uid_t geteuid() noexcept
{
    return unit::Host().user;
}

namespace VORN::OVS {

int Register(const std::string& name, const std::map<std::string, std::string>& bondModes)
{
    return unit::Act("Register " + name, bondModes);
}

int UnRegister(const std::string& name, const std::map<std::string, std::string>& bondModes)
{
    return unit::Act("UnRegister " + name, bondModes);
}

void OVSSetDefault()
{
    (void)unit::Act("OVSSetDefault", {});
}

bool IsDaemonAlive()
{
    return unit::Host().switchRuns;
}

bool IsInterfaceExist(const std::string& name)
{
    return unit::Host().devices.contains(name);
}

OVSRegConf::OVSRegConf() = default;
OVSRegConf::~OVSRegConf() = default;

int OVSRegConf::LoadFromConfig()
{
    if (!unit::Host().clients) {
        return -1;
    }
    m_names = *unit::Host().clients;
    return 0;
}

int OVSRegConf::GetRegNames(std::set<std::string>& out)
{
    out.insert(m_names.begin(), m_names.end());
    return static_cast<int>(out.size());
}

OVSManager::OVSManager() = default;
OVSManager::~OVSManager() = default;

int OVSManager::GetSwitchList(std::set<std::string>& bridges)
{
    if (!unit::Host().switchRuns) {
        unit::Host().calls.emplace_back("the services are started");
    }
    bridges = unit::Host().bridges.value_or(std::set<std::string>());
    return unit::Host().bridges ? 0 : -1;
}

VORN_LINK_AGGR_MODE BondManager::StrToMode(const std::string& text)
{
    if (text == "active-backup") {
        return VORN_LINK_AGGR_ACTIVE_BACKUP;
    }
    return text == "ovs-balance-tcp" ? VORN_LINK_AGGR_OVS_BALANCE_TCP : VORN_LINK_AGGR_NONE;
}

bool BondManager::CheckModeSupport(VORN_LINK_AGGR_MODE mode)
{
    return mode >= VORN_LINK_AGGR_OVS_ACTIVE_BACKUP;
}

} // namespace VORN::OVS
