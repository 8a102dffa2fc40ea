#include "halfstates.h"

#include "wording.h"

#include <support/interfacename.h>
#include <support/tagdevice.h>

#include <algorithm>
#include <array>
#include <iterator>

namespace vornovsctl {

namespace {

constexpr int kFirstExitStatus = 10;
constexpr char kRegistrations[] = "registrations";

bool IsLinkLocal(const std::string& address)
{
    return address.starts_with("fe80:");
}

bool HasBridgeName(const std::string& name)
{
    return !InterfaceOf(name).empty();
}

class Finder {
public:
    explicit Finder(const HostTruths& truths) : m_truths(truths), m_host(truths.host) {}

    std::vector<HalfState> Find()
    {
        for (const Bridge& bridge : Bridges()) {
            LookAtBridge(bridge);
        }
        for (const FileTruth& file : m_truths.files) {
            LookAtFile(file);
        }
        LookAtClients();
        LookAtRecords();
        for (const std::string& path : m_truths.strays) {
            Add(HalfStateClass::kStrayFile, path, "is left over from a writer that was killed");
        }
        std::stable_sort(
            m_found.begin(), m_found.end(),
            [](const HalfState& one, const HalfState& other) { return one.kind < other.kind; });
        return std::move(m_found);
    }

private:
    void Add(HalfStateClass kind, const std::string& subject, const std::string& text)
    {
        m_found.push_back({kind, subject, text});
    }

    /** The bridges that stand for interfaces; other programs have their own. */
    std::vector<Bridge> Bridges() const
    {
        std::vector<Bridge> bridges;
        const auto all = m_host.bridges.value_or(std::vector<Bridge>());
        std::copy_if(all.begin(), all.end(), std::back_inserter(bridges),
                     [](const Bridge& bridge) { return HasBridgeName(bridge.name); });
        return bridges;
    }

    /** Whether the switch answered, or does not run and so has nothing. */
    bool IsSwitchKnown() const { return !m_host.switchRuns || m_host.bridges.has_value(); }

    const Bridge* FindBridge(const std::string& name) const
    {
        if (m_host.bridges) {
            for (const Bridge& bridge : *m_host.bridges) {
                if (bridge.name == name) {
                    return &bridge;
                }
            }
        }
        return nullptr;
    }

    bool HasBridge(const std::string& name) const { return FindBridge(name) != nullptr; }

    void LookAtBridge(const Bridge& bridge)
    {
        const std::string interface = InterfaceOf(bridge.name);
        bool reachesTheWire = false;
        for (const Port& port : bridge.ports) {
            if (port.wire || port.name == interface) {
                reachesTheWire = true;
                LookAtWire(bridge, port);
            } else {
                CompareTag(port.name, port.tag);
            }
        }
        // Towards the wire frames are tagged; the tag of the plain file is the bridge's own.
        CompareTag(bridge.name, bridge.tag);
        const FileTruth* file = m_truths.FindFile(bridge.name);
        if (reachesTheWire && file == nullptr) {
            Add(HalfStateClass::kBridgeWithoutFile, bridge.name,
                "is a bridge of the switch without a file; a start of the network takes it away");
        }
    }

    void LookAtWire(const Bridge& bridge, const Port& port)
    {
        for (const Member& member : port.members) {
            const Device* device = m_host.Find(member.name);
            for (const std::string& address :
                 device == nullptr ? std::vector<std::string>() : device->addresses) {
                if (!IsLinkLocal(address)) {
                    Add(HalfStateClass::kAddressBelowBridge, member.name,
                        "has the address " + address + ", which does not answer below the bridge " +
                            bridge.name);
                }
            }
        }
        if (port.bond && port.members.size() < 2) {
            Add(HalfStateClass::kBondOfOne, port.name,
                "is a bond of the switch with " + Count(port.members.size()));
        }
    }

    static std::string Count(std::size_t members)
    {
        return members == 0 ? "no member" : "a single member";
    }

    void CompareTag(const std::string& port, std::optional<int> tag)
    {
        const FileTruth* file = m_truths.FindFile(port);
        if (file != nullptr && !file->tag.empty() && file->tag != std::to_string(tag.value_or(0)) &&
            (tag || file->tag != "0")) {
            Add(HalfStateClass::kLostTag, port,
                "has the VLAN tag " + file->tag + " in its file and " +
                    (tag ? std::to_string(*tag) : "none") + " in the switch");
        }
    }

