/**
 * A host of two ports on a real kernel, for tests of the network program.
 */
#ifndef VORNOVS_TESTS_CONTRACT_RCNETWORK_HOST_H
#define VORNOVS_TESTS_CONTRACT_RCNETWORK_HOST_H

#include "tools.h"

#include <gtest/gtest.h>

#include <chrono>
#include <filesystem>
#include <functional>
#include <string>
#include <vector>

namespace contract {

/** Runs the network program as a shell does. */
Outcome RcNetwork(const std::vector<std::string>& arguments);

/** Runs it as the library does: its stop only holds. */
Outcome RcNetworkOfLibrary(const std::vector<std::string>& arguments);

/** Addresses and routes of the ports, a line each: "eth0 192.0.2.5/24", "default via ...". */
std::string Network();

/** Everything of the ports that "ip" shows, without what only time changes. */
std::string Snapshot();

/** Waits until a condition holds. @return  false when it did not within 20 seconds. */
bool WaitUntil(const std::function<bool()>& condition);

/**
 * The folders in /proc of the processes in this test's network whose file there begins so: others
 * on the machine are those of tests that run side by side.
 */
std::vector<std::filesystem::path> Processes(const std::string& file, const std::string& beginning);

/** The ports eth0 and eth1, down and without addresses, and their cables. */
class Host : public testing::Test {
protected:
    void SetUp() override;
    void TearDown() override;

    static void File(const std::string& interface, const std::string& text);
};

} // namespace contract

#endif
