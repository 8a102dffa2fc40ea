/**
 * Runs vornovsctl on the fake host.
 */
#ifndef VORNOVS_TESTS_UNIT_TOOLS_CTL_H
#define VORNOVS_TESTS_UNIT_TOOLS_CTL_H

#include "fakelibrary.h"

#include <gtest/gtest.h>
#include <iosfwd>
#include <string>
#include <vector>

namespace unit {

struct Outcome {
    int exitStatus;
    std::string output;
    std::string errors;

    bool operator==(const Outcome&) const = default;
};

void PrintTo(const Outcome& outcome, std::ostream* stream);

/** Runs the program with these words on its command line. */
Outcome Ctl(std::vector<std::string> words);

/** The outcome of a command that did what was asked and says this. */
Outcome Done(const std::string& output);

/** The outcome of one that did not, or not quite. */
Outcome Failed(int exitStatus, const std::string& message);

/** The outcome of a wrong command line. */
Outcome WrongUsage(const std::string& message);

/** A host of its own for each test, asked by root. Nobody is registered on it. */
class OnAHost : public testing::Test {
public:
    OnAHost(const OnAHost&) = delete;
    OnAHost& operator=(const OnAHost&) = delete;

protected:
    OnAHost();
    ~OnAHost() override;

    /** Registers clients and puts eth0 and eth1 on the switch. */
    static void PutOnTheSwitch(std::set<std::string> clients);

    /** Writes the list of the interfaces taken off the switch. */
    static void WriteTakenOff(const std::string& text);
    /** Writes an interface's configuration file. */
    static void WriteInterfaceFile(const std::string& name, const std::string& text);
};

} // namespace unit

#endif
