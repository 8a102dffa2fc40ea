/**
 * A call of the library on a host in some situation, and what it may answer.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_SCENARIO_H
#define VORNOVS_TESTS_RELIABILITY_SCENARIO_H

#include "faults/ways.h"
#include "model/simulatedhost.h"

#include <functional>
#include <ostream>

namespace reliability {

enum class Situation {
    kPlain,    ///< Two ports, one with a VLAN, and a bond; nobody is registered.
    kOnSwitch, ///< The same on the switch; one client is registered and has a port there.
    kShared,   ///< Two clients are registered.
    kTakenOff, ///< A port has been taken off the switch.
};

/** The result of a failure is one of those documented; which one depends on more. */
constexpr int kDepends = 1000;

/** What a call answers when something fails that it cannot do without. */
struct Fatal {
    std::string point; ///< Its first words, or a path that any operation fails on.
    int result;
};

struct Scenario {
    std::string name;
    Situation situation;
    std::function<int()> run;
    int success;
    /** What it may answer besides, whatever fails. */
    std::vector<int> failures = {};
    /** What it answers when these fail; whatever else fails, it succeeds. */
    std::vector<Fatal> fatal = {};
    /** Answers of the platform from the beginning. */
    std::vector<std::pair<std::string, int>> answers = {};
    /** What these calls say when they fail here. */
    std::vector<Row> own = {};
    /** A failure may leave the network stopped: that is what the call documents. */
    bool mayStayStopped = false;
    /** A failure that no call of the platform or of the system explains is not logged. */
    bool silent = false;

    friend void PrintTo(const Scenario& scenario, std::ostream* out) { *out << scenario.name; }
};

/** Registrations, interfaces, ports, bonds and tags: what clients call. */
std::vector<Scenario> EntryPoints();
/** Services, network, gateways, stores and hook. */
std::vector<Scenario> Helpers();
/** The steps of the conversions, of bonds and of tags. */
std::vector<Scenario> Steps();

// Names that fit a string without an allocation, which would be the test's own.
inline const std::string kClient = "client";
inline const std::string kOther = "other";
inline const std::string kBond = "ovs_bond0";
inline const std::string kPort = "tap0";

constexpr char kFailsToLock[] = "VLIBCFileLockTimeByFile";
constexpr char kFailsToRead[] = "open-read /usr/vorn/etc/vornovs/ovs_reg.conf";
constexpr char kFailsToWrite[] = "/usr/vorn/etc/vornovs/ovs_reg.conf";

inline int AsInt(bool result)
{
    return result ? 1 : 0;
}

} // namespace reliability

#endif
