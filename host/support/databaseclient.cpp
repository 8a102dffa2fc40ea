#include "databaseclient.h"

#include "descriptor.h"

#include <algorithm>
#include <cerrno>
#include <poll.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <thread>

namespace vornhost {

namespace {

using Clock = std::chrono::steady_clock;

// Where one message of the server ends: messages are JSON objects with nothing between them.
class MessageEnd {
public:
    /** Takes the next byte. @return whether the message ends with it. */
    bool Take(char byte)
    {
        if (m_inString) {
            m_inString = m_escaped || byte != '"';
            m_escaped = !m_escaped && byte == '\\';
            return false;
        }
        m_inString = byte == '"';
        m_depth += byte == '{' || byte == '[' ? 1 : 0;
        m_depth -= byte == '}' || byte == ']' ? 1 : 0;
        return m_depth == 0 && (byte == '}' || byte == ']');
    }

private:
    int m_depth = 0;
    bool m_inString = false;
    bool m_escaped = false;
};

class Connection {
public:
    explicit Connection(Clock::time_point limit)
        : m_socket(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0)), m_limit(limit)
    {
    }

    bool Open(const std::string& path) const
    {
        sockaddr_un address{};
        address.sun_family = AF_UNIX;
        if (!m_socket || path.size() >= sizeof(address.sun_path)) {
            return false;
        }
        path.copy(address.sun_path, path.size());
        // A local server takes the connection at once, or its queue is full for a moment.
        while (
            connect(m_socket.Get(), reinterpret_cast<const sockaddr*>(&address), sizeof(address))) {
            if ((errno != EAGAIN && errno != EINTR) || Clock::now() >= m_limit) {
                return false;
            }
            std::this_thread::sleep_for(std::chrono::milliseconds(10));
        }
        return true;
    }

    bool Send(std::string_view text) const
    {
        while (!text.empty()) {
            if (!Wait(POLLOUT)) {
                return false;
            }
            const ssize_t count = send(m_socket.Get(), text.data(), text.size(), MSG_NOSIGNAL);
            if (count < 0 && errno != EINTR && errno != EAGAIN) {
                return false;
            }
            text.remove_prefix(static_cast<std::size_t>(std::max<ssize_t>(count, 0)));
        }
        return true;
    }

    std::optional<std::string> ReceiveMessage() const
    {
        std::string message;
        MessageEnd end;
        char part[4096];
        while (Wait(POLLIN)) {
            const ssize_t count = recv(m_socket.Get(), part, sizeof(part), 0);
            if (count == 0 || (count < 0 && errno != EINTR && errno != EAGAIN)) {
                return std::nullopt;
            }
            for (ssize_t index = 0; index < count; ++index) {
                message += part[index];
                if (end.Take(part[index])) {
                    return message;
                }
            }
        }
        return std::nullopt;
    }

private:
    bool Wait(short event) const
    {
        for (;;) {
            const auto left =
                std::chrono::duration_cast<std::chrono::milliseconds>(m_limit - Clock::now());
            if (left.count() <= 0) {
                return false;
            }
            pollfd waiting{m_socket.Get(), event, 0};
            const int ready = poll(&waiting, 1, static_cast<int>(left.count()));
            if (ready > 0) {
                return true;
            }
            if (ready == 0 || errno != EINTR) {
                return false;
            }
        }
    }

    Descriptor m_socket;
    Clock::time_point m_limit;
};

} // namespace

std::optional<std::string> AskDatabase(const std::string& socketPath, std::string_view request,
                                       std::chrono::milliseconds limit)
{
    const Connection connection(Clock::now() + limit);
    if (!connection.Open(socketPath) || !connection.Send(request)) {
        return std::nullopt;
    }
    return connection.ReceiveMessage();
}

} // namespace vornhost
