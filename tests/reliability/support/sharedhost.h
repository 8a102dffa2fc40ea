/**
 * A simulated host that several processes share: its kernel and its switch live in shared memory
 * and outlive whoever changes them.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_SHAREDHOST_H
#define VORNOVS_TESTS_RELIABILITY_SHAREDHOST_H

#include "model/simulatedhost.h"

#include <cstdint>

#include <pthread.h>

namespace reliability {

class SharedHost {
public:
    SharedHost();
    ~SharedHost();
    SharedHost(const SharedHost&) = delete;
    SharedHost& operator=(const SharedHost&) = delete;

    void Set(const unit::SimulatedState& state);
    [[nodiscard]] unit::SimulatedState Get() const;

    /** For the time of one call: nobody else changes the host, and this one is up to date. */
    void Enter(unit::SimulatedHost& host);
    void Leave(const unit::SimulatedHost& host);

private:
    static constexpr std::size_t kCapacity = 1 << 20;

    struct Memory {
        pthread_mutex_t mutex;
        std::uint64_t changes;
        std::size_t size;
        char text[kCapacity];
    };

    void Write(const std::string& text);

    Memory* m_memory;
    /** The state of the changes that this process has seen. */
    std::uint64_t m_seen = 0;
};

} // namespace reliability

#endif
