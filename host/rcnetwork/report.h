/**
 * What the network program has to say: on standard error and in the system log.
 */
#ifndef VORNHOST_RCNETWORK_REPORT_H
#define VORNHOST_RCNETWORK_REPORT_H

#include <string>
#include <vector>

namespace vornhost {

enum class Severity { kError, kWarning, kNotice };

/** One sentence about one thing; an error makes the program's exit status non-zero. */
struct Remark {
    Severity severity = Severity::kError;
    std::string text;

    bool operator==(const Remark&) const = default;
};

/** Says one remark on standard error and in the system log. */
void Say(const Remark& remark);

/** Says every remark. @return  whether one of them was an error. */
bool SayAll(const std::vector<Remark>& remarks);

} // namespace vornhost

#endif
