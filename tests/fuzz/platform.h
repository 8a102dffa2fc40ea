/**
 * The platform below the library's readers: its files are real ones, the switch answers with what
 * the subject puts here, and nothing is ever started.
 */
#ifndef VORNOVS_TESTS_FUZZ_PLATFORM_H
#define VORNOVS_TESTS_FUZZ_PLATFORM_H

#include <string>

namespace fuzz {

/** What the switch's tool prints and how it ends. */
struct SwitchAnswers {
    std::string bridges;
    std::string tag;
    int status = 0; ///< Wait status of the question for the tag.
};

SwitchAnswers& Answers();

} // namespace fuzz

#endif
