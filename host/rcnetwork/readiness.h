/**
 * What a plan waits for between its steps, so that traffic always has a way.
 */
#ifndef VORNHOST_RCNETWORK_READINESS_H
#define VORNHOST_RCNETWORK_READINESS_H

#include <string>
#include <vector>

namespace vornhost {

/**
 * Waits for one of these, each as long as it may take:
 *   link NAME          the interface has a carrier
 *   member NAME        the kernel's bond has the interface in use
 *   alone NAME         the partner, of which nothing shows here what it thinks, takes the interface
 *                      for one that is in no aggregate any more
 *   switch BRIDGE PORT the partner of the switch's bond has agreed on LACP
 * @return  whether it came.
 */
bool WaitFor(const std::vector<std::string>& what);

} // namespace vornhost

#endif
