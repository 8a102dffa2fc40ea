/**
 * Something that there is to say about a host's network.
 */
#ifndef VORNHOST_SUPPORT_REMARK_H
#define VORNHOST_SUPPORT_REMARK_H

#include <string>

namespace vornhost {

enum class Severity { kError, kWarning, kNotice };

/** One sentence about one thing; an error makes a program's exit status non-zero. */
struct Remark {
    Severity severity = Severity::kError;
    std::string text;

    bool operator==(const Remark&) const = default;
};

} // namespace vornhost

#endif
