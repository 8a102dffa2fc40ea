#include "runs.h"

#include "handover.h"
#include "hold.h"
#include "reconcile.h"
#include "report.h"

#include "support/runlock.h"
#include "support/servicemanager.h"

#include <cerrno>
#include <cstring>

namespace vornhost {
namespace {

constexpr char kLockName[] = "network.lock";
constexpr int kLockSeconds = 90;

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
    if (!held && IsPartOfConversion() && SystemdRuns()) {
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

} // namespace vornhost
