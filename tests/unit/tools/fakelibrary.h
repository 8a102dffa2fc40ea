/**
 * A library that plays a host: the exported functions that vornovsctl uses, and what it reads of
 * the switch and the kernel by itself, on a state that the test sets.
 */
#ifndef VORNOVS_TESTS_UNIT_TOOLS_FAKELIBRARY_H
#define VORNOVS_TESTS_UNIT_TOOLS_FAKELIBRARY_H

#include <functional>
#include <map>
#include <optional>
#include <set>
#include <string>
#include <support/netlink.h>
#include <vector>
#include <vornplatform/records.h>

namespace unit {

struct FakeBond {
    VORN_LINK_AGGR_MODE mode = VORN_LINK_AGGR_NONE;
    std::vector<std::string> slaves;
};

struct FakeHost {
    std::optional<std::set<std::string>> clients = std::set<std::string>(); /**< none: unreadable */
    bool switchRuns = false;
    std::optional<std::set<std::string>> bridges = std::set<std::string>(); /**< none: unreadable */
    std::set<std::string> devices;
    std::map<std::string, FakeBond> bonds;
    std::map<std::string, int> tags; /**< of the switch's ports; 0: no tag */
    int freeNameResult = 0;
    int lockResult = 0;

    /** What the bridges carry: ports by bridge. The database does not answer without it. */
    std::optional<std::map<std::string, std::set<std::string>>> ports;
    std::set<std::string> wires;       /**< those of the ports that the network program made */
    std::optional<std::string> answer; /**< what the database answers instead */

    std::vector<vornhost::Link> links;
    std::optional<std::vector<vornhost::Address>> addresses = std::vector<vornhost::Address>();
    std::optional<std::vector<vornhost::Route>> routes = std::vector<vornhost::Route>();

    /** What a call that changes something does to the host, and what it answers. */
    std::function<int(FakeHost&)> act = [](FakeHost&) { return 0; };

    /** What was asked of the library that changes something, or would start something. */
    std::vector<std::string> calls;
    bool interruptible = true; /**< whether SIGINT would have ended the last of these calls */
};

/** The host of the running test. */
FakeHost& Host();

/** Plays that another user runs the program; nothing: the one who does. */
void PlayUser(std::optional<unsigned> user);

} // namespace unit

#endif
