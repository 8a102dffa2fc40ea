/**
 * What the platform functions share: the recorder behind the RecordingPlatform that lives now.
 */
#ifndef HARNESS_RECORDER_H
#define HARNESS_RECORDER_H

#include "recordingplatform/recordingplatform.h"

#include <cstdarg>
#include <functional>
#include <map>
#include <mutex>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <thread>
#include <utility>
#include <vector>

namespace harness {

/** Ends the program with a message: going on would read memory that is not there. */
[[noreturn]] void Abort(const std::string& message);

/** An argument as it stands in a call's text. */
std::string Word(std::string_view argument);

/** Function name and arguments as one text. */
std::string CallText(std::string_view function, const std::vector<std::string>& arguments);

/** A text argument; ends the program on a pointer that is null or leads nowhere. */
std::string Text(const char* function, const char* argument);

/** Variable arguments up to the null pointer that must end them. */
std::vector<std::string> Arguments(const char* function, const char* path, va_list arguments);

/** Elements of an argument vector up to the null pointer that must end it. */
std::vector<std::string> Elements(const char* function, const char* const* vector);

/** The test fails unless the two are equal. */
void Expect(std::string_view function, std::string_view what, long long is, long long expected);

class Recorder {
public:
    /** The one that lives; ends the program when none does. */
    static Recorder& Current(const char* function);
    /** Whether a test has a platform now. */
    static bool IsAlive() { return s_current != nullptr; }

    Recorder();
    ~Recorder();
    Recorder(const Recorder&) = delete;
    Recorder& operator=(const Recorder&) = delete;

    /** Records a call and gives the answer that the test set for it, if any. */
    std::optional<int> Call(const std::string& text);
    /** The same for the handling of memory, which Calls() leaves out. */
    std::optional<int> Housekeeping(const std::string& text);

    /** @param release  frees the handle should it be left open. */
    void Open(const void* handle, const std::string& what, std::function<void()> release);
    /** Forgets a handle; the test fails, and false is the answer, when it is not open. */
    bool Close(const void* handle, const std::string& function);
    /** The test fails, and false is the answer, when the handle is not open. */
    bool IsOpen(const void* handle, const std::string& function) const;

    struct Rule {
        std::string call;
        int nth; /**< 0: every call */
        int result;
        int seen;
    };
    struct ProgramOutput {
        std::string text;
        int status;
    };
    struct Link {
        std::vector<int> speeds;
        std::size_t asked = 0;
    };
    struct OpenPipe {
        std::string command;
        std::string text;
        int status;
    };

    std::function<std::optional<int>(const std::string&)> m_interception;
    std::function<std::optional<int>(const std::string&)> m_reaction;
    std::function<void()> m_before;
    std::function<void()> m_after;
    std::vector<Rule> m_rules;
    std::vector<std::string> m_calls;
    std::vector<std::string> m_allCalls;
    std::vector<LogLine> m_log;
    struct OpenHandle {
        std::string what;
        std::function<void()> release;
    };
    std::map<const void*, OpenHandle> m_open;

    std::vector<std::pair<std::string, ProgramOutput>> m_outputs;
    std::optional<ProgramOutput> m_nextOutput;
    std::map<const void*, OpenPipe> m_pipes;
    std::vector<std::string> m_interfaces{"eth0"};
    std::map<std::string, _tag_VLIB_VLAN> m_vlans;
    std::map<std::string, VORNLINKAGGROPT> m_bonds;
    std::map<std::string, std::string> m_conflicts;
    std::map<std::pair<std::string, std::string>, std::string> m_values;
    std::map<std::string, Link> m_links;
    std::optional<int> m_lockHandle;
    int m_heldLock = -1;
    /** The thread that holds the platform's file lock; none: nobody does. */
    std::thread::id m_platformLockHolder;
    bool m_takesRealLocks = false;
    int m_realPlatformLock = -1;
    bool m_carryOutEdits = false;
    bool m_fillNamesWhole = false;

private:
    std::optional<int> AnswerFor(const std::string& text);

    static Recorder* s_current;
};

/** Around the body of every function of the platform. */
class PlatformCall {
public:
    PlatformCall();
    ~PlatformCall();
    PlatformCall(const PlatformCall&) = delete;
    PlatformCall& operator=(const PlatformCall&) = delete;

private:
    HarnessAllocations m_allocations;
    std::unique_lock<std::recursive_mutex> m_oneThread;
};

/** Whether the call is, or begins with, the words. */
bool Matches(const std::string& call, const std::string& words);

} // namespace harness

#endif
