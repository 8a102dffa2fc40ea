/**
 * The plan of the network program. The text is a host on paper, as the plan's tests have it, with
 * its configuration files under "files".
 */
#include "possiblehost.h"
#include "subject.h"
#include "text.h"

#include "contract/rcnetwork/world.h"

#include "support/contains.h"
#include "support/interfacevalues.h"

#include <algorithm>
#include <array>
#include <climits>
#include <set>

#include <linux/if_addr.h>
#include <linux/rtnetlink.h>
#include <nlohmann/json.hpp>

namespace {

using fuzz::Expect;
using vornhost::Inputs;
using vornhost::LiveState;
using vornhost::Plan;
using vornhost::Stage;
using vornhost::StageKind;
using Json = nlohmann::json;
using Names = std::set<std::string>;

constexpr char kBridgePrefix[] = "ovs_";
/** A bond of a single member is put together from rows. */
constexpr char kSingleMember[] = "--id=@member";

/** @return nothing: the text is no host. */
std::optional<Inputs> HostOf(std::string_view text)
{
    try {
        const Json json = Json::parse(text);
        Inputs inputs = contract::ReadWorld(json, json.value("files", Json::object())).inputs;
        fuzz::MakePossible(inputs);
        return inputs;
    } catch (const std::exception&) {
        return std::nullopt;
    }
}

/** Everything that a command may name: what is there, what files are about, and their bridges. */
Names KnownNames(const Inputs& inputs)
{
    Names names;
    for (const auto& link : inputs.live.links) {
        names.insert(link.name);
    }
    for (const auto& [name, file] : inputs.files) {
        names.insert(name);
        names.insert(file.name);
    }
    for (const auto& bridge : inputs.switchState.bridges) {
        names.insert(bridge.name);
        for (const auto& port : bridge.ports) {
            names.insert(port.name);
            names.insert(port.interfaces.begin(), port.interfaces.end());
        }
    }
    for (const auto& [name, record] : inputs.runState.interfaces) {
        names.insert(name);
    }
    for (const auto& [name, client] : inputs.clients) {
        names.insert(name);
    }
    for (const auto& [name, bond] : inputs.live.bonds) {
        names.insert(name);
        names.insert(bond.members.begin(), bond.members.end());
    }
    const Names plain = names;
    for (const std::string& name : plain) {
        names.insert(kBridgePrefix + name);
        names.insert(vornhost::PlainOf(name));
    }
    return names;
}

/** The bonds that a plan makes on the switch itself. */
void AddMadeBonds(const Plan& plan, Names& names)
{
    constexpr std::string_view kName = "name=";
    for (const Stage& stage : plan.stages) {
        for (const std::string& line : stage.lines) {
            const auto words = vornhost::Words(line);
            if (words[0] == "add-bond") {
                names.insert(words[2]);
            } else if (words[0] == kSingleMember) {
                names.insert(words.at(8).substr(kName.size()));
            }
        }
    }
}

void ExpectKnown(const Names& names, const std::string& name, const std::string& line)
{
    Expect(names.contains(name), "\"" + name + "\" is nothing known: " + line);
}

/** Whether a command has a word that is not there: an interface or a value that is not known. */
bool LacksAWord(const std::string& line)
{
    return line != vornhost::Joined(vornhost::Words(line));
}

/** Lines of "ip", and what they are about. */
void CheckBatch(const std::string& line)
{
    constexpr std::array<std::string_view, 5> kObjects{"link", "addr", "route", "neigh", "token"};
    const auto words = vornhost::Words(line);
    Expect(words.size() > 2 && !LacksAWord(line), "a command says too little: " + line);
    Expect(vornhost::Contains(kObjects, words[0]), "a command is about something else: " + line);
}

/** What the switch does not know in a port's row would keep it from all that it is told with it. */
void CheckPortColumn(const std::string& word, const std::string& line)
{
    constexpr std::array<std::string_view, 2> kMaps{"other_config:", "external_ids:"};
    constexpr std::array<std::string_view, 3> kTexts{"bond_mode", "lacp", "bond_fake_iface"};
    constexpr std::array<std::string_view, 3> kNumbers{"bond_updelay", "bond_downdelay", "tag"};
    const auto equals = word.rfind('=');
    const std::string column = word.substr(0, equals);
    const bool isMap = std::any_of(kMaps.begin(), kMaps.end(), [&](std::string_view map) {
        return column.starts_with(map) && column.size() > map.size();
    });
    const bool isNumber = vornhost::Contains(kNumbers, column);
    Expect(equals != std::string::npos && (isMap || isNumber || vornhost::Contains(kTexts, column)),
           "a port has no such column: " + line);
    Expect(!isNumber ||
               vornhost::ToNumber(word.substr(equals + 1), 0, column == "tag" ? 4095 : INT_MAX),
           "a column is no such number: " + line);
}

/** Lines of "ovs-vsctl", of which each is one command, or of a bond the three that make it. */
void CheckSwitch(const std::string& line, const Names& names)
{
    constexpr std::array<std::string_view, 10> kVerbs{
        "add-br",         "del-br",         "add-port", "del-port", "add-bond",
        "add-bond-iface", "del-bond-iface", "set",      "clear",    "remove"};
    auto words = vornhost::Words(line);
    Expect(!LacksAWord(line), "a command lacks a word: " + line);
    if (words[0] == kSingleMember) {
        return;
    }
    if (words[0].starts_with("--")) {
        words.erase(words.begin());
    }
    Expect(words.size() > 1 && vornhost::Contains(kVerbs, words[0]),
           "the switch has no such command: " + line);
    const bool onRow = words[0] == "set" || words[0] == "clear" || words[0] == "remove";
    Expect(!onRow || words.size() > 3, "a row is given nothing: " + line);
    for (std::size_t at = 3; words[0] == "set" && words[1] == "Port" && at < words.size(); ++at) {
        CheckPortColumn(words[at], line);
    }
    ExpectKnown(names, words[onRow ? 2 : 1], line);
    Expect(std::find(words.begin(), words.end(), "--") == words.end(),
           "one command is two: " + line);
}

void CheckLine(const Stage& stage, const std::string& line, const Names& names)
{
    Expect(!line.empty() && !fuzz::HasControls(line), "a line is empty or several: " + line);
    const auto words = vornhost::Words(line);
    Expect(!words.empty(), "a line says nothing");
    switch (stage.kind) {
    case StageKind::kBatch:
        CheckBatch(line);
        break;
    case StageKind::kSwitch:
        CheckSwitch(line, names);
        break;
    case StageKind::kAnnounce:
    case StageKind::kAnnouncer:
        break;
    case StageKind::kWait:
    case StageKind::kGateways:
        ExpectKnown(names, words[0], line);
        break;
    case StageKind::kSettings:
    case StageKind::kRouters:
    case StageKind::kCards:
        Expect(words.size() > 2, "a line says too little: " + line);
        break;
    case StageKind::kServices:
    case StageKind::kResolver:
    case StageKind::kClients:
    case StageKind::kReady:
        Expect(words.size() > 1, "a line says too little: " + line);
        break;
    }
}

/** The kernel's interfaces, and the addresses on each, while a plan is carried out. */
class Network {
public:
    explicit Network(const LiveState& live) : m_live(live)
    {
        for (const auto& link : live.links) {
            m_there[link.name];
        }
        for (const auto& address : live.addresses) {
            m_there[live.NameOf(address.index)].insert(address.local);
        }
    }

