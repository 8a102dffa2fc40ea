#include "support/servicemanager.h"
#include "systemd/fakesystemd.h"

#include <chrono>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using harness::FakeSystemd;
using std::chrono::milliseconds;
using std::chrono::seconds;
using testing::ElementsAre;
using testing::IsEmpty;
using vornhost::RestartUnit;
using vornhost::StartUnit;
using vornhost::StopUnit;
using vornhost::SystemdRuns;
using vornhost::UnitExists;
using vornhost::UnitIsActive;

constexpr char kUnit[] = "vornovs-db.service";
constexpr seconds kEnough{20};

TEST(ServiceManager, FindsNoSystemdWhereNoneStartedTheHost)
{
    std::string error;
    EXPECT_FALSE(SystemdRuns());
    EXPECT_FALSE(StartUnit(kUnit, milliseconds(1), &error));
    EXPECT_EQ(error, "vornovs-db.service: systemd does not answer");
    EXPECT_EQ(UnitIsActive(kUnit), std::nullopt);
    EXPECT_EQ(UnitExists(kUnit), std::nullopt);
}

TEST(ServiceManager, HasUnitsStartedStoppedAndStartedAnew)
{
    FakeSystemd systemd;
    systemd.AddUnit(kUnit);
    EXPECT_TRUE(SystemdRuns());
    EXPECT_TRUE(StartUnit(kUnit, kEnough));
    EXPECT_TRUE(StopUnit(kUnit, kEnough));
    EXPECT_TRUE(RestartUnit(kUnit, kEnough));
    EXPECT_THAT(systemd.Jobs(),
                ElementsAre("StartUnit vornovs-db.service", "StopUnit vornovs-db.service",
                            "RestartUnit vornovs-db.service"));
}

TEST(ServiceManager, TellsHowAJobEnded)
{
    FakeSystemd systemd(
        [](const std::string&, const std::string& unit) { return unit.substr(0, unit.find('.')); });
    for (const char* result : {"failed", "dependency", "canceled", "timeout", "skipped"}) {
        const std::string unit = std::string(result) + ".service";
        std::string error;
        systemd.AddUnit(unit);
        EXPECT_FALSE(StartUnit(unit, kEnough, &error));
        EXPECT_EQ(error, unit + ": result " + result);
    }
}

TEST(ServiceManager, StartsAUnitAnewThatHasFailedTooOften)
{
    FakeSystemd systemd;
    systemd.AddUnit(kUnit, "failed");
    EXPECT_TRUE(StartUnit(kUnit, kEnough));
}

TEST(ServiceManager, TellsWhatSystemdAnswersWhenItRefuses)
{
    FakeSystemd systemd;
    std::string error;
    EXPECT_FALSE(StartUnit("none.service", kEnough, &error));
    EXPECT_EQ(error, "none.service: Unit none.service not found.");
}

TEST(ServiceManager, DoesNotWaitForAJobBeyondTheDeadline)
{
    FakeSystemd systemd([](const std::string&, const std::string&) { return ""; });
    systemd.AddUnit(kUnit);
    std::string error;
    const auto begin = std::chrono::steady_clock::now();
    EXPECT_FALSE(StartUnit(kUnit, milliseconds(300), &error));
    EXPECT_LT(std::chrono::steady_clock::now() - begin, seconds(5));
    EXPECT_EQ(error, "vornovs-db.service: not done in time");
}

TEST(ServiceManager, AsksAgainWhenSystemdIsReplacedMeanwhile)
{
    FakeSystemd systemd;
    systemd.AddUnit(kUnit);
    systemd.BreakConnections(2);
    EXPECT_TRUE(StartUnit(kUnit, kEnough));
    EXPECT_THAT(systemd.Jobs(),
                ElementsAre("StartUnit vornovs-db.service", "StartUnit vornovs-db.service",
                            "StartUnit vornovs-db.service"));
}

TEST(ServiceManager, TellsWhatAUnitIs)
{
    FakeSystemd systemd;
    systemd.AddUnit("on.service", "active");
    systemd.AddUnit("off.service", "failed");
    EXPECT_EQ(UnitIsActive("on.service"), true);
    EXPECT_EQ(UnitIsActive("off.service"), false);
    EXPECT_EQ(UnitIsActive("none.service"), false);
    EXPECT_EQ(UnitExists("on.service"), true);
    EXPECT_EQ(UnitExists("off.service"), true);
    EXPECT_EQ(UnitExists("none.service"), false);
    EXPECT_THAT(systemd.Jobs(), IsEmpty());
}

} // namespace