    void LookAtFile(const FileTruth& file)
    {
        const std::string& name = file.Name();
        const bool ofBridge = HasBridgeName(name);
        const bool copied = ofBridge ? file.type != "OVS" || file.device != name
                                     : file.device == BridgeOf(name) ||
                                           (file.type == "OVS" && file.content.slaveList.empty());
        const bool foreign = !file.device.empty() && file.device != name && m_host.Find(name);
        if (copied || foreign) {
            Add(HalfStateClass::kUnfinishedFile, name,
                "has a file that describes " +
                    (file.device.empty() || file.device == name
                         ? std::string(ofBridge ? "no bridge" : "a bridge")
                         : Quoted(file.device)));
            return;
        }
        if (LookAtMembership(file)) {
            return;
        }
        if (!file.IsBridges()) {
            LookAtPlainFile(file);
        }
        if (!file.IsBridges() || file.content.slave || !file.content.onBoot) {
            return;
        }
        if (IsSwitchKnown() && !HasBridge(name)) {
            Add(HalfStateClass::kBridgeFileWithoutBridge, name,
                m_host.switchRuns ? "has a file, and the switch has no such bridge"
                                  : "has a bridge's file, and the switch does not run");
        }
        if (file.content.slaveList.size() == 1 && !HasBridge(name)) {
            Add(HalfStateClass::kBondOfOne, InterfaceOf(name), "is a bond with a single member");
        }
    }

    /** Whether a bond's file lists the interface as one of its members. */
    bool IsListed(const std::string& interface) const
    {
        return std::any_of(m_truths.files.begin(), m_truths.files.end(), [&](const auto& file) {
            const auto& list = file.content.slaveList;
            return std::find(list.begin(), list.end(), interface) != list.end();
        });
    }

    /** @return whether the file and those of the bonds differ on whose member it is. */
    bool LookAtMembership(const FileTruth& file)
    {
        const vornhost::InterfaceFile& content = file.content;
        const bool listed =
            content.slaveList.empty() && IsListed(file.IsBridges() ? content.primary : file.Name());
        const bool ofNone = content.slave && !listed &&
                            (file.IsBridges() || (!content.master.empty() &&
                                                  m_truths.FindFile(content.master) == nullptr));
        if (ofNone) {
            Add(HalfStateClass::kUnfinishedFile, file.Name(),
                "has a file of a member of a bond, and no bond's file has it");
        } else if (listed && !content.slave) {
            Add(HalfStateClass::kUnfinishedFile, file.Name(),
                "has a file that does not know of its bond");
        }
        return ofNone || (listed && !content.slave);
    }

    void LookAtPlainFile(const FileTruth& file)
    {
        const std::string& name = file.Name();
        if (file.content.use != vornhost::FileUse::kPlain || file.content.slave) {
            return;
        }
        const FileTruth* bridge = m_truths.FindFile(BridgeOf(name));
        if (bridge != nullptr && bridge->IsBridges() && bridge->content.primary == name &&
            file.content.bridge.empty()) {
            Add(HalfStateClass::kUnfinishedFile, name,
                "has a file that does not name its bridge " + BridgeOf(name));
        } else if (bridge == nullptr && WasForgotten(name)) {
            Add(HalfStateClass::kRegisteredButPlain, name,
                "is not on the switch, and " + List(*m_host.clients) + " are registered");
        }
    }

    /** Whether others are on the switch, and nobody took this one off. */
    bool WasForgotten(const std::string& name) const
    {
        const Device* device = m_host.Find(name);
        return m_host.clients && !m_host.clients->empty() && IsOnSwitch() && device != nullptr &&
               (device->kind.empty() || device->kind == "bond") && device->master.empty() &&
               !device->onTheSwitch && IsConverted(name) && m_host.takenOff &&
               !m_host.takenOff->contains(name);
    }

    /** What the library leaves as it is when it takes the host to the switch. */
    static bool IsConverted(const std::string& name)
    {
        constexpr std::array kNever{"ovs_", "wlan", "ppp", "tun"};
        return std::none_of(kNever.begin(), kNever.end(),
                            [&](const char* prefix) { return name.starts_with(prefix); });
    }

    bool IsOnSwitch() const
    {
        return !Bridges().empty() ||
               std::any_of(m_truths.files.begin(), m_truths.files.end(),
                           [](const FileTruth& file) { return file.IsBridges(); });
    }

    void LookAtClients()
    {
        if (!m_host.clients) {
            return;
        }
        const bool onSwitch = IsOnSwitch();
        const bool emptied = m_host.takenOff && !m_host.takenOff->empty();
        const bool cutShort = m_host.clients->contains(kRepairClient);
        if (onSwitch && m_host.clients->empty()) {
            Add(HalfStateClass::kOnSwitchButUnregistered, kRegistrations,
                "name nobody, and interfaces are on the switch");
        } else if (onSwitch && cutShort) {
            Add(HalfStateClass::kOnSwitchButUnregistered, kRegistrations,
                "name a repair that was cut short");
        } else if (!m_host.clients->empty() && !onSwitch && !emptied && IsSwitchKnown()) {
            Add(HalfStateClass::kRegisteredButPlain, kRegistrations,
                "name " + List(*m_host.clients) + ", and no interface is on the switch");
        }
    }

