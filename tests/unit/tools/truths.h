/**
 * Hosts whose four truths are told, for tests of what does not fit together in them.
 */
#ifndef VORNOVS_TESTS_UNIT_TRUTHS_H
#define VORNOVS_TESTS_UNIT_TRUTHS_H

#include "check/halfstates.h"
#include "ctl.h"
#include "show/samplehost.h"

#include <stdexcept>

namespace unit {

using vornhost::KeyValueFile;
using vornovsctl::FileTruthOf;
using vornovsctl::HostTruths;

inline void AddFile(HostTruths& truths, const std::string& name, const std::string& text)
{
    std::erase_if(truths.files, [&](const auto& file) { return file.Name() == name; });
    truths.files.push_back(FileTruthOf(name, KeyValueFile::Parse(text)));
}

inline void RemoveFile(HostTruths& truths, const std::string& name)
{
    std::erase_if(truths.files, [&](const auto& file) { return file.Name() == name; });
}

/** A port with a tag, two bonds, ports of clients. */
inline HostTruths OnTheSwitch()
{
    HostTruths truths;
    truths.host = SampleHost();
    for (const std::string number : {"1", "2", "4", "5"}) {
        const std::string master = number < "3" ? "ovs_bond0" : "ovs_bond1";
        AddFile(truths, "eth" + number,
                "DEVICE=eth" + number + "\nSLAVE=yes\nMASTER=" + master + "\n");
    }
    AddFile(truths, "ovs_bond0",
            "DEVICE=ovs_bond0\nTYPE=OVS\nPRIMARY=bond0\nSLAVE_LIST=\"eth1 eth2\"\n"
            "IPADDR=192.0.2.10\n");
    AddFile(truths, "ovs_bond1",
            "DEVICE=ovs_bond1\nTYPE=OVS\nPRIMARY=bond1\nSLAVE_LIST=\"eth4 eth5\"\n");
    AddFile(truths, "ovs_eth0", "DEVICE=ovs_eth0\nTYPE=OVS\nPRIMARY=eth0\nOVS_VLAN_ID=10\n");
    AddFile(truths, "eth0", "DEVICE=eth0\nBRIDGE=ovs_eth0\nOVS_VLAN_ID=10\n");
    AddFile(truths, "tap0", "DEVICE=tap0\nOVS_VLAN_ID=20\n");
    return truths;
}

inline HostTruths Plain()
{
    HostTruths truths;
    truths.host = PlainHost();
    truths.host.clients.emplace();
    AddFile(truths, "eth0", "DEVICE=eth0\nIPADDR=192.0.2.10\n");
    return truths;
}

inline vornovsctl::Bridge& BridgeIn(HostTruths& truths, const std::string& name)
{
    for (vornovsctl::Bridge& bridge : *truths.host.bridges) {
        if (bridge.name == name) {
            return bridge;
        }
    }
    throw std::out_of_range(name);
}

inline vornovsctl::Device& DeviceIn(HostTruths& truths, const std::string& name)
{
    for (vornovsctl::Device& device : truths.host.devices) {
        if (device.name == name) {
            return device;
        }
    }
    throw std::out_of_range(name);
}

/** A host with one card. */
class Check : public OnAHost {
protected:
    Check()
    {
        vornhost::Link link;
        link.index = 1;
        link.name = "eth0";
        Host().links = {link};
    }
};

} // namespace unit

#endif
