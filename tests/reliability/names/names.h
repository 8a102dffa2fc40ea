/**
 * Names that clients could come with.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_NAMES_NAMES_H
#define VORNOVS_TESTS_RELIABILITY_NAMES_NAMES_H

#include <set>
#include <string>
#include <vector>

namespace reliability {

/** More than 500, each once, always the same. */
std::vector<std::string> Names();

/** Interfaces whose files a call with that name is meant to change. */
std::set<std::string> InterfacesOf(const std::string& name);

/** The name as it can be printed. */
std::string Printable(const std::string& name);

} // namespace reliability

#endif
