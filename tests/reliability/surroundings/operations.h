/**
 * What clients have the library do in bad surroundings, and what holds whatever becomes of it.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_SURROUNDINGS_OPERATIONS_H
#define VORNOVS_TESTS_RELIABILITY_SURROUNDINGS_OPERATIONS_H

#include "host/client.h"
#include "host/files.h"

#include <functional>
#include <map>
#include <set>
#include <string>
#include <vector>

namespace reliability {

using Files = std::map<std::string, std::string>;

constexpr char kRegistrations[] = "/usr/vorn/etc/vornovs/ovs_reg.conf";
constexpr char kInterfaces[] = "/usr/vorn/etc/vornovs/ovs_interface.conf";
constexpr char kIgnored[] = "/usr/vorn/etc/vornovs/ovs_ignore.conf";

/** A host with one interface, eth0, before anybody has registered. */
Files PlainHost();

/** The same on the switch: "keeper" is registered; eth1 was taken off; ovs_bond0 is a bond. */
Files HostOnSwitch();

/** One call of a client. */
struct Operation {
    std::string name;
    Files start;
    std::function<int()> run;
    std::set<int> documented; ///< results
    int whole;                ///< the result when nothing is wrong
};

/** Every kind of call that writes. */
const std::vector<Operation>& Operations();

/** The operation of that name. */
const Operation& OperationCalled(const std::string& name);

/** Makes the host's interfaces and tries each operation with nothing wrong. Once is enough. */
void LearnEnds();

/** What an operation leaves when nothing is wrong: the library's files by path. */
const Files& WholeEnd(const Operation& operation);

/** The library's files as they are: state, configuration and gateways. */
Files LibraryFiles();

/** What became of an operation. */
struct Outcome {
    int result;
    std::string findings; ///< of the client that ran it
    Files files;
    std::vector<std::string> log;
};

/**
 * Runs the operation where it is set up to run.
 * @param spoil  done in the client just before.
 */
Outcome Run(
    const Operation& operation, const std::function<void()>& spoil = [] {});

/** @return  whether everything was done. */
bool IsWhole(const Operation& operation, const Outcome& outcome);

/**
 * What holds however much fails: a documented result; every line of every file is a whole one that
 * belongs there; the address stands in some file; no temporary file is left; the lock is free; and
 * what was not done is told in the log.
 */
void ExpectSound(const Operation& operation, const Outcome& outcome);

} // namespace reliability

#endif
