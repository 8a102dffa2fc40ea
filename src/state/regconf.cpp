#include <vornovs/vornovs.h>

#include "state/namefile.h"
#include "state/statefiles.h"
#include "system/log.h"

#include <vornplatform/core.h>

#include <exception>

namespace VORN::OVS {
namespace {

constexpr char kLogFile[] = "regconf.cpp";

} // namespace

OVSRegConf::OVSRegConf() = default;

OVSRegConf::~OVSRegConf() = default;

int OVSRegConf::LoadFromConfig()
try {
    if (CheckAndMkdir() < 0) {
        OVS_ERR("Failed to mkdir");
        return 0;
    }
    if (VLIBCFileExist(kRegistrationPath) == 0) {
        return 0;
    }
    if (!ReadNames(kRegistrationPath, m_names)) {
        OVS_ERR(" Open %s fails", kRegistrationPath);
        return -1;
    }
    return 0;
} catch (const std::exception&) {
    return -1;
}

int OVSRegConf::Register(const std::string& name)
try {
    if (m_names.contains(name)) {
        OVS_ERR("The %s has been registered before", name.c_str());
        return 1;
    }
    m_names.insert(name);
    return WriteToConfig() < 0 ? -1 : 0;
} catch (const std::exception&) {
    return -1;
}

int OVSRegConf::UnRegister(const std::string& name)
{
    if (m_names.erase(name) == 0) {
        OVS_ERR("The %s has not been registered before", name.c_str());
        return 2;
    }
    return WriteToConfig() < 0 ? -1 : 0;
}

int OVSRegConf::IsRegister(const std::string& name)
{
    return m_names.contains(name) ? 1 : -1;
}

int OVSRegConf::GetRegNames(std::set<std::string>& out)
try {
    std::set<std::string> merged = out;
    merged.insert(m_names.begin(), m_names.end());
    out.swap(merged);
    return static_cast<int>(out.size());
} catch (const std::exception&) {
    return -1;
}

int OVSRegConf::CheckAndMkdir() const
{
    if (MakeStateFolder()) {
        return 0;
    }
    OVS_ERR("Failed to mkdir [%s][%d]", kRegistrationPath, static_cast<int>(kStateFolderMode));
    return -1;
}

int OVSRegConf::WriteToConfig() const
try {
    if (CheckAndMkdir() < 0) {
        OVS_ERR("Failed to mkdir");
        return 0;
    }
    if (!WriteNames(kRegistrationPath, m_names)) {
        OVS_ERR(" Open %s fails", kRegistrationPath);
        return -1;
    }
    return 0;
} catch (const std::exception&) {
    return -1;
}

} // namespace VORN::OVS
