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

/** The interfaces of which one stands for the addressing while there is no bond. */
std::vector<std::string> CarriersOf(const BondPlan& plan)
{
    return {plan.slaves[0], kBridgePrefix + plan.slaves[0]};
}

/**
 * The bond's gateways as its first slave's and its bridge's. The caller may have moved the bond's
 * own to the bridge that will stand for it.
 */
std::optional<std::vector<GatewayState>> GatewaysForCarriers(const BondPlan& plan)
{
    const auto bonds = ReadGatewayStates({plan.name, kBridgePrefix + plan.name});
    auto carriers = ReadGatewayStates(CarriersOf(plan));
    if (!bonds || !carriers) {
        return std::nullopt;
    }
    for (GatewayState& carrier : *carriers) {
        carrier.gateway.reset();
        for (const GatewayState& bond : *bonds) {
            if (bond.family == carrier.family && !carrier.gateway) {
                carrier.gateway = bond.gateway;
            }
        }
    }
    return carriers;
}

/** Takes one bond apart. */
class Dissolution {
public:
    explicit Dissolution(BondPlan plan) : m_plan(std::move(plan)) {}

    int Run()
    {
        const Step step = ChangeFiles();
        if (step == Step::kRefused) {
            return -1;
        }
        const bool changed = step == Step::kDone && StartNetworkOf(NamesOf(m_plan));
        if (!changed && !m_record.name.empty()) {
            TakeBack();
        }
        return changed ? 0 : -1;
    }

private:
    enum class Step { kRefused, kFailed, kDone };

    Step ChangeFiles()
    {
        const FilesLock lock;
        if (!lock) {
            (void)Fail(m_plan, "somebody else is editing configuration files");
            return Step::kRefused;
        }
        const Step prepared = Prepare();
        if (prepared != Step::kDone || m_record.name.empty()) {
            return prepared;
        }
        if (!m_record.Save()) {
            (void)FailWithReason(m_plan, "cannot be remembered, so it is not taken apart");
            return Step::kRefused;
        }
        LogWhatIsLost();
        return MoveGateways() && WriteFileStates(OrderApart(m_plan), m_record.state.moved)
                   ? Step::kDone
                   : Step::kFailed;
    }

    /** Finds out what there is. No record is made where the files are as they are to be. */
    Step Prepare()
    {
        const auto options = BondOptions::ReadLive(m_plan.name);
        const auto slaves = ReadLiveSlaves(m_plan.name);
        AddSlaves(slaves.value_or(std::vector<std::string>()));
        const auto before = ReadFileStates(NamesOf(m_plan));
        if (!before || m_plan.slaves.empty()) {
            (void)Fail(m_plan, before ? "has no slaves" : "its files cannot be read");
            return Step::kRefused;
        }
        const auto memory = RememberedBond::Load(m_plan.name);
        const bool known = memory && memory->HasSlaves(m_plan.slaves);
        if (!slaves && !before->at(m_plan.name).text) {
            // Apart already, though the network program may not have come to know of that?
            if (!known) {
                (void)Fail(m_plan, "there is none to be taken apart");
            }
            return known ? Step::kDone : Step::kRefused;
        }
        if (known && IsHalfTakenApart(memory->state, *before)) {
            m_record = *memory;
            return Step::kDone;
        }
        return Remember(*before, options) ? Step::kDone : Step::kRefused;
    }

    /** The caller's list decides about the order, but none may be left a slave of nothing. */
    void AddSlaves(const std::vector<std::string>& live)
    {
        for (const std::string& slave : live) {
            if (!Contains(m_plan.slaves, slave)) {
                m_plan.slaves.push_back(slave);
            }
        }
    }

    bool Remember(const FileStates& before, const std::optional<BondOptions>& live)
    {
        const LiveNetwork network = LiveNetwork::Read();
        m_plan.live = LiveAddressing(network, m_plan.name);
        m_record.name = m_plan.name;
        m_record.slaves = m_plan.slaves;
        if (const Link* const link = network.Find(m_plan.name)) {
            m_record.mac = link->mac;
            m_record.mtu = link->mtu;
        }
        const auto written = FileOf(before, m_plan.name).Get("BONDING_OPTS");
        m_record.options =
            BondOptions::Parse(written.value_or("")).OverlaidWith(live.value_or(BondOptions{}));
        m_record.state.before = before;
        m_record.state.moved = TakenApart(m_plan, before);
        const auto gateways = ReadGatewayStates(CarriersOf(m_plan));
        if (!gateways) {
            (void)FailWithReason(m_plan, "the gateway records cannot be read");
            return false;
        }
        m_record.state.gateways = *gateways;
        return true;
    }

    void LogWhatIsLost() const
    {
        std::string lost;
        for (const std::string& option : WithoutTwin(m_record.options)) {
            lost += (lost.empty() ? "" : " ") + option;
        }
        if (!lost.empty()) {
            ::syslog(LOG_NOTICE,
                     "vornnetsdk: bond %s: %s has no effect on the switch and comes back with the "
                     "bond",
                     m_plan.name.c_str(), lost.c_str());
        }
    }

    bool MoveGateways() const
    {
        const auto gateways = GatewaysForCarriers(m_plan);
        if (gateways && WriteGatewayStates(*gateways)) {
            return true;
        }
        (void)FailWithReason(m_plan, "its gateways cannot be moved");
        return false;
    }

    /** The host had better keep its bond than stay between the two. */
    void TakeBack() const
    {
        (void)Fail(m_plan, "cannot be taken apart; it stays");
        const bool whole = WriteFileStates(NamesOf(m_plan), m_record.state.before) &&
                           WriteGatewayStates(m_record.state.gateways) &&
                           StartNetworkOf(NamesOf(m_plan));
        if (whole) {
            (void)RememberedBond::Forget(m_plan.name);
        }
    }

    BondPlan m_plan;
    RememberedBond m_record;
};

} // namespace

int TakeBondApart(BondPlan plan)
{
    return Dissolution(std::move(plan)).Run();
}

} // namespace vornhost
