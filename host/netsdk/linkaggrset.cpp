/**
 * Taking bonds apart and building them.
 *
 * Files change in an order in which a host that is restarted in between stays reachable: a bond
 * whose file names no slaves any more is none, so whichever of the bond and its first slave has the
 * other's part left carries the addressing. What was before is on the disk before the first change,
 * so that a step that was cut short can be made again.
 */
#include "bondfiles.h"
#include "bondmodes.h"

#include "support/fileslock.h"
#include "support/filestates.h"
#include "support/interfacename.h"
#include "support/livesettings.h"
#include "support/networkprogram.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <exception>
#include <iterator>
#include <syslog.h>
#include <vornplatform/netsdk.h>

namespace {

using vornhost::BondPlan;
using vornhost::FileStates;
using vornhost::GatewayState;
using vornhost::LiveNetwork;
using vornhost::RememberedBond;

constexpr char kBridgePrefix[] = "ovs_";

std::string Name(const char (&field)[VORN_NAME_SIZE])
{
    return {field, ::strnlen(field, VORN_NAME_SIZE)};
}

bool Contains(const std::vector<std::string>& list, const std::string& name)
{
    return std::find(list.begin(), list.end(), name) != list.end();
}

/** @return  the bond and the slaves of a record, no slaves when the record is wrong. */
BondPlan PlanOf(const VORNLINKAGGROPT& opt)
{
    BondPlan plan;
    plan.name = Name(opt.szMaster);
    plan.mode = vornhost::KernelModeName(opt.mode);
    const int count = std::clamp(opt.nSlave, 0, VORN_LINK_AGGR_SLAVES);
    for (int index = 0; index < count; ++index) {
        const std::string slave = Name(opt.rgszSlave[index]);
        if (!vornhost::IsInterfaceName(slave) || slave == plan.name ||
            Contains(plan.slaves, slave)) {
            return {};
        }
        plan.slaves.push_back(slave);
    }
    return opt.nSlave == count && vornhost::IsInterfaceName(plan.name) ? plan : BondPlan{};
}

std::vector<std::string> NamesOf(const BondPlan& plan)
{
    std::vector<std::string> names{plan.name};
    names.insert(names.end(), plan.slaves.begin(), plan.slaves.end());
    return names;
}

/** From the last slave to the first and then the bond; the other way round when it is built. */
std::vector<std::string> OrderApart(const BondPlan& plan)
{
    const std::vector<std::string> names = NamesOf(plan);
    return {names.rbegin(), names.rend()};
}

int Fail(const BondPlan& plan, const char* reason)
{
    ::syslog(LOG_ERR, "vornnetsdk: bond %s: %s", plan.name.c_str(), reason);
    return -1;
}

int FailWithReason(const BondPlan& plan, const char* what)
{
    ::syslog(LOG_ERR, "vornnetsdk: bond %s: %s: %s", plan.name.c_str(), what, std::strerror(errno));
    return -1;
}

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
    const auto bonds = vornhost::ReadGatewayStates({plan.name, kBridgePrefix + plan.name});
    auto carriers = vornhost::ReadGatewayStates(CarriersOf(plan));
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
        const bool changed = step == Step::kDone && vornhost::StartNetworkOf(NamesOf(m_plan));
        if (!changed && !m_record.name.empty()) {
            TakeBack();
        }
        return changed ? 0 : -1;
    }

private:
    enum class Step { kRefused, kFailed, kDone };

    Step ChangeFiles()
    {
        const vornhost::FilesLock lock;
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
        return MoveGateways() && vornhost::WriteFileStates(OrderApart(m_plan), m_record.state.moved)
                   ? Step::kDone
                   : Step::kFailed;
    }

    /** Finds out what there is. No record is made where the files are as they are to be. */
    Step Prepare()
    {
        const auto options = vornhost::BondOptions::ReadLive(m_plan.name);
        const auto slaves = vornhost::ReadLiveSlaves(m_plan.name);
        AddSlaves(slaves.value_or(std::vector<std::string>()));
        const auto before = vornhost::ReadFileStates(NamesOf(m_plan));
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
        if (known && vornhost::IsHalfTakenApart(memory->state, *before)) {
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

    bool Remember(const FileStates& before, const std::optional<vornhost::BondOptions>& live)
    {
        const LiveNetwork network = LiveNetwork::Read();
        m_plan.live = vornhost::LiveAddressing(network, m_plan.name);
        m_record.name = m_plan.name;
        m_record.slaves = m_plan.slaves;
        if (const vornhost::Link* const link = network.Find(m_plan.name)) {
            m_record.mac = link->mac;
            m_record.mtu = link->mtu;
        }
        const auto written = vornhost::FileOf(before, m_plan.name).Get("BONDING_OPTS");
        m_record.options = vornhost::BondOptions::Parse(written.value_or(""))
                               .OverlaidWith(live.value_or(vornhost::BondOptions{}));
        m_record.state.before = before;
        m_record.state.moved = vornhost::TakenApart(m_plan, before);
        const auto gateways = vornhost::ReadGatewayStates(CarriersOf(m_plan));
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
        for (const std::string& option : vornhost::WithoutTwin(m_record.options)) {
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
        if (gateways && vornhost::WriteGatewayStates(*gateways)) {
            return true;
        }
        (void)FailWithReason(m_plan, "its gateways cannot be moved");
        return false;
    }

    /** The host had better keep its bond than stay between the two. */
    void TakeBack() const
    {
        (void)Fail(m_plan, "cannot be taken apart; it stays");
        const bool whole = vornhost::WriteFileStates(NamesOf(m_plan), m_record.state.before) &&
                           vornhost::WriteGatewayStates(m_record.state.gateways) &&
                           vornhost::StartNetworkOf(NamesOf(m_plan));
        if (whole) {
            (void)RememberedBond::Forget(m_plan.name);
        }
    }

    BondPlan m_plan;
    RememberedBond m_record;
};

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
               const auto file = vornhost::FileOf(files, slave);
               return file.Get("MASTER") == plan.name && file.Get("SLAVE") == "yes";
           });
}