    void LookAtRecords()
    {
        if (!IsSwitchKnown()) {
            return;
        }
        for (const auto& [name, bond] : m_truths.converted.bonds) {
            if (!IsKernelsBond(name) && !IsSwitchsBond(name)) {
                Add(HalfStateClass::kUnfinishedBond, name,
                    "is a bond that a conversion which was cut short has taken apart");
            }
        }
        for (const vornhost::FileVlan& vlan : m_truths.converted.vlans) {
            if (!IsKernelsVlan(vlan) && !IsSwitchsTag(vlan)) {
                AddVlan(vlan, "which a conversion that was cut short has taken from it");
            }
        }
        // What the kernel has again is remembered only until it is as it was.
        for (const auto& [name, bond] : m_truths.remembered.bonds) {
            if (IsKernelsBond(name) && !IsSwitchsBond(name)) {
                Add(HalfStateClass::kUnfinishedBond, name, "is a bond that is built only half");
            }
        }
        for (const vornhost::FileVlan& vlan : m_truths.remembered.vlans) {
            if (IsKernelsVlan(vlan) && !IsSwitchsTag(vlan)) {
                AddVlan(vlan, "which is made only half");
            }
        }
    }

    void AddVlan(const vornhost::FileVlan& vlan, const std::string& text)
    {
        Add(HalfStateClass::kUnfinishedVlan, vlan.parent,
            "has had the VLAN " + std::to_string(vlan.id) + ", " + text);
    }

    /** A bond's own file may outlive what made members of the others. */
    bool IsKernelsBond(const std::string& name) const
    {
        const Device* device = m_host.Find(name);
        return (device != nullptr && device->bond) ||
               std::any_of(m_truths.files.begin(), m_truths.files.end(),
                           [&](const FileTruth& file) { return file.content.master == name; });
    }

    bool IsSwitchsBond(const std::string& name) const
    {
        const FileTruth* file = m_truths.FindFile(BridgeOf(name));
        const Bridge* bridge = FindBridge(BridgeOf(name));
        return (file != nullptr && !file->content.slaveList.empty()) ||
               (bridge != nullptr && std::any_of(bridge->ports.begin(), bridge->ports.end(),
                                                 [](const Port& port) { return port.bond; }));
    }

    bool IsKernelsVlan(const vornhost::FileVlan& vlan) const
    {
        const int id = static_cast<int>(vlan.id);
        return std::any_of(m_truths.files.begin(), m_truths.files.end(),
                           [&](const FileTruth& each) { return each.content.vlan == vlan; }) ||
               std::any_of(m_host.devices.begin(), m_host.devices.end(), [&](const Device& each) {
                   return each.vlan == id && !vornhost::IsTagDeviceName(each.name, id) &&
                          (each.parent == vlan.parent || each.parent == BridgeOf(vlan.parent));
               });
    }

    bool IsSwitchsTag(const vornhost::FileVlan& vlan) const
    {
        const FileTruth* file = m_truths.FindFile(BridgeOf(vlan.parent));
        const Bridge* bridge = FindBridge(BridgeOf(vlan.parent));
        return (file != nullptr && file->tag == std::to_string(vlan.id)) ||
               (bridge != nullptr && bridge->tag == static_cast<int>(vlan.id));
    }

    const HostTruths& m_truths;
    const HostModel& m_host;
    std::vector<HalfState> m_found;
};

} // namespace

int ExitStatusOf(HalfStateClass kind)
{
    return kFirstExitStatus + static_cast<int>(kind);
}

const char* WordOf(HalfStateClass kind)
{
    switch (kind) {
    case HalfStateClass::kAddressBelowBridge:
        return "address-below-bridge";
    case HalfStateClass::kBridgeFileWithoutBridge:
        return "bridge-file-without-bridge";
    case HalfStateClass::kUnfinishedFile:
        return "unfinished-file";
    case HalfStateClass::kBridgeWithoutFile:
        return "bridge-without-file";
    case HalfStateClass::kRegisteredButPlain:
        return "registered-but-plain";
    case HalfStateClass::kOnSwitchButUnregistered:
        return "on-switch-but-unregistered";
    case HalfStateClass::kBondOfOne:
        return "bond-of-one";
    case HalfStateClass::kLostTag:
        return "lost-tag";
    case HalfStateClass::kUnfinishedBond:
        return "unfinished-bond";
    case HalfStateClass::kUnfinishedVlan:
        return "unfinished-vlan";
    case HalfStateClass::kStrayFile:
        return "stray-file";
    }
    return "";
}

std::vector<HalfState> FindHalfStates(const HostTruths& truths)
{
    return Finder(truths).Find();
}

} // namespace vornovsctl
