/**
 * Random numbers that come again: VORNOVS_SEED in the environment says where they begin.
 */
#ifndef VORNOVS_TESTS_UNIT_SEED_H
#define VORNOVS_TESTS_UNIT_SEED_H

#include <cstdio>
#include <cstdlib>
#include <random>

namespace unit {

/** The seed of a test's first run, which is printed; the runs that follow count on from it. */
inline unsigned int FirstSeed()
{
    constexpr unsigned int kDefault = 20240501;
    const char* const set = std::getenv("VORNOVS_SEED");
    const auto seed =
        set == nullptr ? kDefault : static_cast<unsigned int>(std::strtoul(set, nullptr, 10));
    (void)std::printf("VORNOVS_SEED=%u\n", seed);
    return seed;
}

class Random {
public:
    explicit Random(unsigned int seed) : m_engine(seed) {}

    /** A number from 0 up to, but without, the limit. */
    int Below(int limit) { return static_cast<int>(m_engine() % static_cast<unsigned int>(limit)); }

private:
    std::mt19937 m_engine;
};

} // namespace unit

#endif