    /** Does what a line says, which may name what is there only. */
    void Take(StageKind kind, const std::string& line)
    {
        const auto words = vornhost::Words(line);
        switch (kind) {
        case StageKind::kBatch:
            TakeBatch(words, line);
            break;
        case StageKind::kSwitch:
            TakeSwitch(words, line);
            break;
        case StageKind::kWait:
            m_there[words[0]]; // nothing goes on without it
            break;
        case StageKind::kSettings:
        case StageKind::kCards:
        case StageKind::kAnnounce:
        case StageKind::kAnnouncer:
        case StageKind::kRouters:
            ExpectThere(words[0], line);
            break;
        default:
            break;
        }
    }

    bool Has(const std::string& address) const
    {
        return std::any_of(m_there.begin(), m_there.end(),
                           [&](const auto& each) { return each.second.contains(address); });
    }

private:
    /** Its database may have a bridge that it could not make, as the name is another device's. */
    bool IsOfTheSwitch(const std::string& name) const
    {
        const auto* link = m_live.FindLink(name);
        return link == nullptr || link->kind == "openvswitch" || link->kind == "tun";
    }

    void ExpectThere(const std::string& name, const std::string& line) const
    {
        Expect(m_there.contains(name), "\"" + name + "\" is not there: " + line);
    }

    void TakeSwitch(const std::vector<std::string>& words, const std::string& line)
    {
        if (words[1] == "del-br" && IsOfTheSwitch(words[2])) {
            Remove(words[2]);
        } else if (words[1] == "add-port" || words[1] == "add-bond-iface") {
            ExpectThere(words[3], line);
        }
        for (std::size_t at = 3; words[0] == "add-bond" && at < words.size(); ++at) {
            ExpectThere(words[at], line);
        }
    }

