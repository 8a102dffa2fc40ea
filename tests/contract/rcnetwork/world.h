/**
 * A host on paper: a folder with its configuration files and "world.json", which holds what the
 * kernel, the switch and the gateway store know.
 */
#ifndef VORNOVS_TESTS_CONTRACT_RCNETWORK_WORLD_H
#define VORNOVS_TESTS_CONTRACT_RCNETWORK_WORLD_H

#include "rcnetwork/plan.h"

#include <map>
#include <string>
#include <vector>

#include <nlohmann/json_fwd.hpp>

namespace contract {

struct World {
    vornhost::Inputs inputs;
    std::vector<vornhost::Remark> remarks; ///< What the parser said of the files.
};

/** Reads such a folder; throws what goes wrong. */
World ReadWorld(const std::string& folder);

/** The same of what "world.json" says and of the texts of the files by interface. */
World ReadWorld(const nlohmann::json& json, const std::map<std::string, std::string>& files);

/** The plan as "rc.network --dry-run" prints it, and below it what is said. */
std::string Describe(const vornhost::Plan& plan, const std::vector<vornhost::Remark>& remarks);

/** @return  the file's text; throws when there is no such file. */
std::string ReadText(const std::string& path);

} // namespace contract

#endif
