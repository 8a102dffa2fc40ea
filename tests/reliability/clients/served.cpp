#include "clients/served.h"

#include "host/host.h"

#include <array>
#include <csignal>
#include <cstdio>

#include <vornovs/vornovs.h>
#include <vornplatform/core.h>

namespace reliability {
namespace {

using namespace VORN::OVS; // NOLINT: the library's own names

constexpr int kOptions = 0xBB;

/** How a program ends, in the words of the actor, and its wait status. */
struct Ending {
    const char* verb;
    const char* value;
    int status;
};

constexpr std::array<Ending, 6> kEndings = {{{"exit", "0", 0},
                                             {"exit", "1", 1 << 8},
                                             {"exit", "7", 7 << 8},
                                             {"exit", "255", 255 << 8},
                                             {"kill", "9", SIGKILL},
                                             {"kill", "15", SIGTERM}}};

/** What a program prints, and its wait status. */
struct Answer {
    int status = -1;
    std::string text;
};

Answer Read(const char* mode, const char* verb, const char* value)
{
    Answer answer;
    FILE* const stream = VLIBCPopen(kActor, mode, verb, value, nullptr);
    if (stream == nullptr) {
        return answer;
    }
    std::array<char, 65536> part{};
    for (size_t size = 0; (size = std::fread(part.data(), 1, part.size(), stream)) > 0;) {
        answer.text.append(part.data(), size);
    }
    answer.status = VLIBCPclose(stream);
    return answer;
}

std::string Letters(int count)
{
    std::string letters;
    for (int index = 0; index < count; ++index) {
        letters += static_cast<char>('a' + index % 26);
    }
    return letters;
}

void ExpectRead(const Ending& ending, Findings& findings)
{
    for (const char* const mode : {"r", "rB"}) {
        findings.Expect(Read(mode, ending.verb, ending.value).status == ending.status,
                        "VLIBCPclose gives another status in mode", mode);
    }
}

void ExpectRun(const Ending& ending, Findings& findings)
{
    const std::array<const char*, 4> argv = {kActor, ending.verb, ending.value, nullptr};
    const bool succeeds = ending.status == 0;
    const int exec = VLIBCExec(kActor, ending.verb, ending.value, nullptr);
    findings.Expect(succeeds ? exec == 0 : exec < 0,
                    "VLIBCExec gives another result:", ending.value);
    const int execl = VLIBCExecl(kActor, kOptions, ending.verb, ending.value, nullptr);
    findings.Expect(succeeds ? execl == 0 : execl < 0,
                    "VLIBCExecl gives another result:", ending.value);
    const int execv = VLIBCExecv(kActor, argv.data(), 1);
    findings.Expect(succeeds ? execv == 0 : execv < 0,
                    "VLIBCExecv gives another result:", ending.value);
}

} // namespace

void ExpectStatuses(Findings& findings)
{
    for (const Ending& ending : kEndings) {
        ExpectRead(ending, findings);
    }
    ExpectRun(kEndings[0], findings);
    ExpectRun(kEndings[2], findings);
    ExpectRun(kEndings[4], findings);
    findings.Expect(VLIBCExec("/run/missing", nullptr) < 0, "a missing program counts as run");
}

void ExpectOutput(Findings& findings)
{
    constexpr int kMany = 300000; // more than any pipe holds
    const std::string letters = Letters(kMany);
    for (const char* const mode : {"r", "rB"}) {
        const Answer answer = Read(mode, "print", std::to_string(kMany).c_str());
        findings.Expect(answer.status == 0 && answer.text == letters, "lost output in mode", mode);
        const Answer failed = Read(mode, "exit", "7 the whole answer");
        findings.Expect(failed.status == 7 << 8 && failed.text == "the whole answer\n",
                        "lost output of a program that fails in mode", mode);
    }
}

void ExpectOwnSurroundings(Findings& findings)
{
    const std::string expected = std::string(kProgramEnvironment) +
                                 "descriptor 0\ndescriptor 1\ndescriptor 2\n"
                                 "SigBlk: 0\nSigIgn: 0\n/\nfiles of any size\nenough descriptors\n";
    for (const char* const mode : {"r", "rB"}) {
        const Answer answer = Read(mode, "witness", nullptr);
        findings.Expect(answer.text == expected,
                        "a program saw something of the client's:", answer.text.c_str());
    }
}

void ExpectLibrary(Findings& findings)
{
    findings.Expect(VLIBServiceIsRunning("vornovs-db") == 1, "a service does not count as running");
    findings.Expect(VLIBServiceStart("vornovs-db", 0) == 0, "a service cannot be started");
    findings.Expect(VLIBServiceStop("failing", 0) < 0, "a service that fails counts as stopped");

    int handle = -1;
    findings.Expect(VLIBCFileLockTimeByFile(kLockPath, 1, 5, &handle) == 0, "no lock");
    findings.Expect(VLIBCFileUnlockByFile(handle) == 0, "the lock cannot be released");

    findings.Expect(Register("client", {}) == 0 && IsRegister("client") == 0, "not registered");
    findings.Expect(AttachPort("ovs_eth0", "tap0") == 1, "no port was attached");
    findings.Expect(UnRegister("client", {}) == 0 && IsRegister("client") == -1,
                    "still registered");
}

void ExpectServed(Findings& findings)
{
    ExpectStatuses(findings);
    ExpectOutput(findings);
    ExpectOwnSurroundings(findings);
    ExpectLibrary(findings);
}

void ExpectRefused(Findings& findings)
{
    const std::array<const char*, 2> argv = {kActor, nullptr};
    findings.Expect(VLIBCExec(kActor, nullptr) < 0, "VLIBCExec did not fail");
    findings.Expect(VLIBCExecl(kActor, kOptions, nullptr) != 0, "VLIBCExecl did not fail");
    findings.Expect(VLIBCExecv(kActor, argv.data(), 1) != 0, "VLIBCExecv did not fail");
    for (const char* const mode : {"r", "rB"}) {
        findings.Expect(VLIBCPopen(kActor, mode, nullptr) == nullptr, "VLIBCPopen did not fail");
    }
    findings.Expect(VLIBServiceStart("vornovs-db", 0) < 0, "VLIBServiceStart did not fail");
    int handle = -1;
    findings.Expect(VLIBCFileLockTimeByFile(kLockPath, 1, 0, &handle) < 0 && handle == -1,
                    "a lock without a descriptor");
    // As documented: 0, and nothing is registered.
    findings.Expect(Register("client", {}) == 0 && IsRegister("client") == -1, "Register");
    findings.Expect(UnRegister("keeper", {}) == -1, "UnRegister");
    findings.Expect(AttachPort("ovs_eth0", "tap0") == -1, "AttachPort");
}

} // namespace reliability
