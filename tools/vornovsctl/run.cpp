#include "run.h"

#include "commandline.h"
#include "hoststate.h"
#include "report.h"

#include <vornovs/vornovs.h>

#include <array>
#include <csignal>
#include <exception>
#include <ostream>
#include <unistd.h>

namespace vornovsctl {

namespace {

// A conversion must not end half-way because the terminal went away with the network.
class Uninterrupted {
public:
    Uninterrupted()
    {
        struct sigaction ignore {};
        ignore.sa_handler = SIG_IGN;
        for (std::size_t index = 0; index < kSignals.size(); ++index) {
            (void)sigaction(kSignals[index], &ignore, &m_before[index]);
        }
    }
    ~Uninterrupted()
    {
        for (std::size_t index = 0; index < kSignals.size(); ++index) {
            (void)sigaction(kSignals[index], &m_before[index], nullptr);
        }
    }
    Uninterrupted(const Uninterrupted&) = delete;
    Uninterrupted& operator=(const Uninterrupted&) = delete;

private:
    static constexpr std::array kSignals{SIGHUP, SIGINT, SIGQUIT, SIGTERM, SIGPIPE};
    std::array<struct sigaction, kSignals.size()> m_before{};
};

std::string Quoted(const std::string& name)
{
    return '\'' + name + '\'';
}

// Where the results of the library are 0 on failure too, the host's state decides.
class Conversation {
public:
    Conversation(const Command& command, std::ostream& output, std::ostream& errors)
        : m_command(command), m_client(Quoted(command.client)), m_output(output), m_errors(errors)
    {
    }

    int Register()
    {
        const Uninterrupted guard;
        const auto before = ReadClients();
        if (before && before->empty()) {
            m_output << "Registering " << m_client << ": it is the first client, so the host's "
                     << "wired interfaces go on to the switch.\n"
                     << std::flush;
        }
        const int result = VORN::OVS::Register(m_command.client, m_command.bondModes);
        if (result == 1) {
            m_errors << "vornovsctl: " << m_client
                     << " was registered already; nothing was changed.\n";
            return kNothingToDo;
        }
        if (result > 1) {
            m_errors << "vornovsctl: this host cannot run Open vSwitch (reason " << result
                     << "); nothing was changed.\n";
            return kDoesNotHold;
        }

        const HostState after = ReadHostState();
        return after.IsRegistered(m_command.client) ? ReportRegistered(after)
                                                    : ReportNotRegistered(after);
    }

    int Unregister()
    {
        const Uninterrupted guard;
        const HostState before = ReadHostState();
        if (before.IsRegistered(m_command.client) && before.clients->size() == 1) {
            m_output << "Withdrawing " << m_client << ": it is the last client, so the host's "
                     << "interfaces leave the switch.\n"
                     << std::flush;
        }
        const int result = VORN::OVS::UnRegister(m_command.client, m_command.bondModes);
        if (result == 1) {
            m_errors << "vornovsctl: " << m_client << " was not registered; nothing was changed.\n";
            return kNothingToDo;
        }

        const HostState after = ReadHostState();
        if (!after.clients || after.IsRegistered(m_command.client)) {
            m_errors << "vornovsctl: " << m_client
                     << " is still registered, as far as can be told. Another program may hold the "
                        "configuration lock,\nor the registrations cannot be read or written: see "
                        "the system log, then try again.\n";
            return kDoesNotHold;
        }
        return ReportWithdrawn(before, after);
    }

    int Status()
    {
        const HostState state = ReadHostState();
        m_output << (m_command.json ? StatusJson(state) : StatusText(state));
        if (!state.clients) {
            return kDoesNotHold;
        }
        return state.IsConsistent() ? kHolds : kOutOfStep;
    }

