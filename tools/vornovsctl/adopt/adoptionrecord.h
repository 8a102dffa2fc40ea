/**
 * What is kept of interfaces that were taken over: what it takes to give them back, and how far a
 * change of hands has come. It is written before each change, so that one that was cut short can be
 * finished or undone.
 */
#ifndef VORNOVSCTL_ADOPT_ADOPTIONRECORD_H
#define VORNOVSCTL_ADOPT_ADOPTIONRECORD_H

#include "adopt/hands.h"
#include "adopt/wish.h"

#include <map>
#include <optional>
#include <set>
#include <string>
#include <vector>

namespace vornovsctl {

constexpr char kAdoptedFolder[] = "/usr/vorn/etc/vornnetd/adopted";

enum class Phase { kAdopting, kAdopted, kReleasing };

/** A file that we write, and what it was. */
struct ChangedFile {
    std::string path;
    std::string text;
    unsigned mode = 0644;
    std::optional<SavedFile> before; /**< nothing: there was none */

    bool operator==(const ChangedFile&) const = default;
};

/** A client of ifupdown's that was ended. */
struct EndedClient {
    std::string pidFile;
    std::vector<std::string> words; /**< its command line; empty: it was not running */

    bool operator==(const EndedClient&) const = default;
};

struct AdoptedInterface {
    std::string name;
    Manager manager = Manager::kNobody;
    std::string origin;  /**< the file or the profile that says how the manager does it */
    std::string profile; /**< UUID of NetworkManager's */
    Phase phase = Phase::kAdopting;
    std::vector<ChangedFile> files; /**< of its own: configuration, lease */
    std::vector<EndedClient> clients;
    std::string stateLine;                       /**< of ifupdown, such as "eth0=eth0" */
    std::map<std::string, std::string> settings; /**< of the kernel, as KernelSettingsOf() */

    bool operator==(const AdoptedInterface&) const = default;
};

/** How a file keeps a manager away from interfaces. */
enum class Silencer { kInterfaces, kNetwork, kNetdev, kKeyfile, kCloud };

struct SilencingFile {
    Silencer kind = Silencer::kInterfaces;
    std::string path;
    std::string device; /**< of a file for a single device */
    std::optional<SavedFile> before;

    bool operator==(const SilencingFile&) const = default;
};

/** A unit whose start at boot was changed. */
struct ChangedUnit {
    std::string unit;
    bool enable = false;
    bool before = false;

    bool operator==(const ChangedUnit&) const = default;
};

struct AdoptionRecord {
    std::vector<AdoptedInterface> interfaces;
    std::vector<SilencingFile> silencers;
    std::vector<ChangedUnit> units;

    /** @return nothing: there is none. @throws std::runtime_error when it cannot be read. */
    static std::optional<AdoptionRecord> Load(const Hands& hands);
    void Save(Hands& hands) const;
    static void Forget(Hands& hands);

    const AdoptedInterface* Find(const std::string& name) const;
    AdoptedInterface* Find(const std::string& name);
    std::set<std::string> NamesIn(std::initializer_list<Phase> phases) const;

    bool operator==(const AdoptionRecord&) const = default;
};

} // namespace vornovsctl

#endif
