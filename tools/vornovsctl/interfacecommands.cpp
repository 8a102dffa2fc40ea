#include "commands.h"
#include "hoststate.h"
#include "show/switchreader.h"
#include "wording.h"

#include <vornovs/vornovs.h>

#include <algorithm>
#include <iterator>

namespace vornovsctl {

namespace {

using VORN::OVS::IsInterfaceExist;

// An interface and its bridge, whichever of the two was named.
struct Pair {
    explicit Pair(const std::string& name)
        : interface(InterfaceOf(name).empty() ? name : InterfaceOf(name)),
          bridge(BridgeOf(interface))
    {
    }

    std::string interface;
    std::string bridge;
};

Json PairFields(const Pair& pair)
{
    Json fields;
    fields["interface"] = pair.interface;
    fields["bridge"] = pair.bridge;
    fields["onTheSwitch"] = IsInterfaceExist(pair.bridge);
    return fields;
}

Names Added(const std::optional<Names>& before, const std::optional<Names>& after)
{
    Names added;
    if (before && after) {
        std::set_difference(after->begin(), after->end(), before->begin(), before->end(),
                            std::inserter(added, added.end()));
    }
    return added;
}

Json RemovalFields(const Pair& pair, const Names& takenOff)
{
    Json fields = PairFields(pair);
    fields["takenOff"] = takenOff;
    return fields;
}

// The library fails half-way for an interface that is listed as taken off already. One that the
// bridge reaches the wire through is listed from an earlier time.
void ForgetWhatCameBack(const std::string& bridge)
{
    const auto takenOff = ReadTakenOff();
    const SwitchAnswer answer = AskSwitch();
    if (!takenOff || takenOff->empty() || !answer.bridges) {
        return;
    }
    for (const Bridge& each : *answer.bridges) {
        for (const Port& port : each.ports) {
            for (const Member& member : port.members) {
                if (each.name == bridge && port.wire && takenOff->contains(member.name)) {
                    ForgetTakenOff(member.name);
                }
            }
        }
    }
}

Answer ReportNotOnTheSwitch(const Pair& pair)
{
    const Json fields = RemovalFields(pair, {});
    if (IsInterfaceExist(pair.interface)) {
        return Failed(kNothingToDo,
                      Quoted(pair.interface) + " is not on the switch; nothing was changed.",
                      fields);
    }
    return Failed(kDoesNotHold,
                  "there is neither an interface " + Quoted(pair.interface) + " nor a bridge " +
                      Quoted(pair.bridge) + "; nothing was changed.",
                  fields);
}

Answer ReportRemoved(const Pair& pair, const Names& takenOff)
{
    const Json fields = RemovalFields(pair, takenOff);
    std::string text = Quoted(pair.bridge) + " is gone from the switch.";
    if (!takenOff.empty()) {
        text += " Plain interfaces now: " + List(takenOff) + ".";
    }
    for (const std::string& interface : takenOff) {
        text += "\nPut it back with: vornovsctl interface add " + interface;
    }
    return Done(text + '\n', fields);
}

// What stands against putting an interface on the switch; the library itself would begin and stop
// half-way.
std::string ReasonNotToAdd(const Pair& pair)
{
    const auto clients = ReadClients();
    if (clients && clients->empty()) {
        return "no client is registered, so nothing can be on the switch: 'vornovsctl register' "
               "puts every interface there.";
    }
    if (!IsInterfaceExist(pair.interface)) {
        return "there is no interface " + Quoted(pair.interface) + ".";
    }
    const auto takenOff = ReadTakenOff();
    if (takenOff && !takenOff->contains(pair.interface)) {
        return Quoted(pair.interface) +
               " was not taken off the switch with 'interface remove', so it cannot be put back; "
               "nothing was changed.";
    }
    return "";
}

} // namespace

Answer ListInterfaces(const Context& /*context*/)
{
    Names bridges;
    const int result = VORN::OVS::ListInterface(bridges);
    const auto clients = ReadClients();

    Json fields;
    fields["clients"] = NamesOrNull(clients);
    fields["bridges"] = Json::array();
    std::string text;
    for (const std::string& bridge : bridges) {
        const std::string interface = InterfaceOf(bridge);
        fields["bridges"].push_back(
            {{"name", bridge}, {"interface", interface.empty() ? Json(nullptr) : Json(interface)}});
        text += bridge + '\n';
    }

    if (result < 0) {
        fields["bridges"] = nullptr;
        return Failed(kDoesNotHold,
                      "the registrations or the switch cannot be read: see the system log.",
                      fields);
    }
    if (!bridges.empty()) {
        return Done(text, fields);
    }
    if (clients && clients->empty()) {
        return Done("No client is registered, so nothing is on the switch.\n", fields);
    }
    if (ReadHostState().IsEmptied()) {
        return Done("Every interface was taken off the switch.\n", fields);
    }
    // A switch that does not answer lists nothing as well.
    return Failed(kOutOfStep,
                  "clients are registered, but the switch lists no bridge: run "
                  "'/etc/rc.network start', then see 'vornovsctl status'.",
                  fields);
}

Answer AddInterface(const Context& context)
{
    const Pair pair(context.arguments.Get("INTERFACE"));
    if (IsInterfaceExist(pair.bridge)) {
        return Failed(kNothingToDo,
                      Quoted(pair.interface) + " is on the switch already; nothing was changed.",
                      PairFields(pair));
    }
    const std::string reason = ReasonNotToAdd(pair);
    if (!reason.empty()) {
        return Failed(kDoesNotHold, reason, PairFields(pair));
    }

    const int result = VORN::OVS::AddInterface(pair.interface);
    const Json fields = PairFields(pair);
    if (result == 0 && IsInterfaceExist(pair.bridge)) {
        return Done(Quoted(pair.interface) + " is on the switch, with bridge " +
                        Quoted(pair.bridge) + ".\n",
                    fields);
    }
    return Failed(kOutOfStep,
                  Quoted(pair.interface) + " was stopped, but " +
                      (result == 0 ? "its bridge is not there" : "could not be put on the switch") +
                      ".\nSee the system log for the reason, and run '/etc/rc.network start' to "
                      "bring the network up as its files have it.",
                  fields);
}

Answer RemoveInterface(const Context& context)
{
    const Pair pair(context.arguments.Get("INTERFACE"));
    const bool wasThere = IsInterfaceExist(pair.bridge);
    ForgetWhatCameBack(pair.bridge);
    const auto before = ReadTakenOff();
    const int result = VORN::OVS::RemoveInterface(pair.bridge);
    const Names takenOff = Added(before, ReadTakenOff());
    const Json fields = RemovalFields(pair, takenOff);

    if (!wasThere && takenOff.empty()) {
        return ReportNotOnTheSwitch(pair);
    }
    if (result == 0 && !IsInterfaceExist(pair.bridge)) {
        return ReportRemoved(pair, takenOff);
    }
    if (result == 0) {
        return Failed(kOutOfStep,
                      Quoted(pair.bridge) +
                          " is still there: it carries neither an interface nor a bond, or the "
                          "network did not follow.\nSee the system log for the reason, and run "
                          "'/etc/rc.network start' to bring the network up as its files have it.",
                      fields);
    }
    return Failed(kOutOfStep,
                  Quoted(pair.interface) +
                      " could not be taken off the switch, or not as a whole; its network may be "
                      "stopped.\nSee the system log for the reason, and run '/etc/rc.network "
                      "start' to bring the network up as its files have it.",
                  fields);
}

} // namespace vornovsctl
