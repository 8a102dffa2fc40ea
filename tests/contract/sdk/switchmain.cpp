/**
 * main() of the tests that run a real switch. Debian's Open vSwitch, unpacked into the build
 * folder, appears where its packages would install it, and every process of the tests ends with
 * them, whatever happens to the test itself.
 */
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sandbox/sandbox.h>

#include <cerrno>
#include <cstring>
#include <exception>
#include <filesystem>
#include <iostream>
#include <sched.h>
#include <stdexcept>
#include <string>
#include <sys/mount.h>
#include <sys/wait.h>
#include <unistd.h>

namespace {

void Mount(const char* type, const std::string& place, const std::string& options)
{
    if (mount(type, place.c_str(), type, 0, options.c_str()) != 0) {
        throw std::runtime_error(std::string("mounting ") + type + " on " + place + ": " +
                                 std::strerror(errno));
    }
}

// The machine's own files come first, so that its programs keep the libraries they are made for.
void AddOpenVSwitch()
{
    const std::string tree = VORNOVS_OPENVSWITCH_TREE;
    for (const std::string folder : {"/usr/bin", "/usr/sbin", "/usr/lib", "/usr/share"}) {
        Mount("overlay", folder, "lowerdir=" + folder + ':' + tree + folder);
    }
    std::filesystem::create_directories("/etc/openvswitch");
    Mount("tmpfs", "/etc/openvswitch", "mode=0755");
    Mount("tmpfs", "/var/log", "mode=0755");
}

int WaitFor(pid_t process)
{
    for (;;) {
        int status = 0;
        const pid_t ended = wait(&status);
        if (ended == process) {
            return WIFEXITED(status) ? WEXITSTATUS(status) : 128;
        }
        if (ended < 0 && errno != EINTR) {
            return 128;
        }
    }
}

int RunTests()
{
    Mount("proc", "/proc", "");
    for (const char* const script : {"vornovs-db", "vornovs-vswitch"}) {
        std::filesystem::copy_file(std::string(VORNOVS_SERVICES) + '/' + script,
                                   std::string("/etc/init.d/") + script);
    }
    std::filesystem::create_directories("/usr/vorn/lib");
    std::filesystem::copy_file(VORNOVS_SERVICES "/service-functions.sh",
                               "/usr/vorn/lib/service-functions.sh");
    return RUN_ALL_TESTS();
}

// Goes on in a new process; this one only waits for it. No exit handlers run here: they may want
// a process of their own, which cannot be had any more.
void ContinueInChild()
{
    std::cout << std::flush;
    const pid_t child = fork();
    if (child < 0) {
        throw std::runtime_error(std::string("fork: ") + std::strerror(errno));
    }
    if (child > 0) {
        _exit(WaitFor(child));
    }
}

// The first process of the new process namespace takes in the daemons, and ends them by ending.
void ContinueBelowInit()
{
    if (unshare(CLONE_NEWPID) != 0) {
        throw std::runtime_error(std::string("unshare: ") + std::strerror(errno));
    }
    ContinueInChild();
    ContinueInChild();
}

} // namespace

int main(int argc, char** argv)
{
    testing::InitGoogleMock(&argc, argv);
    if (testing::GTEST_FLAG(list_tests)) {
        return RUN_ALL_TESTS();
    }
    try {
        harness::SandboxOptions options;
        options.network = true;
        harness::EnterSandbox(options);
        AddOpenVSwitch();
        ContinueBelowInit();
        return RunTests();
    } catch (const std::exception& error) {
        std::cerr << error.what() << '\n';
        return 1;
    }
}
