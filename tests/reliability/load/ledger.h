/**
 * What the clients of a load test tell each other and the test: in shared memory.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_LEDGER_H
#define VORNOVS_TESTS_RELIABILITY_LEDGER_H

#include <array>
#include <atomic>

namespace reliability {

constexpr int kClients = 64;

struct Ledger {
    /** Each client's own: whether it is registered. */
    std::array<std::atomic<bool>, kClients> registered{};
    std::atomic<long> operations{0};
    std::atomic<long> failures{0}; ///< that the log explained
    std::atomic<long> conversions{0};
    std::atomic<int> converting{0};
    std::atomic<int> overlaps{0}; ///< conversions that began while another one was under way
};

} // namespace reliability

#endif
