#include "tools.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sandbox/systemlog.h>
#include <sys/stat.h>
#include <thread>

namespace {

using contract::Outcome;
using contract::ReadFile;
using contract::WriteFile;
using testing::ElementsAre;
using testing::HasSubstr;

constexpr char kStore[] = "/usr/vorn/etc/vornnetd/gateways.conf";

Outcome Tool(std::vector<std::string> arguments)
{
    arguments.insert(arguments.begin(), VORNNETDTOOL);
    return contract::RunProgram(arguments);
}

const Outcome kSilentSuccess{0, "", ""};

class NetdTool : public testing::Test {
protected:
    NetdTool() { contract::Delete("/usr/vorn/etc"); }
};

TEST_F(NetdTool, SetsCopiesAndDeletesARecord)
{
    EXPECT_EQ(Tool({"--set-gateway-info", "-4", "eth0", "192.0.2.1", "100"}), kSilentSuccess);
    EXPECT_EQ(Tool({"--copy-gateway-info", "-4", "eth0", "ovs_eth0"}), kSilentSuccess);
    EXPECT_EQ(ReadFile(kStore), "eth0 inet 192.0.2.1 metric 100\n"
                                "ovs_eth0 inet 192.0.2.1 metric 100\n");

    EXPECT_EQ(Tool({"--del-gateway-info", "-4", "eth0"}), kSilentSuccess);
    EXPECT_EQ(ReadFile(kStore), "ovs_eth0 inet 192.0.2.1 metric 100\n");
}

TEST_F(NetdTool, TakesANameForNothingElse)
{
    for (const char* const name : {"--help", "--version", "--json", "-6", "--", "-h", "--bad=1"}) {
        EXPECT_EQ(Tool({"--del-gateway-info", "-4", name}).exitCode, 2) << name;
        EXPECT_EQ(Tool({"--copy-gateway-info", "-4", name, "eth0"}).exitCode, 2) << name;
        EXPECT_EQ(Tool({"--copy-gateway-info", "-4", "eth0", name}).exitCode, 2) << name;
        EXPECT_EQ(Tool({"--del-gateway-info", "-4", name}).output, "") << name;
    }
    EXPECT_EQ(Tool({"--help"}).exitCode, 0);
    EXPECT_EQ(Tool({"--list-gateway-info", "-4", "--json"}).exitCode, 0);
}

TEST_F(NetdTool, TouchesOnlyTheFamilyThatIsAskedFor)
{
    WriteFile(kStore, "eth0 inet 192.0.2.1\neth0 inet6 fe80::1\n");

    EXPECT_EQ(Tool({"--copy-gateway-info", "-6", "eth0", "ovs_eth0"}), kSilentSuccess);
    EXPECT_EQ(Tool({"--del-gateway-info", "-6", "eth0"}), kSilentSuccess);

    EXPECT_EQ(ReadFile(kStore), "eth0 inet 192.0.2.1\novs_eth0 inet6 fe80::1\n");
}

TEST_F(NetdTool, SucceedsAndWritesNothingWhenThereIsNothingToCopyOrDelete)
{
    EXPECT_EQ(Tool({"--copy-gateway-info", "-4", "eth0", "ovs_eth0"}), kSilentSuccess);
    EXPECT_EQ(Tool({"--del-gateway-info", "-4", "eth0"}), kSilentSuccess);
    EXPECT_EQ(ReadFile(kStore), "(none)");

    WriteFile(kStore, "eth1 inet 192.0.2.1\n");
    struct stat before {};
    ASSERT_EQ(stat(kStore, &before), 0);
    EXPECT_EQ(Tool({"--copy-gateway-info", "-4", "eth0", "ovs_eth0"}), kSilentSuccess);
    struct stat after {};
    ASSERT_EQ(stat(kStore, &after), 0);
    EXPECT_EQ(after.st_ino, before.st_ino);
}

TEST_F(NetdTool, TakesTheTargetsRecordAwayWhenTheSourceHasNone)
{
    WriteFile(kStore, "ovs_eth0 inet 192.0.2.1\n");

    EXPECT_EQ(Tool({"--copy-gateway-info", "-4", "eth0", "ovs_eth0"}), kSilentSuccess);

    EXPECT_EQ(ReadFile(kStore), "(none)");
}

TEST_F(NetdTool, ListsTheRecords)
{
    WriteFile(kStore, "eth0 inet 192.0.2.1\neth0 inet6 fe80::1 metric 1024\n");

    EXPECT_EQ(Tool({"--list-gateway-info"}),
              (Outcome{0, "eth0 inet 192.0.2.1\neth0 inet6 fe80::1 metric 1024\n", ""}));
    EXPECT_EQ(Tool({"--list-gateway-info", "-4"}), (Outcome{0, "eth0 inet 192.0.2.1\n", ""}));
    EXPECT_EQ(Tool({"--list-gateway-info", "--json", "-6"}), (Outcome{0,
                                                                      R"([
  {
    "interface": "eth0",
    "family": 6,
    "gateway": "fe80::1",
    "metric": 1024
  }
]
)",
                                                                      ""}));
}

