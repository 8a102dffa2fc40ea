#include "runs.h"

#include "clientcontrol.h"
#include "handover.h"
#include "hold.h"
#include "reconcile.h"
#include "report.h"
#include "retry.h"
#include "runstate.h"

#include "support/atomicfile.h"
#include "support/runlock.h"

#include <cerrno>
#include <cstring>
#include <fstream>
#include <sstream>

namespace vornhost {
namespace {

constexpr char kLockName[] = "network.lock";
constexpr int kLockSeconds = 90;

bool ForgetRecords(const std::set<std::string>& names)
{
    std::ifstream file(kRunStatePath);
    std::ostringstream text;
    if (!file || !(text << file.rdbuf())) {
        return true; // nothing was made in this boot
    }
    RunState state = ParseRunState(text.str());
    for (const std::string& name : names) {
        state.interfaces.erase(name);
    }
    if (!ReplaceFile(kRunStatePath, RunStateText(state), kPrivateFile)) {
        Say({Severity::kError,
             std::string("cannot write ") + kRunStatePath + ": " + std::strerror(errno)});
        return false;
    }
    return true;
}

} // namespace

Descriptor TakeNetworkLock()
{
    Descriptor lock = TakeRunLock(kLockName, LockDeadlineIn(kLockSeconds));
    if (!lock) {
        Say({Severity::kError, std::string("cannot get the lock ") + kRunFolder + "/" + kLockName});
    }
    return lock;
}

bool Start(const Request& request)
{
    // The hold lasts until all is done: if this run is killed, its holder finishes the work.
    const std::set<std::string> concerned = ConcernedBy(request);
    const bool held = IsHeld();
    // What ends a client's whole service ends this run, too, and a hold is what survives that.
    if (!held && IsPartOfConversion()) {
        (void)BeginHold(request);
    }
    const bool done = Reconcile(request);
    if (done || !held) {
        EndHold(concerned);
    }
    return done;
}

bool Stop(const Request& request)
{
    if (IsPartOfConversion()) {
        const bool kept = KeepTags();
        if (BeginHold(request)) {
            return kept;
        }
        Say({Severity::kError, std::string("cannot hold the network: ") + std::strerror(errno)});
        return false;
    }
    EndHold(ConcernedBy(request));
    return Reconcile(request);
}

bool Leave(const Request& request)
{
    bool done = ForgetRecords(request.names);
    // Nor does anybody bring them to the switch later.
    MindRetry(request.names, {});
    const auto clients = ReadClients();
    for (const std::string& name : request.names) {
        std::string error;
        if (clients.contains(name) && !DropClient(name, error)) {
            Say({Severity::kError,
                 "the client of " + std::string(name).append(": ").append(error)});
            done = false;
        }
    }
    return done;
}

} // namespace vornhost
