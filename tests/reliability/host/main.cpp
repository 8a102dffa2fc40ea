#include "host/host.h"
#include "sandbox/sandbox.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <exception>
#include <iostream>

int main(int argc, char** argv)
{
    testing::InitGoogleMock(&argc, argv);
    if (!testing::GTEST_FLAG(list_tests)) {
        try {
            harness::SandboxOptions options;
            options.network = true;
            options.writable = {"/usr/bin"};
            harness::EnterSandbox(options);
            reliability::InstallPrograms();
        } catch (const std::exception& error) {
            std::cerr << error.what() << "\n";
            return 1;
        }
    }
    return RUN_ALL_TESTS();
}
