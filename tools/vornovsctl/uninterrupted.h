/**
 * Keeps a conversion whole when the terminal goes away with the network.
 */
#ifndef VORNOVSCTL_UNINTERRUPTED_H
#define VORNOVSCTL_UNINTERRUPTED_H

#include <array>
#include <csignal>

namespace vornovsctl {

/** Ignores the signals that would end the process while it lives. */
class Uninterrupted {
public:
    Uninterrupted()
    {
        struct sigaction ignore {};
        ignore.sa_handler = SIG_IGN;
        for (std::size_t index = 0; index < kSignals.size(); ++index) {
            (void)sigaction(kSignals[index], &ignore, &m_before[index]);
        }
    }
    ~Uninterrupted()
    {
        for (std::size_t index = 0; index < kSignals.size(); ++index) {
            (void)sigaction(kSignals[index], &m_before[index], nullptr);
        }
    }
    Uninterrupted(const Uninterrupted&) = delete;
    Uninterrupted& operator=(const Uninterrupted&) = delete;

private:
    static constexpr std::array kSignals{SIGHUP, SIGINT, SIGQUIT, SIGTERM, SIGPIPE};
    std::array<struct sigaction, kSignals.size()> m_before{};
};

} // namespace vornovsctl

#endif
