#ifndef VORNOVS_SWITCH_NETWORK_H
#define VORNOVS_SWITCH_NETWORK_H

namespace VORN::OVS {

/**
 * The whole host's network, stopped and left alone for a while, then started again: at the latest
 * when this object goes, so that a host whose memory runs out half-way does not stay dark. Failures
 * of the network script are only logged.
 */
class StoppedNetwork {
public:
    StoppedNetwork();
    ~StoppedNetwork();
    StoppedNetwork(const StoppedNetwork&) = delete;
    StoppedNetwork& operator=(const StoppedNetwork&) = delete;

    /** Starts the network, and with it the wireless service if that runs. */
    void Start();

private:
    bool m_stopped = true;
};

} // namespace VORN::OVS

#endif
