#include "commands.h"
#include "hoststate.h"
#include "wording.h"

#include <vornovs/vornovs.h>

namespace vornovsctl {

namespace {

Json SwitchFields()
{
    Json fields;
    fields["switchRunning"] = VORN::OVS::IsDaemonAlive();
    return fields;
}

std::string Named(const std::vector<std::string>& names)
{
    return names.empty() ? "every interface" : List(names);
}

Answer Network(const std::vector<std::string>& names, bool worked, const std::string& done)
{
    Json fields;
    fields["names"] = names;
    if (worked) {
        return Done(done + Named(names) + ".\n", fields);
    }
    return Failed(kDoesNotHold,
                  "'/etc/rc.network' failed for " + Named(names) + ": see the system log.", fields);
}

} // namespace

Answer StartSwitch(const Context& /*context*/)
{
    if (VORN::OVS::IsDaemonAlive()) {
        return Failed(kNothingToDo, "the switch runs already.", SwitchFields());
    }
    if (VORN::OVS::StartOVSDaemon() && VORN::OVS::IsDaemonAlive()) {
        return Done("The switch runs.\n", SwitchFields());
    }
    return Failed(kDoesNotHold, "the switch could not be started: see the system log.",
                  SwitchFields());
}

Answer StopSwitch(const Context& context)
{
    const auto clients = ReadClients();
    if (!context.arguments.yes && (!clients || !clients->empty())) {
        return Failed(kDoesNotHold,
                      "clients are registered, as far as can be told, and would lose the switch: "
                      "say --yes if that is meant.",
                      SwitchFields());
    }
    if (VORN::OVS::StopOVSBaemon() && !VORN::OVS::IsDaemonAlive()) {
        return Done("The switch is stopped.\n", SwitchFields());
    }
    return Failed(kDoesNotHold, "the switch could not be stopped: see the system log.",
                  SwitchFields());
}

Answer StartNetwork(const Context& context)
{
    const std::vector<std::string>& names = context.arguments.All("INTERFACE");
    return Network(names, VORN::OVS::StartNetwork(names), "The network is started: ");
}

Answer StopNetwork(const Context& context)
{
    const std::vector<std::string>& names = context.arguments.All("INTERFACE");
    return Network(names, VORN::OVS::StopNetwork(names), "The network waits to be started again: ");
}

Answer CopyGateway(const Context& context)
{
    const std::string& from = context.arguments.Get("FROM");
    const std::string& to = context.arguments.Get("TO");
    Json fields;
    fields["from"] = from;
    fields["to"] = to;
    if (VORN::OVS::CopyGatewayInfo(from.c_str(), to.c_str()) < 0) {
        return Failed(kDoesNotHold,
                      "the gateway records of " + Quoted(from) +
                          " could not be copied, or not all of them: see the system log.",
                      fields);
    }
    return Done(Quoted(to) + " has the gateway records of " + Quoted(from) + ".\n", fields);
}

Answer RemoveGateway(const Context& context)
{
    const std::string& name = context.arguments.Get("INTERFACE");
    Json fields;
    fields["interface"] = name;
    if (VORN::OVS::RemoveGateWayInfo(name.c_str()) < 0) {
        return Failed(kDoesNotHold,
                      "the gateway records of " + Quoted(name) +
                          " could not be removed, or not all of them: see the system log.",
                      fields);
    }
    return Done(Quoted(name) + " has no gateway records.\n", fields);
}

} // namespace vornovsctl
