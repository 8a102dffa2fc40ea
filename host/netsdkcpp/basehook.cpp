#include "hookfolder.h"

#include "core/guard.h"
#include "core/program.h"

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <string>
#include <utility>
#include <vector>

#include <vornplatform/hook.h>

namespace vornnetsdk::hook {

namespace {

using vornhost::Guarded;
using vornhost::HookProgram;

/** A conversion waits for its hooks, so a hung one gets no longer. */
constexpr std::chrono::milliseconds kHookDeadline{30000};

} // namespace

struct BaseHook::State {
    std::string category;
    std::string name;
    std::vector<std::pair<std::string, std::string>> variables;
};

namespace {

/** @return whether it can stand before the "=" in an environment. */
bool IsVariable(const std::string& key)
{
    return !key.empty() && key.find_first_of(std::string("=\0", 2)) == std::string::npos;
}

/** A hook's programs are no part of the conversion: the mark of its own programs is not theirs. */
std::vector<std::string>
Environment(const std::vector<std::pair<std::string, std::string>>& variables,
            const std::string& category, const std::string& name, int action)
{
    std::vector<std::string> environment = vornhost::PlainEnvironment();
    environment.push_back("HOOK_CATEGORY=" + category);
    environment.push_back("HOOK_NAME=" + name);
    environment.push_back("HOOK_ACTION=" + std::to_string(action));
    for (const auto& [key, value] : variables) {
        environment.push_back(key);
        environment.back().append("=").append(value);
    }
    return environment;
}

/** @return whether the program succeeded; what became of it is in the system log. */
bool RunHookProgram(HookProgram program, const std::vector<std::string>& environment)
{
    vornhost::ProgramRequest request;
    request.argv = {std::move(program.path)};
    request.opened = std::move(program.file);
    request.environment = environment;
    request.deadline = kHookDeadline;
    const vornhost::RunnerReport report = vornhost::RunProgram(std::move(request));
    return report.startError == 0 && report.status == 0;
}

} // namespace

BaseHook::BaseHook(const std::string& category, const std::string& name)
    : m_state(Guarded<State*>(nullptr, [&] {
          return new State{category, name, {}};
      }))
{
}

BaseHook::~BaseHook()
{
    delete m_state;
}

int BaseHook::SetEnv(const std::string& key, const std::string& value)
{
    if (m_state == nullptr || !IsVariable(key) || value.find('\0') != std::string::npos) {
        return -1;
    }
    return Guarded(-1, [&] {
        auto& variables = m_state->variables;
        const auto found = std::find_if(variables.begin(), variables.end(),
                                        [&](const auto& entry) { return entry.first == key; });
        if (found != variables.end()) {
            found->second = value;
        } else {
            variables.emplace_back(key, value);
        }
        return 0;
    });
}

/** Its name can be a hook's. One without a folder can be run too: there is nothing to do. */
bool BaseHook::IsValid()
{
    return m_state != nullptr &&
           Guarded(false, [&] { return vornhost::IsHookName(m_state->name); });
}

int BaseHook::ExecHook(_tag_sdk_plugin_action_ action)
{
    if (!IsValid()) {
        return -1;
    }
    return Guarded(-1, [&] {
        auto found = vornhost::OpenHookPrograms(m_state->name);
        if (!found) {
            return errno == EPERM ? -1 : 0;
        }
        const std::vector<std::string> environment =
            Environment(m_state->variables, m_state->category, m_state->name, action);
        bool succeeded = !found->refused;
        for (HookProgram& program : found->programs) {
            // One that fails does not keep the others from hearing of it.
            succeeded = RunHookProgram(std::move(program), environment) && succeeded;
        }
        return succeeded ? 0 : -1;
    });
}

} // namespace vornnetsdk::hook
