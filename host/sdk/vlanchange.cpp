#include "vlanchange.h"

#include "vlanfiles.h"

#include "support/fileslock.h"
#include "support/filestates.h"
#include "support/interfacename.h"
#include "support/networkprogram.h"
#include "support/vlanrules.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <syslog.h>

// Of the two files the one that gets the addressing is written first: a host that is restarted in
// between has it once or twice, but never not at all.

namespace vornhost {
namespace {

int Fail(const std::string& name, const std::string& reason)
{
    ::syslog(LOG_ERR, "vornsdk: VLAN %s: %s", name.c_str(), reason.c_str());
    return -1;
}

int FailWithReason(const std::string& name, const std::string& what)
{
    return Fail(name, what + ": " + std::strerror(errno));
}

/** The gateways of one interface as another's. */
std::vector<GatewayState> Renamed(const std::vector<GatewayState>& gateways,
                                  const std::string& from, const std::string& to)
{
    std::vector<GatewayState> renamed;
    for (GatewayState state : gateways) {
        if (state.interface == from) {
            state.interface = to;
            renamed.push_back(state);
        }
    }
    return renamed;
}

std::vector<GatewayState> Together(std::vector<GatewayState> first,
                                   const std::vector<GatewayState>& second)
{
    first.insert(first.end(), second.begin(), second.end());
    return first;
}

/** Takes one VLAN from its interface. */
class Removal {
public:
    explicit Removal(const std::string& name) { m_plan.name = name; }

    int Run(const LiveNetwork& network)
    {
        const Link* const vlan = FindVlan(network, m_plan.name);
        const Link* const parent = vlan == nullptr ? nullptr : ParentOf(network, *vlan);
        if (vlan == nullptr) {
            return Finish();
        }
        const std::string obstacle = ObstacleToTag(network, *vlan);
        if (parent == nullptr || !obstacle.empty()) {
            return Fail(m_plan.name, "is not what one tag can say: " + obstacle);
        }
        m_plan.parent = parent->name;
        m_plan.id = vlan->vlanId;
        m_plan.live = LiveAddressing(network, m_plan.name);
        if (vlan->mtu != parent->mtu) {
            m_plan.mtu = std::to_string(vlan->mtu);
        }
        return Move();
    }

private:
    /** It is the tag already; the network program may not have come to know of that. */
    int Finish() const
    {
        const auto memory = RememberedVlan::Load(m_plan.name);
        const auto file = ReadFileState(m_plan.name);
        if (!memory || !file || file->text) {
            return Fail(m_plan.name, "there is no such interface");
        }
        return StartNetworkOf({memory->parent, m_plan.name}) ? 0 : -1;
    }

    bool Remember()
    {
        const auto before = ReadFileStates({m_plan.parent, m_plan.name});
        const auto gateways =
            ReadGatewayStates({m_plan.name, m_plan.parent, kBridgePrefix + m_plan.parent});
        if (!before || !gateways) {
            (void)Fail(m_plan.name, "its files or the gateway records cannot be read");
            return false;
        }
        const auto memory = RememberedVlan::Load(m_plan.name);
        if (memory && memory->parent == m_plan.parent && memory->id == m_plan.id &&
            IsHalfMoved(*memory, *before)) {
            m_record = *memory;
            return true;
        }
        m_record = {m_plan.name,
                    m_plan.parent,
                    m_plan.id,
                    {*before, MovedToParent(m_plan, *before), *gateways}};
        ForgetOthers();
        if (!m_record.Save()) {
            (void)FailWithReason(m_plan.name, "cannot be remembered");
            return false;
        }
        return true;
    }

    /** A parent has one VLAN that becomes its tag; what is known of others is of former times. */
    void ForgetOthers() const
    {
        for (const RememberedVlan& other : RememberedVlan::LoadOfParent(m_plan.parent)) {
            if (other.name != m_plan.name) {
                (void)RememberedVlan::Forget(other.name);
            }
        }
    }

    /** The caller may have given the bridge its gateway before: the parent's, who has none. */
    bool MoveGateways() const
    {
        const auto& known = m_record.state.gateways;
        const auto parents = Renamed(known, m_plan.name, m_plan.parent);
        const auto bridges = Renamed(known, m_plan.name, kBridgePrefix + m_plan.parent);
        auto none = Renamed(known, m_plan.name, m_plan.name);
        for (GatewayState& state : none) {
            state.gateway.reset();
        }
        if (!WriteGatewayStates(Together(Together(parents, bridges), none))) {
            (void)FailWithReason(m_plan.name, "its gateways cannot be moved");
            return false;
        }
        return true;
    }

