// Many clients at once on one host, with one lock and one state folder between them.
#include "load/client.h"
#include "support/figures.h"

#include <vornovs/vornovs.h>

#include <cstdlib>
#include <new>

#include <sys/mman.h>
#include <sys/wait.h>
#include <unistd.h>

namespace reliability {

namespace {

/** How long the clients work; VORNOVS_LOAD_SECONDS says otherwise. */
std::chrono::seconds Duration()
{
    constexpr int kSeconds = 60;
    const char* const set = std::getenv("VORNOVS_LOAD_SECONDS");
    return std::chrono::seconds(set == nullptr ? kSeconds : std::atoi(set));
}

Ledger& NewLedger()
{
    void* const memory =
        ::mmap(nullptr, sizeof(Ledger), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
    return *new (memory) Ledger;
}

unit::SimulatedState FourPorts()
{
    harness::RecordingPlatform platform;
    unit::SimulatedHost host(platform);
    for (const char* name : {"eth0", "eth1", "eth2", "eth3"}) {
        host.AddPort(name, std::string("IPADDR=10.0.") + name[3] + ".2\n");
    }
    return host;
}

std::vector<pid_t> Start(SharedHost& shared, Ledger& ledger)
{
    const unsigned int seed = unit::FirstSeed();
    const auto end = std::chrono::steady_clock::now() + Duration();
    std::vector<pid_t> clients;
    (void)std::fflush(stdout);
    for (int number = 0; number < kClients; ++number) {
        const pid_t client = ::fork();
        if (client == 0) {
            {
                Client working(shared, ledger, number, seed + static_cast<unsigned int>(number));
                working.Work(end);
            }
            (void)std::fflush(stdout);
            ::_exit(testing::Test::HasFailure() ? 1 : 0);
        }
        clients.push_back(client);
    }
    return clients;
}

/** The names in the file are those of the clients that say so of themselves. */
void ExpectNoNameLost(const Ledger& ledger)
{
    unit::Names registered;
    for (int number = 0; number < kClients; ++number) {
        if (ledger.registered.at(static_cast<std::size_t>(number))) {
            registered.insert(Client::NameOf(number));
        }
    }
    const harness::RecordingPlatform platform;
    unit::Names names;
    EXPECT_EQ(VORN::OVS::GetAllRegister(names), static_cast<int>(registered.size()));
    EXPECT_EQ(names, registered);
}

TEST(Load, LosesNoNameAndConvertsOneAtATime)
{
    SharedHost shared;
    Ledger& ledger = NewLedger();
    shared.Set(FourPorts());
    for (const pid_t client : Start(shared, ledger)) {
        int status = 0;
        EXPECT_EQ(::waitpid(client, &status, 0), client);
        EXPECT_EQ(status, 0) << "a client ended with that wait status";
    }
    ExpectNoNameLost(ledger);
    EXPECT_EQ(ledger.overlaps, 0);
    EXPECT_EQ(ledger.converting, 0);
    EXPECT_GT(ledger.conversions, 2);
    EXPECT_GT(ledger.operations, 10 * kClients);
    for (const std::string& name : unit::ListFolder(unit::kStateFolder)) {
        EXPECT_EQ(name.find(".new"), std::string::npos) << name;
    }
    Figure(std::to_string(kClients) + " clients made " + std::to_string(ledger.operations) +
           " calls at once, which converted the host " + std::to_string(ledger.conversions) +
           " times; the log explained all " + std::to_string(ledger.failures) + " that failed");
}

} // namespace

} // namespace reliability
