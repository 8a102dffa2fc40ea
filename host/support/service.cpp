#include "service.h"

#include "process.h"
#include "servicemanager.h"

#include <algorithm>

#include <unistd.h>

namespace vornhost {
namespace {

bool RunScript(const std::string& script, const std::string& verb,
               std::chrono::milliseconds deadline, std::string& error)
{
    ProcessOptions options;
    options.deadline = deadline;
    options.environment = {"PATH=/usr/sbin:/usr/bin:/sbin:/bin", "LC_ALL=C", kScriptMark};
    const ProcessResult result = RunProcess({script, verb}, options);
    if (!result.Succeeded()) {
        error = result.timedOut ? "did not end in time" : result.errors;
    }
    return result.Succeeded();
}

/** Stops what runs, whoever has started it: a daemon that is not the unit's is in its way too. */
bool Stop(const std::string& script, const std::string& unit, std::chrono::milliseconds deadline,
          std::string& error)
{
    const auto end = std::chrono::steady_clock::now() + deadline;
    if (!StopUnit(unit, deadline, &error)) {
        return false;
    }
    const auto left = std::chrono::duration_cast<std::chrono::milliseconds>(
        end - std::chrono::steady_clock::now());
    return ::access(script.c_str(), X_OK) != 0 ||
           RunScript(script, "stop", std::max(left, std::chrono::milliseconds(1)), error);
}

} // namespace

bool RunService(const std::string& name, const std::string& verb,
                std::chrono::milliseconds deadline, std::string& error)
{
    const std::string script = kServiceScripts + name;
    const std::string unit = name + ".service";
    if (!SystemdRuns() || !UnitExists(unit).value_or(false)) {
        return RunScript(script, verb, deadline, error);
    }
    if (verb == "stop") {
        return Stop(script, unit, deadline, error);
    }
    if (verb == "restart" && UnitIsActive(unit).value_or(false)) {
        return RestartUnit(unit, deadline, &error);
    }
    return (verb != "restart" || Stop(script, unit, deadline, error)) &&
           StartUnit(unit, deadline, &error);
}

} // namespace vornhost
