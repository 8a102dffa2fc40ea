#include "sandbox/systemlog.h"

#include <array>
#include <cerrno>
#include <chrono>
#include <cstdlib>
#include <cstring>
#include <stdexcept>

#include <sys/socket.h>
#include <sys/un.h>
#include <syslog.h>
#include <unistd.h>

namespace harness {
namespace {

constexpr char kPath[] = "/dev/log";
constexpr char kStop[] = "stop";
constexpr char kMark[] = "mark";

sockaddr_un Address()
{
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    std::memcpy(address.sun_path, kPath, sizeof kPath);
    return address;
}

/** From "<11>Nov 21 01:02:03 program[12]: text" to "3 text". */
std::string Readable(const std::string& datagram)
{
    constexpr size_t kStampLength = sizeof "Nov 21 01:02:03 " - 1;
    const size_t stamp = datagram.find('>') + 1;
    const size_t text = datagram.find(": ", stamp + kStampLength);
    if (stamp == 0 || text == std::string::npos) {
        return datagram;
    }
    const long priority = std::strtol(datagram.c_str() + 1, nullptr, 10) & LOG_PRIMASK;
    return std::to_string(priority) + " " + datagram.substr(text + 2);
}

} // namespace

SystemLog::SystemLog() : m_socket(::socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0))
{
    const sockaddr_un address = Address();
    (void)::unlink(kPath);
    if (m_socket < 0 ||
        ::bind(m_socket, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0) {
        throw std::runtime_error(std::string("cannot serve /dev/log: ") + std::strerror(errno));
    }
    ::closelog(); // the C library may hold a connection to an earlier one
    m_server = std::thread([this] { Serve(); });
    // A thread that begins takes memory; who is forked meanwhile would find the allocator locked,
    // for not every sanitizer's looks after that.
    (void)Lines();
}

SystemLog::~SystemLog()
{
    Send(kStop);
    m_server.join();
    ::close(m_socket);
    (void)::unlink(kPath);
    ::closelog();
}

std::vector<std::string> SystemLog::Lines()
{
    // The queue is in order: once the mark is read, so is everything that was sent before it.
    Send(kMark);
    for (;;) {
        {
            const std::lock_guard<std::mutex> guard(m_mutex);
            if (!m_datagrams.empty() && m_datagrams.back() == kMark) {
                m_datagrams.pop_back();
                std::vector<std::string> lines;
                for (const std::string& datagram : m_datagrams) {
                    lines.push_back(Readable(datagram));
                }
                return lines;
            }
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
}

void SystemLog::Serve()
{
    // The queue is short, and who logs into a full one waits: it is emptied all the time.
    std::array<char, 65536> buffer{};
    for (;;) {
        const ssize_t size = ::recv(m_socket, buffer.data(), buffer.size(), 0);
        if (size < 0) {
            continue;
        }
        const std::string datagram(buffer.data(), static_cast<size_t>(size));
        if (datagram == kStop) {
            return;
        }
        const std::lock_guard<std::mutex> guard(m_mutex);
        m_datagrams.push_back(datagram);
    }
}

void SystemLog::Send(const std::string& datagram) const
{
    const sockaddr_un address = Address();
    (void)::sendto(m_socket, datagram.data(), datagram.size(), 0,
                   reinterpret_cast<const sockaddr*>(&address), sizeof address);
}

} // namespace harness
