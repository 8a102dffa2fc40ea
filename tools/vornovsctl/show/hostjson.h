/**
 * The host as members of a JSON object.
 */
#ifndef VORNOVSCTL_SHOW_HOSTJSON_H
#define VORNOVSCTL_SHOW_HOSTJSON_H

#include "answer.h"
#include "show/hostmodel.h"

namespace vornovsctl {

Json FieldsOf(const HostModel& host);

} // namespace vornovsctl

#endif
