/**
 * The bridges of the switch with all that is drawn of them.
 */
#ifndef VORNOVSCTL_SHOW_SWITCHREADER_H
#define VORNOVSCTL_SHOW_SWITCHREADER_H

#include "hostmodel.h"

#include <support/switchdatabase.h>

#include <optional>
#include <string>
#include <vector>

namespace vornovsctl {

/** What the switch was asked. */
struct SwitchAnswer {
    std::optional<std::vector<Bridge>> bridges;
    std::string fault; /**< why there are none, in words */
};

/** Turns what the database says into what is drawn, in the order in which it is drawn. */
std::vector<Bridge> DrawnBridges(const std::vector<vornhost::SwitchBridge>& bridges);

/** Asks the switch's database; starts nothing, and does not wait long. */
SwitchAnswer AskSwitch();

/** @return the bridge that has a port of that name; null: none has. */
const Bridge* FindBridgeOfPort(const std::vector<Bridge>& bridges, const std::string& port);

} // namespace vornovsctl

#endif
