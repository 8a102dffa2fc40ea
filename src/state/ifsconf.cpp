#include <vornovs/vornovs.h>

#include "state/namefile.h"
#include "system/log.h"

#include <vornplatform/core.h>

#include <exception>
#include <utility>

namespace VORN::OVS {
namespace {

constexpr char kLogFile[] = "ifsconf.cpp";

} // namespace

OVSIfsConf::OVSIfsConf(std::string path) : m_path(std::move(path))
{
    if (LoadFromConfig() < 0) {
        OVS_ERR("Read interface config fail");
    }
}

OVSIfsConf::~OVSIfsConf() = default;

int OVSIfsConf::LoadFromConfig()
try {
    if (CheckAndMkdir() < 0) {
        OVS_ERR("Failed to mkdir");
        return 0;
    }
    if (VLIBCFileExist(m_path.c_str()) == 0) {
        return 0;
    }
    if (!ReadNames(m_path, m_names)) {
        OVS_ERR(" Open %s fails", m_path.c_str());
        return -1;
    }
    return 0;
} catch (const std::exception&) {
    return -1;
}

int OVSIfsConf::Write(const std::string& name)
try {
    if (m_names.contains(name)) {
        OVS_ERR("The %s has exist", name.c_str());
        return -1;
    }
    m_names.insert(name);
    if (WriteToConfig(m_names) < 0) {
        OVS_ERR("Failed to write to config %s", m_path.c_str());
        return -1;
    }
    return 0;
} catch (const std::exception&) {
    return -1;
}

int OVSIfsConf::Remove(const std::string& name)
{
    if (m_names.erase(name) == 0) {
        OVS_ERR("The %s has not been used before", name.c_str());
        return -1;
    }
    if (WriteToConfig(m_names) < 0) {
        OVS_ERR("Failed to wrtie the config");
        return -1;
    }
    return 0;
}

int OVSIfsConf::WriteToConfig(const std::set<std::string>& names) const
try {
    if (CheckAndMkdir() < 0) {
        OVS_ERR("Failed to mkdir");
        return 0;
    }
    if (!WriteNames(m_path, names)) {
        OVS_ERR(" Open %s fails", m_path.c_str());
        return -1;
    }
    return 0;
} catch (const std::exception&) {
    return -1;
}

int OVSIfsConf::CheckAndMkdir() const
{
    if (MakeStateFolder()) {
        return 0;
    }
    OVS_ERR("Failed to mkdir [%s][%d]", m_path.c_str(), static_cast<int>(kStateFolderMode));
    return -1;
}

} // namespace VORN::OVS