/** The gateway records of a bond that is built and of what carried its addressing until then. */
std::optional<std::vector<GatewayState>>
GatewaysForBond(const BondPlan& plan, const std::optional<RememberedBond>& memory)
{
    if (memory) {
        // The bond's own are there: the caller has brought them back from its bridge. The bridge
        // that was given some is gone.
        auto former = memory->state.gateways;
        for (GatewayState& state : former) {
            if (state.interface.starts_with(kBridgePrefix)) {
                state.gateway.reset();
            }
        }
        return former;
    }
    auto bonds = vornhost::ReadGatewayStates({plan.name});
    auto carriers = vornhost::ReadGatewayStates({plan.slaves[0]});
    if (!bonds || !carriers) {
        return std::nullopt;
    }
    for (std::size_t family = 0; family < bonds->size(); ++family) {
        GatewayState& bond = (*bonds)[family];
        GatewayState& carrier = (*carriers)[family];
        bond.gateway = bond.gateway ? bond.gateway : carrier.gateway;
        carrier.gateway.reset();
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
        if (!vornhost::StartNetworkOf(NamesOf(m_plan))) {
            return Fail(m_plan, "the network program cannot build it");
        }
        const vornhost::FilesLock lock;
        if (!lock || !vornhost::WriteFileStates(OrderApart(m_plan), m_built.final)) {
            return -1;
        }
        return RememberedBond::Forget(m_plan.name) ? 0
                                                   : FailWithReason(m_plan, "cannot be forgotten");
    }

private:
    bool ChangeFiles()
    {
        const vornhost::FilesLock lock;
        const auto current = vornhost::ReadFileStates(NamesOf(m_plan));
        if (!lock || !current) {
            (void)Fail(m_plan, lock ? "its files cannot be read"
                                    : "somebody else is editing configuration files");
            return false;
        }
        const bool stands = IsWhole(m_plan, *current) && vornhost::ReadLiveSlaves(m_plan.name);
        if (!stands) {
            Remember();
        }
        m_plan.live = vornhost::LiveAddressing(LiveNetwork::Read(), m_plan.slaves[0]);
        m_built = vornhost::Built(m_plan, *current, m_memory);
        return (stands || MoveGateways()) &&
               vornhost::WriteFileStates(NamesOf(m_plan), m_built.build);
    }

    void Remember()
    {
        m_memory = RememberedBond::Load(m_plan.name);
        if (m_memory && !SharesSlave(*m_memory, m_plan.slaves)) {
            m_memory.reset(); // another bond of that name
        }
        const std::string mode = vornhost::ModeOf(m_plan, m_memory);
        if (mode != m_plan.mode) {
            ::syslog(LOG_NOTICE, "vornnetsdk: bond %s is %s again, for which the switch had %s",
                     m_plan.name.c_str(), mode.c_str(), m_plan.mode.c_str());
        }
    }

    bool MoveGateways() const
    {
        const auto gateways = GatewaysForBond(m_plan, m_memory);
        if (gateways && vornhost::WriteGatewayStates(*gateways)) {
            return true;
        }
        (void)FailWithReason(m_plan, "its gateways cannot be moved");
        return false;
    }

    BondPlan m_plan;
    std::optional<RememberedBond> m_memory;
    vornhost::BuiltBond m_built;
};

int Set(const VORNLINKAGGROPT& opt)
{
    BondPlan plan = PlanOf(opt);
    if (plan.name.empty()) {
        ::syslog(LOG_ERR, "vornnetsdk: the record of a bond names no bond or wrong slaves");
        return -1;
    }
    if (opt.mode == VORN_LINK_AGGR_NONE) {
        return Dissolution(std::move(plan)).Run();
    }
    if (plan.mode.empty()) {
        return Fail(plan, "its mode is none of the kernel's");
    }
    return plan.slaves.empty() ? Fail(plan, "has no slaves") : Building(std::move(plan)).Run();
}

} // namespace

int VORNNetLinkAggrSet(const VORNLINKAGGROPT* opt)
{
    if (opt == nullptr) {
        return -1;
    }
    try {
        return Set(*opt);
    } catch (const std::exception& error) {
        ::syslog(LOG_ERR, "vornnetsdk: cannot change a bond: %s", error.what());
        return -1;
    }
}
