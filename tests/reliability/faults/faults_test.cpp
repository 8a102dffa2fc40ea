// Everything that can fail is made to fail, one thing at a time: each call of the platform and each
// file operation in every way that it may, each allocation. Then the same with those of its
// function that follow failing as well.
#include "faults/promises.h"
#include "support/figures.h"

#include <cerrno>
#include <cstdio>

namespace reliability {

namespace {

constexpr int kFewestFaults = 5000;
constexpr long kMostAllocations = 5000;

/** How the runs of a scenario ended. */
struct Outcomes {
    std::size_t points = 0;
    int faults = 0;
    int success = 0;
    int failure = 0;
};

std::map<std::string, Outcomes> g_outcomes;

std::vector<Scenario> All()
{
    std::vector<Scenario> all;
    for (const auto& part : {EntryPoints(), Helpers(), Steps()}) {
        all.insert(all.end(), part.begin(), part.end());
    }
    return all;
}

const Scene& SceneOf(Situation situation)
{
    static std::map<Situation, Scene> s_scenes;
    auto found = s_scenes.find(situation);
    if (found == s_scenes.end()) {
        found = s_scenes.emplace(situation, Scene(situation)).first;
    }
    return found->second;
}

/** What is tried again at once until it passes. */
bool IsPassing(const Point& point, const Way& way)
{
    return (point.file && way.result == EINTR) || point.text.starts_with("sleep ");
}

class Faults : public testing::TestWithParam<Scenario> {
protected:
    const Scenario& m_scenario = GetParam();
    const Scene& m_scene = SceneOf(m_scenario.situation);
    const reliability::Run m_clean = RunScenario(m_scenario, m_scene, std::nullopt);
    Outcomes& m_outcomes = g_outcomes[m_scenario.name];

    /** @return whether anything failed. */
    bool Try(const Fault& fault)
    {
        const reliability::Run run = RunScenario(m_scenario, m_scene, fault);
        ExpectNothingLost(m_scenario, m_scene, run);
        if (run.fired == 0) {
            EXPECT_EQ(run.result, m_scenario.success);
            EXPECT_EQ(run.log, m_clean.log);
            return false;
        }
        ExpectWordsAndResult(m_scenario, m_clean, run, fault);
        ++m_outcomes.faults;
        ++(run.result == m_scenario.success ? m_outcomes.success : m_outcomes.failure);
        return true;
    }
};

TEST_P(Faults, AreAnsweredAsDocumentedAndLoseNothing)
{
    ExpectNothingLost(m_scenario, m_scene, m_clean);
    EXPECT_EQ(m_clean.result, m_scenario.success);
    m_outcomes.points = m_clean.points.size();
    for (std::size_t at = 0; at < m_clean.points.size(); ++at) {
        const Point& point = m_clean.points[at];
        const std::vector<Way> ways = WaysOf(point, m_scenario.own);
        for (const Way& way : ways) {
            SCOPED_TRACE(point.text + " " + NameOf(way));
            EXPECT_TRUE(Try({at, way, false, 0}));
        }
        if (!ways.empty() && !IsPassing(point, ways.front())) {
            SCOPED_TRACE(point.text + " " + NameOf(ways.front()) + " from then on");
            EXPECT_TRUE(Try({at, ways.front(), true, 0}));
        }
        if (HasFailure()) {
            return;
        }
    }
    EXPECT_FALSE(Try({m_clean.points.size(), {}, false, 0}));
}

TEST_P(Faults, OfMemoryAreAnsweredAsDocumentedAndLoseNothing)
{
    for (long nth = 1; nth < kMostAllocations; ++nth) {
        SCOPED_TRACE("allocation " + std::to_string(nth));
        const bool failed = Try({0, {}, false, nth});
        if (HasFailure() || !failed) {
            return;
        }
    }
    FAIL() << "no run passed";
}

INSTANTIATE_TEST_SUITE_P(Each, Faults, testing::ValuesIn(All()),
                         [](const auto& row) { return row.param.name; });

/** Prints the table when all have run. */
class Table : public testing::Environment {
    void TearDown() override
    {
        int faults = 0;
        int success = 0;
        int failure = 0;
        (void)std::printf("%-32s %7s %7s %8s %8s\n", "scenario", "points", "faults", "success",
                          "failure");
        for (const auto& [name, outcomes] : g_outcomes) {
            (void)std::printf("%-32s %7zu %7d %8d %8d\n", name.c_str(), outcomes.points,
                              outcomes.faults, outcomes.success, outcomes.failure);
            faults += outcomes.faults;
            success += outcomes.success;
            failure += outcomes.failure;
        }
        Figure(std::to_string(faults) + " faults injected in " + std::to_string(g_outcomes.size()) +
               " scenarios: " + std::to_string(success) + " runs succeeded all the same, " +
               std::to_string(failure) + " answered with the documented failure");
        const bool whole = g_outcomes.size() == All().size();
        EXPECT_TRUE(!whole || faults >= kFewestFaults);
    }
};

[[maybe_unused]] const auto* const kTable = testing::AddGlobalTestEnvironment(new Table);

} // namespace

} // namespace reliability