TEST_F(NetdTool, ListsNothingWithoutAStore)
{
    EXPECT_EQ(Tool({"--list-gateway-info"}), kSilentSuccess);
    EXPECT_EQ(Tool({"--list-gateway-info", "--json"}), (Outcome{0, "[]\n", ""}));
}

TEST_F(NetdTool, RefusesAWrongCommandLine)
{
    struct Row {
        std::vector<std::string> arguments;
        std::string message;
    };
    const Row rows[] = {
        {{"--copy-gateway-info", "eth0", "ovs_eth0"}, "-4 or -6 is missing"},
        {{"-4", "-6", "--copy-gateway-info", "eth0", "ovs_eth0"}, "-4 excludes -6"},
        {{"--copy-gateway-info", "-4", "eth0"}, "too few arguments"},
        {{"--copy-gateway-info", "-4", "eth0", "eth1", "eth2"}, "too many arguments"},
        {{"--copy-gateway-info", "-4", "eth0", ""}, "'' is no interface name"},
        {{"--copy-gateway-info", "-4", "eth0", "ovs_enp0s31f6np1"},
         "'ovs_enp0s31f6np1' is no interface name"},
        {{"--del-gateway-info", "-4", "--", "-x"}, "'-x' is no interface name"},
        {{"--del-gateway-info", "-4", "eth\n0"}, "'eth\n0' is no interface name"},
        {{"--set-gateway-info", "-4", "eth0", "fe80::1"},
         "'fe80::1' is no gateway address of that family"},
        {{"--set-gateway-info", "-4", "eth0", "192.0.2.1", "many"}, "'many' is no route metric"},
        {{"--json", "--del-gateway-info", "-4", "eth0"}, "--json is for listing"},
        {{"--list-gateway-info", "eth0"}, "too many arguments"},
    };
    for (const Row& row : rows) {
        const Outcome wanted{2, "",
                             "vornnetdtool: " + row.message + "\nTry 'vornnetdtool --help'.\n"};
        EXPECT_EQ(Tool(row.arguments), wanted) << row.message;
        EXPECT_EQ(ReadFile(kStore), "(none)") << row.message;
    }
}

TEST_F(NetdTool, WantsExactlyOneAction)
{
    EXPECT_EQ(Tool({}).exitCode, 2);
    EXPECT_EQ(Tool({"--del-gateway-info", "--list-gateway-info", "-4", "eth0"}).exitCode, 2);
}

TEST_F(NetdTool, FailsAndLogsWhenTheStoreCannotBeRead)
{
    WriteFile(std::string(kStore) + "/file", "");
    harness::SystemLog log;
    const std::string message = "cannot read " + std::string(kStore) + ": Is a directory";

    const Outcome wanted{1, "", "vornnetdtool: " + message + "\n"};
    EXPECT_EQ(Tool({"--copy-gateway-info", "-4", "eth0", "ovs_eth0"}), wanted);
    EXPECT_THAT(log.Lines(), ElementsAre("3 vornnetdtool: " + message));
}

TEST_F(NetdTool, FailsWhenTheStoreCannotBeWritten)
{
    WriteFile("/usr/vorn/etc/vornnetd", "in the way");

    const Outcome outcome = Tool({"--set-gateway-info", "-4", "eth0", "192.0.2.1"});

    EXPECT_EQ(outcome.exitCode, 1);
}

TEST_F(NetdTool, LosesNoRecordWhenSeveralRunAtOnce)
{
    constexpr int kTools = 16;
    {
        std::vector<std::jthread> tools;
        for (int index = 0; index < kTools; ++index) {
            tools.emplace_back([index] {
                (void)Tool(
                    {"--set-gateway-info", "-4", "eth" + std::to_string(index), "192.0.2.1"});
            });
        }
    }

    const std::string list = Tool({"--list-gateway-info"}).output;
    EXPECT_EQ(std::count(list.begin(), list.end(), '\n'), kTools) << list;
}

TEST_F(NetdTool, TeachesItsUse)
{
    const Outcome help = Tool({"--help"});
    EXPECT_EQ(help.exitCode, 0);
    EXPECT_THAT(help.output, HasSubstr("--copy-gateway-info -4|-6 SOURCE TARGET\n"));
    EXPECT_THAT(help.output, HasSubstr("Exit status:\n"));
    EXPECT_EQ(Tool({"--version"}), (Outcome{0, "vornnetdtool 1.0.0\n", ""}));
}

} // namespace
