#include "fakesystemd.h"

#include <array>
#include <cstdint>
#include <cstring>
#include <filesystem>
#include <list>
#include <memory>
#include <stdexcept>

#include <poll.h>
#include <sys/eventfd.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <systemd/sd-bus.h>
#include <unistd.h>

namespace harness {
namespace {

constexpr char kMark[] = "/run/systemd/system";
constexpr char kSocket[] = "/run/systemd/private";
constexpr char kManagerPath[] = "/org/freedesktop/systemd1";
constexpr char kManager[] = "org.freedesktop.systemd1.Manager";
constexpr char kUnitFolder[] = "/org/freedesktop/systemd1/unit/";
constexpr int kPollMilliseconds = 5;

struct Closer {
    void operator()(sd_bus* bus) const { sd_bus_flush_close_unref(bus); }
};
using Bus = std::unique_ptr<sd_bus, Closer>;

int Listen()
{
    std::filesystem::create_directories(kMark);
    std::filesystem::remove(kSocket);
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    std::memcpy(address.sun_path, kSocket, sizeof kSocket);
    const int listener = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0);
    if (listener < 0 ||
        ::bind(listener, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0 ||
        ::listen(listener, SOMAXCONN) != 0) {
        throw std::runtime_error("cannot listen at systemd's socket");
    }
    return listener;
}

} // namespace

class FakeSystemd::Server {
public:
    explicit Server(FakeSystemd& owner) : m_owner(owner) {}
    void Run();

private:
    static int OnMessage(sd_bus_message* message, void* server, sd_bus_error* error);
    void Accept();
    int Answer(sd_bus_message* message);
    int AnswerJob(sd_bus_message* message, const std::string& method);
    int AnswerReset(sd_bus_message* message);
    int AnswerLoad(sd_bus_message* message) const;
    int AnswerProperty(sd_bus_message* message) const;
    std::string StateOf(const std::string& unit) const;
    void EndJobs();

    struct Ending {
        sd_bus* bus;
        std::uint32_t number;
        std::string unit;
        std::string result;
    };