    int Move()
    {
        const std::vector<std::string> names{m_plan.parent, m_plan.name};
        {
            const FilesLock lock;
            if (!lock || !Remember()) {
                return -1;
            }
            m_moved = MoveGateways() && WriteFileStates(names, m_record.state.moved);
        }
        if (m_moved && StartNetworkOf(names)) {
            return 0;
        }
        // The host had better keep its VLAN than stay between the two.
        (void)Fail(m_plan.name, "cannot be taken from its interface; it stays");
        if (TakeBack() && StartNetworkOf(names)) {
            (void)RememberedVlan::Forget(m_plan.name);
        }
        return -1;
    }

    bool TakeBack() const
    {
        const FilesLock lock;
        return WriteFileStates({m_plan.name, m_plan.parent}, m_record.state.before) &&
               WriteGatewayStates(m_record.state.gateways);
    }

    VlanPlan m_plan;
    RememberedVlan m_record;
    bool m_moved = false;
};

/** What is remembered of the VLAN that is wanted back; it may have got another number meanwhile. */
std::optional<RememberedVlan> MemoryOf(const std::string& parent, int id)
{
    const auto known = RememberedVlan::LoadOfParent(parent);
    const auto same = std::find_if(known.begin(), known.end(),
                                   [&](const RememberedVlan& vlan) { return vlan.id == id; });
    if (same != known.end()) {
        return *same;
    }
    return known.empty() ? std::nullopt : std::optional<RememberedVlan>(known.front());
}

/** Gives one VLAN an interface again. */
class Creation {
public:
    Creation(const std::string& parent, int id, const KeyValueFile& live)
        : m_memory(MemoryOf(parent, id))
    {
        m_plan.parent = parent;
        m_plan.id = id;
        m_plan.live = live;
        const bool sameName = m_memory && m_memory->id == id;
        m_plan.name = sameName ? m_memory->name : parent + '.' + std::to_string(id);
    }

    int Run()
    {
        if (!IsInterfaceName(m_plan.name)) {
            return Fail(m_plan.name, "the name is too long");
        }
        if (!ChangeFiles()) {
            return -1;
        }
        if (!StartNetworkOf({m_plan.parent, m_plan.name})) {
            return Fail(m_plan.name, "the network program cannot make it");
        }
        const FilesLock lock;
        if (!lock || !WriteFileStates({m_plan.parent, m_plan.name}, m_built.final)) {
            return -1;
        }
        return !m_memory || RememberedVlan::Forget(m_memory->name)
                   ? 0
                   : FailWithReason(m_plan.name, "cannot be forgotten");
    }

private:
    bool ChangeFiles()
    {
        const std::vector<std::string> names{m_plan.name, m_plan.parent};
        const FilesLock lock;
        const auto current = ReadFileStates(names);
        if (!lock || !current) {
            (void)Fail(m_plan.name, lock ? "the files cannot be read"
                                         : "somebody else is editing configuration files");
            return false;
        }
        m_built = MovedToVlan(m_plan, *current, m_memory);
        if (!MoveGateways() || !WriteFileStates(names, m_built.build)) {
            (void)FailWithReason(m_plan.name, "cannot be written");
            return false;
        }
        return true;
    }

    bool MoveGateways() const
    {
        const auto parents = ReadGatewayStates({m_plan.parent});
        if (!parents) {
            return false;
        }
        std::vector<GatewayState> states = Renamed(*parents, m_plan.parent, m_plan.name);
        std::vector<GatewayState> former = m_memory ? m_memory->state.gateways : *parents;
        std::erase_if(former, [&](const GatewayState& state) {
            return m_memory && state.interface == m_memory->name;
        });
        for (GatewayState& state : former) {
            // The bridge that was given some is gone.
            if (!m_memory || state.interface != m_plan.parent) {
                state.gateway.reset();
            }
        }
        return WriteGatewayStates(Together(std::move(states), former));
    }

    VlanPlan m_plan;
    std::optional<RememberedVlan> m_memory;
    BuiltVlan m_built;
};

} // namespace

int TakeVlan(const LiveNetwork& network, const std::string& name)
{
    return Removal(name).Run(network);
}

int GiveVlan(const std::string& parent, int id, const KeyValueFile& live)
{
    return Creation(parent, id, live).Run();
}

} // namespace vornhost
