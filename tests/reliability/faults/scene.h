/**
 * Hosts in each situation, to be put back after every fault.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_SCENE_H
#define VORNOVS_TESTS_RELIABILITY_SCENE_H

#include "faults/scenario.h"

namespace reliability {

/** The library's folders and the host behind the platform. */
class Scene {
public:
    /** @param situation  made by calls of the library, none of which fails. */
    explicit Scene(Situation situation);

    /** Puts the folders back, and gives the host to put behind a new platform. */
    const unit::SimulatedState& Restore() const;

    /** The lines that must be in some configuration file whatever happens. */
    const std::vector<std::string>& Settings() const { return m_settings; }

private:
    unit::SimulatedState m_host;
    std::map<std::string, std::string> m_files;
    std::vector<std::string> m_settings;
};

} // namespace reliability

#endif
