/**
 * The files that keep other managers away from adopted interfaces and from what the switch makes.
 */
#ifndef VORNOVSCTL_ADOPT_SILENCERS_H
#define VORNOVSCTL_ADOPT_SILENCERS_H

#include "adopt/adoptionrecord.h"
#include "adopt/hostview.h"

#include <set>
#include <string>
#include <vector>

namespace vornovsctl {

/**
 * The files that are needed for interfaces, with what they are now. Every manager that is installed
 * is told: one that lost an interface to nobody would be glad to take it.
 */
std::vector<SilencingFile> SilencersFor(const HostView& host, const Hands& hands,
                                        const std::set<std::string>& names);

/**
 * What a file is to say while these interfaces are adopted.
 * @param now  what it says at the moment; nothing: it is not there.
 * @return  nothing: it is to go.
 */
std::optional<std::string> SilencingText(const SilencingFile& file,
                                         const std::optional<std::string>& now,
                                         const std::set<std::string>& names);

/** Brings every file to what these interfaces need; without any, to what it was. */
void SettleSilencers(const AdoptionRecord& record, const std::set<std::string>& names,
                     Hands& hands);

/** @return why systemd-networkd would not heed its file for an interface; empty: it would. */
std::string NetworkFileObstacle(const std::string& networkFile);

} // namespace vornovsctl

#endif
