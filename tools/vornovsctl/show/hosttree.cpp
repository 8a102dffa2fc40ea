#include "show/hosttree.h"

#include "show/hostwords.h"

namespace vornovsctl {

namespace {

void AddPiece(TreeNode& node, const std::string& text, Tone tone = Tone::kPlain)
{
    if (!text.empty()) {
        node.pieces.push_back({text, tone});
    }
}

void AddVlans(TreeNode& node, const Port& port)
{
    if (port.tag) {
        AddPiece(node, VlanWords(*port.tag));
    }
    if (!port.trunks.empty()) {
        std::string trunks = "trunk";
        for (const int vlan : port.trunks) {
            trunks += ' ' + std::to_string(vlan);
        }
        AddPiece(node, trunks);
    }
}

class HostTree {
public:
    explicit HostTree(const HostModel& host) : m_host(host) {}

    TreeNode Draw() const
    {
        TreeNode root;
        AddPiece(root, m_host.name.empty() ? "host" : m_host.name, Tone::kName);
        root.children.push_back({{{"clients: " + ClientWords(m_host)}}, {}});
        TreeNode theSwitch{{{"switch: " + SwitchWords(m_host)}}, {}};
        if (m_host.bridges) {
            for (const Bridge& bridge : *m_host.bridges) {
                theSwitch.children.push_back(DrawBridge(bridge));
            }
        }
        root.children.push_back(theSwitch);
        for (const Device* device : DevicesOnTheirOwn(m_host)) {
            root.children.push_back(DrawDevice(*device, KindWord(*device)));
        }
        AddMissing(root);
        return root;
    }

private:
    static void AddLink(TreeNode& node, const Device& device)
    {
        const bool works = device.up && device.carrier;
        AddPiece(node, LinkWord(device), works ? Tone::kGood : Tone::kBad);
        AddPiece(node, SpeedWord(device));
    }

    void AddContents(TreeNode& node, const Device& device) const
    {
        for (const std::string& address : device.addresses) {
            node.children.push_back({{{address}}, {}});
        }
        for (const DefaultRoute& route : device.routes) {
            node.children.push_back({{{RouteWords(route)}}, {}});
        }
        for (const Device* each : DevicesOn(m_host, device.name)) {
            TreeNode child = DrawDevice(*each, each->vlan ? "VLAN" : "member");
            if (device.bond && device.bond->active == each->name) {
                AddPiece(child, "active");
            }
            node.children.push_back(child);
        }
    }

    TreeNode DrawDevice(const Device& device, const std::string& word) const
    {
        TreeNode node;
        AddPiece(node, word);
        AddPiece(node, device.name, Tone::kName);
        if (device.vlan) {
            AddPiece(node, "id " + std::to_string(*device.vlan));
        }
        AddLink(node, device);
        if (device.bond) {
            AddPiece(node, device.bond->mode);
            AddPiece(node, LacpWords(*device.bond));
        }
        AddPiece(node, device.mac);
        if (IsTakenOff(m_host, device.name)) {
            AddPiece(node, "taken off the switch");
        }
        if (device.onTheSwitch && !m_host.bridges) {
            AddPiece(node, "on the switch");
        }
        AddContents(node, device);
        return node;
    }

    TreeNode DrawBridge(const Bridge& bridge) const
    {
        TreeNode node;
        AddPiece(node, "bridge");
        AddPiece(node, bridge.name, Tone::kName);
        const Device* const device = m_host.Find(bridge.name);
        if (device != nullptr) {
            AddLink(node, *device);
            AddPiece(node, device->mac);
        } else {
            AddPiece(node, "no device", Tone::kBad);
        }
        if (bridge.tag) {
            AddPiece(node, VlanWords(*bridge.tag));
        }
        if (device != nullptr) {
            AddContents(node, *device);
        }
        for (const Port& port : bridge.ports) {
            node.children.push_back(port.bond ? DrawBond(port) : DrawPort(port));
        }
        return node;
    }

    TreeNode DrawMember(const Member& member, const std::string& word) const
    {
        TreeNode node;
        AddPiece(node, word);
        AddPiece(node, member.name, Tone::kName);
        const Device* const device = m_host.Find(member.name);
        if (device != nullptr) {
            AddLink(node, *device);
            AddPiece(node, device->mac);
            AddContents(node, *device);
        } else if (member.link) {
            AddPiece(node, *member.link ? "up" : "no link",
                     *member.link ? Tone::kGood : Tone::kBad);
        } else {
            AddPiece(node, "no device", Tone::kBad);
        }
        return node;
    }

    TreeNode DrawPort(const Port& port) const
    {
        TreeNode node = DrawMember(port.members.empty() ? Member{port.name, "", {}, false, ""}
                                                        : port.members.front(),
                                   "port");
        AddVlans(node, port);
        for (const Member& member : port.members) {
            AddPiece(node, member.error.empty() ? "" : "(" + member.error + ")", Tone::kBad);
        }
        return node;
    }

    TreeNode DrawBond(const Port& port) const
    {
        TreeNode node;
        AddPiece(node, "bond");
        AddPiece(node, port.name, Tone::kName);
        AddPiece(node, port.mode);
        AddPiece(node, LacpWords(port), port.IsNegotiated() ? Tone::kGood : Tone::kBad);
        AddVlans(node, port);
        for (const Member& member : port.members) {
            TreeNode child = DrawMember(member, "member");
            if (member.name == port.active) {
                AddPiece(child, "active");
            }
            AddPiece(child, LacpWords(port, member), Tone::kBad);
            AddPiece(child, member.error.empty() ? "" : "(" + member.error + ")", Tone::kBad);
            node.children.push_back(child);
        }
        return node;
    }

    void AddMissing(TreeNode& root) const
    {
        for (const std::string& name : TakenOffWithoutDevice(m_host)) {
            root.children.push_back({{{"interface"},
                                      {name, Tone::kName},
                                      {"no device", Tone::kBad},
                                      {"taken off the switch"}},
                                     {}});
        }
    }

    const HostModel& m_host;
};

} // namespace

TreeNode TreeOf(const HostModel& host)
{
    return HostTree(host).Draw();
}

} // namespace vornovsctl
