#include "host.h"
#include "systemd/fakesystemd.h"

#include <gmock/gmock.h>

#include <chrono>
#include <csignal>
#include <filesystem>
#include <thread>

namespace contract {
namespace {

constexpr char kBefore[] = "IPADDR=192.0.2.5\nPREFIX=24\nGATEWAY=192.0.2.1\n";
constexpr char kBeforeNetwork[] =
    "eth0 192.0.2.5/24\ndefault via 192.0.2.1 dev eth0 proto static\n";
constexpr char kAfter[] = "IPADDR=192.0.2.6\nPREFIX=24\nGATEWAY=192.0.2.1\n";
constexpr char kAfterNetwork[] = "eth0 192.0.2.6/24\ndefault via 192.0.2.1 dev eth0 proto static\n";
constexpr char kHoldPath[] = "/run/vornovs/network.hold";

/** Of the hold that is there. */
std::string Token()
{
    const std::string text = ReadFile(kHoldPath);
    const std::string beginning = "\"token\":\"";
    const auto begin = text.find(beginning) + beginning.size();
    return text.substr(begin, text.find('"', begin) - begin);
}

class Hold : public Host {
protected:
    void SetUp() override
    {
        Host::SetUp();
        WriteFile("/etc/vornovs-host.conf", "HOLD_SECONDS=1\n");
        File("eth0", kBefore);
        ASSERT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""}));
    }

    void TearDown() override
    {
        EXPECT_TRUE(WaitUntil([] { return Holders().empty(); }));
        Host::TearDown();
    }

    /** The folders of the processes that wait for the end of a hold. */
    static std::vector<std::filesystem::path> Holders()
    {
        return Processes("cmdline", std::string("rc.network\0holder", 17));
    }
};

TEST_F(Hold, AStopOfTheLibraryChangesNothingAndReturnsAtOnce)
{
    const std::string before = Snapshot();

    EXPECT_EQ(RcNetworkOfLibrary({"stop"}), (Outcome{0, "", ""}));

    EXPECT_EQ(Snapshot(), before);
    EXPECT_TRUE(WaitUntil([] { return Holders().size() == 1; }));
}

TEST_F(Hold, TheStartThatFollowsReconcilesAndEndsIt)
{
    ASSERT_EQ(RcNetworkOfLibrary({"stop"}), (Outcome{0, "", ""}));
    File("eth0", kAfter);

    EXPECT_EQ(RcNetworkOfLibrary({"start"}), (Outcome{0, "", ""}));

    EXPECT_EQ(Network(), kAfterNetwork);
    EXPECT_EQ(ReadFile(kHoldPath), "(none)");
    // The holder finds its token gone and must not touch what somebody changed meanwhile.
    File("eth0", kBefore);
    EXPECT_TRUE(WaitUntil([] { return Holders().empty(); }));
    EXPECT_EQ(Network(), kAfterNetwork);
}

TEST_F(Hold, WithoutAStartTheHolderReconcilesWithTheFilesAsTheyAreThen)
{
    ASSERT_EQ(RcNetworkOfLibrary({"stop"}), (Outcome{0, "", ""}));
    File("eth0", kAfter);

    EXPECT_TRUE(WaitUntil([] { return ReadFile(kHoldPath) == "(none)"; }));

    EXPECT_EQ(Network(), kAfterNetwork);
}

TEST_F(Hold, EachStopReplacesTheOneBefore)
{
    ASSERT_EQ(RcNetworkOfLibrary({"stop", "eth0"}), (Outcome{0, "", ""}));
    const std::string first = ReadFile(kHoldPath);
    ASSERT_EQ(RcNetworkOfLibrary({"stop", "eth1"}), (Outcome{0, "", ""}));

    const std::string second = ReadFile(kHoldPath);
    EXPECT_NE(second, first);
    EXPECT_THAT(second, testing::HasSubstr(R"("names":["eth0","eth1"])"));

    EXPECT_EQ(RcNetworkOfLibrary({"start", "eth0"}), (Outcome{0, "", ""}));
    EXPECT_THAT(ReadFile(kHoldPath), testing::HasSubstr(R"("names":["eth1"])"));
}

TEST_F(Hold, AnAdministratorsStopStopsForRealAndEndsTheHold)
{
    ASSERT_EQ(RcNetworkOfLibrary({"stop"}), (Outcome{0, "", ""}));

    EXPECT_EQ(RcNetwork({"stop"}), (Outcome{0, "", ""}));

    EXPECT_EQ(Network(), "");
    EXPECT_TRUE(WaitUntil([] { return Holders().empty(); }));
    EXPECT_EQ(Network(), "");
}

