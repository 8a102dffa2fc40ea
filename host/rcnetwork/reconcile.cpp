#include "reconcile.h"

#include "apply.h"
#include "conversion.h"
#include "decision.h"
#include "inputs.h"
#include "retry.h"

#include "support/atomicfile.h"
#include "support/wholebonds.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <utility>

namespace vornhost {
namespace {

constexpr int kTries = 2;

void WriteHandover(const Handover& handover)
{
    if (!SaveHandover(handover)) {
        Say({Severity::kWarning,
             std::string("cannot write ") + kHandoverPath + ": " + std::strerror(errno)});
    }
}

/** What cannot be read back is known to be so once it was done. */
RunState WithWhatIsTold(const Plan& plan)
{
    RunState state = plan.recordBefore;
    for (const auto& [name, record] : plan.recordAfter.interfaces) {
        state.interfaces[name].linkCommands = record.linkCommands;
        state.interfaces[name].resolver = record.resolver;
    }
    return state;
}

class Reconciler {
public:
    explicit Reconciler(Request request) : m_request(std::move(request)) {}
    bool Run();
    /** Leaves word of what is to be on the switch and is not. */
    void MindWaiting() const;

private:
    void SayOnce(const std::vector<Remark>& remarks);
    std::optional<Inputs> Read();
    void StartServices();
    bool Attempt(bool (*apply)(const Plan&, std::vector<Remark>&));
    void UpdateHandover(Inputs& inputs);
    void SettleHandover(const Inputs& inputs);
    void RememberNames(const Inputs& inputs);
    void Save(const RunState& former, const RunState& state);
    void StayWithoutSwitch();
    bool ReportRest();

