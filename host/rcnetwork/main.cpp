#include "announcer.h"
#include "automatic.h"
#include "conversion.h"
#include "hold.h"
#include "online.h"
#include "reconcile.h"
#include "report.h"
#include "retry.h"
#include "runs.h"

#include "support/interfacename.h"

#include <algorithm>
#include <array>
#include <csignal>
#include <cstdio>
#include <cstdlib>

#include <sys/prctl.h>
#include <syslog.h>

namespace vornhost {
namespace {

constexpr int kUsageError = 2;
constexpr char kBondVerb[] = "set-ovs-bond";
/** Of the hook program that is told of conversions: "create", "delete" or "end". */
constexpr char kConversionVerb[] = "conversion";

/** Of the tool that gives interfaces back to another manager. */
constexpr char kLeaveVerb[] = "leave";

constexpr char kUsage[] =
    "Usage: rc.network [--dry-run] start|stop [interface...]\n"
    "       rc.network set-ovs-bond bond\n"
    "       rc.network leave interface...\n"
    "       rc.network wait-online\n"
    "Brings the network to what the files in /etc/sysconfig/network-scripts ask for (start),\n"
    "or takes down what start made (stop); without interfaces, all of them. set-ovs-bond brings\n"
    "the options of a bond on the switch to what its file says, while it goes on to work.\n"
    "leave ends what works for interfaces and changes nothing on them: somebody else takes over.\n"
    "wait-online waits until the addresses that the files ask for answer.\n"
    "  --boot      wait for interfaces that have not appeared yet, within a limit\n"
    "  --dry-run   print what would be done and change nothing\n"
    "Exit status: 0 all of it is so now, 1 something is not (it says what), 2 wrong usage.\n";

/** What a verb is followed by. */
enum class Words { kNone, kInterfaces, kInterface, kText };

struct VerbForm {
    const char* name;
    Words words;
    bool takesTime; ///< It waits, and locks the network only when it changes something.
};

constexpr std::array kVerbs = {
    VerbForm{"start", Words::kInterfaces, false},
    VerbForm{"stop", Words::kInterfaces, false},
    VerbForm{kLeaveVerb, Words::kInterfaces, false},
    VerbForm{kOnlineVerb, Words::kNone, true},
    VerbForm{kBondVerb, Words::kInterface, false},
    VerbForm{kConversionVerb, Words::kText, false},
    VerbForm{kHolderVerb, Words::kText, true},
    VerbForm{kRetryVerb, Words::kNone, true},
    VerbForm{kAnnounceVerb, Words::kInterface, true},
    VerbForm{kAppearedVerb, Words::kInterface, true},
};

const VerbForm* FindVerb(const std::string& name)
{
    const auto* const found = std::find_if(kVerbs.begin(), kVerbs.end(),
                                           [&](const VerbForm& verb) { return name == verb.name; });
    return found == kVerbs.end() ? nullptr : found;
}

struct CommandLine {
    std::string verb;
    Request request;
    std::string word; ///< The one word of a verb that has one.
    bool dryRun = false;
    bool boot = false;
};

/** Takes a word that follows the verb. @return  whether it may stand there. */
bool TakeWord(const std::string& argument, CommandLine& line)
{
    const Words words = FindVerb(line.verb)->words;
    if (words == Words::kInterfaces && IsInterfaceName(argument)) {
        line.request.names.insert(PlainOf(argument));
        return true;
    }
    const bool taken =
        line.word.empty() &&
        (words == Words::kText || (words == Words::kInterface && IsInterfaceName(argument)));
    if (taken) {
        line.word = argument;
    } else if (words != Words::kText && !IsInterfaceName(argument)) {
        (void)std::fprintf(stderr, "rc.network: \"%s\" is no interface name\n", argument.c_str());
    }
    return taken;
}

bool ParseCommandLine(int count, char** arguments, CommandLine& line)
{
    for (int i = 1; i < count; ++i) {
        const std::string argument = arguments[i];
        // What follows the verb is names, whatever they look like.
        if (line.verb.empty() && argument == "--dry-run") {
            line.dryRun = true;
        } else if (line.verb.empty() && argument == "--boot") {
            line.boot = true;
        } else if (line.verb.empty() && FindVerb(argument) != nullptr) {
            line.verb = argument;
        } else if (line.verb.empty() || !TakeWord(argument, line)) {
            return false;
        }
    }
    if (line.verb.empty()) {
        return false;
    }
    line.request.verb = line.verb == "stop" ? Verb::kStop : Verb::kStart;
    const Words words = FindVerb(line.verb)->words;
    const bool isPlain = words == Words::kInterfaces;
    return line.word.empty() == (isPlain || words == Words::kNone) && (isPlain || !line.dryRun) &&
           (!line.boot || line.verb == "start") &&
           (line.verb != kLeaveVerb || (!line.request.names.empty() && !line.dryRun)) &&
           (line.verb != kConversionVerb || FindStage(line.word));
}

bool RunHolder(const std::string& token)
{
    WaitForStart(token, HoldTime());
    const Descriptor lock = TakeNetworkLock();
    if (!lock) {
        return false;
    }
    const auto request = HeldBy(token);
    if (!request) {
        return true;
    }
    Say({Severity::kWarning, "no start followed a stop; the network is brought to its files"});
    const bool done = Reconcile(*request);
    EndHold(request->names);
    return done;
}

bool RunWithoutLock(const CommandLine& line)
{
    // Started through /proc it would be listed as "exe".
    (void)prctl(PR_SET_NAME, "rc.network");
    if (line.verb == kHolderVerb) {
        return RunHolder(line.word);
    }
    if (line.verb == kRetryVerb) {
        RetryUntilDone();
        return true;
    }
    if (line.verb == kAnnounceVerb) {
        AnnounceForAWhile(line.word);
        return true;
    }
    if (line.verb == kAppearedVerb) {
        return StartAppeared(line.word);
    }
    return line.verb == kOnlineVerb ? WaitUntilOnline() : StartAtBoot(line.request);
}

bool RunLocked(const CommandLine& line)
{
    const Descriptor lock = TakeNetworkLock();
    if (!lock) {
        return false;
    }
    if (line.verb == kLeaveVerb) {
        return Leave(line.request);
    }
    if (line.verb == kBondVerb) {
        return SetSwitchBond(line.word);
    }
    if (line.verb == kConversionVerb) {
        return MindConversion(*FindStage(line.word));
    }
    return line.request.verb == Verb::kStop ? Stop(line.request) : Start(line.request);
}

bool Run(const CommandLine& line)
{
    if (line.dryRun) {
        return PrintPlan(line.request);
    }
    return line.boot || FindVerb(line.verb)->takesTime ? RunWithoutLock(line) : RunLocked(line);
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
        return vornhost::Run(line) ? EXIT_SUCCESS : EXIT_FAILURE;
    } catch (const std::exception& exception) {
        vornhost::Say({vornhost::Severity::kError, exception.what()});
        return EXIT_FAILURE;
    }
}
