#include "commands.h"
#include "hoststate.h"
#include "wording.h"

#include <vornovs/vornovs.h>

namespace vornovsctl {

namespace {

// What the switch has for a port now.
class Tag {
public:
    explicit Tag(const std::string& port)
        : m_port(port), m_result(VORN::OVS::OVSVlanGet(port, &m_record))
    {
    }

    bool IsKnown() const { return m_result >= 0; }
    bool IsSet() const { return m_result == 1; }
    bool Is(const std::string& id) const
    {
        return IsSet() && std::to_string(m_record.vlanId) == id;
    }

    std::string Text() const
    {
        return IsSet() ? "VLAN tag " + std::to_string(m_record.vlanId) : "no VLAN tag";
    }

    Json Fields() const
    {
        Json fields;
        fields["port"] = m_port;
        fields["tagged"] = IsKnown() ? Json(IsSet()) : Json(nullptr);
        fields["vlan"] = IsSet() ? Json(m_record.vlanId) : Json(nullptr);
        const std::string recorded = ReadRecordedTag(m_port);
        fields["recorded"] = recorded.empty() ? Json(nullptr) : Json(recorded);
        return fields;
    }

private:
    std::string m_port;
    _tag_VLIB_VLAN m_record{};
    int m_result;
};

Answer NotAPort(const Tag& tag, const std::string& port)
{
    return Failed(kDoesNotHold,
                  Quoted(port) +
                      " is no port of the switch, or the switch does not answer; nothing was "
                      "changed. The system log tells which.",
                  tag.Fields());
}

Answer Refused(const std::string& port)
{
    const Tag after(port);
    return Failed(kDoesNotHold,
                  "the switch refused, or does not answer: see the system log. " + Quoted(port) +
                      (after.IsKnown() ? " has " + after.Text() + "." : " cannot be read."),
                  after.Fields());
}

// Recording a tag succeeds whatever becomes of the file and of the live port.
Answer ReportRecorded(const std::string& port, int result, bool live, bool recorded,
                      const std::string& done)
{
    const Tag after(port);
    if (result < 0) {
        return Failed(kDoesNotHold,
                      "another program is editing the configuration files; nothing was changed: "
                      "try again.",
                      after.Fields());
    }
    if (live && recorded) {
        return Done(done, after.Fields());
    }
    if (recorded) {
        return Failed(kOutOfStep,
                      "the configuration file of " + Quoted(port) +
                          " says so now, but the switch did not follow: see the system log, then "
                          "run '/etc/rc.network start'.",
                      after.Fields());
    }
    return Failed(kOutOfStep,
                  "the configuration file of " + Quoted(port) +
                      " could not be changed: see the system log. " + Quoted(port) +
                      (after.IsKnown() ? " has " + after.Text() +
                                             " until the network is started "
                                             "again."
                                       : " cannot be read."),
                  after.Fields());
}

} // namespace

Answer GetVlan(const Context& context)
{
    const std::string& port = context.arguments.Get("PORT");
    const Tag tag(port);
    if (!tag.IsKnown()) {
        return Failed(kDoesNotHold,
                      Quoted(port) + " is no port of the switch, or the switch does not answer. "
                                     "The system log tells which.",
                      tag.Fields());
    }
    return Done(Quoted(port) + " has " + tag.Text() + ".\n", tag.Fields());
}

Answer SetVlan(const Context& context)
{
    const std::string& port = context.arguments.Get("PORT");
    const std::string& id = context.arguments.Get("ID");
    if (VORN::OVS::OVSVlanSet(port, id) < 0) {
        return Refused(port);
    }
    const Tag after(port);
    if (!after.Is(id)) {
        return Refused(port);
    }
    return Done(Quoted(port) + " has VLAN tag " + id +
                    " until the network is started again; 'vlan create' would record it.\n",
                after.Fields());
}

Answer ClearVlan(const Context& context)
{
    const std::string& port = context.arguments.Get("PORT");
    if (VORN::OVS::OVSVlanClear(port) < 0) {
        return Refused(port);
    }
    const Tag after(port);
    if (!after.IsKnown() || after.IsSet()) {
        return Refused(port);
    }
    const std::string recorded = ReadRecordedTag(port);
    return Done(Quoted(port) + " has no VLAN tag" +
                    (recorded.empty() ? ".\n"
                                      : " until the network is started again, since its file "
                                        "records " +
                                            recorded + "; 'vlan remove' would forget it.\n"),
                after.Fields());
}

Answer CreateVlan(const Context& context)
{
    const std::string& port = context.arguments.Get("PORT");
    const std::string& id = context.arguments.Get("ID");
    // Otherwise a file would be made for whatever name it is.
    const Tag before(port);
    if (!before.IsKnown()) {
        return NotAPort(before, port);
    }
    const int result = VORN::OVS::OVSVlanCreate(port, id);
    return ReportRecorded(port, result, Tag(port).Is(id), ReadRecordedTag(port) == id,
                          Quoted(port) + " has VLAN tag " + id + ", and its file records it.\n");
}

Answer RemoveVlan(const Context& context)
{
    const std::string& port = context.arguments.Get("PORT");
    const Tag before(port);
    if (!before.IsKnown() && ReadRecordedTag(port).empty()) {
        return NotAPort(before, port);
    }
    if (before.IsKnown() && !before.IsSet() && ReadRecordedTag(port).empty()) {
        return Failed(kNothingToDo, Quoted(port) + " has no VLAN tag; nothing was changed.",
                      before.Fields());
    }
    const int result = VORN::OVS::OVSVlanRemove(port);
    const Tag after(port);
    return ReportRecorded(port, result, after.IsKnown() && !after.IsSet(),
                          ReadRecordedTag(port).empty(),
                          Quoted(port) + " has no VLAN tag, and its file records none.\n");
}

} // namespace vornovsctl
