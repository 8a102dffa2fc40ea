/**
 * What a command line asks of vornovsctl.
 */
#ifndef VORNOVSCTL_COMMANDLINE_H
#define VORNOVSCTL_COMMANDLINE_H

#include <map>
#include <optional>
#include <string>

namespace vornovsctl {

enum class Verb { kRegister, kUnregister, kStatus, kReset };

struct Command {
    Verb verb = Verb::kStatus;
    std::string client;
    std::map<std::string, std::string> bondModes; /**< bond to mode name */
    bool json = false;
    bool yes = false;
};

/** The command, or what is left to print. */
struct ParsedCommand {
    std::optional<Command> command;
    std::string output; /**< help or version, for standard output */
    std::string error;  /**< what is wrong with the command line */
};

ParsedCommand ParseCommand(int argc, const char* const argv[]);

} // namespace vornovsctl

#endif
