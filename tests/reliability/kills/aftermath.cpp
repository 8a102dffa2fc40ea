#include "kills/aftermath.h"

#include "kills/hostview.h"

#include <vornovs/vornovs.h>

#include <algorithm>
#include <chrono>
#include <filesystem>
#include <sstream>

#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

namespace reliability {

namespace {

namespace fs = std::filesystem;

using testing::IsEmpty;
using unit::SimulatedHost;

/** Every file of both folders. */
std::map<std::string, std::string> ReadAll()
{
    std::map<std::string, std::string> files;
    for (const std::string folder : {unit::kScripts, unit::kStateFolder}) {
        for (const std::string& name : unit::ListFolder(folder)) {
            files[folder + "/" + name] = unit::ReadFile(folder + "/" + name).value_or("");
        }
    }
    return files;
}

/** Whether an interface has what its file says: the network's start gives it to no other. */
bool IsLive(const SimulatedHost& host, const std::string& name)
{
    if (host.bridges.contains(name)) {
        return true;
    }
    const bool there = host.cards.contains(name) || host.linuxBonds.contains(name) ||
                       host.linuxVlans.contains(name);
    return there && !unit::KeyOf(name, "BRIDGE") && unit::KeyOf(name, "TYPE") != "OVS" &&
           unit::KeyOf(name, "DEVICE") == name && unit::KeyOf(name, "SLAVE") != "yes";
}

void ExpectReachable(const Scene& scene, const SimulatedHost& host)
{
    for (const std::string& setting : scene.Settings()) {
        std::vector<std::string> owners;
        for (const auto& [file, text] : unit::ReadFiles()) {
            const std::string name = file.substr(std::string("ifcfg-").size());
            if (text.find(setting + "\n") != std::string::npos && IsLive(host, name)) {
                owners.push_back(name);
            }
        }
        EXPECT_EQ(owners.size(), 1U) << setting << " is at " << testing::PrintToString(owners);
    }
}

/** Time passes: a repair takes what was written just now for a file of a living writer. */
void AgeFiles()
{
    for (const auto& [path, text] : ReadAll()) {
        fs::last_write_time(path, fs::file_time_type::clock::now() - std::chrono::minutes(1));
    }
}

void ExpectFree(const char* lock)
{
    const int descriptor = ::open(lock, O_RDWR | O_CREAT | O_CLOEXEC, 0600);
    EXPECT_EQ(::flock(descriptor, LOCK_EX | LOCK_NB), 0) << lock << " is held";
    (void)::close(descriptor);
}

void ExpectKept(const Registrations& registrations, const unit::Names& names)
{
    for (const std::string& name : registrations.before) {
        EXPECT_TRUE(names.contains(name) || !registrations.after.contains(name))
            << name << " is lost";
    }
    for (const std::string& name : names) {
        EXPECT_TRUE(registrations.before.contains(name) || registrations.after.contains(name))
            << name << " has come from nowhere";
    }
}

/** Interfaces are on the switch while somebody is registered: all that nobody took off. */
void ExpectOnSwitchOrPlain(const SimulatedHost& host, bool registered)
{
    const std::string ignored = unit::ReadFile(unit::kIgnoreList).value_or("");
    for (const std::string& card : host.cards) {
        const bool takenOff = ignored.find(card + "\n") != std::string::npos;
        const bool bridge = unit::ReadFile(unit::kIfcfg + ("ovs_" + card)).has_value();
        EXPECT_TRUE(bridge == registered || (registered && takenOff)) << card;
    }
    EXPECT_EQ(host.bridges.empty(), !registered);
}

} // namespace

unit::Names ReadRegistry()
{
    std::istringstream stream(unit::ReadFile(unit::kRegistry).value_or(""));
    unit::Names names;
    for (std::string line; std::getline(stream, line);) {
        names.insert(line);
    }
    return names;
}

void ExpectWholeFilesAndFreeLocks(const Scene& scene)
{
    ExpectFree("/tmp/ovs_config.lock");
    ExpectFree("/tmp/platform.lock");
    std::string all;
    for (const auto& [path, text] : ReadAll()) {
        EXPECT_TRUE(text.empty() || text.back() == '\n' || path.find(".new") != std::string::npos)
            << path << ": " << text;
        all += text;
    }
    for (const std::string& setting : scene.Settings()) {
        EXPECT_NE(all.find(setting + "\n"), std::string::npos) << setting << " is lost";
    }
}

void ExpectRepair(const Scene& scene, SharedHost& shared, const Registrations& registrations)
{
    AgeFiles();
    harness::RecordingPlatform platform;
    SimulatedHost host(platform, shared.Get());
    host.AllowChanges();
    const HostView view(host);

    std::string told;
    EXPECT_EQ(Ctl("repair", told), 0);
    EXPECT_EQ(Ctl("check", told), 0) << told;
    const unit::Names names = ReadRegistry();
    ExpectKept(registrations, names);
    ExpectOnSwitchOrPlain(host, !names.empty());
    ExpectReachable(scene, host);

    const auto files = ReadAll();
    std::string second;
    EXPECT_EQ(Ctl("repair", second), 0);
    EXPECT_EQ(second, "repair:\nEverything fits together.\n");
    EXPECT_EQ(ReadAll(), files);

    for (const std::string& name : names) {
        EXPECT_EQ(VORN::OVS::UnRegister(name, {}), 0);
    }
    EXPECT_THAT(host.bridges, IsEmpty());
    ExpectReachable(scene, host);
    EXPECT_EQ(Ctl("check", told), 0) << told;
    if (testing::Test::HasFailure()) {
        ADD_FAILURE() << told;
    }
}

} // namespace reliability
