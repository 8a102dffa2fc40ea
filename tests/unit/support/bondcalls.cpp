#include "support/bondcalls.h"

#include <array>

namespace unit {

namespace {

std::string Live(const std::string& interface)
{
    return "/sys/class/net/" + interface + "/flags";
}

std::string Bridge(const std::string& interface)
{
    return "ovs_" + interface;
}

std::string SwitchModeOptions(int mode)
{
    constexpr std::array kOptions{"bond_mode=active-backup lacp=off",
                                  "bond_mode=balance-slb lacp=off",
                                  "bond_mode=balance-tcp lacp=active"};
    return kOptions.at(static_cast<std::size_t>(mode - 6));
}

/** Every slave followed by a blank. */
std::string Listed(const std::vector<std::string>& slaves)
{
    std::string text;
    for (const std::string& slave : slaves) {
        text += slave + " ";
    }
    return text;
}

} // namespace

std::string FileOf(const std::string& interface)
{
    return kIfcfg + interface;
}

std::string SwitchModeName(int mode)
{
    constexpr std::array kNames{"ovs-active-backup", "ovs-balance-slb", "ovs-balance-tcp"};
    return kNames.at(static_cast<std::size_t>(mode - 6));
}

void MakeLive(harness::RecordingPlatform& platform, const std::vector<std::string>& interfaces)
{
    for (const std::string& interface : interfaces) {
        platform.Answer("VLIBCFileExist " + Live(interface), 1);
    }
}

void RecordBond(harness::RecordingPlatform& platform, const SwitchBond& bond)
{
    platform.Value(FileOf(bond.name), "SLAVE_LIST", Listed(bond.slaves));
    platform.Value(FileOf(bond.name), "BOND_MODE", SwitchModeName(bond.mode));
}

Calls BondAccepted(const SwitchBond& bond)
{
    Calls calls{"VLIBCFileExist " + Live(bond.name)};
    calls = Sequence({calls, GatewaysCopied(bond.slaves.front(), bond.name)});
    for (const std::string& slave : bond.slaves) {
        calls.push_back("VLIBCFileExist " + Live(Bridge(slave)));
    }
    return calls;
}

Calls BondWritten(const SwitchBond& bond)
{
    const std::string file = FileOf(bond.name);
    Calls calls{"VLIBCExec /bin/cp -f " + FileOf(Bridge(bond.slaves.front())) + " " + file,
                "VORNNetLinkAggrModeToString " + std::to_string(bond.mode),
                "VLIBCFileSetKeys " + file + " DEVICE=" + bond.name + " 'SLAVE_LIST=\"" +
                    Listed(bond.slaves) + "\"' BOND_MODE=" + SwitchModeName(bond.mode) +
                    " 'BONDING_OPTS=\"" + SwitchModeOptions(bond.mode) + "\"'"};
    for (const std::string& slave : bond.slaves) {
        calls.push_back("VLIBCFileSetKeys " + FileOf(Bridge(slave)) + " SLAVE=yes");
        calls.push_back("VLIBCFileSetKeys " + FileOf(slave) + " SLAVE=yes MASTER=" + bond.name);
    }
    return calls;
}

Calls BondBuilt(const SwitchBond& bond)
{
    std::string stopped;
    for (const std::string& slave : bond.slaves) {
        stopped += " " + Bridge(slave) + " " + slave;
    }
    return Sequence({BondAccepted(bond),
                     {"VLIBCExecv /etc/rc.network stop" + stopped, "sleep 3"},
                     BondWritten(bond),
                     {"VLIBCExecv /etc/rc.network start " + bond.name}});
}

Calls BondRead(const SwitchBond& bond)
{
    Calls calls{"VLIBCFileGetKeyValue " + FileOf(bond.name) + " SLAVE_LIST"};
    for (const std::string& slave : bond.slaves) {
        calls.push_back("VORNNetLinkAggrOptSlsaveAdd " + slave);
    }
    calls.push_back("VLIBCFileGetKeyValue " + FileOf(bond.name) + " BOND_MODE");
    calls.push_back("VORNNetLinkAggrStringToMode " + SwitchModeName(bond.mode));
    return calls;
}

Calls BondErased(const SwitchBond& bond)
{
    const std::string bridge = Bridge(bond.slaves.front());
    Calls calls{"VLIBCExec /bin/cp -f " + FileOf(bond.name) + " " + FileOf(bridge),
                "VLIBCFileExist " + FileOf(bond.name),
                "VLIBCFileSetKeys " + FileOf(bridge) + " DEVICE=" + bridge +
                    " -BONDING_OPTS -SLAVE_LIST -BOND_MODE"};
    for (const std::string& slave : bond.slaves) {
        calls.push_back("VLIBCFileRemoveKey " + FileOf(Bridge(slave)) + " SLAVE");
        calls.push_back("VLIBCFileRemoveKey " + FileOf(slave) + " MASTER");
        calls.push_back("VLIBCFileRemoveKey " + FileOf(slave) + " SLAVE");
    }
    return calls;
}

Calls BondDissolved(const SwitchBond& bond)
{
    std::string slaves;
    std::string bridges;
    for (const std::string& slave : bond.slaves) {
        slaves += " " + slave;
        bridges += " " + Bridge(slave);
    }
    return Sequence({BondRead(bond),
                     {"VORNNetBondIPConflict " + bond.name,
                      "VLIBCExecv /etc/rc.network stop" + slaves + " " + bond.name, "sleep 3"},
                     BondErased(bond),
                     {"VLIBCExecv /etc/rc.network start" + bridges}});
}

} // namespace unit