    void TakeBatch(const std::vector<std::string>& words, const std::string& line)
    {
        const bool onLink = words[0] == "link";
        if (onLink && words[1] == "add") {
            Expect(m_there.try_emplace(words[words[2] == "dev" ? 3 : 5]).second,
                   "it is there: " + line);
        }
        constexpr std::array<std::string_view, 3> kBeforeNames{"dev", "master", "link"};
        for (std::size_t at = 2; at + 1 < words.size(); ++at) {
            if (vornhost::Contains(kBeforeNames, words[at]) && words[at - 1] != "scope") {
                ExpectThere(words[at + 1], line);
            }
        }
        const auto device = std::find(words.begin(), words.end(), "dev");
        if (device == words.end()) {
            return;
        }
        const std::string& interface = *std::next(device);
        const std::string address = words[2].substr(0, words[2].find('/'));
        if (onLink && words[1] == "del") {
            Remove(interface);
        } else if (words[0] == "addr") {
            TakeAddress(words[1], address, m_there[interface]);
        }
    }

    static void TakeAddress(const std::string& verb, const std::string& address, Names& addresses)
    {
        if (verb == "flush") {
            addresses.clear();
        } else if (verb == "del") {
            addresses.erase(address);
        } else {
            addresses.insert(address);
        }
    }

    /** With an interface the VLANs on it go. */
    void Remove(const std::string& name)
    {
        m_there.erase(name);
        for (const auto& link : m_live.links) {
            if (link.kind == "vlan" && m_live.NameOf(link.parent) == name) {
                Remove(link.name);
            }
        }
    }

    const LiveState& m_live;
    std::map<std::string, Names> m_there;
};

/** Whether a device that an earlier run made is to go with all that is on it. */
bool Goes(const Inputs& inputs, const std::string& name)
{
    const auto record = inputs.runState.interfaces.find(name);
    const auto file = inputs.files.find(name);
    return record != inputs.runState.interfaces.end() && record->second.made &&
           (inputs.request.verb == vornhost::Verb::kStop ||
            (file != inputs.files.end() && !file->second.onBoot));
}

/** What an earlier run or its client has put on an interface, which may go. */
Names Made(const Inputs& inputs)
{
    Names made;
    bool served = false;
    for (const auto& [name, record] : inputs.runState.interfaces) {
        for (const std::string& address : record.addresses) {
            made.insert(address.substr(0, address.find('/')));
        }
        served = served || record.client;
    }
    for (const auto& address : inputs.live.addresses) {
        if (served && (address.flags & IFA_F_NOPREFIXROUTE) != 0) {
            made.insert(address.local);
        }
    }
    return made;
}

/** Commands name what is there at that moment, and every address stands somewhere afterwards. */
void CheckNetwork(const Inputs& inputs, const Plan& plan)
{
    Network network(inputs.live);
    for (const Stage& stage : plan.stages) {
        if (stage.kind == StageKind::kServices) {
            return; // the rest is planned anew once they run
        }
        for (const std::string& line : stage.lines) {
            network.Take(stage.kind, line);
        }
    }
    const Names made = Made(inputs);
    for (const auto& address : inputs.live.addresses) {
        Expect(address.scope != RT_SCOPE_UNIVERSE || made.contains(address.local) ||
                   Goes(inputs, inputs.live.NameOf(address.index)) || network.Has(address.local),
               "an address is lost: " + address.local + "\n" + plan.Text());
    }
}

/** What is kept on disk is the same once it is read again; what says nothing is not kept. */
void CheckRecord(vornhost::RunState record)
{
    std::erase_if(record.interfaces, [](const auto& each) { return each.second.Empty(); });
    Expect(vornhost::ParseRunState(vornhost::RunStateText(record)) == record,
           "the record is another one once it is read again");
}

void Run(std::string_view text)
{
    const auto inputs = HostOf(text);
    if (!inputs) {
        return;
    }
    const Plan plan = vornhost::MakePlan(*inputs);
    Names names = KnownNames(*inputs);
    AddMadeBonds(plan, names);
    for (const Stage& stage : plan.stages) {
        Expect(!stage.lines.empty(), "a stage is empty");
        for (const std::string& line : stage.lines) {
            CheckLine(stage, line, names);
        }
    }
    CheckNetwork(*inputs, plan);
    CheckRecord(plan.recordBefore);
    CheckRecord(plan.recordAfter);
    const Plan again = vornhost::MakePlan(*inputs);
    Expect(contract::Describe(plan, {}) == contract::Describe(again, {}) &&
               plan.recordAfter == again.recordAfter,
           "the same host is planned in two ways");
}

const fuzz::Subject kSubject("network_plan", Run);

} // namespace