TEST_F(Hold, TheHolderOutlivesItsCallersWholeGroup)
{
    const std::string script = std::string("VORNOVS_HOLD=1 ") + RCNETWORK + " stop; kill -9 0";
    (void)RunProgram({"setsid", "--wait", "sh", "-c", script});
    File("eth0", kAfter);

    EXPECT_TRUE(WaitUntil([] { return ReadFile(kHoldPath) == "(none)"; }));

    EXPECT_EQ(Network(), kAfterNetwork);
}

TEST_F(Hold, TheHolderKeepsNothingOfItsCallersOpen)
{
    // Long enough that a slow machine still finds it waiting.
    WriteFile("/etc/vornovs-host.conf", "HOLD_SECONDS=60\n");
    ASSERT_EQ(RcNetworkOfLibrary({"stop"}), (Outcome{0, "", ""}));
    ASSERT_TRUE(WaitUntil([] { return Holders().size() == 1; }));

    const std::filesystem::path holder = Holders().at(0);
    EXPECT_TRUE(WaitUntil([&] { return ReadFile(holder / "comm") == "rc.network\n"; }));
    std::vector<std::string> open;
    for (const auto& descriptor : std::filesystem::directory_iterator(holder / "fd")) {
        open.push_back(std::filesystem::read_symlink(descriptor.path()));
    }
    EXPECT_THAT(open, testing::ElementsAre("/dev/null", "/dev/null", "/dev/null"));
    EXPECT_EQ(std::filesystem::read_symlink(holder / "cwd"), "/");

    // A start that comes before the hold's end lets the holder end, too.
    EXPECT_EQ(RcNetworkOfLibrary({"start"}), (Outcome{0, "", ""}));
    ASSERT_EQ(kill(std::stoi(holder.filename()), SIGKILL), 0);
}

TEST_F(Hold, TheHolderRunsInAUnitOfItsOwnWhereSystemdRuns)
{
    harness::FakeSystemd systemd;
    systemd.AddUnit("vornovs-hold@.service");

    EXPECT_EQ(RcNetworkOfLibrary({"stop"}), (Outcome{0, "", ""}));

    EXPECT_THAT(systemd.Jobs(),
                testing::ElementsAre("StartUnit vornovs-hold@" + Token() + ".service"));
    EXPECT_TRUE(Holders().empty());
    EXPECT_EQ(RcNetworkOfLibrary({"start"}), (Outcome{0, "", ""}));
}

TEST_F(Hold, TheHolderIsNobodysChildWhereSystemdDoesNotStartIt)
{
    harness::FakeSystemd systemd;

    EXPECT_EQ(RcNetworkOfLibrary({"stop"}), (Outcome{0, "", ""}));

    EXPECT_THAT(systemd.Jobs(), testing::SizeIs(1));
    EXPECT_TRUE(WaitUntil([] { return Holders().size() == 1; }));
    EXPECT_EQ(RcNetworkOfLibrary({"start"}), (Outcome{0, "", ""}));
}

TEST_F(Hold, AStartOfTheLibraryIsOneItselfWhereItsWholeServiceCanBeEnded)
{
    harness::FakeSystemd systemd;
    systemd.AddUnit("vornovs-hold@.service");
    File("eth0", kAfter);

    EXPECT_EQ(RcNetworkOfLibrary({"start", "eth0"}), (Outcome{0, "", ""}));
    EXPECT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""})) << "an administrator's is none";

    EXPECT_THAT(systemd.Jobs(),
                testing::ElementsAre(testing::StartsWith("StartUnit vornovs-hold@")));
    EXPECT_EQ(Network(), kAfterNetwork);
    EXPECT_EQ(ReadFile(kHoldPath), "(none)");
}

TEST_F(Hold, AStartOfTheLibraryThatFailsLeavesNoneOfItsOwn)
{
    harness::FakeSystemd systemd;
    systemd.AddUnit("vornovs-hold@.service");

    EXPECT_EQ(RcNetworkOfLibrary({"start", "eth7"}).exitCode, 1);

    EXPECT_THAT(systemd.Jobs(), testing::SizeIs(1));
    EXPECT_EQ(ReadFile(kHoldPath), "(none)");
}

TEST_F(Hold, ATokenLeftByAnEarlierBootIsHarmless)
{
    WriteFile(kHoldPath, "{\"token\": \"1-2-3\", \"names\": []}\n");

    EXPECT_EQ(RcNetwork({"start"}), (Outcome{0, "", ""}));

    EXPECT_EQ(ReadFile(kHoldPath), "(none)");
    EXPECT_EQ(Network(), kBeforeNetwork);
}

TEST_F(Hold, AHolderWhoseTokenIsNotTheOneThereDoesNothing)
{
    WriteFile(kHoldPath, "{\"token\": \"1-2-3\", \"names\": []}\n");
    File("eth0", kAfter);

    EXPECT_EQ(RcNetwork({"holder", "4-5-6"}), (Outcome{0, "", ""}));

    EXPECT_EQ(Network(), kBeforeNetwork);
}

} // namespace
} // namespace contract
