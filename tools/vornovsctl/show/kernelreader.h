/**
 * The kernel's network devices with all that is drawn of them.
 */
#ifndef VORNOVSCTL_SHOW_KERNELREADER_H
#define VORNOVSCTL_SHOW_KERNELREADER_H

#include "hostmodel.h"

#include <support/netlink.h>

#include <map>
#include <optional>
#include <string>
#include <vector>

namespace vornovsctl {

/** What only the files below /sys/class/net tell of a device. */
struct DeviceFacts {
    std::optional<int> speed;
    std::optional<LinuxBond> bond;

    bool operator==(const DeviceFacts&) const = default;
};

/** Reads the facts of a device. @param folder  such as "/sys/class/net/eth0". */
DeviceFacts ReadDeviceFacts(const std::string& folder);

/** What the kernel answered. */
struct KernelAnswer {
    std::vector<vornhost::Link> links;
    std::optional<std::vector<vornhost::Address>> addresses;
    std::optional<std::vector<vornhost::Route>> routes;
    std::map<std::string, DeviceFacts> facts; /**< by device */
};

/** Asks the kernel for everything. */
KernelAnswer AskKernel();

/** Puts together what belongs to each device; the loopback device is left out. */
std::vector<Device> DevicesOf(const KernelAnswer& kernel);

/** What could not be read of it, in words. */
std::vector<std::string> UnreadOf(const KernelAnswer& kernel);

} // namespace vornovsctl

#endif
