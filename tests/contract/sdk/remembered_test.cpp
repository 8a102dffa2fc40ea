#include "support/remembered.h"

#include "tools.h"

#include <filesystem>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using contract::ReadFile;
using contract::WriteFile;
using vornhost::AddressFamily;
using vornhost::FileState;
using vornhost::Gateway;
using vornhost::RememberedBond;
using vornhost::RememberedState;
using vornhost::RememberedVlan;

constexpr char kBondPath[] = "/usr/vorn/etc/vornnetd/remembered/bonds/bond0.json";

RememberedState SomeState()
{
    std::string everyByte;
    for (int byte = 0; byte < 256; ++byte) {
        everyByte += static_cast<char>(byte);
    }
    RememberedState state;
    state.before["bond0"] = {"DEVICE=bond0\n# " + everyByte, 0600};
    state.before["eth0"] = {"", 0644};
    state.moved["bond0"] = {};
    state.moved["eth0"] = {"# caf\xc3\xa9 or caf\xe9\r\nDEVICE=eth0", 0640};
    state.gateways = {{"eth0", AddressFamily::kIPv4, Gateway{"192.0.2.1", 100}},
                      {"eth0", AddressFamily::kIPv6, Gateway{"fe80::1", {}}},
                      {"ovs_eth0", AddressFamily::kIPv4, {}}};
    return state;
}

RememberedBond SomeBond()
{
    return {
        "bond0",          "02:00:00:00:00:01", 9000, {{{"mode", "802.3ad"}, {"lacp_rate", "fast"}}},
        {"eth1", "eth0"}, SomeState()};
}

class Remembered : public testing::Test {
protected:
    Remembered() { contract::Delete(vornhost::kRememberedFolder); }
};

TEST_F(Remembered, BondIsWhatWasSavedToTheLastByte)
{
    ASSERT_TRUE(SomeBond().Save());

    EXPECT_EQ(RememberedBond::Load("bond0"), SomeBond());
    EXPECT_EQ(RememberedBond::Load("bond1"), std::nullopt);
    EXPECT_EQ(std::filesystem::status(kBondPath).permissions(),
              std::filesystem::perms::owner_read | std::filesystem::perms::owner_write);
}

TEST_F(Remembered, TakesNothingElseForALinkAddress)
{
    for (const char* damaged :
         {"02:00:00:00:00:0g", "02:00:00:00:00", "02-00-00-00-00-01", "a\nb"}) {
        RememberedBond bond = SomeBond();
        bond.mac = damaged;
        ASSERT_TRUE(bond.Save());
        EXPECT_EQ(RememberedBond::Load("bond0")->mac, "") << damaged;
    }
    ASSERT_TRUE(SomeBond().Save());
}

TEST_F(Remembered, BondIsReplacedByALaterOneAndForgotten)
{
    RememberedBond later = SomeBond();
    later.slaves.push_back("eth2");
    ASSERT_TRUE(SomeBond().Save());
    ASSERT_TRUE(later.Save());
    EXPECT_EQ(RememberedBond::Load("bond0"), later);

    EXPECT_TRUE(RememberedBond::Forget("bond0"));
    EXPECT_EQ(RememberedBond::Load("bond0"), std::nullopt);
    EXPECT_TRUE(RememberedBond::Forget("bond0"));
}

TEST_F(Remembered, BondIsNotReadFromARecordThatIsNotWhole)
{
    ASSERT_TRUE(SomeBond().Save());
    const std::string whole = ReadFile(kBondPath);
    for (std::size_t length = 0; length + 2 < whole.size(); length += 7) {
        WriteFile(kBondPath, whole.substr(0, length));
        EXPECT_EQ(RememberedBond::Load("bond0"), std::nullopt) << length;
    }
    for (const char* const text : {"{}", "[]", "7", R"({"version":2,"name":"bond0"})"}) {
        WriteFile(kBondPath, text);
        EXPECT_EQ(RememberedBond::Load("bond0"), std::nullopt) << text;
    }
}

TEST_F(Remembered, BondIsNotReadFromAnothersRecord)
{
    ASSERT_TRUE(SomeBond().Save());
    std::filesystem::rename(kBondPath, std::string(vornhost::kRememberedFolder) + "/bonds/b.json");

    EXPECT_EQ(RememberedBond::Load("b"), std::nullopt);
}

TEST_F(Remembered, NamesThatCannotBeAnInterfacesReachNoFile)
{
    for (const char* const name : {"", "..", "../bond0", "a-name-that-is-too-long"}) {
        RememberedBond bond = SomeBond();
        bond.name = name;
        EXPECT_FALSE(bond.Save()) << name;
        EXPECT_EQ(RememberedBond::Load(name), std::nullopt) << name;
        EXPECT_FALSE(RememberedBond::Forget(name)) << name;
        EXPECT_FALSE(RememberedVlan::Forget(name)) << name;
    }
    EXPECT_FALSE(std::filesystem::exists(vornhost::kRememberedFolder));
}

TEST_F(Remembered, BondIsToldFromOneOfOtherSlaves)
{
    EXPECT_TRUE(SomeBond().HasSlaves({"eth0", "eth1"}));
    EXPECT_TRUE(SomeBond().HasSlaves({"eth1", "eth0"}));
    EXPECT_FALSE(SomeBond().HasSlaves({"eth0"}));
    EXPECT_FALSE(SomeBond().HasSlaves({"eth0", "eth2"}));
    EXPECT_FALSE(SomeBond().HasSlaves({}));
}

TEST_F(Remembered, VlansAreFoundByTheirNameAndByTheirParent)
{
    const RememberedVlan first{"eth0.10", "eth0", 10, SomeState()};
    const RememberedVlan second{"storage", "eth0", 20, {}};
    const RememberedVlan other{"eth1.10", "eth1", 10, {}};
    EXPECT_EQ(RememberedVlan::LoadOfParent("eth0"), std::vector<RememberedVlan>());
    for (const RememberedVlan& vlan : {second, other, first}) {
        ASSERT_TRUE(vlan.Save());
    }
    WriteFile(std::string(vornhost::kRememberedFolder) + "/vlans/eth0.30.json", "{");
    WriteFile(std::string(vornhost::kRememberedFolder) + "/vlans/notes", "");

    EXPECT_EQ(RememberedVlan::Load("storage"), second);
    EXPECT_EQ(RememberedVlan::LoadOfParent("eth0"), (std::vector<RememberedVlan>{first, second}));

    EXPECT_TRUE(RememberedVlan::Forget("eth0.10"));
    EXPECT_EQ(RememberedVlan::LoadOfParent("eth0"), std::vector<RememberedVlan>{second});
}

} // namespace
