/**
 * Running a program from one of our own programs. A library inside a foreign client uses the exec
 * functions of libvorncore, which do without the client's signals and descriptors.
 */
#ifndef VORNHOST_SUPPORT_PROCESS_H
#define VORNHOST_SUPPORT_PROCESS_H

#include <chrono>
#include <string>
#include <vector>

namespace vornhost {

struct ProcessOptions {
    /** When the program and its process group are ended; 0: never. */
    std::chrono::milliseconds deadline{120000};
    /** What the program reads from its standard input. */
    std::string input;
    /** Its whole environment; empty: PATH and LC_ALL=C. */
    std::vector<std::string> environment;
    /** Whether what it writes is collected; otherwise it writes to where we write. */
    bool capture = true;
};

struct ProcessResult {
    /** Wait status; -1: not started. */
    int status = -1;
    bool timedOut = false;
    /** What it wrote to its standard output; of a program that left another one running, what was
        written until the program itself ended. */
    std::string output;
    /** What it wrote to its standard error; why it was not started when it was not. */
    std::string errors;

    bool Succeeded() const { return status == 0 && !timedOut; }
};

/**
 * Runs a program in a process group of its own, with default signals, and waits for it. It gets no
 * descriptors but the three standard ones. A process that ignores SIGCHLD stops doing so.
 * @param argv  the program's absolute path, then its arguments.
 */
ProcessResult RunProcess(const std::vector<std::string>& argv, const ProcessOptions& options = {});

} // namespace vornhost

#endif
