// Clients that keep the library busy.
//
//   load client NAME PORT SECONDS SEED
//       does what comes to its mind: registers and withdraws itself, attaches and detaches its
//       port, asks who is registered
//   load attach BRIDGE PREFIX COUNT
//   load detach BRIDGE PREFIX COUNT
//       attaches PREFIX1 to PREFIXn, or detaches them, one after the other
//
// A client remembers what it did, and fails when its registration is lost or a name turns up that
// is nobody's. In the end it says whether it is registered, how many calls it made and how many of
// them failed: "client-3 registered 120 calls 3 failed".
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <random>
#include <set>
#include <string>
#include <utility>
#include <vornovs/vornovs.h>

namespace {

using Names = std::set<std::string>;

[[noreturn]] void Die(const std::string& text)
{
    std::fprintf(stderr, "load: %s\n", text.c_str());
    std::exit(1);
}

class Client {
public:
    Client(std::string name, std::string port, unsigned seed)
        : m_name(std::move(name)), m_port(std::move(port)), m_random(seed)
    {
    }

    void Run(std::chrono::seconds time)
    {
        const auto end = std::chrono::steady_clock::now() + time;
        while (std::chrono::steady_clock::now() < end) {
            ++m_calls;
            const bool done = Act();
            m_failed += done ? 0 : 1;
            Look();
        }
        std::printf("%s %s %d calls %d failed\n", m_name.c_str(),
                    m_registered ? "registered" : "withdrawn", m_calls, m_failed);
    }

private:
    bool Act()
    {
        // Seldom in and soon out: the host comes home whenever all are out at once.
        if (m_random() % (m_registered ? 2 : 16) == 0) {
            return ChangeRegistration();
        }
        Names bridges;
        switch (m_random() % 7) {
        case 0:
        case 1:
            return VORN::OVS::ListInterface(bridges) >= 0;
        case 2:
        case 3:
        case 4:
            return VORN::OVS::AttachPort("ovs_eth0", m_port) >= 0;
        default:
            return VORN::OVS::DetachPort("ovs_eth0", m_port) >= 0;
        }
    }

    /** Without the lock a registration answers 0, too: whether it was done is seen afterwards. */
    bool ChangeRegistration()
    {
        const bool wanted = !m_registered;
        const int result =
            wanted ? VORN::OVS::Register(m_name, {}) : VORN::OVS::UnRegister(m_name, {});
        m_registered = IsRegistered();
        if (!wanted && result == 0 && m_registered) {
            Die(m_name + " was withdrawn and is registered");
        }
        return m_registered == wanted;
    }

    [[nodiscard]] bool IsRegistered() const { return VORN::OVS::IsRegister(m_name) == 0; }

    /** Nobody else registers or withdraws this client, and every name in the list is a client's. */
    void Look() const
    {
        Names names;
        (void)VORN::OVS::GetAllRegister(names);
        for (const std::string& name : names) {
            if (name.compare(0, 7, "client-") != 0 || name.size() > 9) {
                Die("a name that is nobody's: " + name);
            }
        }
        if ((names.count(m_name) > 0) != m_registered) {
            Die(m_name + (m_registered ? " was lost" : " was registered by nobody"));
        }
    }

    std::string m_name;
    std::string m_port;
    std::mt19937 m_random;
    bool m_registered = false;
    int m_calls = 0;
    int m_failed = 0;
};

void ChangePorts(bool attach, const std::string& bridge, const std::string& prefix, int count)
{
    for (int number = 1; number <= count; ++number) {
        const std::string port = prefix + std::to_string(number);
        const int result =
            attach ? VORN::OVS::AttachPort(bridge, port) : VORN::OVS::DetachPort(bridge, port);
        if (result != 1) {
            Die(port + ": " + std::to_string(result));
        }
    }
}

} // namespace

int main(int count, char** arguments)
{
    const std::string what = count > 1 ? arguments[1] : "";
    if (what == "client" && count == 6) {
        Client client(arguments[2], arguments[3], static_cast<unsigned>(std::atoi(arguments[5])));
        client.Run(std::chrono::seconds(std::atoi(arguments[4])));
        return 0;
    }
    if ((what == "attach" || what == "detach") && count == 5) {
        ChangePorts(what == "attach", arguments[2], arguments[3], std::atoi(arguments[4]));
        return 0;
    }
    std::fputs("Usage: load client NAME PORT SECONDS SEED\n"
               "       load attach BRIDGE PREFIX COUNT\n"
               "       load detach BRIDGE PREFIX COUNT\n",
               stderr);
    return 2;
}
