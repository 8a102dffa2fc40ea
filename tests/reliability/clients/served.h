/**
 * What every client of the platform is owed.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_CLIENTS_SERVED_H
#define VORNOVS_TESTS_RELIABILITY_CLIENTS_SERVED_H

#include "host/client.h"

namespace reliability {

/** The status of every program that each function starts is the right one. */
void ExpectStatuses(Findings& findings);

/** What programs print arrives whole, however much it is. */
void ExpectOutput(Findings& findings);

/** A program gets nothing of the client's: environment, descriptors, signals, folder, limits. */
void ExpectOwnSurroundings(Findings& findings);

/** Services, the lock and a registration beside another client's. */
void ExpectLibrary(Findings& findings);

/** All of these. */
void ExpectServed(Findings& findings);

/** Without a descriptor left: each function's documented failure, and nothing is changed. */
void ExpectRefused(Findings& findings);

} // namespace reliability

#endif
