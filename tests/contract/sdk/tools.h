/**
 * What the tests of this folder do to the machine of their sandbox.
 */
#ifndef VORNOVS_TESTS_CONTRACT_SDK_TOOLS_H
#define VORNOVS_TESTS_CONTRACT_SDK_TOOLS_H

#include <string>
#include <vector>

namespace contract {

struct Outcome {
    int exitCode; /**< -1: it was ended by a signal or not started */
    std::string output;
    std::string errors;

    bool operator==(const Outcome&) const = default;
};

/** Lets a failed comparison show what the program did. */
void PrintTo(const Outcome& outcome, std::ostream* stream);

/** Runs a program, found as a shell finds it, to its end. */
Outcome RunProgram(const std::vector<std::string>& argv);

/** Runs "ip" with the words of the line; fails the test when that fails. */
void Ip(const std::string& line);

/** Makes a file and the folders above it. */
void WriteFile(const std::string& path, const std::string& text);

/** @return the file's text, "(none)" when there is no such file. */
std::string ReadFile(const std::string& path);

/** Deletes a file or a folder with all that it holds. */
void Delete(const std::string& path);

/** The path of an interface's configuration file. */
std::string IfcfgPath(const std::string& interface);

} // namespace contract

#endif
