#include "show/readhost.h"

#include "show/kernelreader.h"
#include "show/switchreader.h"

#include <vornovs/vornovs.h>

#include <array>
#include <unistd.h>

namespace vornovsctl {

namespace {

std::string HostName()
{
    std::array<char, 256> name{};
    return gethostname(name.data(), name.size() - 1) == 0 ? name.data() : "";
}

} // namespace

HostModel ReadHost()
{
    HostModel host;
    host.name = HostName();
    host.clients = ReadClients();
    if (!host.clients) {
        host.unread.emplace_back("the registrations cannot be read");
    }
    host.takenOff = ReadTakenOff();
    if (!host.takenOff) {
        host.unread.emplace_back("the list of interfaces taken off the switch cannot be read");
    }

    const KernelAnswer kernel = AskKernel();
    host.devices = DevicesOf(kernel);
    for (const std::string& fault : UnreadOf(kernel)) {
        host.unread.push_back(fault);
    }

    host.switchRuns = VORN::OVS::IsDaemonAlive();
    if (host.switchRuns) {
        const SwitchAnswer answer = AskSwitch();
        host.bridges = answer.bridges;
        if (!answer.bridges) {
            host.unread.push_back(answer.fault);
        }
    }
    return host;
}

} // namespace vornovsctl
