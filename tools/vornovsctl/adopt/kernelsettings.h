/**
 * Settings of the kernel for an interface that we, or the client that works for us, make their own.
 */
#ifndef VORNOVSCTL_ADOPT_KERNELSETTINGS_H
#define VORNOVSCTL_ADOPT_KERNELSETTINGS_H

#include "adopt/adoptionrecord.h"
#include "adopt/hostview.h"

#include <map>
#include <set>
#include <string>

namespace vornovsctl {

/** @return  what they are now, by names such as "net/ipv6/conf/eth0/accept_ra". */
std::map<std::string, std::string> KernelSettingsOf(const HostView& host,
                                                    const std::string& interface);

/** Makes them what they were when the interfaces were adopted. */
void RestoreKernelSettings(const HostView& host, const AdoptionRecord& record,
                           const std::set<std::string>& names, Hands& hands);

} // namespace vornovsctl

#endif
