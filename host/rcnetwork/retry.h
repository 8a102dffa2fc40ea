/**
 * What the switch could not be made to carry: its addresses are on the plain interfaces, and a run
 * that belongs to nobody brings them to the switch once it works.
 */
#ifndef VORNHOST_RCNETWORK_RETRY_H
#define VORNHOST_RCNETWORK_RETRY_H

#include <set>
#include <string>

namespace vornhost {

/** The hidden verb under which it tries again. */
constexpr char kRetryVerb[] = "retry";

/**
 * Writes down how a run ended, and has somebody try again if something is left.
 * @param concerned      the interfaces that the run concerned; none: all of them.
 * @param withoutSwitch  those of them that should be on the switch and are not.
 */
void MindRetry(const std::set<std::string>& concerned, const std::set<std::string>& withoutSwitch);

/** @return  the interfaces that wait for the switch. */
std::set<std::string> WaitingForSwitch();

/**
 * Tries again until nothing waits any more: when daemons of the switch were started, and now and
 * then anyway. One such run at a time; another one returns at once.
 */
void RetryUntilDone();

} // namespace vornhost

#endif
