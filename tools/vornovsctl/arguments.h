/**
 * What a command line says, checked.
 */
#ifndef VORNOVSCTL_ARGUMENTS_H
#define VORNOVSCTL_ARGUMENTS_H

#include <map>
#include <string>
#include <vector>

namespace vornovsctl {

struct Arguments {
    std::map<std::string, std::vector<std::string>> operands; /**< by their names in the help */
    std::map<std::string, std::string> bondModes;             /**< bond to mode name */
    std::string format = "text";                              /**< "text", "dot" or "json" */
    bool yes = false;
    bool dryRun = false;

    const std::string& Get(const char* operand) const { return operands.at(operand).front(); }
    const std::vector<std::string>& All(const char* operand) const { return operands.at(operand); }
    bool IsJson() const { return format == "json"; }
};

} // namespace vornovsctl

#endif
