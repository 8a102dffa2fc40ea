/**
 * Tells the network outside again where an interface is: a switch outside passes nothing for a
 * while after a cable has come up, and the first time may have been lost on it.
 */
#ifndef VORNHOST_RCNETWORK_ANNOUNCER_H
#define VORNHOST_RCNETWORK_ANNOUNCER_H

#include <string>

namespace vornhost {

/** The hidden verb under which it goes on. */
constexpr char kAnnounceVerb[] = "announce";

/** Has somebody announce the interface for a while, without waiting. What fails is logged. */
void KeepAnnouncing(const std::string& interface);

/** Announces the interface now and then, for 15 seconds or as long as it is there. */
void AnnounceForAWhile(const std::string& interface);

} // namespace vornhost

#endif
