#include "recordingplatform/recorder.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <utility>

#include <sys/uio.h>
#include <unistd.h>

namespace harness {

namespace {

/** More arguments than any caller passes; a vector that goes on past it has no end. */
constexpr int kMostArguments = 4096;

bool IsReadable(const void* address)
{
    char byte = 0;
    iovec local{&byte, 1};
    iovec remote{const_cast<void*>(address), 1};
    return process_vm_readv(getpid(), &local, 1, &remote, 1, 0) == 1;
}

} // namespace

thread_local int HarnessAllocations::s_depth = 0;
Recorder* Recorder::s_current = nullptr;

void Abort(const std::string& message)
{
    (void)std::fprintf(stderr, "recording platform: %s\n", message.c_str());
    std::abort();
}

std::string Word(std::string_view argument)
{
    if (argument.empty() || argument.find_first_of(" \t\n\r") != std::string_view::npos) {
        return "'" + std::string(argument) + "'";
    }
    return std::string(argument);
}

std::string CallText(std::string_view function, const std::vector<std::string>& arguments)
{
    std::string text(function);
    for (const std::string& argument : arguments) {
        text += ' ';
        text += Word(argument);
    }
    return text;
}

std::string Text(const char* function, const char* argument)
{
    if (argument == nullptr) {
        Abort(std::string(function) + " was handed a null pointer for a text");
    }
    if (!IsReadable(argument)) {
        Abort(std::string(function) + ": no null pointer ends the arguments");
    }
    return argument;
}

std::vector<std::string> Arguments(const char* function, const char* path, va_list arguments)
{
    std::vector<std::string> result{Text(function, path)};
    for (int i = 0; i < kMostArguments; ++i) {
        const char* const argument = va_arg(arguments, const char*);
        if (argument == nullptr) {
            return result;
        }
        result.push_back(Text(function, argument));
    }
    Abort(std::string(function) + ": no null pointer ends the arguments");
}

std::vector<std::string> Elements(const char* function, const char* const* vector)
{
    std::vector<std::string> result;
    for (int i = 0; i < kMostArguments && IsReadable(vector + i); ++i) {
        if (vector[i] == nullptr) {
            return result;
        }
        result.push_back(Text(function, vector[i]));
    }
    Abort(std::string(function) + ": no null pointer ends the vector");
}

void Expect(std::string_view function, std::string_view what, long long is, long long expected)
{
    if (is != expected) {
        ADD_FAILURE() << function << ": " << what << " is " << is << ", not " << expected;
    }
}

bool Matches(const std::string& call, const std::string& words)
{
    return call.starts_with(words) && (call.size() == words.size() || call[words.size()] == ' ');
}

PlatformCall::PlatformCall()
{
    static std::recursive_mutex s_mutex;
    m_oneThread = std::unique_lock(s_mutex);
    if (Recorder::IsAlive() && Recorder::Current("").m_before) {
        Recorder::Current("").m_before();
    }
}

PlatformCall::~PlatformCall()
{
    if (Recorder::IsAlive() && Recorder::Current("").m_after) {
        Recorder::Current("").m_after();
    }
}

Recorder& Recorder::Current(const char* function)
{
    if (s_current == nullptr) {
        Abort(std::string(function) + " was called while no RecordingPlatform lives");
    }
    return *s_current;
}

Recorder::Recorder()
{
    if (s_current != nullptr) {
        Abort("a second RecordingPlatform was made");
    }
    s_current = this;
}

Recorder::~Recorder()
{
    s_current = nullptr;
    for (const auto& [handle, open] : m_open) {
        ADD_FAILURE() << "left open: " << open.what;
        open.release();
    }
    if (m_heldLock != -1) {
        ADD_FAILURE() << "left locked: the lock file, handle " << m_heldLock;
    }
    if (m_platformLockHolder != std::thread::id()) {
        ADD_FAILURE() << "left locked: the platform's file lock";
    }
}

std::optional<int> Recorder::Call(const std::string& text)
{
    m_calls.push_back(text);
    m_allCalls.push_back(text);
    const std::optional<int> answer = AnswerFor(text);
    return answer || !m_reaction ? answer : m_reaction(text);
}

std::optional<int> Recorder::Housekeeping(const std::string& text)
{
    m_allCalls.push_back(text);
    return AnswerFor(text);
}

std::optional<int> Recorder::AnswerFor(const std::string& text)
{
    std::optional<int> answer = m_interception ? m_interception(text) : std::nullopt;
    if (answer) {
        return answer;
    }
    for (Rule& rule : m_rules) {
        if (!Matches(text, rule.call)) {
            continue;
        }
        ++rule.seen;
        if (rule.nth == 0 || rule.nth == rule.seen) {
            answer = rule.result;
        }
    }
    return answer;
}

void Recorder::Open(const void* handle, const std::string& what, std::function<void()> release)
{
    m_open[handle] = {what, std::move(release)};
}

bool Recorder::IsOpen(const void* handle, const std::string& function) const
{
    if (m_open.contains(handle)) {
        return true;
    }
    ADD_FAILURE() << function << ": the handle is not open";
    return false;
}

bool Recorder::Close(const void* handle, const std::string& function)
{
    if (!IsOpen(handle, function)) {
        return false;
    }
    m_open.erase(handle);
    return true;
}

} // namespace harness
