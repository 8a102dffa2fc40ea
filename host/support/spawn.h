/**
 * What starting a program takes: owners of the lists that posix_spawn() reads.
 */
#ifndef VORNHOST_SUPPORT_SPAWN_H
#define VORNHOST_SUPPORT_SPAWN_H

#include "descriptor.h"

#include <chrono>
#include <csignal>
#include <string>
#include <vector>

#include <spawn.h>
#include <sys/types.h>

namespace vornhost {

/** What happens to the descriptors of a program before it runs. */
class SpawnActions {
public:
    SpawnActions() { ::posix_spawn_file_actions_init(&m_actions); }
    SpawnActions(const SpawnActions&) = delete;
    SpawnActions& operator=(const SpawnActions&) = delete;
    ~SpawnActions() { ::posix_spawn_file_actions_destroy(&m_actions); }

    /** Opens a file as that descriptor. */
    void Open(int target, const char* path, int flags);
    /** Makes a descriptor another one too; they must differ. */
    void Duplicate(int source, int target);
    /** Closes a descriptor, which need not be open. */
    void Close(int target);
    /** Closes every descriptor from that one on. */
    void CloseFrom(int first);
    void ChangeFolder(const char* path);

    /** @return whether every step could be noted down. */
    bool IsComplete() const { return m_complete; }
    const posix_spawn_file_actions_t* Get() const { return &m_actions; }

private:
    posix_spawn_file_actions_t m_actions{};
    bool m_complete = true;
};

/** In which session and process group and with which signal mask a program starts. */
class SpawnAttributes {
public:
    /** All signals get their default disposition. @param flags  such as POSIX_SPAWN_SETSID. */
    SpawnAttributes(short flags, const sigset_t& mask);
    SpawnAttributes(const SpawnAttributes&) = delete;
    SpawnAttributes& operator=(const SpawnAttributes&) = delete;
    ~SpawnAttributes() { ::posix_spawnattr_destroy(&m_attributes); }

    const posix_spawnattr_t* Get() const { return &m_attributes; }

private:
    posix_spawnattr_t m_attributes{};
};

sigset_t EmptySignalSet();
sigset_t FullSignalSet();

/** The pointers to strings, ended with a null one, as programs receive them. */
std::vector<char*> Pointers(const std::vector<std::string>& strings);

/** A descriptor that can be read once the process has ended; none when there is no such process. */
Descriptor OpenProcess(pid_t process);

/** How a program ended. */
struct ProgramEnd {
    int status = -1; /**< wait status; never 0 for one that ran out of time */
    bool timedOut = false;
};

/**
 * Waits for a child that leads its process group. At the deadline the group is asked to end, and
 * is killed soon afterwards. What the child left running when it ended in time is left alone.
 * @param deadline  0: none.
 */
ProgramEnd WaitForGroup(pid_t leader, std::chrono::milliseconds deadline);

} // namespace vornhost

#endif
