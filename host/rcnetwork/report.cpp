#include "report.h"

#include "handover.h"

#include <cstdio>

#include <syslog.h>

namespace vornhost {
namespace {

int Priority(Severity severity)
{
    switch (severity) {
    case Severity::kError:
        return LOG_ERR;
    case Severity::kWarning:
        return LOG_WARNING;
    case Severity::kNotice:
        break;
    }
    return LOG_NOTICE;
}

} // namespace

void Say(const Remark& remark)
{
    ::syslog(Priority(remark.severity), "%s", remark.text.c_str());
    // In a conversion the one that runs this program would log it once more.
    if (!IsPartOfConversion()) {
        (void)std::fprintf(stderr, "rc.network: %s\n", remark.text.c_str());
    }
}

bool SayAll(const std::vector<Remark>& remarks)
{
    bool failed = false;
    for (const Remark& remark : remarks) {
        Say(remark);
        failed = failed || remark.severity == Severity::kError;
    }
    return failed;
}

} // namespace vornhost
