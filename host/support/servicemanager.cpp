#include "servicemanager.h"

#include <cerrno>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <map>
#include <memory>
#include <thread>

#include <systemd/sd-bus.h>

namespace vornhost {
namespace {

using std::chrono::microseconds;
using std::chrono::milliseconds;
using Clock = std::chrono::steady_clock;

constexpr char kAddress[] = "unix:path=/run/systemd/private";
constexpr char kDestination[] = "org.freedesktop.systemd1";
constexpr char kManagerPath[] = "/org/freedesktop/systemd1";
constexpr char kManager[] = "org.freedesktop.systemd1.Manager";
constexpr char kUnit[] = "org.freedesktop.systemd1.Unit";
constexpr char kNoSuchUnit[] = "org.freedesktop.systemd1.NoSuchUnit";
constexpr char kJobDone[] = "done";
/** What still works is not turned down; what could work on and does not fails with the others. */
constexpr char kMode[] = "replace";
constexpr milliseconds kAnswerLimit{10000};
/** systemd is gone for a moment when it is replaced by a newer one. */
constexpr milliseconds kPause{200};

struct Closer {
    void operator()(sd_bus* bus) const { sd_bus_close_unref(bus); }
    void operator()(sd_bus_message* message) const { sd_bus_message_unref(message); }
    void operator()(char* text) const { std::free(text); }
};
using Bus = std::unique_ptr<sd_bus, Closer>;
using Message = std::unique_ptr<sd_bus_message, Closer>;
using Text = std::unique_ptr<char, Closer>;

struct Error {
    Error() = default;
    Error(const Error&) = delete;
    Error& operator=(const Error&) = delete;
    ~Error() { sd_bus_error_free(&value); }

    sd_bus_error value{nullptr, nullptr, 0};
};

/** Results of jobs that ended, by the job's path. */
using EndedJobs = std::map<std::string, std::string>;

int NoteEndedJob(sd_bus_message* message, void* jobs, sd_bus_error*)
{
    std::uint32_t number = 0;
    const char* job = nullptr;
    const char* unit = nullptr;
    const char* result = nullptr;
    if (sd_bus_message_read(message, "uoss", &number, &job, &unit, &result) >= 0) {
        try {
            (*static_cast<EndedJobs*>(jobs))[job] = result;
        } catch (const std::exception&) {
            return -ENOMEM;
        }
    }
    return 0;
}

Bus Connect()
{
    sd_bus* bus = nullptr;
    if (sd_bus_new(&bus) < 0) {
        return {};
    }
    Bus owned(bus);
    if (sd_bus_set_address(bus, kAddress) < 0 || sd_bus_start(bus) < 0) {
        return {};
    }
    return owned;
}

std::uint64_t Left(Clock::time_point deadline)
{
    const auto left = std::chrono::duration_cast<microseconds>(deadline - Clock::now()).count();
    return left > 0 ? static_cast<std::uint64_t>(left) : 0;
}

enum class Outcome { kDone, kFailed, kLate, kLost };

/** One job of systemd on one connection. */
class Job {
public:
    Job(const char* method, const std::string& unit, Clock::time_point deadline)
        : m_method(method), m_unit(unit), m_deadline(deadline)
    {
    }
    Outcome Run();
    const std::string& Why() const { return m_why; }

private:
    Outcome Fail(Outcome outcome, const std::string& why);
    Outcome Request();
    Outcome Wait();

