// A switch's database that is down, silent, or talks nonsense; and locks that others hold.
#include "host/client.h"
#include "host/host.h"
#include "support/figures.h"
#include "surroundings/operations.h"

#include <gtest/gtest.h>

#include <array>
#include <chrono>
#include <filesystem>
#include <thread>

#include <poll.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>
#include <vornovs/vornovs.h>
#include <vornplatform/core.h>

namespace {

using reliability::Findings;

constexpr char kSocket[] = "/run/openvswitch/db.sock";

/** Answers whoever asks with the same text; without one it says nothing. */
class Database {
public:
    explicit Database(std::string answer) : m_answer(std::move(answer))
    {
        std::filesystem::create_directories("/run/openvswitch");
        std::filesystem::remove(kSocket);
        sockaddr_un address{};
        address.sun_family = AF_UNIX;
        std::string(kSocket).copy(address.sun_path, sizeof address.sun_path - 1);
        m_socket = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
        EXPECT_EQ(::bind(m_socket, reinterpret_cast<const sockaddr*>(&address), sizeof address), 0);
        EXPECT_EQ(::listen(m_socket, 10), 0);
        m_server = std::thread([this] { Serve(); });
    }
    Database(const Database&) = delete;
    Database& operator=(const Database&) = delete;
    ~Database()
    {
        (void)::shutdown(m_socket, SHUT_RDWR);
        m_server.join();
        (void)::close(m_socket);
        std::filesystem::remove(kSocket);
    }

private:
    void Serve() const
    {
        for (int client = 0; (client = ::accept4(m_socket, nullptr, nullptr, SOCK_CLOEXEC)) >= 0;) {
            size_t sent = 0;
            while (sent < m_answer.size()) {
                const ssize_t size =
                    ::send(client, m_answer.data() + sent, m_answer.size() - sent, MSG_NOSIGNAL);
                if (size <= 0) {
                    break;
                }
                sent += static_cast<size_t>(size);
            }
            // Until the other side has gone: nothing more is said.
            pollfd gone = {client, POLLRDHUP, 0};
            (void)::poll(&gone, 1, 60000);
            (void)::close(client);
        }
    }

    std::string m_answer;
    int m_socket = -1;
    std::thread m_server;
};

/** @return  seconds that it took a client to be told that the bridge is not known. */
double SecondsUntilRefused()
{
    reliability::StartWith(reliability::HostOnSwitch());
    const auto begin = std::chrono::steady_clock::now();
    EXPECT_EQ(reliability::RunClient({},
                                     [](Findings& findings) {
                                         findings.Expect(VORN::OVS::RemoveInterface("ovs_eth0") ==
                                                             -1,
                                                         "an interface was taken off");
                                     }),
              "");
    const std::chrono::duration<double> taken = std::chrono::steady_clock::now() - begin;
    EXPECT_EQ(reliability::LibraryFiles(), reliability::HostOnSwitch());
    EXPECT_TRUE(reliability::TakeCalls().empty()) << "the network was stopped";
    return taken.count();
}

TEST(Database, ThatTellsNothingLeavesTheHostAsItIs)
{
    EXPECT_LT(SecondsUntilRefused(), 10) << "down";
    const std::string deep = std::string(500000, '[') + std::string(500000, ']');
    const std::array<std::string, 6> answers = {"{}",
                                                "[]",
                                                "{\"result\":[{\"rows\":\"none\"}],\"id\":0}",
                                                "{\"error\":\"no\"}",
                                                deep,
                                                "{\"result\":\"" + std::string(1000000, 'x') +
                                                    "\"}"};
    for (const std::string& answer : answers) {
        SCOPED_TRACE(answer.substr(0, 40));
        const Database database(answer);
        EXPECT_LT(SecondsUntilRefused(), 15);
    }
    reliability::Figure(std::to_string(answers.size() + 1) +
                        " surroundings with a database that is down or talks nonsense");
}

TEST(Database, WaitsOfWhichHaveAnEnd)
{
    for (const char* const answer : {"", "{\"result\":[", "rubbish without any end"}) {
        SCOPED_TRACE(answer);
        const Database database(answer);
        EXPECT_LT(SecondsUntilRefused(), 30);
    }
    reliability::Figure("3 surroundings with a database that does not end its answer");
}

/** Each in a process of its own, all at once. */
TEST(PlantedLock, WaitsOfAllAreAsLongAsAgreedAndNothingIsDone)
{
    reliability::LearnEnds();
    reliability::StartWith(reliability::HostOnSwitch());
    int handle = -1;
    ASSERT_EQ(VLIBCFileLockTimeByFile(reliability::kLockPath, 1, 0, &handle), 0);
    const auto begin = std::chrono::steady_clock::now();
    std::vector<std::thread> clients;
    const std::vector<std::pair<std::string, int>> expected = {
        {"Register", 0},       {"UnRegister", -1},    {"AttachPort", -1},
        {"OVSBondCreate", -1}, {"OVSBondRemove", -1}, {"OVSBodChMode", -1}};
    for (const auto& [name, result] : expected) {
        clients.emplace_back([name = name, result = result] {
            Findings findings;
            reliability::RunClient(
                {},
                [&](Findings& shared) {
                    shared.SetResult(reliability::OperationCalled(name).run());
                },
                findings);
            EXPECT_EQ(findings.Text(), "") << name;
            EXPECT_EQ(findings.Result(), result) << name;
        });
    }
    for (std::thread& client : clients) {
        client.join();
    }
    const std::chrono::duration<double> taken = std::chrono::steady_clock::now() - begin;
    EXPECT_GT(taken.count(), 4.5);
    EXPECT_LT(taken.count(), 25);
    EXPECT_EQ(VLIBCFileUnlockByFile(handle), 0);
    EXPECT_EQ(reliability::LibraryFiles(), reliability::HostOnSwitch());
    EXPECT_TRUE(reliability::TakeCalls().empty());
    reliability::Figure(std::to_string(expected.size()) +
                        " surroundings with a lock that somebody else holds");
}

} // namespace
