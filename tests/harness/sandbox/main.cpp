#include "sandbox/sandbox.h"

#include <exception>
#include <iostream>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

int main(int argc, char** argv)
{
    testing::InitGoogleMock(&argc, argv);
    if (!testing::GTEST_FLAG(list_tests)) {
        try {
            harness::SandboxOptions options;
            options.network = VORNOVS_SANDBOX_NETWORK;
            harness::EnterSandbox(options);
        } catch (const std::exception& error) {
            std::cerr << error.what() << "\n";
            return 1;
        }
    }
    return RUN_ALL_TESTS();
}
