/**
 * What is fed with made-up texts: a reader or an editor of files and answers, with what has to hold
 * for each text that it is given.
 */
#ifndef VORNOVS_TESTS_FUZZ_SUBJECT_H
#define VORNOVS_TESTS_FUZZ_SUBJECT_H

#include <map>
#include <stdexcept>
#include <string>
#include <string_view>

namespace fuzz {

/** Something that has to hold for every text does not hold for this one. */
class Broken : public std::logic_error {
public:
    using std::logic_error::logic_error;
};

/** @throws Broken */
inline void Expect(bool holds, const std::string& what)
{
    if (!holds) {
        throw Broken(what);
    }
}

/** Feeds one text. @throws Broken */
using Feed = void (*)(std::string_view text);

/** The subjects of the program by name. */
inline std::map<std::string, Feed>& Subjects()
{
    static std::map<std::string, Feed> subjects;
    return subjects;
}

/** Makes a subject known; one of static storage stands beside each Feed function. */
struct Subject {
    Subject(const char* name, Feed feed) { Subjects()[name] = feed; }
};

} // namespace fuzz

#endif
