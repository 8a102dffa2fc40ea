/**
 * Taking interfaces over and giving them back. Both can be done again after they were cut short,
 * and both leave a host that boots to a network that can be reached, wherever that happens.
 */
#ifndef VORNOVSCTL_ADOPT_ADOPTION_H
#define VORNOVSCTL_ADOPT_ADOPTION_H

#include "adopt/adoptionrecord.h"
#include "adopt/handover.h"
#include "adopt/hostview.h"
#include "adopt/wish.h"

#include <functional>
#include <set>
#include <string>

namespace vornovsctl {

/** Adds to a record what it takes to adopt interfaces; changes nothing yet. */
void AddToRecord(const HostView& host, const Hands& hands, const Wishes& wishes,
                 AdoptionRecord& record);

/** Makes these interfaces ours, as their record says. @throws std::runtime_error when it cannot. */
void PerformAdoption(const HostView& host, const std::set<std::string>& names,
                     AdoptionRecord& record, Hands& hands);

/** Gives these interfaces back. @throws std::runtime_error when it cannot. */
LooseEnds PerformRelease(const HostView& host, const std::set<std::string>& names,
                         AdoptionRecord& record, Hands& hands);

} // namespace vornovsctl

#endif
