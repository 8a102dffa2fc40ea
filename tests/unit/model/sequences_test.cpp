// Random sequences of calls against a small model: files, lists, kernel and switch agree with it
// after every one of them.
#include <vornovs/vornovs.h>

#include "model/clientmodel.h"
#include "model/seed.h"

#include <algorithm>
#include <array>
#include <chrono>

using harness::RecordingPlatform;
using unit::ClientModel;
using unit::Names;
using unit::SimulatedHost;

namespace {

// In five tests, which run beside each other.
constexpr int kTests = 5;
constexpr int kSequences = 100;
constexpr int kCallsEach = 20;
constexpr std::chrono::seconds kMostTime{60};

class Client {
public:
    explicit Client(unsigned int seed) : m_random(seed), m_host(m_platform)
    {
        for (const char* name : {"eth0", "eth1", "eth2", "eth3"}) {
            m_host.AddPort(name, std::string("IPADDR=10.0.") + name[3] + ".2\n");
        }
        m_host.AddBond("bond0", 4, {"eth5", "eth4"}, "IPADDR=10.0.9.2\n");
        m_model.interfaces = {"eth0", "eth1", "eth2", "eth3", "eth4", "eth5"};
        m_model.linuxBonds = m_host.linuxBonds;
        m_host.AllowChanges();
    }

    /** Makes one call of those that the model lets succeed, or that must change nothing. */
    void Step()
    {
        using Call = void (Client::*)();
        constexpr std::array<Call, 14> kCalls{
            &Client::Register,     &Client::Register,    &Client::UnRegister,
            &Client::AddInterface, &Client::MakeBond,    &Client::RemoveInterface,
            &Client::DropBond,     &Client::ChangeMode,  &Client::RemoveBondInterface,
            &Client::AttachPort,   &Client::DetachPort,  &Client::CreateTag,
            &Client::RemoveTag,    &Client::AskQuestions};
        (this->*kCalls.at(Pick(kCalls.size())))();
        m_model.ExpectAgreement(m_host);
        m_platform.Forget();
    }

    std::string done;

private:
    std::size_t Pick(std::size_t count)
    {
        return static_cast<std::size_t>(m_random.Below(static_cast<int>(count)));
    }
    template <typename List>
    std::string Any(const List& list)
    {
        return list.empty() ? std::string()
                            : *std::next(list.begin(), static_cast<long>(Pick(list.size())));
    }
    bool Runs() const { return !m_model.clients.empty(); }
    void Note(const std::string& text) { done += text + "\n"; }

    void Register()
    {
        const std::string name = Any(std::vector<std::string>{"a", "b", "c"});
        Note("Register " + name);
        const bool known = m_model.clients.contains(name);
        EXPECT_EQ(VORN::OVS::Register(name, {}), known ? 1 : 0);
        if (!Runs()) {
            m_model.ConvertAll();
        }
        m_model.clients.insert(name);
    }

    void UnRegister()
    {
        const std::string name = Any(std::vector<std::string>{"a", "b", "c"});
        Note("UnRegister " + name);
        const bool known = m_model.clients.erase(name) == 1;
        EXPECT_EQ(VORN::OVS::UnRegister(name, {}), known ? 0 : 1);
        if (known && !Runs()) {
            m_model.ConvertAllBack();
        }
    }

    void RemoveInterface()
    {
        const std::string name = Any(m_model.Bridged());
        if (name.empty() || m_model.ignored.contains(name)) {
            Note("RemoveInterface nosuch");
            EXPECT_EQ(VORN::OVS::RemoveInterface("ovs_nosuch"), -1);
            return;
        }
        Note("RemoveInterface " + name);
        EXPECT_EQ(VORN::OVS::RemoveInterface("ovs_" + name), 0);
        m_model.TakeOff(name);
    }

    void RemoveBondInterface()
    {
        for (const auto& [key, bond] : m_model.bonds) {
            const std::string name = key; // outlives the bond, which goes below
            const auto slaves = bond.slaves;
            if (std::any_of(slaves.begin(), slaves.end(), [this](const std::string& slave) {
                    return m_model.ignored.contains(slave);
                })) {
                continue;
            }
            Note("RemoveInterface " + name);
            EXPECT_EQ(VORN::OVS::RemoveInterface(name), 0);
            m_model.DropBond(name);
            for (const std::string& slave : slaves) {
                m_model.TakeOff(slave);
            }
            return;
        }
    }

    void AddInterface()
    {
        const std::string name = Any(m_model.ignored);
        if (!Runs() || name.empty() || m_model.onSwitch.contains(name)) {
            return;
        }
        Note("AddInterface " + name);
        EXPECT_EQ(VORN::OVS::AddInterface(name), 0);
        m_model.PutOn(name);
    }

    void MakeBond()
    {
        std::vector<std::string> slaves;
        for (const std::string& name : m_model.Bridged()) {
            if (!m_model.tags.contains(name) && m_random.Below(2) == 0) {
                slaves.insert(slaves.begin() + m_random.Below(static_cast<int>(slaves.size()) + 1),
                              name);
            }
        }
        const int mode = 5 + m_random.Below(4);
        std::string name;
        EXPECT_EQ(VORN::OVS::GetUniqueBondName(name), 0);
        Note("OVSBondCreate " + name + " " + std::to_string(mode));
        const bool accepted = Runs() && mode > 5 && slaves.size() > 1;
        EXPECT_EQ(VORN::OVS::OVSBondCreate(static_cast<VORN_LINK_AGGR_MODE>(mode), name, slaves),
                  accepted ? 0 : -1);
        if (accepted) {
            m_model.MakeBond(name, mode, slaves);
        }
    }

