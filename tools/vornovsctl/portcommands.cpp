#include "commands.h"
#include "hoststate.h"
#include "show/switchreader.h"
#include "wording.h"

#include <vornovs/vornovs.h>

namespace vornovsctl {

namespace {

// A bridge and a port as they stand on the switch.
class Plug {
public:
    explicit Plug(const Context& context)
        : m_bridge(context.arguments.Get("BRIDGE")), m_port(context.arguments.Get("PORT"))
    {
    }

    const std::string& Bridge() const { return m_bridge; }
    const std::string& Port() const { return m_port; }
    std::string Words() const { return Quoted(m_port); }

    /** Asks the switch. @return whether it told. */
    bool Look()
    {
        const SwitchAnswer answer = AskSwitch();
        m_known = answer.bridges.has_value();
        m_carrier.clear();
        m_wire = false;
        if (m_known) {
            if (const auto* const carrier = FindBridgeOfPort(*answer.bridges, m_port)) {
                m_carrier = carrier->name;
                m_wire = carrier->Find(m_port)->wire;
            }
        }
        return m_known;
    }

    bool IsIn() const { return m_carrier == m_bridge; }
    /** The bridge that it is a port of; empty: none. */
    const std::string& Carrier() const { return m_carrier; }
    /** Whether the bridge reaches the wire through it. */
    bool IsWire() const { return m_wire; }

    Json Fields() const
    {
        Json fields;
        fields["bridge"] = m_bridge;
        fields["port"] = m_port;
        fields["attached"] = m_known ? Json(IsIn()) : Json(nullptr);
        fields["device"] = VORN::OVS::IsInterfaceExist(m_port);
        return fields;
    }

private:
    std::string m_bridge;
    std::string m_port;
    bool m_known = false;
    std::string m_carrier;
    bool m_wire = false;
};

Answer NobodyRegistered(const Plug& plug)
{
    return Failed(kDoesNotHold,
                  "no client is registered, so nothing was done: 'vornovsctl register' first.",
                  plug.Fields());
}

// The library says that it is done also when the services could not be started.
Answer NotSeen(const Plug& plug, bool known)
{
    if (known) {
        return Failed(kDoesNotHold,
                      "the switch did not follow: " + plug.Words() +
                          (plug.IsIn() ? " is still" : " is not") + " a port of " +
                          Quoted(plug.Bridge()) + ". The system log tells why.",
                      plug.Fields());
    }
    return Failed(kDoesNotHold,
                  "the switch does not answer, so nothing may have been done: see the system log "
                  "and 'vornovsctl status'.",
                  plug.Fields());
}

Answer Refused(const Plug& plug)
{
    return Failed(kDoesNotHold,
                  "the switch refused, or another program held the configuration lock: see the "
                  "system log. Nothing was changed.",
                  plug.Fields());
}

} // namespace

Answer AttachPort(const Context& context)
{
    Plug plug(context);
    if (plug.Look() && !plug.Carrier().empty()) {
        return Failed(plug.IsIn() ? kNothingToDo : kDoesNotHold,
                      plug.Words() + " is a port of " + Quoted(plug.Carrier()) +
                          " already; nothing was changed.",
                      plug.Fields());
    }

    const int result = VORN::OVS::AttachPort(plug.Bridge(), plug.Port());
    const bool known = plug.Look();
    if (result == 0) {
        return NobodyRegistered(plug);
    }
    if (result < 0) {
        return Refused(plug);
    }
    if (!known || !plug.IsIn()) {
        return NotSeen(plug, known);
    }
    std::string text = plug.Words() + " is a port of " + Quoted(plug.Bridge()) + ".\n";
    if (!VORN::OVS::IsInterfaceExist(plug.Port())) {
        text += "There is no such interface yet; it begins to work when there is one.\n";
    }
    return Done(text, plug.Fields());
}

Answer DetachPort(const Context& context)
{
    Plug plug(context);
    if (plug.Look() && !plug.IsIn()) {
        return Failed(plug.Carrier().empty() ? kNothingToDo : kDoesNotHold,
                      plug.Words() +
                          (plug.Carrier().empty() ? " is no port of the switch"
                                                  : " is a port of " + Quoted(plug.Carrier())) +
                          "; nothing was changed.",
                      plug.Fields());
    }
    if (plug.IsWire()) {
        return Failed(kDoesNotHold,
                      Quoted(plug.Bridge()) + " reaches the wire through " + plug.Words() +
                          "; nothing was changed. 'vornovsctl interface remove " + plug.Bridge() +
                          "' takes the interface off the switch.",
                      plug.Fields());
    }

    const int result = VORN::OVS::DetachPort(plug.Bridge(), plug.Port());
    const bool known = plug.Look();
    if (result == 0) {
        return NobodyRegistered(plug);
    }
    if (result < 0) {
        return Refused(plug);
    }
    if (!known || plug.IsIn()) {
        return NotSeen(plug, known);
    }
    return Done(plug.Words() + " is no port of " + Quoted(plug.Bridge()) + " any more.\n",
                plug.Fields());
}

} // namespace vornovsctl
