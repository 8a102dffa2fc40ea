#include "adopt/recordedhost.h"

#include <adopt/ifupdownreader.h>
#include <adopt/interfacesfile.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using testing::ElementsAre;
using testing::Pair;
using testing::UnorderedElementsAre;
using unit::RecordedHost;
using vornovsctl::InterfacesConfig;
using vornovsctl::InterfaceStanza;
using vornovsctl::WithInterfacesAgain;
using vornovsctl::WithoutInterfaces;

constexpr char kText[] = "# the host's network\n"
                         "source /etc/network/interfaces.d/*\n"
                         "auto lo eth0\n"
                         "  auto eth1\n"
                         "iface lo inet loopback\n"
                         "\n"
                         "iface eth0 inet static\n"
                         "    address 192.0.2.10/24\n"
                         "    # the way out\n"
                         "    gateway \\\n"
                         "        192.0.2.1\n"
                         "iface eth0 inet6 auto\n"
                         "iface eth1 inet dhcp\n"
                         "allow-hotplug eth1 eth0";

TEST(InterfacesFile, IsReadWithItsContinuedLinesAndSources)
{
    RecordedHost host;
    host.Write("/etc/network/interfaces", kText);
    host.Write("/etc/network/interfaces.d/more", "iface eth2 inet manual\n\tmtu 9000\n");

    const InterfacesConfig config = vornovsctl::ReadInterfaces(host.view);

    EXPECT_THAT(config.paths,
                ElementsAre("/etc/network/interfaces", "/etc/network/interfaces.d/more"));
    EXPECT_THAT(config.classes,
                UnorderedElementsAre(Pair("auto", UnorderedElementsAre("lo", "eth0", "eth1")),
                                     Pair("hotplug", UnorderedElementsAre("eth1", "eth0"))));
    const std::string main = "/etc/network/interfaces";
    EXPECT_THAT(
        config.stanzas,
        ElementsAre(
            InterfaceStanza{
                "eth2", "inet", "manual", "/etc/network/interfaces.d/more", {{"mtu", "9000"}}},
            InterfaceStanza{"lo", "inet", "loopback", main, {}},
            InterfaceStanza{"eth0",
                            "inet",
                            "static",
                            main,
                            {{"address", "192.0.2.10/24"}, {"gateway", "192.0.2.1"}}},
            InterfaceStanza{"eth0", "inet6", "auto", main, {}},
            InterfaceStanza{"eth1", "inet", "dhcp", main, {}}));
    EXPECT_TRUE(config.Has("eth0"));
    EXPECT_FALSE(config.Has("eth3"));
    EXPECT_TRUE(config.IsBroughtUp("eth1"));
    EXPECT_FALSE(config.IsBroughtUp("eth2"));
}

TEST(InterfacesFile, ReadsFilesThatIncludeEachOtherOnce)
{
    RecordedHost host;
    host.Write("/etc/network/interfaces", "source interfaces.d/*\nsource interfaces.d/*\n"
                                          "source interfaces\niface eth0 inet dhcp\n");
    host.Write("/etc/network/interfaces.d/more", "source ../interfaces.d/*\nsource more\n"
                                                 "source /etc/network/interfaces\n");

    const InterfacesConfig config = vornovsctl::ReadInterfaces(host.view);

    EXPECT_EQ(config.stanzas.size(), 1U);
    EXPECT_THAT(config.paths,
                ElementsAre("/etc/network/interfaces", "/etc/network/interfaces.d/more"));
}

TEST(InterfacesFile, InheritsTheOptionsOfTemplates)
{
    RecordedHost host;
    host.Write("/etc/network/interfaces", "iface office inet static\n\tgateway 192.0.2.1\n"
                                          "iface eth0 inet static inherits office\n"
                                          "\taddress 192.0.2.10/24\n");

    EXPECT_THAT(vornovsctl::ReadInterfaces(host.view).stanzas.at(1).options,
                ElementsAre(Pair("gateway", "192.0.2.1"), Pair("address", "192.0.2.10/24")));
}

TEST(WithoutInterfaces, CommentsOutWhatIsSaidOfThem)
{
    EXPECT_EQ(WithoutInterfaces(kText, {"eth0"}), "# the host's network\n"
                                                  "source /etc/network/interfaces.d/*\n"
                                                  "#replaced# auto lo eth0\n"
                                                  "auto lo\n"
                                                  "  auto eth1\n"
                                                  "iface lo inet loopback\n"
                                                  "\n"
                                                  "#adopted# iface eth0 inet static\n"
                                                  "#adopted#     address 192.0.2.10/24\n"
                                                  "    # the way out\n"
                                                  "#adopted#     gateway \\\n"
                                                  "#adopted#         192.0.2.1\n"
                                                  "#adopted# iface eth0 inet6 auto\n"
                                                  "iface eth1 inet dhcp\n"
                                                  "#adopted# allow-hotplug eth1 eth0\n"
                                                  "#replaced# \n"
                                                  "allow-hotplug eth1");
}

TEST(InterfacesFile, MayHoldLinesOfBlanksOfAnyKind)
{
    RecordedHost host;
    host.Write("/etc/network/interfaces", "\f\niface eth0 inet dhcp\n \v\n");

    EXPECT_EQ(vornovsctl::ReadInterfaces(host.view).stanzas.size(), 1U);
    EXPECT_EQ(WithoutInterfaces("\f\n", {"eth0"}), "\f\n");
}

TEST(InterfacesFile, TakesATemplateForNoInterface)
{
    RecordedHost host;
    host.Write("/etc/network/interfaces", "template eth0 inet static\n\tgateway 192.0.2.1\n"
                                          "iface eth1 inet static inherits eth0\n");

    const InterfacesConfig config = vornovsctl::ReadInterfaces(host.view);

    EXPECT_FALSE(config.Has("eth0"));
    EXPECT_TRUE(config.Has("eth1"));
    EXPECT_THAT(config.stanzas.at(1).options, ElementsAre(Pair("gateway", "192.0.2.1")));
}

TEST(WithoutInterfaces, KnowsKeywordsFromNamesAndEndsNoLineWithABackslash)
{
    EXPECT_EQ(WithoutInterfaces("auto auto eth0\n", {"auto"}),
              "#replaced# auto auto eth0\nauto eth0\n");
    EXPECT_EQ(WithoutInterfaces("auto eth1 \\ eth0\niface eth1 inet dhcp\n", {"eth0"}),
              "#replaced# auto eth1 \\ eth0\nauto eth1 \\ \niface eth1 inet dhcp\n");
}

TEST(WithoutInterfaces, ChangesNothingForOthers)
{
    EXPECT_EQ(WithoutInterfaces(kText, {"eth7"}), kText);
    EXPECT_EQ(WithoutInterfaces("", {"eth0"}), "");
}

TEST(WithInterfacesAgain, BringsBackWhatWasThereByteForByte)
{
    for (const std::string& text : {std::string(kText), std::string(kText) + '\n'}) {
        for (const std::set<std::string>& names :
             {std::set<std::string>{"eth0"}, {"eth1"}, {"eth0", "eth1"}, {"lo"}}) {
            EXPECT_EQ(WithInterfacesAgain(WithoutInterfaces(text, names)), text);
        }
    }
}

TEST(WithInterfacesAgain, KeepsWhatWasEditedMeanwhile)
{
    const std::string edited =
        WithoutInterfaces("auto eth0\niface eth0 inet dhcp\n", {"eth0"}) + "auto eth5\n";

    EXPECT_EQ(WithInterfacesAgain(edited), "auto eth0\niface eth0 inet dhcp\nauto eth5\n");
}

} // namespace
