/**
 * What is taken over from the kernel rather than from a manager's configuration.
 */
#ifndef VORNOVSCTL_ADOPT_LIVEDETAILS_H
#define VORNOVSCTL_ADOPT_LIVEDETAILS_H

#include "adopt/hostview.h"
#include "adopt/wish.h"

namespace vornovsctl {

/** Whether it is one that a server of IPv6 gave to the host alone. */
bool IsOfServer(const vornhost::Address& address);

/**
 * Completes a wish: what kind of interface it is and what it is made of, metrics that were chosen
 * for it, and the interface identifiers of its IPv6 addresses where they are not the MAC's.
 */
void CompleteFromKernel(const HostView& host, Wish& wish);

/** An interface that nobody manages: what it has is what it is to have. */
Wish ReadUnmanaged(const HostView& host, const std::string& name);

} // namespace vornovsctl

#endif