    FakeSystemd& m_owner;
    std::list<Bus> m_buses;
    std::vector<Ending> m_endings;
    std::vector<sd_bus*> m_broken;
    std::uint32_t m_lastJob = 0;
};

int FakeSystemd::Server::OnMessage(sd_bus_message* message, void* server, sd_bus_error*)
{
    return static_cast<Server*>(server)->Answer(message);
}

void FakeSystemd::Server::Accept()
{
    const int connection =
        ::accept4(m_owner.m_listener, nullptr, nullptr, SOCK_CLOEXEC | SOCK_NONBLOCK);
    if (connection < 0) {
        return;
    }
    sd_bus* bus = nullptr;
    sd_id128_t identity{};
    (void)sd_id128_randomize(&identity);
    if (sd_bus_new(&bus) < 0) {
        throw std::runtime_error("out of memory");
    }
    m_buses.emplace_back(bus);
    if (sd_bus_set_fd(bus, connection, connection) < 0 || sd_bus_set_server(bus, 1, identity) < 0 ||
        sd_bus_add_filter(bus, nullptr, OnMessage, this) < 0 || sd_bus_start(bus) < 0) {
        throw std::runtime_error("cannot serve a connection");
    }
}

std::string FakeSystemd::Server::StateOf(const std::string& unit) const
{
    const std::lock_guard<std::mutex> guard(m_owner.m_mutex);
    auto found = m_owner.m_units.find(unit);
    const auto at = unit.find('@');
    if (found == m_owner.m_units.end() && at != std::string::npos) {
        found = m_owner.m_units.find(unit.substr(0, at + 1) + unit.substr(unit.rfind('.')));
    }
    return found == m_owner.m_units.end() ? "" : found->second;
}

int FakeSystemd::Server::AnswerJob(sd_bus_message* message, const std::string& method)
{
    const char* unit = nullptr;
    const char* mode = nullptr;
    if (sd_bus_message_read(message, "ss", &unit, &mode) < 0) {
        return -EINVAL;
    }
    {
        const std::lock_guard<std::mutex> guard(m_owner.m_mutex);
        m_owner.m_jobs.push_back(method + " " + unit);
        if (m_owner.m_breaks > 0) {
            --m_owner.m_breaks;
            m_broken.push_back(sd_bus_message_get_bus(message));
            return 1;
        }
    }
    if (StateOf(unit).empty()) {
        return sd_bus_reply_method_errorf(message, "org.freedesktop.systemd1.NoSuchUnit",
                                          "Unit %s not found.", unit);
    }
    const std::uint32_t number = ++m_lastJob;
    const std::string path = std::string(kManagerPath) + "/job/" + std::to_string(number);
    // A unit that has failed too often is not started any more.
    const std::string result = StateOf(unit) == "failed" ? "failed"
                               : m_owner.m_worker        ? m_owner.m_worker(method, unit)
                                                         : "done";
    if (!result.empty()) {
        m_endings.push_back({sd_bus_message_get_bus(message), number, unit, result});
    }
    return sd_bus_reply_method_return(message, "o", path.c_str());
}

int FakeSystemd::Server::AnswerReset(sd_bus_message* message)
{
    const char* unit = nullptr;
    if (sd_bus_message_read(message, "s", &unit) < 0) {
        return -EINVAL;
    }
    const std::lock_guard<std::mutex> guard(m_owner.m_mutex);
    const auto found = m_owner.m_units.find(unit);
    if (found == m_owner.m_units.end()) {
        return sd_bus_reply_method_errorf(message, "org.freedesktop.systemd1.NoSuchUnit",
                                          "Unit %s not loaded.", unit);
    }
    if (found->second == "failed") {
        found->second = "inactive";
    }
    return sd_bus_reply_method_return(message, nullptr);
}

int FakeSystemd::Server::AnswerLoad(sd_bus_message* message) const
{
    const char* unit = nullptr;
    char* path = nullptr;
    if (sd_bus_message_read(message, "s", &unit) < 0 ||
        sd_bus_path_encode("/org/freedesktop/systemd1/unit", unit, &path) < 0) {
        return -EINVAL;
    }
    const std::unique_ptr<char, decltype(&std::free)> owned(path, &std::free);
    return sd_bus_reply_method_return(message, "o", path);
}

int FakeSystemd::Server::AnswerProperty(sd_bus_message* message) const
{
    const char* interface = nullptr;
    const char* property = nullptr;
    char* unit = nullptr;
    if (sd_bus_message_read(message, "ss", &interface, &property) < 0 ||
        sd_bus_path_decode(sd_bus_message_get_path(message), "/org/freedesktop/systemd1/unit",
                           &unit) <= 0) {
        return -EINVAL;
    }
    const std::unique_ptr<char, decltype(&std::free)> owned(unit, &std::free);
    const std::string state = StateOf(unit);
    const std::string value = std::string(property) == "LoadState"
                                  ? (state.empty() ? "not-found" : "loaded")
                                  : (state.empty() ? "inactive" : state);
    return sd_bus_reply_method_return(message, "v", "s", value.c_str());
}

int FakeSystemd::Server::Answer(sd_bus_message* message)
{
    const char* const member = sd_bus_message_get_member(message);
    const std::string method = member == nullptr ? "" : member;
    if (sd_bus_message_is_method_call(message, kManager, nullptr) > 0) {
        if (method == "ResetFailedUnit") {
            return AnswerReset(message);
        }
        return method == "LoadUnit" ? AnswerLoad(message) : AnswerJob(message, method);
    }
    const char* const path = sd_bus_message_get_path(message);
    if (path != nullptr && std::string(path).starts_with(kUnitFolder) && method == "Get") {
        return AnswerProperty(message);
    }
    return 0;
}

void FakeSystemd::Server::EndJobs()
{
    for (const Ending& ending : m_endings) {
        const std::string path =
            std::string(kManagerPath) + "/job/" + std::to_string(ending.number);
        (void)sd_bus_emit_signal(ending.bus, kManagerPath, kManager, "JobRemoved", "uoss",
                                 ending.number, path.c_str(), ending.unit.c_str(),
                                 ending.result.c_str());
    }
    m_endings.clear();
}

void FakeSystemd::Server::Run()
{
    for (;;) {
        std::array<pollfd, 2> watched = {
            {{m_owner.m_listener, POLLIN, 0}, {m_owner.m_end, POLLIN, 0}}};
        (void)::poll(watched.data(), watched.size(), kPollMilliseconds);
        if (watched[1].revents != 0) {
            return;
        }
        if (watched[0].revents != 0) {
            Accept();
        }
        for (auto bus = m_buses.begin(); bus != m_buses.end();) {
            int result = 0;
            while ((result = sd_bus_process(bus->get(), nullptr)) > 0) {
                EndJobs();
            }
            const bool broken = std::erase(m_broken, bus->get()) > 0;
            if (broken) {
                sd_bus_close(bus->get());
            }
            bus = broken || result < 0 ? m_buses.erase(bus) : std::next(bus);
        }
    }
}

FakeSystemd::FakeSystemd(Worker worker)
    : m_worker(std::move(worker)), m_listener(Listen()), m_end(::eventfd(0, EFD_CLOEXEC)),
      m_server([this] { Serve(); })
{
}

FakeSystemd::~FakeSystemd()
{
    (void)::eventfd_write(m_end, 1);
    m_server.join();
    ::close(m_listener);
    ::close(m_end);
    std::filesystem::remove_all("/run/systemd");
}

void FakeSystemd::Serve()
{
    Server(*this).Run();
}

void FakeSystemd::AddUnit(const std::string& unit, const std::string& state)
{
    const std::lock_guard<std::mutex> guard(m_mutex);
    m_units[unit] = state;
}

void FakeSystemd::BreakConnections(int times)
{
    const std::lock_guard<std::mutex> guard(m_mutex);
    m_breaks = times;
}

std::vector<std::string> FakeSystemd::Jobs()
{
    const std::lock_guard<std::mutex> guard(m_mutex);
    return m_jobs;
}

} // namespace harness
