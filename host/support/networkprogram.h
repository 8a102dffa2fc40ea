/**
 * Having the network program bring the host to what the configuration files say. It runs as the
 * core library runs programs for a client: waited for, with its locks held and a deadline.
 */
#ifndef VORNHOST_SUPPORT_NETWORKPROGRAM_H
#define VORNHOST_SUPPORT_NETWORKPROGRAM_H

#include <string>
#include <vector>

#include <vornplatform/core.h>

namespace vornhost {

/** @return  whether the network of these interfaces is what their files ask for. */
inline bool StartNetworkOf(const std::vector<std::string>& interfaces)
{
    constexpr char kProgram[] = "/etc/rc.network";
    std::vector<const char*> argv{kProgram, "start"};
    for (const std::string& interface : interfaces) {
        argv.push_back(interface.c_str());
    }
    argv.push_back(nullptr);
    return VLIBCExecv(kProgram, argv.data(), 1) == 0;
}

} // namespace vornhost

#endif