    void DropBond()
    {
        VORNLINKAGGROPT record{};
        if (m_model.bonds.empty()) {
            Note("OVSBondRemove nosuch");
            EXPECT_EQ(VORN::OVS::OVSBondRemove("ovs_nosuch", &record), -1);
            return;
        }
        const auto [name, bond] = *m_model.bonds.begin();
        Note("OVSBondRemove " + name);
        EXPECT_EQ(VORN::OVS::OVSBondRemove(name, &record), 0);
        EXPECT_EQ(record.mode, bond.mode);
        EXPECT_EQ(record.nSlave, static_cast<int>(bond.slaves.size()));
        EXPECT_EQ(record.rgszSlave[0], bond.slaves.front());
        m_model.DropBond(name);
    }

    void ChangeMode()
    {
        if (m_model.bonds.empty()) {
            return;
        }
        auto& [name, bond] = *m_model.bonds.begin();
        const int mode = 6 + m_random.Below(3);
        Note("OVSBodChMode " + name + " " + std::to_string(mode));
        EXPECT_EQ(VORN::OVS::OVSBodChMode(static_cast<VORN_LINK_AGGR_MODE>(mode), name), 0);
        bond.mode = mode;
        VORNLINKAGGROPT record{};
        EXPECT_EQ(VORN::OVS::OVSBondGet(name, &record), 0);
        EXPECT_EQ(record.mode, mode);
    }

    void AttachPort()
    {
        const std::string bridge = Any(m_model.Bridges());
        const std::string port = "tap" + std::to_string(++m_taps);
        Note("AttachPort " + bridge + " " + port);
        const int expected = !Runs() ? 0 : bridge.empty() ? -1 : 1;
        EXPECT_EQ(VORN::OVS::AttachPort(bridge.empty() ? "ovs_nosuch" : bridge, port), expected);
        if (expected == 1) {
            m_model.ports[bridge].insert(port);
        }
    }

    void DetachPort()
    {
        const std::string bridge = Any(m_model.Bridges());
        const auto plugged = m_model.ports.find(bridge);
        const bool there = plugged != m_model.ports.end() && !plugged->second.empty();
        const std::string port = there ? Any(plugged->second) : "nosuch";
        Note("DetachPort " + bridge + " " + port);
        EXPECT_EQ(VORN::OVS::DetachPort(bridge.empty() ? "ovs_nosuch" : bridge, port), !Runs() ? 0
                                                                                       : there
                                                                                           ? 1
                                                                                           : -1);
        if (there) {
            plugged->second.erase(port);
        }
    }

    void CreateTag()
    {
        const std::string bridge = Any(m_model.Bridges());
        if (bridge.empty()) {
            return;
        }
        const std::string id = std::to_string(1 + m_random.Below(4094));
        Note("OVSVlanCreate " + bridge + " " + id);
        EXPECT_EQ(VORN::OVS::OVSVlanCreate(bridge, id), 0);
        m_model.tags[Owner(bridge)] = id;
    }

    void RemoveTag()
    {
        const std::string bridge = Any(m_model.Bridges());
        if (bridge.empty()) {
            return;
        }
        Note("OVSVlanRemove " + bridge);
        EXPECT_EQ(VORN::OVS::OVSVlanRemove(bridge), 0);
        m_model.tags.erase(Owner(bridge));
    }

    void AskQuestions()
    {
        Names names;
        EXPECT_EQ(VORN::OVS::GetAllRegister(names), static_cast<int>(m_model.clients.size()));
        EXPECT_EQ(names, m_model.clients);
        EXPECT_EQ(VORN::OVS::IsOVSRunning(), Runs());
        EXPECT_EQ(VORN::OVS::ListInterface(names), 0);
        const std::vector<std::string> bridges = m_model.Bridges();
        EXPECT_EQ(names, Runs() ? Names(bridges.begin(), bridges.end()) : m_model.clients);
        for (const std::string& bridge : bridges) {
            _tag_VLIB_VLAN vlan{};
            const auto tag = m_model.tags.find(Owner(bridge));
            EXPECT_EQ(VORN::OVS::OVSVlanGet(bridge, &vlan), tag == m_model.tags.end() ? 0 : 1);
            EXPECT_EQ(std::to_string(vlan.vlanId), tag == m_model.tags.end() ? "0" : tag->second);
        }
    }

    std::string Owner(const std::string& bridge) const
    {
        return m_model.bonds.contains(bridge) ? bridge : bridge.substr(std::string("ovs_").size());
    }

    unit::Random m_random;
    RecordingPlatform m_platform;
    SimulatedHost m_host;
    ClientModel m_model;
    int m_taps = 0;
};

class Sequences : public testing::TestWithParam<int> {};

INSTANTIATE_TEST_SUITE_P(Hundred, Sequences, testing::Range(0, kTests));

TEST_P(Sequences, AgreeWithTheModelAfterEveryCall)
{
    const unsigned int first =
        unit::FirstSeed() + static_cast<unsigned int>(GetParam() * kSequences);
    const auto begin = std::chrono::steady_clock::now();
    for (unsigned int seed = first; seed < first + kSequences; ++seed) {
        ASSERT_LT(std::chrono::steady_clock::now() - begin, kMostTime) << seed - first << " done";
        unit::RenewFolders();
        Client client(seed);
        for (int call = 0; call < kCallsEach && !HasFailure(); ++call) {
            client.Step();
        }
        if (HasFailure()) {
            FAIL() << "VORNOVS_SEED=" << seed << " after these calls:\n" << client.done;
        }
    }
}

} // namespace
