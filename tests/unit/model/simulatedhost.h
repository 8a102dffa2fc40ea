/**
 * A host behind the recording platform: its configuration files are real, its kernel and its switch
 * are a few maps. It does what the platform's contracts promise: bonds and VLANs are taken apart
 * with their addressing left to the first slave or the parent, and come back as they were; the
 * network program has on the switch what the files say.
 */
#ifndef VORNOVS_TESTS_UNIT_SIMULATEDHOST_H
#define VORNOVS_TESTS_UNIT_SIMULATEDHOST_H

#include "support/bondcalls.h"

namespace unit {

/** Folder of the configuration files. */
constexpr char kScripts[] = "/etc/sysconfig/network-scripts";

/** A file's name and content, for every file of the folder. */
using Files = std::map<std::string, std::string>;
Files ReadFiles();

/** The value of a key, or nothing. */
std::optional<std::string> KeyOf(const std::string& interface, const std::string& key);

/** What a host's kernel and switch have, and what its platform remembers. */
struct SimulatedState {
    struct Bridge {
        std::string tag;
        Names ports;
        friend bool operator==(const Bridge&, const Bridge&) = default;
    };
    struct LinuxBond {
        int mode;
        std::vector<std::string> slaves;
        friend bool operator==(const LinuxBond&, const LinuxBond&) = default;
    };
    struct LinuxVlan {
        std::string parent;
        int id;
        friend bool operator==(const LinuxVlan&, const LinuxVlan&) = default;
    };
    /** What was there before something was taken apart, and what was left then. */
    struct Memory {
        int mode;
        Files before;
        Files left;
    };

    Names cards;
    std::map<std::string, Bridge> bridges;
    std::map<std::string, LinuxBond> linuxBonds;
    std::map<std::string, LinuxVlan> linuxVlans;
    std::map<std::string, Memory> memories;
};

class SimulatedHost : public SimulatedState {
public:
    explicit SimulatedHost(harness::RecordingPlatform& platform);
    /** A host as another one was. */
    SimulatedHost(harness::RecordingPlatform& platform, const SimulatedState& state);

    /** Adds an interface; the rest of its file stands in `text`, one key a line. */
    void AddPort(const std::string& name, const std::string& text);
    void AddBond(const std::string& name, int mode, const std::vector<std::string>& slaves,
                 const std::string& text);
    void AddVlan(const std::string& parent, int id, const std::string& text);

    /**
     * From now on bonds and VLANs may come back otherwise than they went, or for the first time:
     * without this the test fails unless everything is as it was left.
     */
    void AllowChanges() { m_allowsChanges = true; }

    /** Becomes a host as another one is. */
    void Become(const SimulatedState& state);

private:
    std::optional<int> React(const std::string& call);
    std::optional<int> Exists(const std::string& path) const;
    std::optional<int> Act(const std::vector<std::string>& words);
    std::optional<int> RunSwitchTool(const std::vector<std::string>& words);
    void RunNetwork(const std::vector<std::string>& words);
    int SetBond(const std::vector<std::string>& words);
    int TakeBondApart(const std::string& name, const LinuxBond& bond);
    void BuildNewBond(const std::string& name, const LinuxBond& bond);
    int RemoveVlan(const std::string& name);
    int CreateVlan(const std::string& parent, int id);
    void TellPlatform();

    harness::RecordingPlatform& m_platform;
    bool m_allowsChanges = false;
};

} // namespace unit

#endif
