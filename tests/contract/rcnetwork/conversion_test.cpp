#include "rcnetwork/conversion.h"
#include "world.h"

#include <gtest/gtest.h>

namespace vornhost {
namespace {

ConversionRecord RecordOf(const std::string& fixture)
{
    return BondsAndVlansOf(
        contract::ReadWorld(std::string(VORNOVS_FIXTURES) + '/' + fixture).inputs);
}

const ConversionRecord kBond{{{"bond0", {"802.3ad", {"eth0", "eth1"}}}}, {}};
const ConversionRecord kVlans{{}, {{"eth2", 5}, {"eth2", 6}}};

ConversionRecord Both()
{
    ConversionRecord both = kBond;
    both.Add(kVlans);
    return both;
}

TEST(Conversion, FindsBondsAndVlansOfTheKernel)
{
    EXPECT_EQ(RecordOf("BondTakenApart"),
              (ConversionRecord{{{"bond0", {"active-backup", {"eth0", "eth1"}}}}, {}}));
    EXPECT_EQ(RecordOf("VlanBecomesATag"), (ConversionRecord{{}, {{"eth0", 10}}}));
}

TEST(Conversion, FindsBondsAndTagsOfTheSwitch)
{
    EXPECT_EQ(RecordOf("TagThatIsOwedComesBackAsADevice"), (ConversionRecord{{}, {{"eth0", 10}}}));

    auto inputs =
        contract::ReadWorld(std::string(VORNOVS_FIXTURES) + "/SwitchBondIntoTwoBridges").inputs;
    const auto modeWith = [&](const std::string& mode, const std::string& lacp) {
        for (SwitchPort& port : inputs.switchState.bridges.at(0).ports) {
            if (port.bond) {
                port.columns = {{"bond_mode", mode}, {"lacp", lacp}};
            }
        }
        const ConversionRecord record = BondsAndVlansOf(inputs);
        EXPECT_EQ(record.bonds.at("bond0").slaves, (std::vector<std::string>{"eth0", "eth1"}));
        return record.bonds.at("bond0").mode;
    };
    EXPECT_EQ(modeWith("active-backup", "off"), "active-backup");
    EXPECT_EQ(modeWith("balance-slb", "off"), "balance-xor");
    EXPECT_EQ(modeWith("balance-tcp", "active"), "802.3ad");
}

TEST(Conversion, WritesDownAtItsBeginningWhatThereIsAndWhatAnEarlierOneTookApart)
{
    EXPECT_EQ(RecordAt(ConversionStage::kToSwitch, kBond, {}), kBond);
    EXPECT_EQ(RecordAt(ConversionStage::kToPlain, kVlans, kBond), Both());
    ConversionRecord changed = kBond;
    changed.bonds["bond0"].slaves.emplace_back("eth3");
    EXPECT_EQ(RecordAt(ConversionStage::kToPlain, changed, kBond), changed);
}

TEST(Conversion, LeavesAtItsEndOnlyWhatTheHostHasLost)
{
    EXPECT_TRUE(RecordAt(ConversionStage::kDone, Both(), Both()).Empty());
    EXPECT_EQ(RecordAt(ConversionStage::kDone, kBond, Both()), kVlans);
    EXPECT_EQ(RecordAt(ConversionStage::kDone, kVlans, Both()), kBond);
    EXPECT_TRUE(RecordAt(ConversionStage::kDone, kBond, {}).Empty()) << "made meanwhile";
}

std::map<std::string, InterfaceFile> FilesOf(const std::map<std::string, std::string>& texts)
{
    std::map<std::string, InterfaceFile> files;
    for (const auto& [name, text] : texts) {
        files[name] = ParseInterfaceFile(name, text).file;
    }
    return files;
}

constexpr char kAddressing[] = "IPADDR=192.0.2.5\nPREFIX=24\n";

TEST(Conversion, ThatWasCutShortOwesTheVlanToWhatHasItsAddressing)
{
    const ConversionRecord record{{{"bond0", {"802.3ad", {"eth0", "eth1"}}}},
                                  {{"eth2", 30}, {"bond0", 5}}};
    RememberedVlan vlan{"eth2.30", "eth2", 30, {}};
    vlan.state.before["eth2.30"].text = std::string("DEVICE=eth2.30\nVLAN=yes\n") + kAddressing;
    RememberedVlan onBond{"bond0.5", "bond0", 5, {}};
    onBond.state.before["bond0.5"].text = "DEVICE=bond0.5\nVLAN=yes\nBOOTPROTO=dhcp\n";

    const auto files = FilesOf({{"eth2", std::string("DEVICE=eth2\n") + kAddressing},
                                {"eth0", "DEVICE=eth0\nBOOTPROTO=dhcp\n"}});
    using Tags = std::map<std::string, unsigned>;
    EXPECT_EQ(OwedSince(record, {vlan, onBond}, files).tags, (Tags{{"eth2", 30}, {"eth0", 5}}));
    EXPECT_EQ(OwedSince(record, {vlan, onBond},
                        FilesOf({{"ovs_eth2", std::string("DEVICE=ovs_eth2\nTYPE=OVS\nPRIMARY="
                                                          "eth2\n") +
                                                  kAddressing}}))
                  .tags,
              (Tags{{"eth2", 30}}));
    EXPECT_EQ(OwedSince(record, {vlan, onBond}, FilesOf({{"eth2", "DEVICE=eth2\n"}})).tags, Tags{})
        << "an administrator has given it another addressing";
    EXPECT_EQ(OwedSince(record, {}, files).tags, (Tags{{"eth2", 30}, {"bond0", 5}, {"eth0", 5}}))
        << "of a tag that was never a VLAN's interface nothing else is known";
}

} // namespace
} // namespace vornhost
