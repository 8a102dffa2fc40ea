// A host of any make goes on to the switch and comes back with the very files that it had.
#include <vornovs/vornovs.h>

#include "model/seed.h"
#include "model/simulatedhost.h"

using harness::RecordingPlatform;
using testing::IsEmpty;
using unit::Names;
using unit::SimulatedHost;

namespace {

constexpr int kTopologies = 250;

class Generator {
public:
    Generator(unsigned int seed, SimulatedHost& host) : m_random(seed), m_host(host) {}

    void Build()
    {
        const int ports = m_random.Below(4);
        const int bonds = m_random.Below(3);
        for (int i = 0; i < ports; ++i) {
            AddAddressed("eth" + std::to_string(m_next), [&](const std::string& text) {
                m_host.AddPort("eth" + std::to_string(m_next), text);
            });
            ++m_next;
        }
        for (int i = 0; i < bonds; ++i) {
            AddBond("bond" + std::to_string(i));
        }
        if (ports + bonds == 0) {
            m_host.AddPort("eth0", Address());
        }
    }

    /** The modes that the bonds must be brought back with, where they do not come by themselves. */
    unit::BondModes modesBack;
    Names bridges;

private:
    std::string Address()
    {
        const std::string n = std::to_string(++m_address);
        std::string text = m_random.Below(3) == 0 ? "# kept as it is\n" : "";
        text += "BOOTPROTO=static\nONBOOT=yes\nIPADDR=10.0." + n + ".2\nNETMASK=255.255.255.0\n";
        text += m_random.Below(2) == 0 ? "GATEWAY=10.0." + n + ".1\n" : "";
        text += m_random.Below(2) == 0 ? "IPV6INIT=yes\nIPV6ADDR=fd00:" + n + "::2/64\n" : "";
        text += m_random.Below(3) == 0 ? "X_UNKNOWN=\"a  b\"\n" : "";
        return text;
    }

    /** Gives an interface its address, or a VLAN on it that has one. */
    template <typename Add>
    void AddAddressed(const std::string& name, const Add& add)
    {
        const bool onVlan = m_random.Below(3) == 0;
        add(onVlan ? "BOOTPROTO=none\nONBOOT=yes\n" : Address());
        if (onVlan) {
            m_host.AddVlan(name, 1 + m_random.Below(4094), Address());
        }
        bridges.insert("ovs_" + name);
    }

    void AddBond(const std::string& name)
    {
        std::vector<std::string> slaves;
        const int count = 2 + m_random.Below(3);
        for (int i = 0; i < count; ++i) {
            slaves.insert(slaves.begin() + m_random.Below(i + 1), "eth" + std::to_string(m_next++));
        }
        const int mode = 1 + m_random.Below(5);
        AddAddressed(name,
                     [&](const std::string& text) { m_host.AddBond(name, mode, slaves, text); });
        if (mode == 1 || mode == 5) {
            modesBack["ovs_" + name] = mode == 1 ? "balance-rr" : "balance-alb";
        }
    }

    unit::Random m_random;
    SimulatedHost& m_host;
    int m_next = 0;
    int m_address = 0;
};

Names NamesOf(const std::map<std::string, SimulatedHost::Bridge>& bridges)
{
    Names names;
    for (const auto& [name, bridge] : bridges) {
        names.insert(name);
    }
    return names;
}

TEST(RoundTrip, GivesEveryFileBackByteForByte)
{
    const unsigned int first = unit::FirstSeed();
    for (unsigned int seed = first; seed < first + kTopologies; ++seed) {
        SCOPED_TRACE("VORNOVS_SEED=" + std::to_string(seed));
        unit::RenewFolders();
        RecordingPlatform platform;
        SimulatedHost host(platform);
        Generator generator(seed, host);
        generator.Build();
        const unit::Files before = unit::ReadFiles();
        const auto bonds = host.linuxBonds;
        const auto vlans = host.linuxVlans;

        ASSERT_EQ(VORN::OVS::Register("client", {}), 0);
        ASSERT_EQ(VORN::OVS::IsRegister("client"), 0);
        if (!generator.bridges.empty()) {
            EXPECT_EQ(NamesOf(host.bridges), generator.bridges);
        }
        for (const auto& [name, vlan] : vlans) {
            EXPECT_EQ(host.bridges["ovs_" + vlan.parent].tag, std::to_string(vlan.id)) << name;
        }
        EXPECT_THAT(host.linuxBonds, IsEmpty());
        EXPECT_THAT(host.linuxVlans, IsEmpty());

        ASSERT_EQ(VORN::OVS::UnRegister("client", generator.modesBack), 0);
        EXPECT_EQ(unit::ReadFiles(), before);
        EXPECT_EQ(host.linuxBonds, bonds);
        EXPECT_EQ(host.linuxVlans, vlans);
        EXPECT_THAT(NamesOf(host.bridges), IsEmpty());
        EXPECT_THAT(unit::ListFolder(unit::kStateFolder), IsEmpty());
        if (HasFailure()) {
            return;
        }
    }
}

} // namespace
