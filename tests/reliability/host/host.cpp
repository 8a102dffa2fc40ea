#include "host/host.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <sstream>
#include <stdexcept>

#include <sys/mount.h>
#include <sys/wait.h>
#include <unistd.h>
#include <vornplatform/core.h>

namespace reliability {
namespace {

namespace fs = std::filesystem;

constexpr char kCalls[] = "/run/fake/calls";

void InstallFake(const std::string& path)
{
    fs::create_directories(fs::path(path).parent_path());
    fs::copy_file(FAKE_PROGRAM, path, fs::copy_options::overwrite_existing);
}

/** A service whose process is this one. */
void InstallService(const std::string& name, const std::string& body)
{
    std::string comm = ReadFile("/proc/self/comm");
    comm.pop_back();
    WriteFile("/run/fake/pid", std::to_string(::getpid()));
    WriteFile("/etc/init.d/" + name,
              "#!/bin/sh\n# pidfile: /run/fake/pid\n# processname: " + comm + "\n" + body + "\n",
              0755);
}

#ifdef PLAIN_VORNRUN
void InstallPlainHelper()
{
    if (::mount(PLAIN_VORNRUN, VORNRUN, nullptr, MS_BIND, nullptr) != 0) {
        throw std::runtime_error("the plain helper cannot be put in its place");
    }
}
#endif

/** Reads a number and the line break after it. */
size_t TakeNumber(const std::string& text, size_t& at)
{
    const size_t end = text.find('\n', at);
    const size_t number = std::strtoul(text.c_str() + at, nullptr, 10);
    at = end + 1;
    return number;
}

} // namespace

void InstallPrograms()
{
    fs::create_directories("/run/fake");
    for (const char* const path : {kActor, kNetworkScript, kSwitchTool}) {
        InstallFake(path);
    }
    fs::create_directories("/usr/vorn/sbin");
    fs::copy_file(VORNNETDTOOL, "/usr/vorn/sbin/vornnetdtool",
                  fs::copy_options::overwrite_existing);
    InstallService("vornovs-db", "exit 0");
    InstallService("vornovs-vswitch", "exit 0");
    InstallService("failing", "exit 7");
    WriteFile(kCalls, "");
#ifdef PLAIN_VORNRUN
    InstallPlainHelper();
#endif
}

void MakeInterfaces(const std::vector<std::string>& names)
{
    for (const std::string& name : names) {
        const std::string command = "ip link add " + name + " up type veth peer name p" + name +
                                    " && ip link set p" + name + " up";
        EXPECT_EQ(std::system(command.c_str()), 0) << command; // NOLINT: the tests' own words
    }
}

void StartWith(const std::map<std::string, std::string>& files)
{
    fs::create_directories(kConfigurationFolder);
    Empty(kConfigurationFolder);
    fs::remove_all("/usr/vorn/etc");
    fs::create_directories("/usr/vorn/etc");
    for (const auto& [path, text] : files) {
        WriteFile(path, text);
    }
    (void)TakeCalls();
}

void Order(const std::string& program, const std::string& words)
{
    const std::string path = "/run/fake/" + program;
    if (words.empty()) {
        fs::remove(path);
    } else {
        WriteFile(path, words + "\n");
    }
}

std::vector<std::vector<std::string>> TakeCalls()
{
    const std::string text = ReadFile(kCalls);
    WriteFile(kCalls, "");
    std::vector<std::vector<std::string>> calls;
    for (size_t at = 0; at < text.size();) {
        std::vector<std::string> argv(TakeNumber(text, at));
        for (std::string& argument : argv) {
            const size_t size = TakeNumber(text, at);
            argument = text.substr(at, size);
            at += size;
        }
        calls.push_back(argv);
    }
    return calls;
}

std::vector<std::string> TakeCallLines()
{
    std::vector<std::string> lines;
    for (const std::vector<std::string>& argv : TakeCalls()) {
        std::string line = argv.front();
        for (size_t index = 1; index < argv.size(); ++index) {
            line += " " + argv[index];
        }
        lines.push_back(line);
    }
    return lines;
}

bool LockIsFree()
{
    const pid_t child = ::fork();
    if (child == 0) {
        int handle = -1;
        ::_exit(VLIBCFileLockTimeByFile(kLockPath, 1, 0, &handle) < 0 ? 1 : 0);
    }
    int status = -1;
    return ::waitpid(child, &status, 0) == child && status == 0;
}

} // namespace reliability
