#include "support/interfacefile.h"

#include "tools.h"

#include <gtest/gtest.h>

namespace {

using contract::IfcfgPath;
using contract::WriteFile;
using vornhost::LoadInterfaceFile;

class InterfaceFile : public testing::Test {
protected:
    InterfaceFile() { contract::Delete("/etc/sysconfig/network-scripts"); }
};

TEST_F(InterfaceFile, IsTheInterfacesOwnWhenItsDeviceSaysSo)
{
    WriteFile(IfcfgPath("eth0"), "DEVICE=eth0\nMTU=9000\n");

    const auto file = LoadInterfaceFile("eth0");
    ASSERT_TRUE(file.has_value());
    EXPECT_EQ(file->Get("MTU"), "9000");
}

TEST_F(InterfaceFile, IsTheInterfacesOwnWithoutADevice)
{
    WriteFile(IfcfgPath("eth0"), "MTU=9000\n");

    EXPECT_TRUE(LoadInterfaceFile("eth0").has_value());
}

TEST_F(InterfaceFile, IsIgnoredWhenItsDeviceIsAnother)
{
    WriteFile(IfcfgPath("eth0"), "DEVICE=eth1\n");

    EXPECT_FALSE(LoadInterfaceFile("eth0").has_value());
}

TEST_F(InterfaceFile, IsTheInterfacesOwnWhenAConversionBackWasCutShort)
{
    WriteFile(IfcfgPath("eth0"), "DEVICE=ovs_eth0\nTYPE=OVS\nPRIMARY=eth0\n");

    EXPECT_TRUE(LoadInterfaceFile("eth0").has_value());
}

TEST_F(InterfaceFile, IsIgnoredWhenItIsACopyOfAnotherBridgesFile)
{
    WriteFile(IfcfgPath("eth0"), "DEVICE=ovs_eth1\nTYPE=OVS\nPRIMARY=eth1\n");

    EXPECT_FALSE(LoadInterfaceFile("eth0").has_value());
}

TEST_F(InterfaceFile, IsNotThereForANameThatIsNoInterfaces)
{
    WriteFile("/etc/sysconfig/network-scripts/other", "DEVICE=eth0\n");

    EXPECT_FALSE(LoadInterfaceFile("../network-scripts/other").has_value());
    EXPECT_FALSE(LoadInterfaceFile("eth0").has_value());
}

} // namespace
