/**
 * vornservice VERB SERVICE: starts, stops or restarts a service for a client of the platform. A
 * program, so that vornrun keeps the client's locks until the service is started, whatever becomes
 * of the client, and that no client is linked with systemd's library.
 *
 * Exit status: 0 done, 1 not done (standard error says why), 2 wrong usage.
 */
#include "support/service.h"

#include <array>
#include <cstdio>
#include <exception>
#include <string>

namespace {

/** Less than what a client's program may take, so that the reason is still told. */
constexpr std::chrono::seconds kDeadline{115};

constexpr std::array kVerbs = {"start", "stop", "restart"};

int Run(const std::string& verb, const std::string& service)
{
    std::string error;
    if (vornhost::RunService(service, verb, kDeadline, error)) {
        return 0;
    }
    (void)std::fprintf(stderr, "%s\n", error.c_str());
    return 1;
}

} // namespace

int main(int count, char** arguments)
{
    constexpr int kUsageStatus = 2;
    constexpr int kArguments = 3;
    try {
        for (const char* verb : kVerbs) {
            if (count == kArguments && std::string(arguments[1]) == verb) {
                return Run(verb, arguments[2]);
            }
        }
        (void)std::fputs("Usage: vornservice start|stop|restart SERVICE\n", stderr);
        return kUsageStatus;
    } catch (const std::exception& exception) {
        (void)std::fprintf(stderr, "%s\n", exception.what());
        return 1;
    }
}
