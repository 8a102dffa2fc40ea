/**
 * What a command answers.
 */
#ifndef VORNOVSCTL_ANSWER_H
#define VORNOVSCTL_ANSWER_H

#include <iosfwd>
#include <nlohmann/json.hpp>
#include <string>

namespace vornovsctl {

using Json = nlohmann::ordered_json;

enum ExitStatus : int {
    kHolds = 0,       /**< done: what was asked for holds now */
    kDoesNotHold = 1, /**< it does not */
    kWrongUsage = 2,
    kNotRoot = 3,
    kOutOfStep = 4,   /**< half done: what is recorded and the network do not fit together */
    kNothingToDo = 5, /**< it held before, perhaps by somebody else's doing */
};

struct Answer {
    int exitStatus = kHolds;
    std::string text;  /**< for standard output, whole lines */
    std::string error; /**< what is wrong, for standard error; lines, the last one open */
    Json fields = Json::object(); /**< the command's own part of its JSON object */
};

/** The answer of a command that did what was asked. */
Answer Done(std::string text, Json fields);

/** The answer of a command that did not, or not quite. */
Answer Failed(int exitStatus, std::string error, Json fields);

/** Prints text and error to their streams, as people read them. */
void PrintText(const Answer& answer, std::ostream& output, std::ostream& errors);

/** Prints the whole answer as one object. @param command  its words; empty: none was understood. */
void PrintJson(const std::string& command, const Answer& answer, std::ostream& output);

} // namespace vornovsctl

#endif
