#include "world.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>

namespace contract {
namespace {

std::vector<std::string> FixtureNames()
{
    std::vector<std::string> names;
    for (const auto& entry : std::filesystem::directory_iterator(VORNOVS_FIXTURES)) {
        names.push_back(entry.path().filename());
    }
    std::sort(names.begin(), names.end());
    return names;
}

class MakePlan : public testing::TestWithParam<std::string> {};

TEST_P(MakePlan, IsAsThisHostExpectsIt)
{
    const std::string folder = std::string(VORNOVS_FIXTURES) + "/" + GetParam();
    const World world = ReadWorld(folder);

    const vornhost::Plan plan = vornhost::MakePlan(world.inputs);

    EXPECT_EQ(Describe(plan, world.remarks), ReadText(folder + "/plan.txt"));
}

INSTANTIATE_TEST_SUITE_P(Hosts, MakePlan, testing::ValuesIn(FixtureNames()),
                         [](const testing::TestParamInfo<std::string>& row) { return row.param; });

} // namespace
} // namespace contract
