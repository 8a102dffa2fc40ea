/**
 * Every command with its operands, options and help.
 */
#ifndef VORNOVSCTL_COMMANDTABLE_H
#define VORNOVSCTL_COMMANDTABLE_H

#include "commands.h"

#include <cstddef>
#include <string>
#include <vector>

namespace vornovsctl {

struct Operand {
    const char* name;
    const char* about;
    /** What it is called in messages, such as "the port's name". */
    const char* subject;
    std::string (*fault)(const std::string& value);
    std::size_t least = 1;
    std::size_t most = 1;
};

enum class Option { kNone, kSwitchModes, kLinuxModes, kYes, kConfirm, kFormat, kDryRun };

struct CommandRow {
    const char* group; /**< first word of two; empty: the command has one */
    const char* name;
    const char* about;
    const char* more;
    std::vector<Operand> operands;
    Option option;
    bool changes; /**< ends only when it is through, and is for root only */
    bool forAnyone;
    Perform perform;

    std::string Words() const { return *group == '\0' ? name : std::string(group) + ' ' + name; }
};

struct GroupRow {
    const char* name;
    const char* about;
};

const std::vector<GroupRow>& Groups();
const std::vector<CommandRow>& Commands();

} // namespace vornovsctl

#endif
