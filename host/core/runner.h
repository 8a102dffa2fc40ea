/**
 * What passes between a client and vornrun, the program that runs others for it. vornrun is what
 * makes a run independent of the client: its signals, its descriptors, its size and its life.
 */
#ifndef VORNHOST_CORE_RUNNER_H
#define VORNHOST_CORE_RUNNER_H

namespace vornhost {

/** Descriptors with which vornrun starts, besides the standard ones; each may be absent. */
constexpr int kReportDescriptor = 3;  /**< pipe that takes the report */
constexpr int kOutputDescriptor = 4;  /**< the program's standard output */
constexpr int kProgramDescriptor = 5; /**< the program itself, opened */
constexpr int kFirstLockDescriptor = 6;

/** How the run ended. */
struct RunnerReport {
    int status = -1;    /**< the program's wait status; never 0 when its time ran out */
    int startError = 0; /**< not 0: the program could not be started, and why */
    int timedOut = 0;
};

/* Arguments: the options in any order, then the program's arguments, the path first. */
constexpr char kDeadlineOption[] = "--deadline="; /**< milliseconds */
constexpr char kLocksOption[] = "--locks=";       /**< number of lock descriptors */
constexpr char kOpenedOption[] = "--opened";      /**< run what kProgramDescriptor is */
constexpr char kDetachedOption[] = "--detached";  /**< report the start, wait for nothing */
constexpr char kEndOfOptions[] = "--";

} // namespace vornhost

#endif
