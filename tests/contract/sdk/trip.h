/**
 * A host's configuration on its way to the switch and back, as the library and the network program
 * leave it. The network program is one that only writes down what it is called with.
 */
#ifndef VORNOVS_TESTS_CONTRACT_SDK_TRIP_H
#define VORNOVS_TESTS_CONTRACT_SDK_TRIP_H

#include <map>
#include <string>
#include <vector>

#include <vornplatform/records.h>

namespace contract {

/** The texts of the configuration files by interface. */
using Files = std::map<std::string, std::string>;

/** Empties the configuration, the gateway records and what is remembered. */
void StartWith(const Files& files, const std::string& gateways = "");

Files ReadFiles();
std::string ReadGateways();

/** One call of the network program: what it was called with and the files at that moment. */
struct NetworkRun {
    std::string arguments;
    Files files;

    bool operator==(const NetworkRun&) const = default;
};

/** Puts the network program there, with that exit status for each of its next calls. */
void InstallNetworkProgram(const std::vector<int>& statuses = {});

/** @return  its calls since it was put there. */
std::vector<NetworkRun> NetworkRuns();

/** @return  what it was called with since it was put there. */
std::vector<std::string> NetworkCalls();

/** Shows a live bond where the kernel shows its own, until it is hidden. */
void ShowBond(const std::string& name, const std::map<std::string, std::string>& options);
void HideBond(const std::string& name);

VORNLINKAGGROPT BondRecord(const std::string& name, int mode,
                           const std::vector<std::string>& slaves);

/** The gateway tool as the library calls it, for both families. */
void CopyGateways(const std::string& from, const std::string& to);
void DeleteGateways(const std::string& interface);

/** Files of an interface that becomes a bridge, and of the bridge that becomes one again. */
void ToBridge(const std::string& interface);
void FromBridge(const std::string& interface);

/** Files of bridges that become a bond of the switch, and of the bond that becomes them again. */
void ToSwitchBond(const std::string& bond, const std::vector<std::string>& slaves);
void FromSwitchBond(const std::string& bond, const std::vector<std::string>& slaves);

/** Sets or removes keys of one file as the library does. */
void EditFile(const std::string& interface, const std::map<std::string, std::string>& set,
              const std::vector<std::string>& remove = {});

} // namespace contract

#endif
