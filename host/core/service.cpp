#include "support/service.h"
#include "core/guard.h"
#include "core/heldlocks.h"
#include "core/program.h"
#include "support/servicemanager.h"

#include <cctype>
#include <fstream>
#include <sstream>
#include <string>

#include <vornplatform/core.h>

namespace {

using vornhost::Guarded;
using vornhost::kServiceScripts;
using vornhost::SystemdRuns;

/** Where the kernel shows the services that systemd runs. */
constexpr char kUnitFolder[] = "/sys/fs/cgroup/system.slice/";
/** The kernel keeps that much of a process's name. */
constexpr size_t kCommLength = 15;

/** @return the service, empty when the name cannot be one's. */
std::string NameOf(const char* name)
{
    const std::string service = name == nullptr ? "" : name;
    return service.starts_with('.') || service.find('/') != std::string::npos ? "" : service;
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

/** Whether a unit of systemd has processes: the kernel tells that in a file. */
bool UnitHasProcesses(const std::string& service)
{
    std::ifstream events(kUnitFolder + service + ".service/cgroup.events");
    for (std::string line; std::getline(events, line);) {
        if (line == "populated 1") {
            return true;
        }
    }
    return false;
}

bool IsRunning(const char* name)
{
    const std::string service = NameOf(name);
    if (service.empty()) {
        return false;
    }
    const std::string script = kServiceScripts + service;
    const std::string pidFile = Statement(script, "pidfile");
    const std::string process = Statement(script, "processname");
    if (pidFile.empty() || process.empty()) {
        return SystemdRuns() && UnitHasProcesses(service);
    }
    const long pid = ReadPid(pidFile);
    return pid != 0 && IsProcess(pid, process);
}

int Run(const char* name, const char* verb)
{
    return Guarded(-1, [&] {
        const std::string service = NameOf(name);
        if (service.empty()) {
            return -1;
        }
        vornhost::ProgramRequest request;
        if (SystemdRuns()) {
            request.argv = {vornhost::CompanionPath("vornservice"), verb, service};
        } else {
            request.argv = {kServiceScripts + service, verb};
        }
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
    return Run(name, "start");
}

int VLIBServiceStop(const char* name, int)
{
    return Run(name, "stop");
}

int VLIBServiceRestart(const char* name)
{
    return Run(name, "restart");
}