    int Reset()
    {
        VORN::OVS::OVSSetDefault();
        const HostState after = ReadHostState();
        if (!after.clients || !after.clients->empty()) {
            m_errors << "vornovsctl: the registrations could not be removed: see the system log.\n";
            return kDoesNotHold;
        }
        m_output << "Every client is forgotten.\n";
        if (after.HasInterfaces()) {
            m_output << "Still on the switch: " << List(*after.interfaces) << ".\n";
        }
        return kHolds;
    }

private:
    int ReportRegistered(const HostState& after)
    {
        if (after.HasInterfaces()) {
            m_output << m_client << " is registered. On the switch: " << List(*after.interfaces)
                     << ".\n";
            return kHolds;
        }
        m_errors
            << "vornovsctl: " << m_client << " is registered, but "
            << (after.switchRuns ? "no interface is on the switch" : "the switch does not run")
            << ".\nSee the system log for the reason, run '/etc/rc.network start', and look at "
               "'vornovsctl status' again.\nTo go back: 'vornovsctl unregister "
            << m_command.client << "'.\n";
        return kOutOfStep;
    }

    int ReportNotRegistered(const HostState& after)
    {
        m_errors << "vornovsctl: " << m_client
                 << " is not registered: the conversion failed, another program held the "
                    "configuration lock,\nor the registrations cannot be read or written. The "
                    "system log tells which.\n";
        if (after.HasInterfaces() && !after.HasClients()) {
            m_errors << "On the switch all the same: " << List(*after.interfaces)
                     << ".\nRun '/etc/rc.network start' to bring the network up as its files have "
                        "it now. Then register again;\nto go back instead, register and unregister "
                        "again.\n";
            return kOutOfStep;
        }
        m_errors << "No interface was moved for it: try again.\n";
        return kDoesNotHold;
    }

    // Bridges that outlive a switch which no longer runs are found by their devices.
    static Names LeftOnTheSwitch(const HostState& before, const HostState& after)
    {
        Names left = after.interfaces.value_or(Names());
        for (const std::string& interface : before.interfaces.value_or(Names())) {
            if (VORN::OVS::IsInterfaceExist(BridgeOf(interface))) {
                left.insert(interface);
            }
        }
        return left;
    }

    int ReportWithdrawn(const HostState& before, const HostState& after)
    {
        if (after.HasClients()) {
            m_output << m_client << " is withdrawn. Still registered: " << List(*after.clients)
                     << "; the interfaces stay on the switch.\n";
            return kHolds;
        }
        const Names left = LeftOnTheSwitch(before, after);
        if (left.empty()) {
            m_output << m_client
                     << " is withdrawn; it was the last client. No interface is on the switch.\n";
            return kHolds;
        }
        m_errors << "vornovsctl: " << m_client
                 << " is withdrawn and was the last client, but on the switch are still: "
                 << List(left)
                 << ".\nRun '/etc/rc.network start' to bring the network up as its files have it. "
                    "Then, to go back once more,\n'vornovsctl register "
                 << m_command.client << "' and 'vornovsctl unregister " << m_command.client
                 << "'. The system log tells what failed.\n";
        return kOutOfStep;
    }

    const Command& m_command;
    const std::string m_client;
    std::ostream& m_output;
    std::ostream& m_errors;
};

int Perform(const Command& command, std::ostream& output, std::ostream& errors)
{
    if (geteuid() != 0) {
        errors << "vornovsctl: only root may ask for this\n";
        return kNotRoot;
    }

    Conversation conversation(command, output, errors);
    switch (command.verb) {
    case Verb::kRegister:
        return conversation.Register();
    case Verb::kUnregister:
        return conversation.Unregister();
    case Verb::kReset:
        return conversation.Reset();
    case Verb::kStatus:
        break;
    }
    return conversation.Status();
}

} // namespace

int Run(int argc, const char* const argv[], std::ostream& output, std::ostream& errors)
{
    try {
        const ParsedCommand parsed = ParseCommand(argc, argv);
        if (parsed.command) {
            return Perform(*parsed.command, output, errors);
        }
        if (parsed.error.empty()) {
            output << parsed.output;
            return kHolds;
        }
        errors << "vornovsctl: " << parsed.error << "\nTry 'vornovsctl --help'.\n";
        return kWrongUsage;
    } catch (const std::exception& error) {
        errors << "vornovsctl: " << error.what() << '\n';
        return kDoesNotHold;
    }
}

} // namespace vornovsctl
