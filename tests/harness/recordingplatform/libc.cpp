// `sleep` and the system log: definitions in the program take the place of the C library's.
#include "recordingplatform/recorder.h"

#include <gtest/gtest.h>

#include <cstdarg>
#include <cstdio>

#include <syslog.h>
#include <unistd.h>

using harness::LogLine;
using harness::PlatformCall;
using harness::Recorder;

namespace {

constexpr std::string_view kPrefix = "%s:%d ";

/** Takes "file:line text" apart. */
LogLine Parse(int priority, const std::string& line)
{
    const std::size_t colon = line.find(':');
    const std::size_t blank = line.find(' ', colon);
    const std::string number = line.substr(colon + 1, blank - colon - 1);
    if (colon == 0 || number.empty() || number.front() == '-' || number == "0") {
        ADD_FAILURE() << "the log line does not begin with file and line: " << line;
    }
    return {priority, line.substr(0, colon), line.substr(blank + 1)};
}

__attribute__((format(printf, 2, 0))) void Log(int priority, const char* format, va_list arguments)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("syslog");
    if (!std::string_view(format).starts_with(kPrefix)) {
        ADD_FAILURE() << "the log format does not begin with \"" << kPrefix << "\": " << format;
        return;
    }
    va_list measured;
    va_copy(measured, arguments);
    // NOLINTNEXTLINE(clang-analyzer-valist.Uninitialized): the copy is made one line above
    const int size = std::vsnprintf(nullptr, 0, format, measured);
    va_end(measured);
    std::string line(static_cast<std::size_t>(size) + 1, '\0');
    (void)std::vsnprintf(line.data(), line.size(), format, arguments);
    line.pop_back();
    recorder.m_log.push_back(Parse(priority, line));
}

} // namespace

extern "C" {

unsigned int sleep(unsigned int seconds)
{
    const PlatformCall guard;
    const std::optional<int> left =
        Recorder::Current("sleep").Call("sleep " + std::to_string(seconds));
    return static_cast<unsigned int>(left.value_or(0));
}

void syslog(int priority, const char* format, ...)
{
    va_list arguments;
    va_start(arguments, format);
    Log(priority, format, arguments);
    va_end(arguments);
}

void __syslog_chk(int priority, int flag, const char* format, ...)
    __attribute__((format(printf, 3, 4)));

void __syslog_chk(int priority, int /*flag*/, const char* format, ...)
{
    va_list arguments;
    va_start(arguments, format);
    Log(priority, format, arguments);
    va_end(arguments);
}
}
