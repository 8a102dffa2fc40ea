/**
 * A host in a sandbox: the real libraries and the gateway tool; a network program, a switch's tool
 * and services that do as the tests say.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_HOST_HOST_H
#define VORNOVS_TESTS_RELIABILITY_HOST_HOST_H

#include "host/files.h"

#include <cstdint>
#include <map>
#include <string>
#include <vector>

namespace reliability {

/** A program that does what its arguments say, see fakeprogram.cpp. */
constexpr char kActor[] = "/run/act";
constexpr char kNetworkScript[] = "/etc/rc.network";
constexpr char kSwitchTool[] = "/usr/bin/ovs-vsctl";
constexpr char kLockPath[] = "/tmp/ovs_config.lock";

/** What every program that the library starts has for its environment. */
constexpr char kProgramEnvironment[] = "PATH=/usr/sbin:/usr/bin:/sbin:/bin\n"
                                       "LC_ALL=C\n"
                                       "OVS_CTL_TIMEOUT=10\n"
                                       "VORNOVS_HOLD=1\n";

/** Puts the programs there, and services that count as running. Once in a process is enough. */
void InstallPrograms();

/** Makes wired interfaces that the kernel shows. */
void MakeInterfaces(const std::vector<std::string>& names);

/** The host's files anew: these, by path, and nothing of the library's own. */
void StartWith(const std::map<std::string, std::string>& files);

/** Has a program of the host do as fakeprogram.cpp tells. @param words  empty: as usual. */
void Order(const std::string& program, const std::string& words);

/** @return  the programs of the host that ran since it was asked last: path and arguments. */
std::vector<std::vector<std::string>> TakeCalls();

/** @return  the same, each as one line with its words between blanks. */
std::vector<std::string> TakeCallLines();

/** @return  whether a process of its own gets the library's lock at once. */
bool LockIsFree();

} // namespace reliability

#endif
