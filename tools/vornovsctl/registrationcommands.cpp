#include "commands.h"
#include "hoststate.h"
#include "wording.h"

#include <vornovs/vornovs.h>

namespace vornovsctl {

namespace {

Json ClientFields(const std::string& client, const HostState& state)
{
    Json fields;
    fields["client"] = client;
    fields["registered"] = nullptr;
    if (state.clients) {
        fields["registered"] = state.IsRegistered(client);
    }
    fields.update(StateFields(state));
    return fields;
}

Answer ReportRegistered(const std::string& client, const HostState& after)
{
    const Json fields = ClientFields(client, after);
    if (after.HasInterfaces()) {
        return Done(Quoted(client) + " is registered. On the switch: " + List(*after.interfaces) +
                        ".\n",
                    fields);
    }
    if (after.IsConsistent()) {
        return Done(Quoted(client) + " is registered. Every interface was taken off the switch: " +
                        List(*after.takenOff) + ".\n",
                    fields);
    }
    return Failed(
        kOutOfStep,
        Quoted(client) + " is registered, but " +
            (after.switchRuns ? "no interface is on the switch" : "the switch does not run") +
            ".\nSee the system log for the reason, run '/etc/rc.network start', and look at "
            "'vornovsctl status' again.\nTo go back: 'vornovsctl unregister " +
            client + "'.",
        fields);
}

Answer ReportNotRegistered(const std::string& client, const HostState& after)
{
    const Json fields = ClientFields(client, after);
    const std::string what =
        Quoted(client) +
        " is not registered: the conversion failed, another program held the configuration lock,\n"
        "or the registrations cannot be read or written. The system log tells which.\n";
    if (!after.HasInterfaces() || after.HasClients()) {
        return Failed(kDoesNotHold, what + "No interface was moved for it: try again.", fields);
    }
    return Failed(kOutOfStep,
                  what + "On the switch all the same: " + List(*after.interfaces) +
                      ".\nRun '/etc/rc.network start' to bring the network up as its files have it "
                      "now. Then register again;\nto go back instead, register and unregister "
                      "again.",
                  fields);
}

// Bridges that outlive a switch which no longer runs are found by their devices.
Names LeftOnTheSwitch(const HostState& before, const HostState& after)
{
    Names left = after.interfaces.value_or(Names());
    for (const std::string& interface : before.interfaces.value_or(Names())) {
        if (VORN::OVS::IsInterfaceExist(BridgeOf(interface))) {
            left.insert(interface);
        }
    }
    return left;
}

Answer ReportWithdrawn(const std::string& client, const HostState& before, const HostState& after)
{
    const Json fields = ClientFields(client, after);
    if (after.HasClients()) {
        return Done(Quoted(client) + " is withdrawn. Still registered: " + List(*after.clients) +
                        "; the interfaces stay on the switch.\n",
                    fields);
    }
    const Names left = LeftOnTheSwitch(before, after);
    if (left.empty()) {
        return Done(Quoted(client) +
                        " is withdrawn; it was the last client. No interface is on the switch.\n",
                    fields);
    }
    return Failed(
        kOutOfStep,
        Quoted(client) +
            " is withdrawn and was the last client, but on the switch are still: " + List(left) +
            ".\nRun '/etc/rc.network start' to bring the network up as its files have "
            "it. Then, to go back once more,\n'vornovsctl register " +
            client + "' and 'vornovsctl unregister " + client +
            "'. The system log tells what failed.",
        fields);
}

std::string InterfacesText(const HostState& state)
{
    if (!state.interfaces) {
        return state.switchRuns ? "cannot be read" : "not known while the switch does not run";
    }
    Names texts;
    for (const std::string& interface : *state.interfaces) {
        texts.insert(interface + " (" + BridgeOf(interface) + ")");
    }
    return texts.empty() ? "none" : List(texts);
}

std::string TakenOffText(const HostState& state)
{
    if (!state.takenOff) {
        return "Taken off:   cannot be read\n";
    }
    // While nobody is registered, every interface is off the switch.
    return state.HasClients() && !state.takenOff->empty()
               ? "Taken off:   " + List(*state.takenOff) + '\n'
               : "";
}

std::string StatusText(const HostState& state)
{
    std::string clients = "cannot be read";
    if (state.clients) {
        clients = state.HasClients() ? List(*state.clients) : "none";
    }
    return "Clients:     " + clients +
           "\nSwitch:      " + (state.switchRuns ? "running" : "not running") +
           "\nInterfaces:  " + InterfacesText(state) + '\n' + TakenOffText(state);
}

} // namespace

Answer Register(const Context& context)
{
    const std::string& client = context.arguments.Get("NAME");
    const auto before = ReadClients();
    if (before && before->empty()) {
        context.tell("Registering " + Quoted(client) +
                     ": it is the first client, so the host's wired interfaces go on to the "
                     "switch.\n");
    }
    const int result = VORN::OVS::Register(client, context.arguments.bondModes);

    const HostState after = ReadHostState();
    if (result == 1) {
        return Failed(kNothingToDo,
                      Quoted(client) + " was registered already; nothing was changed.",
                      ClientFields(client, after));
    }
    if (result > 1) {
        return Failed(kDoesNotHold,
                      "this host cannot run Open vSwitch (reason " + std::to_string(result) +
                          "); nothing was changed.",
                      ClientFields(client, after));
    }
    return after.IsRegistered(client) ? ReportRegistered(client, after)
                                      : ReportNotRegistered(client, after);
}

Answer Unregister(const Context& context)
{
    const std::string& client = context.arguments.Get("NAME");
    const HostState before = ReadHostState();
    if (before.IsRegistered(client) && before.clients->size() == 1) {
        context.tell("Withdrawing " + Quoted(client) +
                     ": it is the last client, so the host's interfaces leave the switch.\n");
    }
    const int result = VORN::OVS::UnRegister(client, context.arguments.bondModes);

    const HostState after = ReadHostState();
    if (result == 1) {
        return Failed(kNothingToDo, Quoted(client) + " was not registered; nothing was changed.",
                      ClientFields(client, after));
    }
    if (!after.clients || after.IsRegistered(client)) {
        return Failed(kDoesNotHold,
                      Quoted(client) +
                          " is still registered, as far as can be told. Another program may hold "
                          "the configuration lock,\nor the registrations cannot be read or "
                          "written: see the system log, then try again.",
                      ClientFields(client, after));
    }
    return ReportWithdrawn(client, before, after);
}

Answer Status(const Context& /*context*/)
{
    const HostState state = ReadHostState();
    Answer answer = Done(StatusText(state), StateFields(state));
    if (!state.clients) {
        answer.exitStatus = kDoesNotHold;
        answer.error = "the registrations cannot be read: see the system log.";
    } else if (!state.IsConsistent()) {
        answer.exitStatus = kOutOfStep;
        answer.error =
            state.HasClients()
                ? "clients are registered, but no interface is known to be on the switch: run\n"
                  "'/etc/rc.network start'."
                : "no client is registered, but interfaces are on the switch: run\n"
                  "'/etc/rc.network start', then register a client and unregister it again.";
    }
    return answer;
}

Answer Reset(const Context& /*context*/)
{
    VORN::OVS::OVSSetDefault();
    const HostState after = ReadHostState();
    if (!after.clients || !after.clients->empty()) {
        return Failed(kDoesNotHold, "the registrations could not be removed: see the system log.",
                      StateFields(after));
    }
    std::string text = "Every client is forgotten.\n";
    if (after.HasInterfaces()) {
        text += "Still on the switch: " + List(*after.interfaces) + ".\n";
    }
    return Done(text, StateFields(after));
}

} // namespace vornovsctl
