#include "handover.h"
#include "hold.h"
#include "reconcile.h"
#include "report.h"

#include "support/interfacename.h"
#include "support/runlock.h"

#include <cerrno>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include <sys/prctl.h>
#include <syslog.h>

namespace vornhost {
namespace {

constexpr char kLockName[] = "network.lock";
constexpr int kLockSeconds = 90;
constexpr int kUsageError = 2;
constexpr char kBondVerb[] = "set-ovs-bond";
/** Of the hook program that is told of conversions: "begin" or "end". */
constexpr char kHandoverVerb[] = "handover";

constexpr char kUsage[] =
    "Usage: rc.network [--dry-run] start|stop [interface...]\n"
    "       rc.network set-ovs-bond bond\n"
    "Brings the network to what the files in /etc/sysconfig/network-scripts ask for (start),\n"
    "or takes down what start made (stop); without interfaces, all of them. set-ovs-bond brings\n"
    "the options of a bond on the switch to what its file says, while it goes on to work.\n"
    "  --dry-run   print what would be done and change nothing\n"
    "Exit status: 0 all of it is so now, 1 something is not (it says what), 2 wrong usage.\n";

int Fail(const std::string& text)
{
    Say({Severity::kError, text});
    return EXIT_FAILURE;
}

/** Lets one run at a time change the network; free again when its owner dies. */
Descriptor TakeNetworkLock()
{
    return TakeRunLock(kLockName, LockDeadlineIn(kLockSeconds));
}

int FailWithoutLock()
{
    return Fail(std::string("cannot get the lock ") + kRunFolder + "/" + kLockName);
}

struct CommandLine {
    std::string verb;
    Request request;
    std::string token; ///< Of the holder.
    std::string bond;  ///< Of the verb for bonds.
    bool dryRun = false;
};

bool ParseCommandLine(int count, char** arguments, CommandLine& line)
{
    for (int i = 1; i < count; ++i) {
        const std::string argument = arguments[i];
        if (argument == "--dry-run") {
            line.dryRun = true;
        } else if (line.verb.empty()) {
            line.verb = argument;
        } else if (line.token.empty() && (line.verb == kHolderVerb || line.verb == kHandoverVerb)) {
            line.token = argument;
        } else if (line.verb == kBondVerb && line.bond.empty() && IsInterfaceName(argument)) {
            line.bond = argument;
        } else if (line.verb != kBondVerb && IsInterfaceName(argument)) {
            line.request.names.insert(PlainOf(argument));
        } else {
            (void)std::fprintf(stderr, "rc.network: \"%s\" is no interface name\n", arguments[i]);
            return false;
        }
    }
    line.request.verb = line.verb == "stop" ? Verb::kStop : Verb::kStart;
    return line.verb == "start" || line.verb == "stop" ||
           (line.verb == kBondVerb && !line.bond.empty() && !line.dryRun) ||
           (line.verb == kHandoverVerb && (line.token == "begin" || line.token == "end")) ||
           (line.verb == kHolderVerb && !line.token.empty());
}

int Start(const Request& request)
{
    // The hold lasts until all is done: if this run is killed, its holder finishes the work.
    const std::set<std::string> concerned = ConcernedBy(request);
    if (!Reconcile(request)) {
        return EXIT_FAILURE;
    }
    EndHold(concerned);
    return EXIT_SUCCESS;
}

int Stop(const Request& request)
{
    if (IsPartOfConversion()) {
        const bool kept = KeepTags();
        return BeginHold(request)
                   ? (kept ? EXIT_SUCCESS : EXIT_FAILURE)
                   : Fail(std::string("cannot hold the network: ") + std::strerror(errno));
    }
    EndHold(ConcernedBy(request));
    return Reconcile(request) ? EXIT_SUCCESS : EXIT_FAILURE;
}

int RunHolder(const std::string& token)
{
    // Started through /proc it would be listed as "exe".
    (void)prctl(PR_SET_NAME, "rc.network");
    WaitForStart(token, HoldTime());
    const Descriptor lock = TakeNetworkLock();
    if (!lock) {
        return FailWithoutLock();
    }
    const auto request = HeldBy(token);
    if (!request) {
        return EXIT_SUCCESS;
    }
    Say({Severity::kWarning, "no start followed a stop; the network is brought to its files"});
    const bool done = Reconcile(*request);
    EndHold(request->names);
    return done ? EXIT_SUCCESS : EXIT_FAILURE;
}

int Run(const CommandLine& line)
{
    if (line.dryRun) {
        return PrintPlan(line.request) ? EXIT_SUCCESS : EXIT_FAILURE;
    }
    if (line.verb == kHolderVerb) {
        return RunHolder(line.token);
    }
    const Descriptor lock = TakeNetworkLock();
    if (!lock) {
        return FailWithoutLock();
    }
    if (line.verb == kBondVerb) {
        return SetSwitchBond(line.bond) ? EXIT_SUCCESS : EXIT_FAILURE;
    }
    if (line.verb == kHandoverVerb) {
        return BeginHandover(line.token == "begin") ? EXIT_SUCCESS : EXIT_FAILURE;
    }
    return line.request.verb == Verb::kStop ? Stop(line.request) : Start(line.request);
}

} // namespace
} // namespace vornhost

int main(int count, char** arguments)
{
    // A terminal or a pipe that goes away must not end a change of the network half-way.
    (void)std::signal(SIGHUP, SIG_IGN);
    (void)std::signal(SIGPIPE, SIG_IGN);
    ::openlog("rc.network", LOG_PID, LOG_DAEMON);
    try {
        vornhost::CommandLine line;
        if (!vornhost::ParseCommandLine(count, arguments, line)) {
            (void)std::fputs(vornhost::kUsage, stderr);
            return vornhost::kUsageError;
        }
        return vornhost::Run(line);
    } catch (const std::exception& exception) {
        return vornhost::Fail(exception.what());
    }
}
