/**
 * Whether the addresses that the files ask for answer.
 */
#ifndef VORNHOST_RCNETWORK_ONLINE_H
#define VORNHOST_RCNETWORK_ONLINE_H

#include "livestate.h"

#include "support/interfacefile.h"

#include <map>
#include <string>
#include <vector>

namespace vornhost {

constexpr char kOnlineVerb[] = "wait-online";

/** One thing that a file asks for and that is not there yet. */
struct NotOnline {
    std::string what;       ///< "eth0: 192.0.2.1", for the log
    bool isNotOurs = false; ///< It waits for a cable, a router or a stranger with the same address.

    bool operator==(const NotOnline&) const = default;
};

/** What the files ask for, and how much of it answers. */
struct Online {
    unsigned answering = 0;
    std::vector<NotOnline> missing;
};

/** Compares the files with what the kernel has; only interfaces that come up at boot count. */
Online LookWhatAnswers(const std::map<std::string, InterfaceFile>& files, const LiveState& live);

/**
 * Waits until all of it answers. What depends on others is given up after a while when something
 * else answers.
 * @return  false when the limit of the host's settings passed before; what is missing was said.
 */
bool WaitUntilOnline();

} // namespace vornhost

#endif
