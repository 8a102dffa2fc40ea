#include "support/wholebonds.h"

#include "tools.h"
#include "trip.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using contract::Files;
using testing::IsEmpty;

const Files kHost{{"bond0", "# attic\nDEVICE=bond0\nBONDING_OPTS=\"mode=broadcast\"\nTYPE=Bond\n"
                            "IPADDR=192.0.2.10/24\n"},
                  {"eth0", "DEVICE=eth0\nMASTER=bond0\nSLAVE=yes\n"}};

void MindWholeBonds()
{
    std::vector<vornhost::Remark> remarks;
    vornhost::MindWholeBonds(remarks);
    EXPECT_THAT(remarks, IsEmpty());
}

void GoToSwitch()
{
    contract::StartWith(kHost);
    MindWholeBonds();
    contract::ToBridge("bond0");
    MindWholeBonds();
}

TEST(MindWholeBonds, GivesABondThatWasAPortItsFileBack)
{
    GoToSwitch();
    contract::FromBridge("bond0");
    EXPECT_NE(contract::ReadFiles(), kHost);

    MindWholeBonds();

    EXPECT_EQ(contract::ReadFiles(), kHost);
}

TEST(MindWholeBonds, KeepsWhatWasChangedMeanwhile)
{
    GoToSwitch();
    contract::EditFile("ovs_bond0", {{"IPADDR", "192.0.2.11/24"}, {"MTU", "9000"}});
    contract::FromBridge("bond0");

    MindWholeBonds();

    Files wanted = kHost;
    wanted["bond0"] = "# attic\nDEVICE=bond0\nBONDING_OPTS=\"mode=broadcast\"\nTYPE=Bond\n"
                      "IPADDR=192.0.2.11/24\nMTU=9000\n";
    EXPECT_EQ(contract::ReadFiles(), wanted);
}

TEST(MindWholeBonds, ChangesNothingOnTheSwitchOrHalfWayBack)
{
    GoToSwitch();
    const Files onSwitch = contract::ReadFiles();
    MindWholeBonds();
    EXPECT_EQ(contract::ReadFiles(), onSwitch);

    contract::WriteFile(contract::IfcfgPath("bond0"), onSwitch.at("ovs_bond0"));
    contract::Delete(contract::IfcfgPath("ovs_bond0"));
    const Files halfWay = contract::ReadFiles();
    MindWholeBonds();
    EXPECT_EQ(contract::ReadFiles(), halfWay);

    contract::EditFile("bond0", {{"DEVICE", "bond0"}}, {"TYPE", "PRIMARY"});
    MindWholeBonds();
    EXPECT_EQ(contract::ReadFiles(), kHost);
}

TEST(MindWholeBonds, LeavesOptionsThatSomebodyWroteAndForgetsAFileThatIsDeleted)
{
    GoToSwitch();
    contract::FromBridge("bond0");
    contract::EditFile("bond0", {{"BONDING_OPTS", "mode=802.3ad"}});
    const Files chosen = contract::ReadFiles();
    MindWholeBonds();
    EXPECT_EQ(contract::ReadFiles(), chosen);

    GoToSwitch();
    contract::Delete(contract::IfcfgPath("ovs_bond0"));
    contract::Delete(contract::IfcfgPath("bond0"));
    MindWholeBonds();
    contract::WriteFile(contract::IfcfgPath("bond0"), "DEVICE=bond0\n");
    MindWholeBonds();
    EXPECT_EQ(contract::ReadFile(contract::IfcfgPath("bond0")), "DEVICE=bond0\n");
}

TEST(MindWholeBonds, LeavesABondOfTheSwitchAlone)
{
    contract::StartWith(kHost);
    contract::ToBridge("bond0");
    contract::EditFile("ovs_bond0", {{"SLAVE_LIST", "\"eth0 eth1 \""}});
    MindWholeBonds();
    contract::FromBridge("bond0");
    const Files back = contract::ReadFiles();

    MindWholeBonds();

    EXPECT_EQ(contract::ReadFiles(), back);
}

} // namespace
