// Clients are killed at every point of their calls, and the host is repaired each time.
#include "kills/aftermath.h"
#include "kills/victim.h"
#include "support/figures.h"

#include <algorithm>
#include <iterator>

namespace reliability {

namespace {

constexpr int kFewestKills = 2000;
constexpr long kNever = 1L << 40;
constexpr std::size_t kScenarios = 16;

int g_kills = 0;
std::size_t g_scenarios = 0;

/** The calls that change something. */
std::vector<Scenario> Changes()
{
    const unit::Names names{"RegisterFirst",
                            "RegisterFirstWithModes",
                            "RegisterSecond",
                            "UnRegisterLast",
                            "UnRegisterLastWithModes",
                            "UnRegisterOneOfTwo",
                            "RemoveInterface",
                            "RemoveInterfaceOfABond",
                            "AddInterface",
                            "AttachPort",
                            "DetachPort",
                            "OVSBondCreate",
                            "OVSBondRemove",
                            "OVSBodChMode",
                            "OVSVlanCreate",
                            "OVSVlanRemove"};
    std::vector<Scenario> chosen;
    const std::vector<Scenario> all = EntryPoints();
    std::copy_if(all.begin(), all.end(), std::back_inserter(chosen),
                 [&](const Scenario& scenario) { return names.contains(scenario.name); });
    return chosen;
}

class Kills : public testing::TestWithParam<Scenario> {
protected:
    const Scenario& m_scenario = GetParam();
    const Scene m_scene{m_scenario.situation};
    SharedHost m_shared;

    /** Puts the host back and makes the call. */
    Death Try(long nth)
    {
        m_shared.Set(m_scene.Restore());
        return Kill(m_shared, m_scenario.run, nth);
    }
};

TEST_P(Kills, LeaveWhatARepairMakesWhole)
{
    Registrations registrations;
    (void)m_scene.Restore();
    registrations.before = ReadRegistry();
    ASSERT_FALSE(Try(kNever).killed);
    registrations.after = ReadRegistry();
    ++g_scenarios;

    for (long nth = 1;; ++nth) {
        const Death death = Try(nth);
        if (!death.killed) {
            EXPECT_GT(nth, 4) << "nothing was seen";
            return;
        }
        ++g_kills;
        SCOPED_TRACE("killed " + death.point);
        ExpectWholeFilesAndFreeLocks(m_scene);
        ExpectRepair(m_scene, m_shared, registrations);
        if (HasFailure()) {
            return;
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Each, Kills, testing::ValuesIn(Changes()),
                         [](const auto& row) { return row.param.name; });

/** Tells how many there were. */
class Count : public testing::Environment {
    void TearDown() override
    {
        Figure(std::to_string(g_kills) + " clients killed in " + std::to_string(g_scenarios) +
               " calls, each repaired twice");
        EXPECT_TRUE(g_scenarios < kScenarios || g_kills >= kFewestKills);
    }
};

[[maybe_unused]] const auto* const kCount = testing::AddGlobalTestEnvironment(new Count);

} // namespace

} // namespace reliability
