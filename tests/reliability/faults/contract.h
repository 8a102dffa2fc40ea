/**
 * What the platform's functions may answer, and the words that each failure has in the log.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_CONTRACT_H
#define VORNOVS_TESTS_RELIABILITY_CONTRACT_H

#include "faults/ways.h"

namespace reliability {

/** A write() that takes a single byte. */
constexpr int kShortWrite = -1;

/** The rows; the first one that fits a call counts, and a call without one cannot fail. */
const std::vector<Row>& Contract();

} // namespace reliability

#endif
