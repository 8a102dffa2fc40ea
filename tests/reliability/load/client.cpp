#include "load/client.h"

#include <vornovs/vornovs.h>

#include <algorithm>
#include <array>
#include <sstream>
#include <thread>

#include <syslog.h>

namespace reliability {

namespace {

using namespace std::chrono_literals;

// Of every second the last part is quiet, so that the last one to withdraw converts the host back.
constexpr std::chrono::milliseconds kPeriod = 1000ms;
constexpr std::chrono::milliseconds kBusy = 700ms;
constexpr int kLongestPause = 60; // milliseconds between calls

bool IsQuiet()
{
    const auto now = std::chrono::steady_clock::now().time_since_epoch();
    return now % kPeriod >= kBusy;
}

bool IsClient(const std::string& name)
{
    return name.size() == Client::NameOf(10).size() && name.starts_with("client-");
}

} // namespace

std::string Client::NameOf(int number)
{
    return "client-" + std::to_string(10 + number);
}

Client::Client(SharedHost& shared, Ledger& ledger, int number, unsigned int seed)
    : m_host(m_platform, shared.Get()), m_ledger(ledger), m_number(number), m_name(NameOf(number)),
      m_port("tap" + std::to_string(number)), m_random(seed)
{
    m_host.AllowChanges();
    m_platform.TakeRealLocks();
    m_platform.Intercept([this](const std::string& call) { return See(call); });
    m_platform.Around([this, &shared] { shared.Enter(m_host); },
                      [this, &shared] { shared.Leave(m_host); });
}

void Client::Work(std::chrono::steady_clock::time_point end)
{
    while (std::chrono::steady_clock::now() < end && !testing::Test::HasFailure()) {
        Step();
        std::this_thread::sleep_for(std::chrono::milliseconds(m_random.Below(kLongestPause)));
    }
}

// A conversion begins with the hook's first call and is over when the lock is given back.
std::optional<int> Client::See(const std::string& call)
{
    if (call.starts_with("ExecHook net net/ovs_change 4")) {
        m_converting = true;
        ++m_ledger.conversions;
        m_ledger.overlaps += m_ledger.converting.fetch_add(1) > 0 ? 1 : 0;
    } else if (call == "VLIBCFileUnlockByFile" && m_converting) {
        m_converting = false;
        --m_ledger.converting;
    }
    return std::nullopt;
}

void Client::Step()
{
    using Call = void (Client::*)();
    constexpr std::array<Call, 10> kCalls{
        &Client::Register, &Client::Register,   &Client::UnRegister, &Client::Ask,
        &Client::Attach,   &Client::Detach,     &Client::MakeBond,   &Client::DropBond,
        &Client::Tag,      &Client::LookAtLists};
    const auto any = static_cast<std::size_t>(m_random.Below(static_cast<int>(kCalls.size())));
    m_platform.Forget();
    ++m_ledger.operations;
    if (!IsQuiet()) {
        (this->*kCalls.at(any))();
    } else if (m_ledger.registered.at(static_cast<std::size_t>(m_number))) {
        UnRegister();
    }
}

void Client::Register()
{
    std::atomic<bool>& mine = m_ledger.registered.at(static_cast<std::size_t>(m_number));
    const int result = VORN::OVS::Register(m_name, {});
    Expect("Register", result, mine ? 1 : 0);
    // It answers 0 also when there was no lock or the conversion failed, and logs that.
    mine = mine || (result == 0 && !HasComplained()) || VORN::OVS::IsRegister(m_name) == 0;
    EXPECT_EQ(VORN::OVS::IsRegister(m_name), mine ? 0 : -1) << m_name;
}

void Client::UnRegister()
{
    std::atomic<bool>& mine = m_ledger.registered.at(static_cast<std::size_t>(m_number));
    const int result = VORN::OVS::UnRegister(m_name, {});
    Expect("UnRegister", result, mine ? 0 : 1);
    mine = mine && result == -1;
    EXPECT_EQ(VORN::OVS::IsRegister(m_name), mine ? 0 : -1) << m_name;
}

void Client::Ask()
{
    const bool mine = m_ledger.registered.at(static_cast<std::size_t>(m_number));
    unit::Names names;
    const int count = VORN::OVS::GetAllRegister(names);
    EXPECT_EQ(count, static_cast<int>(names.size()));
    EXPECT_EQ(names.contains(m_name), mine) << m_name;
    EXPECT_TRUE(std::all_of(names.begin(), names.end(), IsClient)) << testing::PrintToString(names);
    EXPECT_TRUE(!mine || VORN::OVS::IsOVSRunning());
    unit::Names bridges;
    Expect("ListInterface", VORN::OVS::ListInterface(bridges), 0);
}

std::string Client::AnyBridge()
{
    return "ovs_eth" + std::to_string(m_random.Below(4));
}

void Client::Attach()
{
    const bool mine = m_ledger.registered.at(static_cast<std::size_t>(m_number));
    const int result = VORN::OVS::AttachPort(AnyBridge(), m_port);
    EXPECT_TRUE(result != 0 || !mine) << "nobody is registered, but " << m_name << " is";
    Expect("AttachPort", result, result == 0 ? 0 : 1);
}

void Client::Detach()
{
    const int result = VORN::OVS::DetachPort(AnyBridge(), m_port);
    Expect("DetachPort", result, result == 0 ? 0 : 1);
}

void Client::MakeBond()
{
    std::string name;
    EXPECT_EQ(VORN::OVS::GetUniqueBondName(name), 0);
    std::vector<std::string> slaves{"eth2", "eth3"};
    const int mode = 6 + m_random.Below(3);
    Expect("OVSBondCreate",
           VORN::OVS::OVSBondCreate(static_cast<VORN_LINK_AGGR_MODE>(mode), name, slaves), 0);
}

void Client::DropBond()
{
    VORNLINKAGGROPT bond{};
    const std::string name = "ovs_bond" + std::to_string(m_random.Below(2));
    Expect("OVSBondRemove", VORN::OVS::OVSBondRemove(name, &bond), 0);
}

void Client::Tag()
{
    const std::string bridge = "ovs_eth" + std::to_string(m_random.Below(2));
    if (!m_ledger.registered.at(static_cast<std::size_t>(m_number))) {
        return; // the file of a bridge that is no more would come back with nothing but a tag
    }
    _tag_VLIB_VLAN vlan{};
    switch (m_random.Below(3)) {
    case 0:
        Expect("OVSVlanSet", VORN::OVS::OVSVlanSet(bridge, std::to_string(1 + m_random.Below(9))),
               0);
        break;
    case 1:
        Expect("OVSVlanClear", VORN::OVS::OVSVlanClear(bridge), 0);
        break;
    default:
        Expect("OVSVlanGet", std::min(VORN::OVS::OVSVlanGet(bridge, &vlan), 0), 0);
        break;
    }
}

void Client::LookAtLists()
{
    for (const std::string path : {unit::kRegistry, unit::kInterfaceList}) {
        const std::string text = unit::ReadFile(path).value_or("");
        EXPECT_TRUE(text.empty() || text.back() == '\n') << path << ": " << text;
        std::istringstream stream(text);
        for (std::string line; std::getline(stream, line);) {
            EXPECT_TRUE(IsClient(line) || (line.size() == 4 && line.starts_with("eth")))
                << path << ": " << text;
        }
    }
}

bool Client::HasComplained() const
{
    const auto& log = m_platform.Log();
    return std::any_of(log.begin(), log.end(),
                       [](const auto& line) { return line.priority == LOG_ERR; });
}

void Client::Expect(const char* call, int result, int success)
{
    if (result != success) {
        ++m_ledger.failures;
        EXPECT_TRUE(HasComplained()) << call << " answered " << result << ", and nothing says why";
    }
}

} // namespace reliability
