/**
 * A platform that records instead of acting: every function of the platform libraries, `sleep` and
 * `syslog`, for tests that are linked with the library's own objects.
 *
 * One RecordingPlatform lives at a time, on the test's stack. It keeps the ordered list of calls as
 * text and the list of log lines, and answers each call with its documented success:
 * - programs, services and edits succeed, services run, a switch bridge carries a plain interface;
 * - the host has the one interface eth0, no Linux bridge, VLAN or bond; every link has 1000 Mbit/s;
 * - the switch has no bridge, no port has a tag ("[]");
 * - no settings key holds the value that is asked for;
 * - VLIBCFileExist() and VLIBCFileCheckDir() look at the real file system (the sandbox's).
 * A test says what is different with the functions below.
 *
 * A call is the function's name and its arguments, with a blank between them; an argument that is
 * empty or holds white space stands between single quotes. Constant arguments (option word, sizes,
 * line format) are checked and left out.
 *
 * The test fails when a handle (hash, list, pipe, lock, hook) is left open or released twice, when
 * a constant argument is not the agreed one, and when a record is not zeroed that must be. The
 * program ends with a message where going on would read memory that is not there.
 */
#ifndef HARNESS_RECORDINGPLATFORM_H
#define HARNESS_RECORDINGPLATFORM_H

#include <vornplatform/records.h>

#include <functional>
#include <iosfwd>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace harness {

/** A line of the system log, its "file:line " prefix taken apart. */
struct LogLine {
    int priority;
    std::string file;
    std::string text;

    friend bool operator==(const LogLine&, const LogLine&) = default;
};

LogLine Err(const std::string& file, const std::string& text);
LogLine Info(const std::string& file, const std::string& text);
void PrintTo(const LogLine& line, std::ostream* out);

/** A bond's record as the platform fills it. */
VORNLINKAGGROPT BondRecord(const std::string& name, int mode,
                           const std::vector<std::string>& slaves);

class Recorder;

class RecordingPlatform {
public:
    RecordingPlatform();
    ~RecordingPlatform();
    RecordingPlatform(const RecordingPlatform&) = delete;
    RecordingPlatform& operator=(const RecordingPlatform&) = delete;

    /**
     * Answers every call that is, or begins with, these words. The latest matching answer counts.
     * For a function that gives a pointer, 0 stands for null; for `sleep`, the seconds not slept;
     * for the making of a hook ("BaseHook"), 0 has memory run out.
     */
    void Answer(const std::string& call, int result);

    /**
     * Has a simulation see every call that no answer was set for, and answer it or leave it to the
     * platform. It may change what the platform knows while it is called.
     */
    void React(std::function<std::optional<int>(const std::string& call)> reaction);

    /** The same as Answer() for the nth matching call from now on only, counted from 1. */
    void AnswerNth(const std::string& call, int nth, int result);

    /** What a program started with VLIBCPopen() prints, and the wait status it ends with. */
    void Output(const std::string& call, const std::string& text, int status = 0);

    /** The same for the next program alone, whatever it is. */
    void OutputOnce(const std::string& text, int status = 0);

    /** Answers before all others, also for what only AllCalls() has: the handling of memory. */
    void Intercept(std::function<std::optional<int>(const std::string& call)> answer);

    /**
     * What happens around every function of the platform: `before` it does or records anything, and
     * `after` it has done what it does. Only one thread is in the platform at a time.
     */
    void Around(std::function<void()> before, std::function<void()> after);

    /**
     * Locks are the system's, so that other threads and processes wait for them, which is not
     * recorded, and they go with a process that dies.
     */
    void TakeRealLocks();

    /** The host's interfaces, in the order listed. */
    void Interfaces(const std::vector<std::string>& names);

    /** Forgets every VLAN and bond. */
    void NoVlansAndBonds();

    /** Makes the interface a VLAN. */
    void Vlan(const std::string& name, const std::string& parent, int id);

    /** The same with a record as it stands, whatever it says. */
    void Vlan(const std::string& name, const _tag_VLIB_VLAN& record);

    /** Gives a bond its record; without one it cannot be read. */
    void Bond(const std::string& name, int mode, const std::vector<std::string>& slaves);

    /** The same with a record as it stands, whatever it says. */
    void Bond(const std::string& name, const VORNLINKAGGROPT& record);

    /** The interface whose address conflicts with the bond's, up to 32 bytes; without one: none. */
    void Conflict(const std::string& bond, const std::string& name);

    /** A key's value in a file, whatever the file holds. */
    void Value(const std::string& path, const std::string& key, const std::string& value);

    /** Link speeds that an interface reports one after the other; the last one stays. */
    void LinkSpeeds(const std::string& name, const std::vector<int>& speeds);

    /** Slave names fill their field to its last byte, without an end, when they are that long. */
    void FillNamesWhole();

    /** Handle that the lock call hands out, whatever its result; -1: none. */
    void LockHandle(int handle);

    /** Copies with /bin/cp and edits of key=value files are carried out as well as recorded. */
    void CarryOutFileEdits();

    /** What was called, in order. Handles and records in memory (hashes, lists) are left out. */
    const std::vector<std::string>& Calls() const;

    /** The same with the handling of hashes, lists and hook objects. */
    const std::vector<std::string>& AllCalls() const;

    const std::vector<LogLine>& Log() const;

    /** Empties the lists of calls and log lines. */
    void Forget();

    /** Handles that are open now, as text; empty when there are none. */
    std::vector<std::string> OpenHandles() const;

private:
    std::unique_ptr<Recorder> m_recorder;
};

/** While one lives, allocations are the harness's own and no test makes them fail. */
class HarnessAllocations {
public:
    HarnessAllocations() noexcept { ++s_depth; }
    ~HarnessAllocations() { --s_depth; }
    HarnessAllocations(const HarnessAllocations&) = delete;
    HarnessAllocations& operator=(const HarnessAllocations&) = delete;
    static bool Active() noexcept { return s_depth > 0; }

private:
    static thread_local int s_depth;
};

} // namespace harness

#endif
