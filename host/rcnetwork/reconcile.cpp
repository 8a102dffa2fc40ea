#include "reconcile.h"

#include "apply.h"
#include "decision.h"
#include "inputs.h"

#include "support/atomicfile.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <utility>

namespace vornhost {
namespace {

constexpr int kTries = 2;
constexpr mode_t kPrivate = 0600;

class Reconciler {
public:
    explicit Reconciler(Request request) : m_request(std::move(request)) {}
    bool Run();

private:
    void SayOnce(const std::vector<Remark>& remarks);
    std::optional<Inputs> Read();
    void StartServices();
    bool Attempt();
    void Save(const RunState& former, const RunState& state);
    void StayWithoutSwitch();
    bool ReportRest();

    Request m_request;
    std::vector<Remark> m_said;
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
    return inputs;
}

void Reconciler::Save(const RunState& former, const RunState& state)
{
    if (state != former && !ReplaceFile(kRunStatePath, RunStateText(state), kPrivate)) {
        SayOnce({{Severity::kError,
                  std::string("cannot write ") + kRunStatePath + ": " + std::strerror(errno)}});
    }
}

/** One round. @return  whether nothing was left to do. */
bool Reconciler::Attempt()
{
    const auto inputs = Read();
    if (!inputs) {
        return false;
    }
    const Plan plan = MakePlan(*inputs);
    SayOnce(plan.remarks);
    if (plan.Empty()) {
        Save(inputs->runState, plan.recordAfter);
        return true;
    }
    Save(inputs->runState, plan.recordBefore);
    std::vector<Remark> remarks;
    (void)ApplyPlan(plan, remarks);
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
        (void)Attempt();
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
        return true;
    }
    for (const Stage& stage : plan.stages) {
        for (const std::string& line : stage.lines) {
            SayOnce({{Severity::kError, "could not be done: " + line}});
        }
    }
    return false;
}

bool Reconciler::Run()
{
    StartServices();
    for (int i = 0; i < kTries && m_canGoOn; ++i) {
        if (Attempt()) {
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
    return Reconciler(request).Run();
}

} // namespace vornhost
