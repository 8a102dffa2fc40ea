/**
 * One of many clients that use the host at once.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_CLIENT_H
#define VORNOVS_TESTS_RELIABILITY_CLIENT_H

#include "load/ledger.h"
#include "model/seed.h"
#include "support/sharedhost.h"

#include <chrono>

namespace reliability {

class Client {
public:
    Client(SharedHost& shared, Ledger& ledger, int number, unsigned int seed);

    /** Makes calls at random until then; every so often all clients withdraw. */
    void Work(std::chrono::steady_clock::time_point end);

    /** The name of a client by its number. */
    static std::string NameOf(int number);

private:
    std::optional<int> See(const std::string& call);
    void Step();
    void Register();
    void UnRegister();
    void Ask();
    void Attach();
    void Detach();
    void MakeBond();
    void DropBond();
    void Tag();
    void LookAtLists();
    /** A result that is no success must be explained by a line in the log. */
    void Expect(const char* call, int result, int success);
    /** Whether the latest call logged an error. */
    [[nodiscard]] bool HasComplained() const;

    std::string AnyBridge();

    harness::RecordingPlatform m_platform;
    unit::SimulatedHost m_host;
    Ledger& m_ledger;
    const int m_number;
    const std::string m_name;
    const std::string m_port;
    unit::Random m_random;
    bool m_converting = false;
};

} // namespace reliability

#endif
