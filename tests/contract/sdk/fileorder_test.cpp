#include "trip.h"

#include "sdk/vlanchange.h"
#include "support/descriptor.h"
#include "support/interfacefile.h"
#include "support/remembered.h"

#include <array>
#include <filesystem>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <map>
#include <sys/inotify.h>
#include <sys/mount.h>
#include <unistd.h>
#include <vornplatform/netsdk.h>
#include <vornplatform/sdk.h>

namespace {

using testing::ElementsAre;

/** Sees what is put into some folders and taken from them, in the order in which that happens. */
class Watch {
public:
    explicit Watch(const std::vector<std::string>& folders) : m_events(inotify_init1(IN_NONBLOCK))
    {
        for (const std::string& folder : folders) {
            std::filesystem::create_directories(folder);
            EXPECT_GE(inotify_add_watch(m_events.Get(), folder.c_str(), IN_MOVED_TO | IN_DELETE),
                      0);
        }
    }

    std::vector<std::string> Events()
    {
        std::vector<std::string> list;
        alignas(inotify_event) std::array<char, 16384> buffer{};
        const ssize_t size = read(m_events.Get(), buffer.data(), buffer.size());
        for (ssize_t offset = 0; offset < size;) {
            const auto* const event =
                reinterpret_cast<const inotify_event*>(buffer.data() + offset);
            list.push_back(((event->mask & IN_DELETE) != 0 ? "- " : "+ ") +
                           std::string(event->name));
            offset += static_cast<ssize_t>(sizeof(inotify_event) + event->len);
        }
        return list;
    }

private:
    vornhost::Descriptor m_events;
};

std::vector<std::string> Folders()
{
    const std::string remembered = vornhost::kRememberedFolder;
    return {vornhost::kConfigurationFolder, remembered + "/bonds", remembered + "/vlans"};
}

TEST(FileOrder, OfABondLetsOneOfItAndItsFirstSlaveCarryTheAddressAtAnyMoment)
{
    ASSERT_EQ(mount("devices", vornhost::kInterfaceFolder, "tmpfs", 0, nullptr), 0);
    contract::StartWith({{"bond0", "DEVICE=bond0\nIPADDR=192.0.2.10/24\n"},
                         {"eth0", "DEVICE=eth0\nMASTER=bond0\nSLAVE=yes\n"},
                         {"eth1", "DEVICE=eth1\nMASTER=bond0\nSLAVE=yes\n"}});
    contract::ShowBond("bond0", {{"mode", "802.3ad 4"}, {"slaves", "eth0 eth1"}});
    Watch watch(Folders());

    VORNLINKAGGROPT opt = contract::BondRecord("bond0", 0, {"eth0", "eth1"});
    EXPECT_EQ(VORNNetLinkAggrSet(&opt), 0);
    EXPECT_THAT(watch.Events(),
                ElementsAre("+ bond0.json", "+ ifcfg-eth1", "+ ifcfg-eth0", "- ifcfg-bond0"));

    contract::HideBond("bond0");
    opt.mode = VORN_LINK_AGGR_8023AD;
    EXPECT_EQ(VORNNetLinkAggrSet(&opt), 0);
    EXPECT_THAT(watch.Events(),
                ElementsAre("+ ifcfg-bond0", "+ ifcfg-eth0", "+ ifcfg-eth1",
                            "+ ifcfg-bond0", // without what was in effect for the building only
                            "- bond0.json"));
    ASSERT_EQ(umount(vornhost::kInterfaceFolder), 0);
}

TEST(FileOrder, OfAVlanLetsOneOfItAndItsParentCarryTheAddressAtAnyMoment)
{
    contract::StartWith(
        {{"eth0", "DEVICE=eth0\n"}, {"eth0.10", "DEVICE=eth0.10\nIPADDR=192.0.2.10/24\n"}});
    vornhost::LiveNetwork network;
    network.links.resize(2);
    network.links[0].index = 2;
    network.links[0].name = "eth0";
    network.links[1].index = 3;
    network.links[1].name = "eth0.10";
    network.links[1].kind = "vlan";
    network.links[1].parent = 2;
    network.links[1].vlanId = 10;
    Watch watch(Folders());

    EXPECT_EQ(vornhost::TakeVlan(network, "eth0.10"), 0);
    EXPECT_THAT(watch.Events(), ElementsAre("+ eth0.10.json", "+ ifcfg-eth0", "- ifcfg-eth0.10"));

    EXPECT_EQ(VLIBNetVlanCreate("eth0", 10, nullptr), 0);
    EXPECT_THAT(watch.Events(), ElementsAre("+ ifcfg-eth0.10", "+ ifcfg-eth0", "- eth0.10.json"));
}

} // namespace
