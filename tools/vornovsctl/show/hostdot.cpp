#include "show/hostdot.h"

#include "show/hostwords.h"
#include "show/tree.h"

#include <initializer_list>

namespace vornovsctl {

namespace {

// In labels a backslash and an ampersand begin something else.
std::string Escaped(const std::string& text)
{
    std::string escaped;
    for (const char character : Printable(text, true)) {
        if (character == '"' || character == '\\') {
            escaped += '\\';
            escaped += character;
        } else if (character == '&') {
            escaped += "&amp;";
        } else {
            escaped += character;
        }
    }
    return escaped;
}

// A label of several lines; those without text are left out.
std::string Label(const std::vector<std::string>& lines)
{
    std::string label;
    for (const std::string& line : lines) {
        if (!line.empty()) {
            label += (label.empty() ? "" : "\\n") + Escaped(line);
        }
    }
    return '"' + label + '"';
}

std::string Id(const char* sort, const std::string& name)
{
    return '"' + Escaped(std::string(sort) + ' ' + name) + '"';
}

std::string InOneLine(std::initializer_list<std::string> words)
{
    std::string text;
    for (const std::string& word : words) {
        text += (text.empty() || word.empty() ? "" : " ") + word;
    }
    return text;
}

class HostDot {
public:
    explicit HostDot(const HostModel& host) : m_host(host) {}

    std::string Draw()
    {
        m_text = "graph host {\n"
                 "  graph [rankdir=LR];\n"
                 "  node [shape=box, fontname=\"sans-serif\"];\n"
                 "  edge [fontname=\"sans-serif\"];\n";
        AddNode("host",
                Label({m_host.name.empty() ? "host" : m_host.name,
                       "clients: " + ClientWords(m_host), "switch: " + SwitchWords(m_host)}),
                ", style=bold");
        if (m_host.bridges) {
            for (const Bridge& bridge : *m_host.bridges) {
                AddBridge(bridge);
            }
        }
        for (const Device* device : DevicesOnTheirOwn(m_host)) {
            AddDevice("host", *device, KindWord(*device), {}, "");
        }
        for (const std::string& name : TakenOffWithoutDevice(m_host)) {
            const std::string id = Id("device", name);
            AddNode(id, Label({"interface " + name, "no device", "taken off the switch"}),
                    Style(false));
            AddEdge("host", id, "");
        }
        return m_text + "}\n";
    }

private:
    void AddNode(const std::string& id, const std::string& label, const std::string& more = "")
    {
        m_text += "  " + id + " [label=" + label + more + "];\n";
    }

    void AddEdge(const std::string& one, const std::string& other, const std::string& label)
    {
        m_text += "  " + one + " -- " + other;
        m_text += label.empty() ? ";\n" : " [label=" + Label({label}) + "];\n";
    }

    static std::vector<std::string> LinesOf(const Device& device)
    {
        std::vector<std::string> lines{InOneLine({LinkWord(device), SpeedWord(device)}),
                                       device.mac};
        if (device.bond) {
            lines.push_back(InOneLine({device.bond->mode, LacpWords(*device.bond)}));
        }
        lines.insert(lines.end(), device.addresses.begin(), device.addresses.end());
        for (const DefaultRoute& route : device.routes) {
            lines.push_back(RouteWords(route));
        }
        return lines;
    }

    static const char* Style(bool works) { return works ? "" : ", style=dashed"; }

    void AddDevice(const std::string& from, const Device& device, const std::string& word,
                   const std::vector<std::string>& remarks, const std::string& edge)
    {
        std::vector<std::string> lines{word + ' ' + device.name};
        const std::vector<std::string> more = LinesOf(device);
        lines.insert(lines.end(), more.begin(), more.end());
        lines.insert(lines.end(), remarks.begin(), remarks.end());
        if (IsTakenOff(m_host, device.name)) {
            lines.emplace_back("taken off the switch");
        }
        if (device.onTheSwitch && !m_host.bridges) {
            lines.emplace_back("on the switch");
        }
        const std::string id = Id("device", device.name);
        AddNode(id, Label(lines), Style(device.up && device.carrier));
        AddEdge(from, id, edge);
        AddDevicesOn(id, device);
    }

    void AddDevicesOn(const std::string& from, const Device& device)
    {
        for (const Device* each : DevicesOn(m_host, device.name)) {
            std::string edge = each->vlan ? VlanWords(*each->vlan) : "";
            if (device.bond && device.bond->active == each->name) {
                edge = "active";
            }
            AddDevice(from, *each, each->vlan ? "VLAN" : "member", {}, edge);
        }
    }

    void AddBridge(const Bridge& bridge)
    {
        std::vector<std::string> lines{"bridge " + bridge.name};
        const Device* const device = m_host.Find(bridge.name);
        if (device != nullptr) {
            const std::vector<std::string> more = LinesOf(*device);
            lines.insert(lines.end(), more.begin(), more.end());
        }
        const std::string id = Id("bridge", bridge.name);
        AddNode(id, Label(lines), Style(device != nullptr && device->up && device->carrier));
        AddEdge("host", id, bridge.tag ? VlanWords(*bridge.tag) : "");
        if (device != nullptr) {
            AddDevicesOn(id, *device);
        }
        for (const Port& port : bridge.ports) {
            AddPort(id, port);
        }
    }

    void AddPort(const std::string& bridge, const Port& port)
    {
        std::string edge = port.tag ? VlanWords(*port.tag) : "";
        for (const int vlan : port.trunks) {
            edge += (edge.empty() ? "trunk " : " ") + std::to_string(vlan);
        }
        if (!port.bond) {
            for (const Member& member : port.members) {
                AddMember(bridge, port, member, edge);
            }
            return;
        }
        const std::string id = Id("bond", port.name);
        AddNode(id, Label({"bond " + port.name, InOneLine({port.mode, LacpWords(port)})}));
        AddEdge(bridge, id, edge);
        for (const Member& member : port.members) {
            AddMember(id, port, member, member.name == port.active ? "active" : "");
        }
    }

    void AddMember(const std::string& from, const Port& port, const Member& member,
                   const std::string& edge)
    {
        const Device* const device = m_host.Find(member.name);
        if (device != nullptr) {
            AddDevice(from, *device, port.bond ? "member" : "port",
                      {LacpWords(port, member), member.error}, edge);
            return;
        }
        const std::string id = Id("device", member.name);
        AddNode(id,
                Label({(port.bond ? "member " : "port ") + member.name, "no device", member.error}),
                Style(false));
        AddEdge(from, id, edge);
    }

    const HostModel& m_host;
    std::string m_text;
};

} // namespace

std::string DotOf(const HostModel& host)
{
    return HostDot(host).Draw();
}

} // namespace vornovsctl
