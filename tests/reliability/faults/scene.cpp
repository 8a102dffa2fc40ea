#include "faults/scene.h"

#include <vornovs/vornovs.h>

namespace reliability {

namespace {

const std::vector<std::string> kSettings{"IPADDR=10.0.0.2", "X_UNKNOWN=\"a  b\"", "IPADDR=10.0.1.2",
                                         "IPADDR=10.0.2.2", "GATEWAY=10.0.2.1"};

void Build(unit::SimulatedHost& host)
{
    host.AllowChanges();
    host.AddPort("eth0", "BOOTPROTO=static\n" + kSettings[0] + "\n" + kSettings[1] + "\n");
    host.AddPort("eth1", "BOOTPROTO=none\n");
    host.AddVlan("eth1", 10, kSettings[2] + "\n");
    host.AddPort("eth4", "BOOTPROTO=none\n");
    host.AddBond("bond0", 4, {"eth2", "eth3"}, kSettings[3] + "\n" + kSettings[4] + "\n");
}

void Advance(Situation situation)
{
    if (situation == Situation::kPlain) {
        return;
    }
    EXPECT_EQ(VORN::OVS::Register(kClient, {}), 0);
    EXPECT_EQ(VORN::OVS::AttachPort("ovs_eth0", kPort), 1);
    if (situation == Situation::kShared) {
        EXPECT_EQ(VORN::OVS::Register(kOther, {}), 0);
    } else if (situation == Situation::kTakenOff) {
        EXPECT_EQ(VORN::OVS::RemoveInterface("ovs_eth0"), 0);
    }
}

} // namespace

Scene::Scene(Situation situation) : m_settings(kSettings)
{
    unit::RenewFolders();
    harness::RecordingPlatform platform;
    unit::SimulatedHost host(platform);
    Build(host);
    Advance(situation);
    m_host = host;
    for (const std::string folder : {unit::kScripts, unit::kStateFolder}) {
        for (const std::string& name : unit::ListFolder(folder)) {
            const std::string path = folder + "/" + name;
            m_files[path] = unit::ReadFile(path).value_or("");
        }
    }
}

const unit::SimulatedState& Scene::Restore() const
{
    unit::RenewFolders();
    for (const auto& [path, text] : m_files) {
        unit::WriteFile(path, text);
    }
    return m_host;
}

} // namespace reliability