    Request m_request;
    std::vector<Remark> m_said;
    std::set<std::string> m_concerned; ///< None: everything.
    std::set<std::string> m_unasked;   ///< What a switch that does not answer was to carry.
    bool m_failed = false;
    bool m_canGoOn = true;
};

/** What is still so in a later round was said in the first one. */
void Reconciler::SayOnce(const std::vector<Remark>& remarks)
{
    for (const Remark& remark : remarks) {
        if (std::find(m_said.begin(), m_said.end(), remark) == m_said.end()) {
            Say(remark);
            m_said.push_back(remark);
        }
        m_failed = m_failed || remark.severity == Severity::kError;
    }
}

std::optional<Inputs> Reconciler::Read()
{
    std::vector<Remark> remarks;
    auto inputs = ReadInputs(m_request, remarks);
    SayOnce(remarks);
    m_canGoOn = inputs.has_value();
    m_request.switchHung = inputs && inputs->switchState.hung;
    if (inputs) {
        m_concerned = m_request.names.empty() ? std::set<std::string>() : Concerned(*inputs);
        m_unasked = inputs->switchState.hung ? WantedOnSwitch(*inputs) : std::set<std::string>();
        RememberNames(*inputs);
        UpdateHandover(*inputs);
    }
    return inputs;
}

/** What this run itself takes away is no interface without a file afterwards. */
void Reconciler::RememberNames(const Inputs& inputs)
{
    for (const std::string& name : m_request.names) {
        const Kinship kinship(inputs);
        const Link* link = inputs.live.FindLink(name);
        if ((link != nullptr && IsOfMadeKind(*link)) || !kinship.LiveMembersOf(name).empty() ||
            inputs.runState.interfaces.contains(name)) {
            m_request.known.insert(name);
        }
    }
}

/** In a conversion the other members of a bond that is taken apart wait for it in silence. */
void Reconciler::UpdateHandover(Inputs& inputs)
{
    if (!IsPartOfConversion() || m_request.verb != Verb::kStart) {
        return;
    }
    const Handover former = inputs.handover;
    const Kinship kinship(inputs);
    for (const auto& [name, bond] : inputs.live.bonds) {
        const std::string heir = kinship.HeirOf(name);
        const Link* link = inputs.live.FindLink(name);
        if (heir.empty() || kinship.IsWantedBond(heir) || link == nullptr) {
            continue;
        }
        const auto mode = bond.options.find("mode");
        const bool lacp = mode != bond.options.end() && mode->second == kLacpMode;
        inputs.handover.bonds[name] = {bond.members, link->mac, lacp};
    }
    if (inputs.handover != former) {
        WriteHandover(inputs.handover);
    }
}

/** What stands in a file again is owed no more. */
void Reconciler::SettleHandover(const Inputs& inputs)
{
    Handover handover = inputs.handover;
    const Kinship kinship(inputs);
    const std::set<std::string> concerned = kinship.Closure(m_request.names);
    std::erase_if(handover.bonds, [&](const auto& entry) {
        return kinship.IsWantedBond(entry.first) &&
               (concerned.empty() || concerned.contains(entry.first));
    });
    std::erase_if(handover.tags, [&](const auto& entry) {
        const FileVlan vlan{entry.first, entry.second};
        return std::any_of(inputs.files.begin(), inputs.files.end(), [&](const auto& each) {
            return each.second.use == FileUse::kPlain && each.second.vlan == vlan;
        });
    });
    if (handover != inputs.handover) {
        WriteHandover(handover);
    }
}

void Reconciler::Save(const RunState& former, const RunState& state)
{
    if (state != former && !ReplaceFile(kRunStatePath, RunStateText(state), kPrivateFile)) {
        SayOnce({{Severity::kError,
                  std::string("cannot write ") + kRunStatePath + ": " + std::strerror(errno)}});
    }
}

/** One round. @return  whether nothing was left to do. */
bool Reconciler::Attempt(bool (*apply)(const Plan&, std::vector<Remark>&))
{
    const auto inputs = Read();
    if (!inputs) {
        return false;
    }
    const Plan plan = MakePlan(*inputs);
    SayOnce(plan.remarks);
    if (plan.Empty()) {
        Save(inputs->runState, plan.recordAfter);
        SettleHandover(*inputs);
        SettleConversion(*inputs);
        return true;
    }
    Save(inputs->runState, plan.recordBefore);
    std::vector<Remark> remarks;
    if (apply(plan, remarks)) {
        Save(plan.recordBefore, WithWhatIsTold(plan));
    }
    SayOnce(remarks);
    return false;
}

/** Starts the switch if the plan begins with that. One that does not start is asked no more. */
void Reconciler::StartServices()
{
    const auto inputs = Read();
    if (!inputs) {
        return;
    }
    const Plan plan = MakePlan(*inputs);
    if (plan.Empty() || plan.stages.front().kind != StageKind::kServices) {
        return;
    }
    std::vector<Remark> remarks;
    m_request.switchHung = !ApplyPlan(plan, remarks);
    SayOnce(remarks);
}

/** A host that cannot have the switch is to be reachable all the same. */
void Reconciler::StayWithoutSwitch()
{
    const auto inputs = Read();
    if (!inputs) {
        return;
    }
    m_request.withoutSwitch = NotOnSwitch(*inputs);
    for (const std::string& name : m_request.withoutSwitch) {
        SayOnce({{Severity::kError, "the switch does not carry " + name +
                                        "; its addresses stay on the plain interface"}});
    }
    if (!m_request.withoutSwitch.empty()) {
        (void)Attempt(ApplyWhatCanBe);
        m_failed = true;
    }
}

/** @return  whether nothing is left to do. */
bool Reconciler::ReportRest()
{
    const auto inputs = Read();
    if (!inputs) {
        return false;
    }
    const Plan plan = MakePlan(*inputs);
    if (plan.Empty()) {
        Save(inputs->runState, plan.recordAfter);
        SettleHandover(*inputs);
        SettleConversion(*inputs);
        return true;
    }
    for (const Stage& stage : plan.stages) {
        for (const std::string& line : stage.lines) {
            SayOnce({{Severity::kError, "could not be done: " + line}});
        }
    }
    return false;
}

void Reconciler::MindWaiting() const
{
    if (!m_canGoOn) {
        return;
    }
    std::set<std::string> waiting = m_unasked;
    waiting.insert(m_request.withoutSwitch.begin(), m_request.withoutSwitch.end());
    MindRetry(m_concerned, m_request.verb == Verb::kStart ? waiting : std::set<std::string>());
}

bool Reconciler::Run()
{
    if (m_request.verb == Verb::kStart) {
        std::vector<Remark> remarks;
        MindWholeBonds(remarks);
        SayOnce(remarks);
    }
    StartServices();
    for (int i = 0; i < kTries && m_canGoOn; ++i) {
        // What fails again would fail each time; it keeps nothing else waiting.
        if (Attempt(i + 1 < kTries ? ApplyPlan : ApplyWhatCanBe)) {
            return !m_failed;
        }
    }
    if (m_canGoOn) {
        StayWithoutSwitch();
    }
    return m_canGoOn && ReportRest() && !m_failed;
}

} // namespace

bool PrintPlan(const Request& request)
{
    std::vector<Remark> remarks;
    const auto inputs = ReadInputs(request, remarks);
    if (!inputs) {
        (void)SayAll(remarks);
        return false;
    }
    const Plan plan = MakePlan(*inputs);
    remarks.insert(remarks.end(), plan.remarks.begin(), plan.remarks.end());
    (void)std::fputs(plan.Text().c_str(), stdout);
    return !SayAll(remarks);
}

bool Reconcile(const Request& request)
{
    Reconciler reconciler(request);
    const bool done = reconciler.Run();
    reconciler.MindWaiting();
    return done;
}

std::set<std::string> ConcernedBy(const Request& request)
{
    std::vector<Remark> remarks;
    const auto inputs = ReadInputs(request, remarks);
    return inputs && !request.names.empty() ? Concerned(*inputs) : request.names;
}

} // namespace vornhost
