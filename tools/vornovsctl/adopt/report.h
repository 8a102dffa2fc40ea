/**
 * What adopting and releasing will do or have done, for people and as JSON.
 */
#ifndef VORNOVSCTL_ADOPT_REPORT_H
#define VORNOVSCTL_ADOPT_REPORT_H

#include "adopt/adoptionrecord.h"
#include "adopt/wish.h"
#include "answer.h"

#include <set>
#include <string>

namespace vornovsctl {

/** What stands in the way, one line each; empty: nothing. */
std::string ObstaclesText(const Wishes& wishes);

/** The plan of an adoption. @param record  the one that it would leave behind. */
std::string AdoptionText(const Wishes& wishes, const AdoptionRecord& record);
Json AdoptionFields(const Wishes& wishes, const AdoptionRecord& record, bool done);

/** The plan of a release. */
std::string ReleaseText(const AdoptionRecord& record, const std::set<std::string>& names);
Json ReleaseFields(const AdoptionRecord& record, const std::set<std::string>& names, bool done);

} // namespace vornovsctl

#endif
