#include "core/guard.h"
#include "core/heldlocks.h"
#include "core/program.h"

#include <cctype>
#include <fstream>
#include <optional>
#include <sstream>
#include <string>
#include <string_view>

#include <vornplatform/core.h>

namespace {

using vornhost::Guarded;

constexpr char kScriptFolder[] = "/etc/init.d/";
/** The kernel keeps that much of a process's name. */
constexpr size_t kCommLength = 15;

/** @return the service's script, nothing when the name cannot be one's. */
std::optional<std::string> ScriptOf(const char* name)
{
    const std::string_view service = name == nullptr ? "" : name;
    if (service.empty() || service.front() == '.' || service.find('/') != std::string_view::npos) {
        return std::nullopt;
    }
    return kScriptFolder + std::string(service);
}

/** What a script says about itself in a comment line such as "# pidfile: /run/x.pid". */
std::string Statement(const std::string& script, const std::string& subject)
{
    const std::string begin = "# " + subject + ":";
    std::ifstream file(script);
    for (std::string line; std::getline(file, line);) {
        if (line.starts_with(begin)) {
            std::string value;
            std::istringstream(line.substr(begin.size())) >> value;
            return value;
        }
    }
    return {};
}

/** @return the process of a pid file, 0 when it names none. */
long ReadPid(const std::string& path)
{
    long pid = 0;
    std::ifstream(path) >> pid;
    return pid > 0 ? pid : 0;
}

/** @return whether the process lives under that name: its number may be another's by now. */
bool IsProcess(long pid, const std::string& name)
{
    const std::string folder = "/proc/" + std::to_string(pid);
    std::string comm;
    if (!std::getline(std::ifstream(folder + "/comm"), comm) ||
        comm != name.substr(0, kCommLength)) {
        return false;
    }
    // One that has ended and is not waited for yet is still listed.
    std::string stat;
    std::getline(std::ifstream(folder + "/stat"), stat);
    const size_t state = stat.rfind(") ");
    return state != std::string::npos && stat.substr(state + 2, 1) != "Z";
}

bool IsRunning(const char* service)
{
    const std::optional<std::string> script = ScriptOf(service);
    if (!script) {
        return false;
    }
    const std::string pidFile = Statement(*script, "pidfile");
    const std::string name = Statement(*script, "processname");
    const long pid = pidFile.empty() ? 0 : ReadPid(pidFile);
    return pid != 0 && !name.empty() && IsProcess(pid, name);
}

int RunScript(const char* service, const char* verb)
{
    return Guarded(-1, [&] {
        const std::optional<std::string> script = ScriptOf(service);
        if (!script) {
            return -1;
        }
        vornhost::ProgramRequest request;
        request.argv = {*script, verb};
        request.locks = vornhost::DuplicateHeldLocks();
        const vornhost::RunnerReport report = vornhost::RunProgram(std::move(request));
        return report.startError == 0 && report.status == 0 ? 0 : -1;
    });
}

} // namespace

/** Answered from files: it is asked often, and must not wait for a hung switch. */
int VLIBServiceIsRunning(const char* name)
{
    return Guarded(0, [&] { return IsRunning(name) ? 1 : 0; });
}

int VLIBServiceStart(const char* name, int)
{
    return RunScript(name, "start");
}

int VLIBServiceStop(const char* name, int)
{
    return RunScript(name, "stop");
}

int VLIBServiceRestart(const char* name)
{
    return RunScript(name, "restart");
}
