#include "faults/injection.h"

#include "support/allocations.h"
#include "support/filecalls.h"

#include <algorithm>
#include <iterator>

#include <sys/stat.h>
#include <sys/wait.h>

namespace reliability {

namespace {

std::string FunctionOf(const std::string& call)
{
    return call.substr(0, call.find(' '));
}

/** Numbers the calls and operations of a run, and makes the chosen one fail. */
class Injector {
public:
    Injector(harness::RecordingPlatform& platform, const std::optional<Fault>& fault, Run& run)
        : m_platform(platform), m_fault(fault), m_run(run)
    {
        m_platform.Intercept([this](const std::string& call) { return Answer(call); });
        m_files.Watch([this](const std::string& operation) { return Error(operation); }, {});
    }

    void Stop()
    {
        m_platform.Intercept({});
        m_files.Watch({}, {});
    }

private:
    bool Fires(Point point)
    {
        const std::string function = FunctionOf(point.text);
        m_run.points.push_back(std::move(point));
        if (!m_fault || m_fault->allocation != 0) {
            return false;
        }
        const std::size_t number = m_run.points.size() - 1;
        const bool alike = m_fault->andAlike && m_run.fired > 0 && function == m_function;
        if (number != m_fault->point && !alike) {
            return false;
        }
        if (m_run.fired == 0) {
            m_function = function;
            m_run.logBefore = m_platform.Log().size();
            m_run.callsBefore = m_platform.AllCalls().size();
        }
        ++m_run.fired;
        return true;
    }

    std::optional<int> Answer(const std::string& call)
    {
        if (!Fires({false, call})) {
            return std::nullopt;
        }
        if (m_fault->way.output) {
            m_platform.OutputOnce(*m_fault->way.output, m_fault->way.result);
            return std::nullopt;
        }
        return m_fault->way.result;
    }

    int Error(const std::string& operation)
    {
        const std::string path = operation.substr(operation.find(' ') + 1);
        struct stat status {};
        const bool exists = ::stat(path.substr(0, path.find(".new")).c_str(), &status) == 0;
        return Fires({true, operation, exists}) ? m_fault->way.result : 0;
    }

    harness::RecordingPlatform& m_platform;
    const std::optional<Fault>& m_fault;
    Run& m_run;
    unit::FileCalls m_files;
    std::string m_function;
};

void Call(const Scenario& scenario, const std::optional<Fault>& fault, Run& run)
{
    try {
        const unit::FailingAllocation failing(fault ? fault->allocation : 0, false);
        run.result = scenario.run();
    } catch (...) {
        run.threw = true;
    }
    if (fault && fault->allocation != 0 && unit::FailingAllocation::HasFailed()) {
        run.fired = 1;
    }
}

} // namespace

Run RunScenario(const Scenario& scenario, const Scene& scene, const std::optional<Fault>& fault)
{
    Run run;
    const unit::SimulatedState& state = scene.Restore();
    harness::RecordingPlatform platform;
    unit::SimulatedHost host(platform, state);
    host.AllowChanges();
    for (const auto& [call, answer] : scenario.answers) {
        platform.Answer(call, answer);
    }

    const std::vector<std::string> before = unit::ListFolder("/proc/self/fd");
    Injector injector(platform, fault, run);
    Call(scenario, fault, run);
    injector.Stop();
    const std::vector<std::string> after = unit::ListFolder("/proc/self/fd");
    std::set_difference(after.begin(), after.end(), before.begin(), before.end(),
                        std::back_inserter(run.leftDescriptors));
    run.leftChild = ::waitpid(-1, nullptr, WNOHANG) != -1;

    run.log = platform.Log();
    run.calls = platform.AllCalls();
    run.openHandles = platform.OpenHandles();
    return run;
}

} // namespace reliability
