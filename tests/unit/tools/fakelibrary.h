/**
 * A library that plays a host: the exported functions that vornovsctl uses, on a state that the
 * test sets.
 */
#ifndef VORNOVS_TESTS_UNIT_TOOLS_FAKELIBRARY_H
#define VORNOVS_TESTS_UNIT_TOOLS_FAKELIBRARY_H

#include <functional>
#include <map>
#include <optional>
#include <set>
#include <string>
#include <vector>

namespace unit {

struct FakeHost {
    std::optional<std::set<std::string>> clients = std::set<std::string>(); /**< none: unreadable */
    bool switchRuns = false;
    std::optional<std::set<std::string>> bridges = std::set<std::string>(); /**< none: unreadable */
    std::set<std::string> devices;
    unsigned user = 0;

    /** What Register() and UnRegister() do to the host, and what they answer. */
    std::function<int(FakeHost&)> act = [](FakeHost&) { return 0; };

    /** What was asked of the library that changes something, or would start something. */
    std::vector<std::string> calls;
    bool interruptible = true; /**< whether SIGINT would have ended the last of these calls */
};

/** The host of the running test. */
FakeHost& Host();

} // namespace unit

#endif
