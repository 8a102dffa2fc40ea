// The whole way on to the switch and back, for clients of every kind.
#include "clients/traits.h"
#include "host/host.h"
#include "support/figures.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <vornovs/vornovs.h>

namespace {

using reliability::Findings;
using reliability::IfcfgPath;
using reliability::ReadFile;
using reliability::Trait;
using testing::ElementsAre;

constexpr char kPlainFile[] = "DEVICE=eth0\nONBOOT=yes\nIPADDR=192.0.2.7\nNETMASK=255.255.255.0\n";
constexpr char kPlainOnSwitch[] = "DEVICE=eth0\nONBOOT=yes\nIPADDR=192.0.2.7\n"
                                  "NETMASK=255.255.255.0\nBRIDGE=ovs_eth0\n";
constexpr char kBridgeFile[] = "DEVICE=ovs_eth0\nONBOOT=yes\nIPADDR=192.0.2.7\n"
                               "NETMASK=255.255.255.0\nTYPE=OVS\nPRIMARY=eth0\n";

/** One client of each kind that meets every trait beside several others. */
std::vector<std::vector<Trait>> Representatives()
{
    const auto children = reliability::ChildTraits();
    const auto signals = reliability::SignalTraits();
    const auto descriptors = reliability::DescriptorTraits();
    const auto environments = reliability::EnvironmentTraits();
    std::vector<std::vector<Trait>> representatives;
    for (size_t child = 0; child < children.size(); ++child) {
        for (size_t number = 0; number < 6; ++number) {
            representatives.push_back({environments[number % 2], signals[(child + number) % 3],
                                       children[child], descriptors[(child + number / 2) % 3]});
        }
    }
    return representatives;
}

void ExpectOnSwitch(Findings& findings)
{
    findings.Expect(VORN::OVS::Register("client", {}) == 0, "Register");
    findings.Expect(VORN::OVS::IsRegister("client") == 0, "not registered");
    const std::string bridge = ReadFile(IfcfgPath("ovs_eth0"));
    findings.Expect(bridge == kBridgeFile, "the bridge's file:", bridge.c_str());
    findings.Expect(ReadFile(IfcfgPath("eth0")) == kPlainOnSwitch, "the interface's file");
    findings.Expect(ReadFile("/usr/vorn/etc/vornovs/ovs_interface.conf") == "eth0\n", "the list");
}

void ExpectOffSwitch(Findings& findings)
{
    findings.Expect(VORN::OVS::UnRegister("client", {}) == 0, "UnRegister");
    const std::string plain = ReadFile(IfcfgPath("eth0"));
    findings.Expect(plain == kPlainFile, "the interface's file is another:", plain.c_str());
    findings.Expect(ReadFile(IfcfgPath("ovs_eth0")) == "(none)", "the bridge's file is left");
    findings.Expect(ReadFile("/usr/vorn/etc/vornovs/ovs_reg.conf") == "(none)", "a name is left");
}

TEST(ClientOfAnyKind, TakesTheHostOnToTheSwitchAndBack)
{
    reliability::MakeInterfaces({"eth0"});
    reliability::Plant();
    const auto representatives = Representatives();
    for (const auto& traits : representatives) {
        reliability::StartWith({{IfcfgPath("eth0"), kPlainFile}});
        EXPECT_EQ(reliability::RunClient(traits,
                                         [](Findings& findings) {
                                             ExpectOnSwitch(findings);
                                             ExpectOffSwitch(findings);
                                         }),
                  "");
        EXPECT_THAT(reliability::TakeCallLines(),
                    ElementsAre("/etc/rc.network stop", "/etc/rc.network start",
                                "/usr/bin/ovs-vsctl list-br",
                                "/usr/bin/ovs-vsctl get port ovs_eth0 tag", "/etc/rc.network stop",
                                "/etc/rc.network start"));
        EXPECT_TRUE(reliability::LockIsFree());
    }
    EXPECT_FALSE(reliability::PlantedRan());
    reliability::Figure(std::to_string(representatives.size()) +
                        " hostile clients that took the host on to the switch and back");
}

} // namespace
