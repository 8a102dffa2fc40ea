#include "support/gatewaystore.h"

#include "tools.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

namespace {

using contract::ReadFile;
using contract::WriteFile;
using testing::ElementsAre;
using vornhost::AddressFamily;
using vornhost::Gateway;
using vornhost::GatewayRecord;
using vornhost::GatewayStore;

constexpr auto kIPv4 = AddressFamily::kIPv4;
constexpr auto kIPv6 = AddressFamily::kIPv6;

class GatewayStoreTest : public testing::Test {
protected:
    GatewayStoreTest() { contract::Delete("/usr/vorn/etc"); }

    static GatewayStore Load()
    {
        const auto store = GatewayStore::Load();
        EXPECT_TRUE(store.has_value());
        return store.value_or(GatewayStore());
    }
};

TEST_F(GatewayStoreTest, IsEmptyWithoutAFile)
{
    EXPECT_THAT(Load().Records(), ElementsAre());
}

TEST_F(GatewayStoreTest, CannotBeLoadedFromAFolder)
{
    WriteFile(std::string(vornhost::kGatewayStorePath) + "/file", "");

    EXPECT_FALSE(GatewayStore::Load().has_value());
}

TEST_F(GatewayStoreTest, IsNotHeldUpByAFifoInTheFilesPlace)
{
    WriteFile(vornhost::kGatewayStorePath, "");
    contract::Delete(vornhost::kGatewayStorePath);
    ASSERT_EQ(mkfifo(vornhost::kGatewayStorePath, 0600), 0);

    EXPECT_FALSE(GatewayStore::Load().has_value());
}

TEST_F(GatewayStoreTest, ReadsBothFamiliesAndMetrics)
{
    WriteFile(vornhost::kGatewayStorePath, "eth0 inet 192.0.2.1\n"
                                           "eth0 inet6 fe80::1 metric 1024\n"
                                           "  eth1\tinet   198.51.100.1 metric 0\n");

    EXPECT_THAT(Load().Records(), ElementsAre(GatewayRecord{"eth0", kIPv4, {"192.0.2.1", {}}},
                                              GatewayRecord{"eth0", kIPv6, {"fe80::1", 1024}},
                                              GatewayRecord{"eth1", kIPv4, {"198.51.100.1", 0}}));
}

TEST_F(GatewayStoreTest, TakesTheLastOfSeveralRecordsOfOneInterface)
{
    const auto store = GatewayStore::Parse("eth0 inet 192.0.2.1\neth0 inet 192.0.2.2\n");

    EXPECT_EQ(store.Find("eth0", kIPv4), (Gateway{"192.0.2.2", {}}));
    EXPECT_THAT(store.Records(), ElementsAre(GatewayRecord{"eth0", kIPv4, {"192.0.2.2", {}}}));
}

TEST_F(GatewayStoreTest, DoesNotTakeABrokenLineForARecord)
{
    for (const char* const line :
         {"eth0 inet", "eth0 inet 192.0.2", "eth0 inet fe80::1", "eth0 inet6 192.0.2.1",
          "eth0 inet 192.0.2.1 metric", "eth0 inet 192.0.2.1 metric -1",
          "eth0 inet 192.0.2.1 metric 4294967296", "eth0 inet 192.0.2.1 metric 1 2",
          "eth0 inet 192.0.2.1 dev eth1", "eth0 ipx 192.0.2.1", "# eth0 inet 192.0.2.1",
          "averyveryverylongname inet 192.0.2.1", "a/b inet 192.0.2.1"}) {
        EXPECT_THAT(GatewayStore::Parse(line).Records(), ElementsAre()) << line;
    }
}

TEST_F(GatewayStoreTest, RefusesAnAddressThatCanBeNoGateway)
{
    for (const char* const address : {"", "0.0.0.0", "0.1.2.3", "127.0.0.1", "224.0.0.1",
                                      "255.255.255.255", "192.0.2.1/24", "192.0.2", "fe80::1"}) {
        GatewayStore store;
        EXPECT_FALSE(store.Set("eth0", kIPv4, {address, {}})) << address;
        EXPECT_THAT(store.Records(), ElementsAre()) << address;
    }
    for (const char* const address : {"", "::", "::1", "ff02::1", "fe80::1%eth0", "192.0.2.1"}) {
        GatewayStore store;
        EXPECT_FALSE(store.Set("eth0", kIPv6, {address, {}})) << address;
    }
}

TEST_F(GatewayStoreTest, RefusesWhatCanBeNoInterfaceName)
{
    for (const char* const name :
         {"", ".", "..", "a b", "a\nb", "a/b", "a:b", "-a", "#a", "sixteencharacter", "a\x7f"}) {
        GatewayStore store;
        EXPECT_FALSE(store.Set(name, kIPv4, {"192.0.2.1", {}})) << name;
        EXPECT_FALSE(store.Copy("eth0", name, kIPv4)) << name;
        EXPECT_THAT(store.Records(), ElementsAre()) << name;
    }
}

TEST_F(GatewayStoreTest, WritesAddressesInTheirUsualNotation)
{
    GatewayStore store;
    EXPECT_TRUE(store.Set("eth0", kIPv6, {"FE80:0:0::0001", {}}));

    EXPECT_EQ(store.Text(), "eth0 inet6 fe80::1\n");
}

TEST_F(GatewayStoreTest, ReplacesARecordInItsPlace)
{
    auto store =
        GatewayStore::Parse("eth0 inet 192.0.2.1\neth1 inet 192.0.2.9\neth0 inet 1.2.3.4\n");
    EXPECT_TRUE(store.Set("eth0", kIPv4, {"192.0.2.2", 7}));

    EXPECT_EQ(store.Text(), "eth0 inet 192.0.2.2 metric 7\neth1 inet 192.0.2.9\n");
}

TEST_F(GatewayStoreTest, KeepsWhatItDoesNotUnderstand)
{
    const std::string text = "# by hand\n\neth0   inet 192.0.2.1\nnonsense\n";
    auto store = GatewayStore::Parse(text);
    EXPECT_TRUE(store.Set("eth1", kIPv4, {"192.0.2.1", {}}));

    EXPECT_EQ(store.Text(), text + "eth1 inet 192.0.2.1\n");
}

TEST_F(GatewayStoreTest, IsTheSameAfterARecordCameAndWent)
{
    for (const char* const text : {"eth0   inet 192.0.2.1\n# end", "# only this\n", ""}) {
        auto store = GatewayStore::Parse(text);
        EXPECT_TRUE(store.Set("eth1", kIPv4, {"192.0.2.1", {}}));
        EXPECT_TRUE(store.Remove("eth1", kIPv4));

        EXPECT_EQ(store.Text(), text);
    }
}

TEST_F(GatewayStoreTest, CopyGivesTheTargetWhatTheSourceHas)
{
    auto store = GatewayStore::Parse("eth0 inet 192.0.2.1 metric 5\neth0 inet6 fe80::1\n"
                                     "ovs_eth0 inet 192.0.2.77\n");
    EXPECT_TRUE(store.Copy("eth0", "ovs_eth0", kIPv4));

    EXPECT_EQ(store.Text(), "eth0 inet 192.0.2.1 metric 5\neth0 inet6 fe80::1\n"
                            "ovs_eth0 inet 192.0.2.1 metric 5\n");
}

TEST_F(GatewayStoreTest, CopyOfNothingTakesTheTargetsRecordAway)
{
    auto store = GatewayStore::Parse("eth0 inet 192.0.2.1\neth0 inet6 fe80::1\n");
    EXPECT_TRUE(store.Copy("ovs_eth0", "eth0", kIPv4));

    EXPECT_EQ(store.Text(), "eth0 inet6 fe80::1\n");
}

TEST_F(GatewayStoreTest, CopyToItselfChangesNothing)
{
    auto store = GatewayStore::Parse("eth0 inet 192.0.2.1\n");
    EXPECT_TRUE(store.Copy("eth0", "eth0", kIPv4));

    EXPECT_EQ(store.Text(), "eth0 inet 192.0.2.1\n");
}

TEST_F(GatewayStoreTest, SaveMakesTheFolderAndTheFile)
{
    GatewayStore store = Load();
    EXPECT_TRUE(store.Set("eth0", kIPv4, {"192.0.2.1", {}}));
    EXPECT_TRUE(store.Save());

    EXPECT_EQ(ReadFile(vornhost::kGatewayStorePath), "eth0 inet 192.0.2.1\n");
}

TEST_F(GatewayStoreTest, SaveRemovesTheFileOfAnEmptyStore)
{
    WriteFile(vornhost::kGatewayStorePath, "eth0 inet 192.0.2.1\n");
    GatewayStore store = Load();
    EXPECT_TRUE(store.Remove("eth0", kIPv4));
    EXPECT_TRUE(store.Save());

    EXPECT_EQ(ReadFile(vornhost::kGatewayStorePath), "(none)");
}

TEST_F(GatewayStoreTest, SaveLeavesAFileThatSaysTheSameUntouched)
{
    WriteFile(vornhost::kGatewayStorePath, "eth0    inet 192.0.2.1");
    struct stat before {};
    ASSERT_EQ(stat(vornhost::kGatewayStorePath, &before), 0);
    GatewayStore store = Load();
    EXPECT_TRUE(store.Set("eth0", kIPv4, {"192.0.2.1", {}}));
    EXPECT_TRUE(store.Save());

    struct stat after {};
    ASSERT_EQ(stat(vornhost::kGatewayStorePath, &after), 0);
    EXPECT_EQ(after.st_ino, before.st_ino);
    EXPECT_EQ(ReadFile(vornhost::kGatewayStorePath), "eth0    inet 192.0.2.1");
}

TEST_F(GatewayStoreTest, SaveFailsWhereNoFileCanBe)
{
    WriteFile("/usr/vorn/etc/vornnetd", "in the way");
    GatewayStore store;
    EXPECT_TRUE(store.Set("eth0", kIPv4, {"192.0.2.1", {}}));

    EXPECT_FALSE(store.Save());
}

} // namespace
