#ifndef VORNOVS_SYSTEM_PAUSE_H
#define VORNOVS_SYSTEM_PAUSE_H

#include <unistd.h>

namespace VORN::OVS {

/** How long the network is left alone after a stop, and before bonds and VLANs are rebuilt. */
constexpr unsigned int kSettleSeconds = 3;

/** Pauses for whole seconds; a signal does not shorten the pause. */
inline void Pause(unsigned int seconds)
{
    while (seconds > 0) {
        seconds = ::sleep(seconds);
    }
}

} // namespace VORN::OVS

#endif
