/**
 * Running programs on behalf of a client of the platform.
 */
#ifndef VORNHOST_CORE_PROGRAM_H
#define VORNHOST_CORE_PROGRAM_H

#include "core/runner.h"
#include "support/descriptor.h"

#include <chrono>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include <sys/types.h>

namespace vornhost {

/** When a hung program is ended. Far above what a start of the whole network takes. */
constexpr std::chrono::milliseconds kProgramDeadline{120000};

/** Path of vornrun, which is installed beside the library that this code is part of. */
const char* RunnerPath();

/** Path of another program in the same folder. */
std::string CompanionPath(const std::string& name);

/** PATH and LC_ALL: what every program gets, whatever the client's environment is. */
std::vector<std::string> PlainEnvironment();

/** What a program gets that the library runs: a limit for the switch's tools and our mark too. */
std::vector<std::string> LibraryEnvironment();

struct ProgramRequest {
    std::vector<std::string> argv; /**< the first is the program's absolute path */
    std::vector<std::string> environment = LibraryEnvironment();
    std::chrono::milliseconds deadline = kProgramDeadline;
    Descriptor opened;             /**< the program itself, when it must not be looked up again */
    Descriptor output;             /**< its standard output; none: /dev/null */
    std::vector<Descriptor> locks; /**< held until the program ends, even if the client does not */
    bool detached = false;         /**< only its start is waited for, and nobody ends it */
    std::string runner = RunnerPath();
};

/** A program that runs under vornrun; it is waited for at the latest when this goes. */
class RunningProgram {
public:
    RunningProgram(pid_t runner, Descriptor report) : m_runner(runner), m_report(std::move(report))
    {
    }
    RunningProgram(RunningProgram&& other) noexcept
        : m_runner(std::exchange(other.m_runner, -1)), m_report(std::move(other.m_report))
    {
    }
    RunningProgram& operator=(RunningProgram&&) = delete;
    RunningProgram(const RunningProgram&) = delete;
    RunningProgram& operator=(const RunningProgram&) = delete;
    ~RunningProgram()
    {
        if (m_runner > 0) {
            (void)Wait();
        }
    }

    /** Waits for the program's end. To be called once. */
    RunnerReport Wait();

private:
    pid_t m_runner;
    Descriptor m_report;
};

/**
 * Starts a program. Neither the size of the client's memory nor its signals matter.
 * @return nothing when vornrun cannot be started or the path is not absolute; errno says why.
 */
std::optional<RunningProgram> StartProgram(ProgramRequest request);

/** Runs a program to its end; its start error says so when even vornrun did not start. */
RunnerReport RunProgram(ProgramRequest request);

} // namespace vornhost

#endif
