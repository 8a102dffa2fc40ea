/**
 * What holds after a client was killed, and what a repair makes of it.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_AFTERMATH_H
#define VORNOVS_TESTS_RELIABILITY_AFTERMATH_H

#include "faults/scene.h"
#include "support/sharedhost.h"

namespace reliability {

/** Who was registered before a call, and who is after one that nobody ended. */
struct Registrations {
    unit::Names before;
    unit::Names after;
};

/** The registered names as they stand in the file. */
unit::Names ReadRegistry();

/** The locks are free, and every file is whole. */
void ExpectWholeFilesAndFreeLocks(const Scene& scene);

/**
 * A repair ends in a whole state in which every address is at one live interface, a second one
 * changes nothing, and the clients' withdrawal brings the host back to plain networking.
 */
void ExpectRepair(const Scene& scene, SharedHost& shared, const Registrations& registrations);

} // namespace reliability

#endif
