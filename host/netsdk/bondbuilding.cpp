#include "bondchange.h"

#include "support/contains.h"
#include "support/fileslock.h"
#include "support/filestates.h"
#include "support/interfacename.h"
#include "support/livesettings.h"
#include "support/networkprogram.h"

#include <algorithm>
#include <syslog.h>

namespace vornhost {
namespace {

bool SharesSlave(const RememberedBond& memory, const std::vector<std::string>& slaves)
{
    return std::any_of(slaves.begin(), slaves.end(),
                       [&](const std::string& slave) { return Contains(memory.slaves, slave); });
}

/** Whether the bond's file and its slaves' say that it is one. */
bool IsWhole(const BondPlan& plan, const FileStates& files)
{
    return files.at(plan.name).text &&
           std::all_of(plan.slaves.begin(), plan.slaves.end(), [&](const std::string& slave) {
               const auto file = FileOf(files, slave);
               return file.Get("MASTER") == plan.name && file.Get("SLAVE") == "yes";
           });
}

/** The gateway records of a bond that is built and of what carried its addressing until then. */
std::optional<std::vector<GatewayState>>
GatewaysForBond(const BondPlan& plan, const std::optional<RememberedBond>& memory)
{
    // The bond's own are there when the caller has brought them back from its bridge.
    auto bonds = ReadGatewayStates({plan.name});
    auto carriers = ReadGatewayStates({plan.slaves[0]});
    if (!bonds || !carriers) {
        return std::nullopt;
    }
    for (std::size_t family = 0; family < bonds->size(); ++family) {
        GatewayState& bond = (*bonds)[family];
        GatewayState& carrier = (*carriers)[family];
        bond.gateway = bond.gateway ? bond.gateway : carrier.gateway;
        carrier.gateway.reset();
    }
    if (memory) {
        carriers = memory->state.gateways;
        for (GatewayState& state : *carriers) {
            // The bridge that was given some is gone.
            if (state.interface.starts_with(kBridgePrefix)) {
                state.gateway.reset();
            }
        }
    }
    bonds->insert(bonds->end(), carriers->begin(), carriers->end());
    return bonds;
}

/** Builds one bond, or changes it. */
class Building {
public:
    explicit Building(BondPlan plan) : m_plan(std::move(plan)) {}

    int Run()
    {
        if (!ChangeFiles()) {
            return -1;
        }
        if (!StartNetworkOf(NamesOf(m_plan))) {
            return Fail(m_plan, "the network program cannot build it");
        }
        if (KeepsAnotherMode()) {
            return Fail(m_plan, "it keeps the mode that it had");
        }
        const FilesLock lock;
        if (!lock || !WriteFileStates(OrderApart(m_plan), m_built.final)) {
            return -1;
        }
        return RememberedBond::Forget(m_plan.name) ? 0
                                                   : FailWithReason(m_plan, "cannot be forgotten");
    }

private:
    bool ChangeFiles()
    {
        const FilesLock lock;
        const auto current = ReadFileStates(NamesOf(m_plan));
        if (!lock || !current) {
            (void)Fail(m_plan, lock ? "its files cannot be read"
                                    : "somebody else is editing configuration files");
            return false;
        }
        const bool stands = IsWhole(m_plan, *current) && ReadLiveSlaves(m_plan.name);
        if (!stands) {
            Remember();
        }
        m_plan.live = LiveAddressing(LiveNetwork::Read(), m_plan.slaves[0]);
        m_built = Built(m_plan, *current, m_memory);
        return (stands || MoveGateways()) && WriteFileStates(NamesOf(m_plan), m_built.build);
    }

    void Remember()
    {
        m_memory = RememberedBond::Load(m_plan.name);
        if (m_memory && !SharesSlave(*m_memory, m_plan.slaves)) {
            m_memory.reset(); // another bond of that name
        }
        const std::string mode = ModeOf(m_plan, m_memory);
        if (mode != m_plan.mode) {
            ::syslog(LOG_NOTICE, "vornnetsdk: bond %s is %s again, for which the switch had %s",
                     m_plan.name.c_str(), mode.c_str(), m_plan.mode.c_str());
        }
    }

    /** A bond that stands gets another mode only by being built anew. */
    bool KeepsAnotherMode() const
    {
        const auto live = BondOptions::ReadLive(m_plan.name);
        return live && live->Get("mode") != ModeOf(m_plan, m_memory);
    }

    bool MoveGateways() const
    {
        const auto gateways = GatewaysForBond(m_plan, m_memory);
        if (gateways && WriteGatewayStates(*gateways)) {
            return true;
        }
        (void)FailWithReason(m_plan, "its gateways cannot be moved");
        return false;
    }

    BondPlan m_plan;
    std::optional<RememberedBond> m_memory;
    BuiltBond m_built;
};

} // namespace

int BuildBond(BondPlan plan)
{
    return Building(std::move(plan)).Run();
}

} // namespace vornhost
