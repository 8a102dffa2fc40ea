// Several threads of one client at once: every free function of the library may be called by any of
// them. The platform lets one thread in at a time; what is between its calls is the library's own.
#include <vornovs/vornovs.h>

#include "model/seed.h"
#include "model/simulatedhost.h"

#include <array>
#include <thread>

using harness::RecordingPlatform;
using unit::Names;
using unit::SimulatedHost;

namespace {

constexpr int kThreads = 8;
constexpr int kCallsEach = 150;

/** What one thread does: only its own name and its own port are its business. */
class Caller {
public:
    Caller(int number, unsigned int seed)
        : m_name("thread-" + std::to_string(number)), m_port("tap" + std::to_string(number)),
          m_random(seed)
    {
    }

    void Work()
    {
        using Call = void (Caller::*)();
        constexpr std::array<Call, 7> kCalls{&Caller::Register, &Caller::UnRegister, &Caller::Ask,
                                             &Caller::Plug,     &Caller::Bond,       &Caller::Tag,
                                             &Caller::TakeOff};
        for (int call = 0; call < kCallsEach; ++call) {
            const auto any = static_cast<std::size_t>(m_random.Below(kCalls.size()));
            (this->*kCalls.at(any))();
        }
        EXPECT_EQ(VORN::OVS::IsRegister(m_name), m_registered ? 0 : -1);
        (void)VORN::OVS::UnRegister(m_name, {});
    }

private:
    void Register()
    {
        EXPECT_EQ(VORN::OVS::Register(m_name, {}), m_registered ? 1 : 0);
        m_registered = true;
    }

    void UnRegister()
    {
        EXPECT_EQ(VORN::OVS::UnRegister(m_name, {}), m_registered ? 0 : 1);
        m_registered = false;
    }

    void Ask()
    {
        Names names;
        const int count = VORN::OVS::GetAllRegister(names);
        EXPECT_EQ(count, static_cast<int>(names.size()));
        EXPECT_EQ(names.contains(m_name), m_registered);
        EXPECT_EQ(VORN::OVS::ListInterface(names), 0);
        std::string mode;
        VORN::OVS::ModeToStr(VORN::OVS::StrToMode("802.3ad"), mode);
        EXPECT_EQ(mode, "802.3ad");
    }

    void Plug()
    {
        const int attached = VORN::OVS::AttachPort("ovs_eth0", m_port);
        EXPECT_TRUE(attached != 0 || !m_registered) << "nobody is registered?";
        (void)VORN::OVS::DetachPort("ovs_eth0", m_port);
    }

    void Bond()
    {
        std::string name;
        EXPECT_EQ(VORN::OVS::GetUniqueBondName(name), 0);
        std::vector<std::string> slaves{"eth2", "eth3"};
        (void)VORN::OVS::OVSBondCreate(VORN_LINK_AGGR_OVS_BALANCE_SLB, name, slaves);
        VORNLINKAGGROPT bond{};
        (void)VORN::OVS::OVSBondGet(name, &bond);
        (void)VORN::OVS::OVSBodChMode(VORN_LINK_AGGR_OVS_BALANCE_TCP, name);
        (void)VORN::OVS::OVSBondRemove(name, &bond);
    }

    void Tag()
    {
        _tag_VLIB_VLAN vlan{};
        (void)VORN::OVS::OVSVlanSet("ovs_eth1", "20");
        (void)VORN::OVS::OVSVlanGet("ovs_eth1", &vlan);
        (void)VORN::OVS::OVSVlanClear("ovs_eth1");
    }

    void TakeOff()
    {
        (void)VORN::OVS::RemoveInterface("ovs_eth9");
        (void)VORN::OVS::AddInterface("eth9");
    }

    const std::string m_name;
    const std::string m_port;
    unit::Random m_random;
    bool m_registered = false;
};

TEST(Threads, OfOneClientMayAllCallAtOnce)
{
    RecordingPlatform platform;
    platform.TakeRealLocks();
    SimulatedHost host(platform);
    for (const char* name : {"eth0", "eth1", "eth2", "eth3"}) {
        host.AddPort(name, std::string("IPADDR=10.0.") + name[3] + ".2\n");
    }
    host.AllowChanges();

    const unsigned int seed = unit::FirstSeed();
    std::vector<std::thread> threads;
    for (int number = 0; number < kThreads; ++number) {
        threads.emplace_back(
            [number, seed] { Caller(number, seed + static_cast<unsigned int>(number)).Work(); });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_FALSE(unit::ReadFile(unit::kRegistry)) << "everybody has withdrawn";
    EXPECT_TRUE(host.bridges.empty());
    EXPECT_THAT(platform.OpenHandles(), testing::IsEmpty());
}

} // namespace
