#include "support/databaseclient.h"

#include "support/descriptor.h"

#include <chrono>
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <thread>
#include <unistd.h>

namespace {

using std::chrono::milliseconds;
using vornhost::AskDatabase;

constexpr char kSocket[] = "/run/database-test.sock";
constexpr milliseconds kPlenty(10000);

// Takes one connection, reads the request and sends the pieces with pauses between them.
class Server {
public:
    explicit Server(std::vector<std::string> pieces, std::string* request = nullptr)
        : m_socket(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0)), m_pieces(std::move(pieces)),
          m_request(request)
    {
        (void)unlink(kSocket);
        sockaddr_un address{};
        address.sun_family = AF_UNIX;
        std::string(kSocket).copy(address.sun_path, sizeof(address.sun_path) - 1);
        EXPECT_EQ(
            bind(m_socket.Get(), reinterpret_cast<const sockaddr*>(&address), sizeof(address)), 0);
        EXPECT_EQ(listen(m_socket.Get(), 1), 0);
        m_thread = std::jthread([this] { Serve(); });
    }
    Server(const Server&) = delete;
    Server& operator=(const Server&) = delete;
    ~Server() { m_thread.join(); }

private:
    void Serve()
    {
        const vornhost::Descriptor client(accept4(m_socket.Get(), nullptr, nullptr, SOCK_CLOEXEC));
        char part[256];
        const ssize_t count = recv(client.Get(), part, sizeof(part), 0);
        if (m_request != nullptr && count > 0) {
            m_request->assign(part, static_cast<std::size_t>(count));
        }
        for (const std::string& piece : m_pieces) {
            (void)send(client.Get(), piece.data(), piece.size(), MSG_NOSIGNAL);
            std::this_thread::sleep_for(milliseconds(20));
        }
        // Stays connected for as long as the client does, unless it has nothing to say.
        if (!m_pieces.empty()) {
            (void)recv(client.Get(), part, sizeof(part), 0);
        }
    }

    vornhost::Descriptor m_socket;
    std::vector<std::string> m_pieces;
    std::string* m_request; // set before the server is gone
    std::jthread m_thread;
};

TEST(AskDatabase, GivesTheMessageWhereverItIsCut)
{
    const std::string message = R"({"a":[{"b":"}]{["},["\"}","\\"],{}],"c":"\\\"}"})";
    for (std::size_t cut = 1; cut < message.size(); cut += 5) {
        const Server server({message.substr(0, cut), message.substr(cut) + "{\"next\":1}"});
        EXPECT_EQ(AskDatabase(kSocket, "request", kPlenty), message) << cut;
    }
}

TEST(AskDatabase, SendsTheRequest)
{
    std::string request;
    {
        const Server server({"{}"}, &request);
        EXPECT_EQ(AskDatabase(kSocket, "{\"id\":0}", kPlenty), "{}");
    }
    EXPECT_EQ(request, "{\"id\":0}");
}

TEST(AskDatabase, GivesUpWhenTheServerLeaves)
{
    const Server server({});
    EXPECT_EQ(AskDatabase(kSocket, "request", kPlenty), std::nullopt);
}

TEST(AskDatabase, GivesUpAfterItsLimit)
{
    const Server server({"{\"never\":"});
    const auto begin = std::chrono::steady_clock::now();

    EXPECT_EQ(AskDatabase(kSocket, "request", milliseconds(200)), std::nullopt);

    EXPECT_LT(std::chrono::steady_clock::now() - begin, milliseconds(5000));
}

TEST(AskDatabase, GivesUpWhereNobodyListens)
{
    (void)unlink(kSocket);
    EXPECT_EQ(AskDatabase(kSocket, "request", kPlenty), std::nullopt);
    EXPECT_EQ(AskDatabase(std::string(200, 'a'), "request", kPlenty), std::nullopt);
    EXPECT_EQ(AskDatabase("", "request", kPlenty), std::nullopt);
}

} // namespace
