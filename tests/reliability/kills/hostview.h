/**
 * A simulated host as vornovsctl sees it: through the switch's database and the kernel.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_HOSTVIEW_H
#define VORNOVS_TESTS_RELIABILITY_HOSTVIEW_H

#include "model/simulatedhost.h"

namespace reliability {

/** While one lives, the host is the one that vornovsctl looks at. */
class HostView {
public:
    explicit HostView(const unit::SimulatedState& host);
    ~HostView();
    HostView(const HostView&) = delete;
    HostView& operator=(const HostView&) = delete;
};

/** Runs a command of vornovsctl. @return its exit status; the output is added to `text`. */
int Ctl(const std::string& command, std::string& text);

} // namespace reliability

#endif
