#include <vornovs/vornovs.h>

#include "support/filecalls.h"
#include "support/support.h"

#include <filesystem>

using harness::Err;
using harness::RecordingPlatform;
using testing::ElementsAre;
using testing::IsEmpty;
using unit::Calls;
using unit::kIgnoreList;
using unit::kInterfaceList;
using unit::kRegistry;
using unit::kStateFolder;
using unit::ListFolder;
using unit::WriteFile;
using VORN::OVS::OVSSetDefault;

namespace {

const Calls kLoaded{"VLIBCFileCheckDir /usr/vorn/etc/vornovs",
                    "VLIBCFileExist /usr/vorn/etc/vornovs/ovs_reg.conf"};

TEST(OVSSetDefault, DeletesTheStateAndFiresTheHookWhenAClientWasRegistered)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "a\n");
    WriteFile(kInterfaceList, "eth0\n");
    WriteFile(kIgnoreList, "eth1\n");
    WriteFile(std::string(kStateFolder) + "/other", "");
    OVSSetDefault();
    EXPECT_THAT(ListFolder(kStateFolder), ElementsAre("other"));
    EXPECT_EQ(platform.Calls(),
              unit::Sequence({kLoaded, {"ExecHook net net/ovs_change 4 ACTION=delete"}}));
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(OVSSetDefault, DeletesTheStateAndFiresNoHookWithoutAClient)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "");
    WriteFile(kInterfaceList, "eth0\n");
    WriteFile(kIgnoreList, "eth1\n");
    OVSSetDefault();
    EXPECT_THAT(ListFolder(kStateFolder), IsEmpty());
    EXPECT_EQ(platform.Calls(), kLoaded);
}

TEST(OVSSetDefault, BuildsTheHookBeforeItAsksForClients)
{
    const RecordingPlatform platform;
    OVSSetDefault();
    EXPECT_EQ(
        platform.AllCalls(),
        unit::Sequence(
            {{"BaseHook net net/ovs_change", "SetEnv ACTION delete"}, kLoaded, {"~BaseHook"}}));
}

TEST(OVSSetDefault, DeletesTheListsBeforeTheRegistry)
{
    const RecordingPlatform platform;
    const unit::FileCalls calls;
    OVSSetDefault();
    EXPECT_THAT(calls.List(), ElementsAre("unlink ovs_interface.conf", "unlink ovs_ignore.conf",
                                          "unlink ovs_reg.conf"));
}

TEST(OVSSetDefault, DoesNotMindMissingFiles)
{
    const RecordingPlatform platform;
    OVSSetDefault();
    EXPECT_EQ(platform.Calls(), kLoaded);
    EXPECT_THAT(platform.Log(), IsEmpty());
}

TEST(OVSSetDefault, GoesOnToTheNextFileWhenOneCannotBeDeleted)
{
    const RecordingPlatform platform;
    WriteFile(kRegistry, "a\n");
    std::filesystem::create_directory(kInterfaceList);
    std::filesystem::create_directory(kIgnoreList);
    OVSSetDefault();
    EXPECT_THAT(ListFolder(kStateFolder), ElementsAre("ovs_ignore.conf", "ovs_interface.conf"));
    EXPECT_EQ(platform.Calls().back(), "ExecHook net net/ovs_change 4 ACTION=delete");
}

TEST(OVSSetDefault, DeletesARegistryThatCannotBeReadWithoutTheHook)
{
    const RecordingPlatform platform;
    unit::MakeUnopenable(kRegistry);
    OVSSetDefault();
    EXPECT_THAT(ListFolder(kStateFolder), IsEmpty());
    EXPECT_EQ(platform.Calls(), kLoaded);
    EXPECT_THAT(platform.Log(),
                ElementsAre(Err("regconf.cpp", " Open /usr/vorn/etc/vornovs/ovs_reg.conf fails"),
                            Err("libvornovs.cpp", "Failed to load the ovs config")));
}

TEST(OVSSetDefault, DoesNothingWithoutMemoryForTheHook)
{
    RecordingPlatform platform;
    platform.Answer("BaseHook", 0);
    WriteFile(kRegistry, "a\n");
    OVSSetDefault();
    EXPECT_THAT(ListFolder(kStateFolder), ElementsAre("ovs_reg.conf"));
    EXPECT_THAT(platform.Calls(), IsEmpty());
    EXPECT_THAT(platform.Log(), ElementsAre(Err("libvornovs.cpp", "Failed to set the default")));
}

TEST(OVSSetDefault, DoesNotMindAHookThatFails)
{
    RecordingPlatform platform;
    platform.Answer("ExecHook", -1);
    WriteFile(kRegistry, "a\n");
    OVSSetDefault();
    EXPECT_THAT(ListFolder(kStateFolder), IsEmpty());
    EXPECT_THAT(platform.Log(), IsEmpty());
}

} // namespace