    const char* m_method;
    const std::string& m_unit;
    Clock::time_point m_deadline;
    EndedJobs m_ended; // outlives the connection, which writes into it
    Bus m_bus;
    std::string m_path;
    std::string m_why;
};

Outcome Job::Fail(Outcome outcome, const std::string& why)
{
    m_why = why;
    return outcome;
}

Outcome Job::Request()
{
    Error error;
    sd_bus_message* reply = nullptr;
    sd_bus_message* call = nullptr;
    if (sd_bus_message_new_method_call(m_bus.get(), &call, kDestination, kManagerPath, kManager,
                                       m_method) < 0) {
        return Fail(Outcome::kFailed, "out of memory");
    }
    const Message ownedCall(call);
    const std::uint64_t left = Left(m_deadline);
    const int result = left == 0 ? -ETIMEDOUT
                       : sd_bus_message_append(call, "ss", m_unit.c_str(), kMode) < 0
                           ? -ENOMEM
                           : sd_bus_call(m_bus.get(), call, left, &error.value, &reply);
    const Message ownedReply(reply);
    if (result == -ETIMEDOUT) {
        return Fail(Outcome::kLate, "systemd does not answer");
    }
    if (result < 0 && sd_bus_error_is_set(&error.value) != 0 && sd_bus_is_open(m_bus.get()) > 0) {
        const char* const why = error.value.message;
        return Fail(Outcome::kFailed, why == nullptr ? error.value.name : why);
    }
    const char* path = nullptr;
    if (result < 0 || sd_bus_message_read(reply, "o", &path) < 0) {
        return Fail(Outcome::kLost, "the connection to systemd broke");
    }
    m_path = path;
    return Outcome::kDone;
}

Outcome Job::Wait()
{
    for (;;) {
        if (const auto ended = m_ended.find(m_path); ended != m_ended.end()) {
            return ended->second == kJobDone ? Outcome::kDone
                                             : Fail(Outcome::kFailed, "result " + ended->second);
        }
        int result = sd_bus_process(m_bus.get(), nullptr);
        if (result == 0) {
            const std::uint64_t left = Left(m_deadline);
            if (left == 0) {
                return Fail(Outcome::kLate, "not done in time");
            }
            result = sd_bus_wait(m_bus.get(), left);
        }
        if (result < 0 && result != -EINTR) {
            return Fail(Outcome::kLost, "the connection to systemd broke");
        }
    }
}

Outcome Job::Run()
{
    m_bus = Connect();
    // Before the request: a job may have ended when its path arrives.
    if (m_bus == nullptr ||
        sd_bus_match_signal(m_bus.get(), nullptr, nullptr, kManagerPath, kManager, "JobRemoved",
                            NoteEndedJob, &m_ended) < 0) {
        return Fail(Outcome::kLost, "systemd does not answer");
    }
    const Outcome outcome = Request();
    return outcome == Outcome::kDone ? Wait() : outcome;
}

bool RunJob(const char* method, const std::string& unit, milliseconds deadline, std::string* error)
{
    const auto end = Clock::now() + deadline;
    for (;;) {
        Job job(method, unit, end);
        const Outcome outcome = job.Run();
        if (outcome == Outcome::kDone) {
            return true;
        }
        if (outcome != Outcome::kLost || Clock::now() + kPause >= end) {
            if (error != nullptr) {
                *error = unit + ": " + job.Why();
            }
            return false;
        }
        // Asked again it joins its own job, or finds that it is done.
        std::this_thread::sleep_for(kPause);
    }
}

/** What failed too often is not started any more; somebody who asks for it anew wants it tried. */
void ForgetFailures(const std::string& unit)
{
    const Bus bus = Connect();
    if (bus != nullptr &&
        sd_bus_set_method_call_timeout(bus.get(), microseconds(kAnswerLimit).count()) >= 0) {
        (void)sd_bus_call_method(bus.get(), kDestination, kManagerPath, kManager, "ResetFailedUnit",
                                 nullptr, nullptr, "s", unit.c_str());
    }
}

/** @return  a property of a unit, which is loaded for that; nullopt when systemd does not answer,
 *           empty when it knows no unit of that name. */
std::optional<std::string> UnitProperty(const std::string& unit, const char* property)
{
    const Bus bus = Connect();
    Error error;
    sd_bus_message* reply = nullptr;
    if (bus == nullptr ||
        sd_bus_set_method_call_timeout(bus.get(), microseconds(kAnswerLimit).count()) < 0) {
        return std::nullopt;
    }
    const int result = sd_bus_call_method(bus.get(), kDestination, kManagerPath, kManager,
                                          "LoadUnit", &error.value, &reply, "s", unit.c_str());
    const Message owned(reply);
    if (sd_bus_error_has_name(&error.value, kNoSuchUnit) != 0 ||
        sd_bus_error_has_name(&error.value, SD_BUS_ERROR_INVALID_ARGS) != 0) {
        return std::string();
    }
    const char* path = nullptr;
    char* value = nullptr;
    if (result < 0 || sd_bus_message_read(reply, "o", &path) < 0 ||
        sd_bus_get_property_string(bus.get(), kDestination, path, kUnit, property, nullptr,
                                   &value) < 0) {
        return std::nullopt;
    }
    return std::string(Text(value).get());
}

} // namespace

bool StartUnit(const std::string& unit, milliseconds deadline, std::string* error)
{
    ForgetFailures(unit);
    return RunJob("StartUnit", unit, deadline, error);
}

bool StopUnit(const std::string& unit, milliseconds deadline, std::string* error)
{
    return RunJob("StopUnit", unit, deadline, error);
}

bool RestartUnit(const std::string& unit, milliseconds deadline, std::string* error)
{
    return RunJob("RestartUnit", unit, deadline, error);
}

std::optional<bool> UnitIsActive(const std::string& unit)
{
    const auto state = UnitProperty(unit, "ActiveState");
    return state ? std::optional(*state == "active" || *state == "reloading") : std::nullopt;
}

std::optional<bool> UnitExists(const std::string& unit)
{
    const auto state = UnitProperty(unit, "LoadState");
    return state ? std::optional(!state->empty() && *state != "not-found") : std::nullopt;
}

} // namespace vornhost
