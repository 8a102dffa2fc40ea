/**
 * The commands that people have run when an interface comes up, as far as they can be said without
 * a command.
 */
#ifndef VORNOVSCTL_ADOPT_UPCOMMANDS_H
#define VORNOVSCTL_ADOPT_UPCOMMANDS_H

#include "adopt/wish.h"

#include <string>

namespace vornovsctl {

/** Takes over what a command does. @return whether that is understood. */
bool TakeUpCommand(const std::string& command, Wish& wish);

/** Whether a command only takes back what comes and goes with the interface anyway. */
bool IsMereDownCommand(const std::string& command);

} // namespace vornovsctl

#endif
