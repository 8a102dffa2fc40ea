/**
 * The ways in which each call of the platform and each file operation may fail, and what the
 * library is to say then.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_WAYS_H
#define VORNOVS_TESTS_RELIABILITY_WAYS_H

#include <optional>
#include <string>
#include <vector>

namespace reliability {

/** A call of the platform, or an operation on a file, that can fail. */
struct Point {
    bool file = false;
    std::string text;
    /** Of an operation on a list's replacement: whether there is a list to replace. */
    bool targetExists = false;
};

/** What follows a failure. */
enum class Then {
    kLine,   ///< The failure's own line is the next one in the log.
    kTold,   ///< The same; what the call answers depends on more.
    kSilent, ///< The call succeeds, and the log says what it says without the failure.
    kUnsaid, ///< The call fails, and the log says the same.
    kError,  ///< The platform's last error is set by the next call, whose text is given.
    kAnswer, ///< It is an answer like another, or memory that ran out: the results say more.
};

struct Way {
    int result = 0; ///< of a function, or the error of a file operation
    Then then = Then::kAnswer;
    std::string text; ///< of the line, up to where it depends on more than the call
    /** Instead of the result: what a program prints, and the wait status it ends with. */
    std::optional<std::string> output = {};
};

/**
 * The ways of a call, which is known by its first words and by how a later one begins. In the text
 * of a way $1 stands for the call's first word after the function's name.
 */
struct Row {
    std::string call;
    std::string key;
    std::vector<Way> ways;
};

/** The ways in which a point fails, those of the own rows before all others. */
std::vector<Way> WaysOf(const Point& point, const std::vector<Row>& own);

/** The name of a way as a failure message shows it. */
std::string NameOf(const Way& way);

} // namespace reliability

#endif
