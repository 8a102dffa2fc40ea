#include "run.h"

#include "commandline.h"
#include "uninterrupted.h"

#include <exception>
#include <optional>
#include <ostream>
#include <unistd.h>

namespace vornovsctl {

namespace {

Answer PerformCommand(const ParsedCommand& parsed, std::ostream& output, const Terminal& terminal)
{
    const CommandRow& command = *parsed.command;
    if (!command.forAnyone && geteuid() != 0) {
        return Failed(kNotRoot, "only root may ask for this", Json::object());
    }

    std::optional<Uninterrupted> guard;
    if (command.changes) {
        guard.emplace();
    }
    const bool quiet = parsed.json;
    return command.perform({parsed.arguments, terminal, [&, quiet](const std::string& text) {
                                if (!quiet) {
                                    output << text << std::flush;
                                }
                            }});
}

Answer AnswerTo(const ParsedCommand& parsed, std::ostream& output, const Terminal& terminal)
{
    if (parsed.command == nullptr) {
        return Failed(kWrongUsage, parsed.error + (parsed.json ? "" : "\nTry 'vornovsctl --help'."),
                      Json::object());
    }
    try {
        return PerformCommand(parsed, output, terminal);
    } catch (const std::exception& error) {
        return Failed(kDoesNotHold, error.what(), Json::object());
    }
}

} // namespace

int Run(int argc, const char* const argv[], std::ostream& output, std::ostream& errors,
        const Terminal& terminal)
{
    try {
        const ParsedCommand parsed = ParseCommand(argc, argv);
        if (!parsed.output.empty()) {
            output << parsed.output;
            return kHolds;
        }
        const Answer answer = AnswerTo(parsed, output, terminal);
        if (parsed.json) {
            PrintJson(parsed.command == nullptr ? "" : parsed.command->Words(), answer, output);
        } else {
            PrintText(answer, output, errors);
        }
        return answer.exitStatus;
    } catch (const std::exception& error) {
        errors << "vornovsctl: " << error.what() << '\n';
        return kDoesNotHold;
    }
}

} // namespace vornovsctl
