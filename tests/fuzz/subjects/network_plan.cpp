/**
 * The plan of the network program. The text is a host on paper, as the plan's tests have it, with
 * its configuration files under "files".
 */
#include "subject.h"
#include "text.h"

#include "contract/rcnetwork/world.h"

#include "support/interfacename.h"
#include "support/interfacevalues.h"
#include "support/remembered.h"

#include <algorithm>
#include <array>
#include <set>

#include <nlohmann/json.hpp>

namespace {

using contract::World;
using fuzz::Expect;
using vornhost::Inputs;
using vornhost::Plan;
using vornhost::Stage;
using vornhost::StageKind;
using Json = nlohmann::json;
using Names = std::set<std::string>;

constexpr char kBridgePrefix[] = "ovs_";

/** Whether a text that is not of a configuration file has what no program writes into one. */
bool HasControlCharacter(const Json& json)
{
    if (json.is_string()) {
        const auto& text = json.get_ref<const std::string&>();
        return std::any_of(text.begin(), text.end(),
                           [](char each) { return static_cast<unsigned char>(each) < ' '; });
    }
    return json.is_structured() && std::any_of(json.begin(), json.end(), HasControlCharacter);
}

/** @return nothing: the text is no such host, or one that no kernel would have. */
std::optional<World> HostOf(std::string_view text)
{
    try {
        Json json = Json::parse(text);
        std::map<std::string, std::string> files = json.value("files", Json::object());
        World world = contract::ReadWorld(json, files);
        json.erase("files");
        if (HasControlCharacter(json)) {
            return std::nullopt;
        }
        const auto& links = world.inputs.live.links;
        const bool named = std::all_of(links.begin(), links.end(), [](const auto& link) {
            return vornhost::IsInterfaceName(link.name) && link.index > 0;
        });
        const auto& bonds = world.inputs.formerBonds;
        const bool addressed = std::all_of(bonds.begin(), bonds.end(), [](const auto& entry) {
            const std::string& mac = entry.second.bond.mac;
            return mac.empty() || vornhost::IsLinkAddress(mac);
        });
        return named && addressed ? std::optional(world) : std::nullopt;
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

/** The devices that a plan makes itself. */
void AddMade(const Plan& plan, Names& names)
{
    for (const Stage& stage : plan.stages) {
        for (const std::string& line : stage.lines) {
            const auto words = vornhost::Words(line);
            const bool makes = stage.kind == StageKind::kBatch && words.size() > 5 &&
                               words[0] == "link" && words[1] == "add";
            if (makes) {
                names.insert(words[words[2] == "dev" ? 3 : 5]);
            }
        }
    }
}

void ExpectKnown(const Names& names, const std::string& name, const std::string& line)
{
    Expect(names.contains(name), "\"" + name + "\" is nothing known: " + line);
}

/** Lines of "ip": what they are about, and the interfaces that they name. */
void CheckBatch(const std::string& line, const Names& names)
{
    constexpr std::array<std::string_view, 5> kObjects{"link", "addr", "route", "neigh", "token"};
    const auto words = vornhost::Words(line);
    Expect(words.size() > 2, "a command says too little: " + line);
    Expect(std::find(kObjects.begin(), kObjects.end(), words[0]) != kObjects.end(),
           "a command is about something else: " + line);
    constexpr std::array<std::string_view, 3> kBeforeNames{"dev", "master", "name"};
    for (std::size_t at = 2; at + 1 < words.size(); ++at) {
        if (std::find(kBeforeNames.begin(), kBeforeNames.end(), words[at]) != kBeforeNames.end()) {
            ExpectKnown(names, words[at + 1], line);
        }
    }
}

/** Lines of "ovs-vsctl", of which each is one command, or of a bond the three that make it. */
void CheckSwitch(const std::string& line, const Names& names)
{
    constexpr std::array<std::string_view, 10> kVerbs{
        "add-br",         "del-br",         "add-port", "del-port", "add-bond",
        "add-bond-iface", "del-bond-iface", "set",      "clear",    "remove"};
    auto words = vornhost::Words(line);
    if (words[0] == "--id=@member") {
        return; // a bond of a single member is put together from rows
    }
    if (words[0].starts_with("--")) {
        words.erase(words.begin());
    }
    Expect(words.size() > 1 && std::find(kVerbs.begin(), kVerbs.end(), words[0]) != kVerbs.end(),
           "the switch has no such command: " + line);
    const bool onRow = words[0] == "set" || words[0] == "clear" || words[0] == "remove";
    Expect(!onRow || words.size() > 3, "a row is given nothing: " + line);
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
        CheckBatch(line, names);
        break;
    case StageKind::kSwitch:
        CheckSwitch(line, names);
        break;
    case StageKind::kWait:
    case StageKind::kAnnounce:
    case StageKind::kGateways:
        ExpectKnown(names, words[0], line);
        break;
    case StageKind::kSettings:
    case StageKind::kRouters:
    case StageKind::kCards:
        ExpectKnown(names, words[0], line);
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

/** What is kept on disk is the same once it is read again; what says nothing is not kept. */
void CheckRecord(vornhost::RunState record)
{
    std::erase_if(record.interfaces, [](const auto& each) { return each.second.Empty(); });
    Expect(vornhost::ParseRunState(vornhost::RunStateText(record)) == record,
           "the record is another one once it is read again");
}

void Run(std::string_view text)
{
    const auto world = HostOf(text);
    if (!world) {
        return;
    }
    const Plan plan = vornhost::MakePlan(world->inputs);
    Names names = KnownNames(world->inputs);
    AddMade(plan, names);
    for (const Stage& stage : plan.stages) {
        Expect(!stage.lines.empty(), "a stage is empty");
        for (const std::string& line : stage.lines) {
            CheckLine(stage, line, names);
        }
    }
    CheckRecord(plan.recordBefore);
    CheckRecord(plan.recordAfter);
    const Plan again = vornhost::MakePlan(world->inputs);
    Expect(contract::Describe(plan, {}) == contract::Describe(again, {}) &&
               plan.recordAfter == again.recordAfter,
           "the same host is planned in two ways");
}

const fuzz::Subject kSubject("network_plan", Run);

} // namespace
