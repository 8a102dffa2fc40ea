/**
 * The calls that build a bond on the switch and take it apart.
 */
#ifndef VORNOVS_TESTS_UNIT_BONDCALLS_H
#define VORNOVS_TESTS_UNIT_BONDCALLS_H

#include "support/support.h"

namespace unit {

struct SwitchBond {
    std::string name;
    int mode = 6;
    std::vector<std::string> slaves;
};

/** Path of an interface's configuration file. */
std::string FileOf(const std::string& interface);

/** The mode's name as the recording platform gives it: of 6, 7 and 8. */
std::string SwitchModeName(int mode);

/** Has the kernel know the interfaces. */
void MakeLive(harness::RecordingPlatform& platform, const std::vector<std::string>& interfaces);

/** Gives the bond a file. */
void RecordBond(harness::RecordingPlatform& platform, const SwitchBond& bond);

/** The tests of a new bond's parameters, all of which pass. */
Calls BondAccepted(const SwitchBond& bond);

/** The edits of the files of a new bond, its slaves and their bridges. */
Calls BondWritten(const SwitchBond& bond);

/** A bond built, with the network stopped and started around it. */
Calls BondBuilt(const SwitchBond& bond);

/** The reading of a bond's file. */
Calls BondRead(const SwitchBond& bond);

/** The edits of the files of a bond that goes, its slaves and their bridges. */
Calls BondErased(const SwitchBond& bond);

/** A bond taken apart, with the network stopped and started around it. */
Calls BondDissolved(const SwitchBond& bond);

} // namespace unit

#endif
