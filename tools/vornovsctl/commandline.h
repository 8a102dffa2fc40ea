/**
 * What a command line asks of vornovsctl.
 */
#ifndef VORNOVSCTL_COMMANDLINE_H
#define VORNOVSCTL_COMMANDLINE_H

#include "arguments.h"
#include "commandtable.h"

#include <string>

namespace vornovsctl {

/** The command, or what is left to print. */
struct ParsedCommand {
    const CommandRow* command = nullptr; /**< null: there is nothing to do but to print */
    Arguments arguments;
    std::string output; /**< help or version, for standard output */
    std::string error;  /**< what is wrong with the command line */
    bool json = false;  /**< whether the answer is to be JSON, as far as was understood */
};

ParsedCommand ParseCommand(int argc, const char* const argv[]);

} // namespace vornovsctl

#endif
