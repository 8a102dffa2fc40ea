/**
 * Every entry point that takes a name, with a name in every place where it takes one.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_NAMES_CALLS_H
#define VORNOVS_TESTS_RELIABILITY_NAMES_CALLS_H

#include <functional>
#include <set>
#include <string>
#include <vector>

namespace reliability {

struct Call {
    const char* name;
    std::function<int(const std::string&)> run;
    std::set<int> documented; ///< results; none: any
};

/** In an order in which what one makes another one removes. */
const std::vector<Call>& Calls();

} // namespace reliability

#endif
