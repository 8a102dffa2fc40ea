/**
 * What the network program has to say: on standard error and in the system log.
 */
#ifndef VORNHOST_RCNETWORK_REPORT_H
#define VORNHOST_RCNETWORK_REPORT_H

#include "support/remark.h"

#include <vector>

namespace vornhost {

/** Says one remark on standard error and in the system log. */
void Say(const Remark& remark);

/** Says every remark. @return  whether one of them was an error. */
bool SayAll(const std::vector<Remark>& remarks);

} // namespace vornhost

#endif
