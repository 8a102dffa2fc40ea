#include "spawn.h"

#include <algorithm>
#include <cerrno>
#include <climits>

#include <poll.h>
#include <sys/syscall.h>
#include <sys/wait.h>

namespace vornhost {
namespace {

using Clock = std::chrono::steady_clock;

/** What a program gets between the request to end and being killed. */
constexpr std::chrono::milliseconds kGrace{2000};

/** Waits for a process to end. @return whether it did in time. */
bool WaitUntil(int process, Clock::time_point end)
{
    for (;;) {
        const auto left = std::chrono::ceil<std::chrono::milliseconds>(end - Clock::now());
        const auto timeout = std::clamp<std::chrono::milliseconds::rep>(left.count(), 0, INT_MAX);
        pollfd watched = {process, POLLIN, 0};
        const int ready = ::poll(&watched, 1, static_cast<int>(timeout));
        if (ready > 0 || (ready < 0 && errno != EINTR)) {
            return true; // without a working poll, waiting for the child is all that is left
        }
        if (ready == 0 && timeout < INT_MAX) {
            return false;
        }
    }
}

int Reap(pid_t child)
{
    int status = -1;
    while (::waitpid(child, &status, 0) < 0) {
        if (errno != EINTR) {
            return -1;
        }
    }
    return status;
}

} // namespace

void SpawnActions::Open(int target, const char* path, int flags)
{
    m_complete =
        ::posix_spawn_file_actions_addopen(&m_actions, target, path, flags, 0) == 0 && m_complete;
}

void SpawnActions::Duplicate(int source, int target)
{
    m_complete = ::posix_spawn_file_actions_adddup2(&m_actions, source, target) == 0 && m_complete;
}

void SpawnActions::Close(int target)
{
    m_complete = ::posix_spawn_file_actions_addclose(&m_actions, target) == 0 && m_complete;
}

void SpawnActions::CloseFrom(int first)
{
    m_complete = ::posix_spawn_file_actions_addclosefrom_np(&m_actions, first) == 0 && m_complete;
}

void SpawnActions::ChangeFolder(const char* path)
{
    m_complete = ::posix_spawn_file_actions_addchdir_np(&m_actions, path) == 0 && m_complete;
}

SpawnAttributes::SpawnAttributes(short flags, const sigset_t& mask)
{
    const sigset_t all = FullSignalSet();
    ::posix_spawnattr_init(&m_attributes);
    ::posix_spawnattr_setsigmask(&m_attributes, &mask);
    ::posix_spawnattr_setsigdefault(&m_attributes, &all);
    ::posix_spawnattr_setflags(
        &m_attributes, static_cast<short>(flags | POSIX_SPAWN_SETSIGMASK | POSIX_SPAWN_SETSIGDEF));
}

sigset_t EmptySignalSet()
{
    sigset_t signals;
    ::sigemptyset(&signals);
    return signals;
}

sigset_t FullSignalSet()
{
    sigset_t signals;
    ::sigfillset(&signals);
    return signals;
}

std::vector<char*> Pointers(const std::vector<std::string>& strings)
{
    std::vector<char*> pointers;
    pointers.reserve(strings.size() + 1);
    for (const std::string& string : strings) {
        pointers.push_back(const_cast<char*>(string.c_str())); // never written to
    }
    pointers.push_back(nullptr);
    return pointers;
}

Descriptor OpenProcess(pid_t process)
{
    // The C library's own declaration cannot be used from C++ before its version 2.37.
    return Descriptor(static_cast<int>(::syscall(SYS_pidfd_open, process, 0)));
}

ProgramEnd WaitForGroup(pid_t leader, std::chrono::milliseconds deadline)
{
    ProgramEnd end;
    const Descriptor process = OpenProcess(leader);
    if (process && deadline.count() > 0 && !WaitUntil(process.Get(), Clock::now() + deadline)) {
        end.timedOut = true;
        (void)::kill(-leader, SIGTERM);
        (void)WaitUntil(process.Get(), Clock::now() + kGrace);
        // Whoever of the group did not listen; the leader is not reaped yet, so the group's
        // number is still its own.
        (void)::kill(-leader, SIGKILL);
    }
    end.status = Reap(leader);
    if (end.timedOut && end.status == 0) {
        end.status = SIGTERM;
    }
    return end;
}

} // namespace vornhost
