/**
 * A stop that a start is going to follow. Nothing is taken down meanwhile: what runs keeps running
 * until the start reconciles it with the files. If no start comes, a process of its own does so.
 */
#ifndef VORNHOST_RCNETWORK_HOLD_H
#define VORNHOST_RCNETWORK_HOLD_H

#include "plan.h"

#include <chrono>
#include <optional>
#include <string>

namespace vornhost {

/** Set in the environment of a stop that only holds. */
constexpr char kHoldMark[] = "VORNOVS_HOLD";

/** The hidden verb under which the holder runs. */
constexpr char kHolderVerb[] = "holder";

/** @return  how long a start may take to come, from the host's settings; 30 seconds without. */
std::chrono::seconds HoldTime();

/**
 * Leaves the token of a hold and starts the process that waits for its end. A hold that was there
 * before is replaced; what it held is held on.
 * @return  false when that was not possible (errno says why).
 */
bool BeginHold(const Request& request);

/** @return  whether a start is still to come. */
bool IsHeld();

/** Ends the hold of these interfaces, all of them when none is named. */
void EndHold(const std::set<std::string>& names);

/** @return  what the hold of that token holds; nullopt when it was ended or replaced. */
std::optional<Request> HeldBy(const std::string& token);

/** Sleeps as long as a start may take to come, or until the hold of that token was ended. */
void WaitForStart(const std::string& token, std::chrono::seconds time);

} // namespace vornhost

#endif
