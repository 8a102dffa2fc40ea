/**
 * Both stores, for tests of what they share: how they save.
 */
#ifndef VORNOVS_TESTS_UNIT_SAVEDNAMES_H
#define VORNOVS_TESTS_UNIT_SAVEDNAMES_H

#include <vornovs/vornovs.h>

#include "support/support.h"

#include <filesystem>
#include <functional>
#include <ostream>

#include <sys/stat.h>

namespace unit {

struct Store {
    std::string name;
    std::string path;
    /** Loads, adds the name, saves. */
    std::function<int(const std::string&)> add;
    /** Loads, removes the name, saves. */
    std::function<int(const std::string&)> remove;
    std::string source;
    std::string addFails;
    std::string removeFails;

    [[nodiscard]] std::string FileName() const { return std::filesystem::path(path).filename(); }

    [[nodiscard]] LogLines Refused(const std::string& then) const
    {
        LogLines lines{harness::Err(source, " Open " + path + " fails")};
        if (!then.empty()) {
            lines.push_back(harness::Err(source, then));
        }
        return lines;
    }

    friend void PrintTo(const Store& store, std::ostream* out) { *out << store.name; }
};

inline int AddToRegistry(const std::string& name)
{
    VORN::OVS::OVSRegConf store;
    (void)store.LoadFromConfig();
    return store.Register(name);
}

inline int RemoveFromRegistry(const std::string& name)
{
    VORN::OVS::OVSRegConf store;
    (void)store.LoadFromConfig();
    return store.UnRegister(name);
}

inline Store Registry()
{
    return {"Registry", kRegistry, AddToRegistry, RemoveFromRegistry, "regconf.cpp", "", ""};
}

inline Store InterfaceList()
{
    return {
        "InterfaceList",
        kInterfaceList,
        [](const std::string& name) { return VORN::OVS::OVSIfsConf(kInterfaceList).Write(name); },
        [](const std::string& name) { return VORN::OVS::OVSIfsConf(kInterfaceList).Remove(name); },
        "ifsconf.cpp",
        std::string("Failed to write to config ") + kInterfaceList,
        "Failed to wrtie the config"};
}

class SavedNames : public testing::TestWithParam<Store> {};

inline struct stat StatusOf(const std::string& path)
{
    struct stat status {};
    EXPECT_EQ(lstat(path.c_str(), &status), 0) << path;
    return status;
}

} // namespace unit

#endif
