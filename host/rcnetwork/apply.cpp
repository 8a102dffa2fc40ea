#include "apply.h"

#include "announce.h"
#include "announcer.h"
#include "clientcontrol.h"
#include "inputs.h"
#include "readiness.h"
#include "routers.h"

#include "support/interfacevalues.h"
#include "support/process.h"
#include "support/service.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <set>
#include <sstream>
#include <string_view>
#include <thread>

#include <unistd.h>

namespace vornhost {
namespace {

constexpr char kIpTool[] = "/bin/ip";
constexpr char kCardTool[] = "/sbin/ethtool";
constexpr char kModuleTool[] = "/sbin/modprobe";
constexpr char kBondingLoaded[] = "/sys/class/net/bonding_masters";
constexpr std::chrono::seconds kToolDeadline{15};
constexpr std::chrono::seconds kBridgeDeadline{8};
constexpr std::chrono::milliseconds kBridgePoll{10};

/** What a program said, on one line of the log. */
std::string OneLine(std::string text)
{
    while (!text.empty() && text.back() == '\n') {
        text.pop_back();
    }
    for (std::string::size_type at = 0; (at = text.find('\n', at)) != std::string::npos;) {
        text.replace(at, 1, "; ");
    }
    return text;
}

/**
 * Writes protocols of routes as numbers: after one that has no name "ip" mistakes the name that it
 * read last for that number.
 */
std::string WithNumbers(const std::string& line)
{
    constexpr std::array<std::pair<std::string_view, std::string_view>, 4> kProtocols{
        {{" proto boot ", " proto 3 "},
         {" proto static ", " proto 4 "},
         {" proto ra ", " proto 9 "},
         {" proto dhcp ", " proto 16 "}}};
    std::string text = line + " ";
    for (const auto& [name, number] : kProtocols) {
        if (const auto at = text.find(name); at != std::string::npos) {
            text.replace(at, name.size(), number);
        }
    }
    return text;
}

/** @return  the number of the line at which a batch of "ip" ended, counted from 1; 0: not known. */
std::size_t FailedLine(const std::string& errors, std::size_t lines)
{
    constexpr std::string_view kSays = "Command failed -:";
    const auto at = errors.rfind(kSays);
    if (at == std::string::npos) {
        return 0;
    }
    const std::size_t number = std::strtoul(errors.c_str() + at + kSays.size(), nullptr, 10);
    return number <= lines ? number : 0;
}

/** Whether a line sets a property of a device that is there, without which it carries traffic. */
bool IsProperty(const std::string& line)
{
    const auto words = Words(line);
    if (words.size() < 6 || words[0] != "link" || words[1] != "set") {
        return false;
    }
    return words[4] == "mtu" || words[4] == "addrgenmode" ||
           (words.size() > 6 && words[4] == "type" && words[5] == "bond" && words[6] != "mode");
}

/** The interfaces whose leases a client goes on with; the words are "start NAME of NAME,NAME". */
std::vector<std::string> Formers(const std::vector<std::string>& words)
{
    std::istringstream names(words.at(3));
    std::vector<std::string> formers;
    for (std::string name; std::getline(names, name, ',');) {
        formers.push_back(name);
    }
    return formers;
}

class Applier {
public:
    Applier(const Plan& plan, std::vector<Remark>& remarks) : m_plan(plan), m_remarks(remarks) {}
    bool Run(const Stage& stage);

    /** Carries out what the stage adds, if it can do without what was to be done before. */
    void Add(const Stage& stage);

private:
    bool Fail(const std::string& text);
    bool Program(const std::vector<std::string>& command, std::chrono::milliseconds deadline,
                 const std::string& input, ProcessResult& result) const;
    bool RunServices(const Stage& stage);
    bool RunSwitch(const Stage& stage);
    bool RunBatch(const Stage& stage);
    void LoadBonding(const Stage& stage) const;
    void RunAdditions(const std::vector<std::string>& lines) const;
    bool WaitForBridges(const Stage& stage);
    bool WriteSettings(const Stage& stage);
    void AnnounceAll(const Stage& stage);
    void HearAll(const Stage& stage);
    void SetCards(const Stage& stage);
    void TellResolver(const Stage& stage);
    bool ManageClients(const Stage& stage);
    bool ManageClient(const std::string& line);
    void StartClients(const Stage& stage);
    void WaitForAll(const Stage& stage);
    bool ForgetGateways(const Stage& stage);

    const Plan& m_plan;
    std::vector<Remark>& m_remarks;
    std::set<std::string> m_notEnded; ///< Clients that were to end.
};

bool Applier::Fail(const std::string& text)
{
    m_remarks.push_back({Severity::kWarning, text});
    return false;
}

bool Applier::Program(const std::vector<std::string>& command, std::chrono::milliseconds deadline,
                      const std::string& input, ProcessResult& result) const
{
    ProcessOptions options;
    options.deadline = deadline;
    options.environment = ToolEnvironment();
    options.input = input;
    result = RunProcess(command, options);
    return result.Succeeded();
}

bool Applier::RunServices(const Stage& stage)
{
    return std::all_of(stage.lines.begin(), stage.lines.end(), [&](const std::string& line) {
        const auto words = Words(line);
        const std::string service = words.at(0).substr(words.at(0).rfind('/') + 1);
        std::string error;
        return RunService(service, words.at(1), m_plan.servicePatience, error) ||
               Fail(line + " failed: " + OneLine(error));
    });
}

bool Applier::RunSwitch(const Stage& stage)
{
    std::vector<std::string> command{kSwitchTool};
    if (!m_plan.waitForSwitch) {
        command.emplace_back("--no-wait");
    }
    for (const std::string& line : stage.lines) {
        const auto words = Words(line);
        command.emplace_back("--");
        command.insert(command.end(), words.begin(), words.end());
    }
    ProcessResult result;
    return Program(command, kToolDeadline, "", result) ||
           Fail(stage.title + ": ovs-vsctl failed: " + OneLine(result.errors));
}

/** The module makes a bond of its own when it is loaded without a word about that. */
void Applier::LoadBonding(const Stage& stage) const
{
    const bool makesBond =
        std::any_of(stage.lines.begin(), stage.lines.end(), [](const std::string& line) {
            return line.rfind("link add ", 0) == 0 && line.find(" type bond") != std::string::npos;
        });
    ProcessResult result;
    if (makesBond && ::access(kBondingLoaded, F_OK) != 0) {
        (void)Program({kModuleTool, "-q", "bonding", "max_bonds=0"}, kToolDeadline, "", result);
    }
}

/** A property that the kernel refuses is said and passed over, as settings are. */
bool Applier::RunBatch(const Stage& stage)
{
    LoadBonding(stage);
    std::vector<std::string> rest = stage.lines;
    while (!rest.empty()) {
        std::string input;
        for (const std::string& line : rest) {
            input += WithNumbers(line) + "\n";
        }
        ProcessResult result;
        if (Program({kIpTool, "-batch", "-"}, kToolDeadline, input, result)) {
            return true;
        }
        const std::size_t failed = FailedLine(result.errors, rest.size());
        // Of an option that it does not know it lists all that it knows.
        (void)Fail(failed == 0 ? stage.title + ": ip failed: " + OneLine(result.errors)
                               : stage.title + ": ip failed at \"" + rest[failed - 1] +
                                     "\": " + result.errors.substr(0, result.errors.find('\n')));
        if (failed == 0 || !IsProperty(rest[failed - 1])) {
            RunAdditions(rest);
            return false;
        }
        rest.erase(rest.begin(), rest.begin() + static_cast<std::ptrdiff_t>(failed));
    }
    return true;
}

/** After a line that failed nothing may be taken away any more, but all else is still made. */
void Applier::RunAdditions(const std::vector<std::string>& lines) const
{
    std::string input;
    for (const std::string& line : lines) {
        const auto words = Words(line);
        const bool removes = words.size() > 1 && (words[1] == "del" || words.back() == "down");
        input += removes ? "" : WithNumbers(line) + "\n";
    }
    ProcessResult result;
    (void)Program({kIpTool, "-force", "-batch", "-"}, kToolDeadline, input, result);
}

bool Applier::WaitForBridges(const Stage& stage)
{
    const auto deadline = std::chrono::steady_clock::now() + kBridgeDeadline;
    for (const std::string& line : stage.lines) {
        const auto words = Words(line);
        const auto stands = [&] {
            const auto links = ReadLinks();
            return std::any_of(links.begin(), links.end(), [&](const Link& link) {
                return link.name == words.at(0) && (words.size() < 2 || link.mac == words[1]);
            });
        };
        while (!stands()) {
            if (std::chrono::steady_clock::now() > deadline) {
                return Fail("the switch did not make " + line);
            }
            std::this_thread::sleep_for(kBridgePoll);
        }
    }
    return true;
}

/** A setting that the kernel refuses is said and passed over: the host is reachable without it. */
bool Applier::WriteSettings(const Stage& stage)
{
    for (const std::string& line : stage.lines) {
        const auto words = Words(line);
        const std::string path = SettingPath(words.at(0), words.at(1));
        const std::string value = line.substr(words.at(0).size() + words.at(1).size() + 2);
        std::ofstream file(path);
        file << value << "\n" << std::flush;
        if (!file) {
            (void)Fail("cannot write " + path);
        }
    }
    return true;
}

void Applier::AnnounceAll(const Stage& stage)
{
    for (const std::string& interface : stage.lines) {
        if (!Announce(interface)) {
            (void)Fail("cannot announce " + interface + ": " + std::strerror(errno));
        }
    }
}

/** One that is not heard yet leaves what stands in for its route until that runs out. */
void Applier::HearAll(const Stage& stage)
{
    std::vector<RouterRoute> routes;
    for (const std::string& line : stage.lines) {
        const auto words = Words(line);
        routes.push_back(
            {words.at(0), static_cast<std::uint32_t>(std::stoul(words.at(1))), words.at(2)});
    }
    for (const RouterRoute& route : HearRouters(routes)) {
        ProcessResult result;
        (void)Program({kIpTool, "-6", "route", "del", "default", "via", route.gateway, "dev",
                       route.interface, "metric", std::to_string(route.metric + 1)},
                      kToolDeadline, "", result);
    }
}

/** What a card refuses is said and passed over: the host is reachable without it. */
void Applier::SetCards(const Stage& stage)
{
    for (const std::string& line : stage.lines) {
        const auto words = Words(line);
        std::vector<std::string> command{kCardTool, words.at(1), words.at(0)};
        command.insert(command.end(), words.begin() + 2, words.end());
        ProcessResult result;
        if (!Program(command, kToolDeadline, "", result)) {
            (void)Fail("ethtool failed for " + line + ": " + OneLine(result.errors));
        }
    }
}

void Applier::TellResolver(const Stage& stage)
{
    for (const std::string& line : stage.lines) {
        const auto words = Words(line);
        NameServers told;
        for (size_t i = 2; i + 1 < words.size(); i += 2) {
            (words[i] == "server" ? told.servers : told.domains).push_back(words[i + 1]);
        }
        if (!TellNameServers(words.at(1), told)) {
            (void)Fail("cannot change who resolves names: " + line);
        }
    }
}

bool Applier::ManageClient(const std::string& line)
{
    const auto words = Words(line.substr(0, line.find(": ")));
    std::string error;
    bool done = false;
    if (words.at(0) == "end") {
        done = EndClient(words.at(1), error);
    } else if (words.at(0) == "drop") {
        done = DropClient(words.at(1), error);
    } else {
        const ClientOptions options = ParseClientText(line.substr(line.find(": ") + 2));
        done = StartClient(words.at(1), Formers(words), options, error);
    }
    return done ||
           Fail("DHCP client of " + words.at(1) + ": cannot " + words.at(0) + " it: " + error);
}

/** One that does not start leaves the others their turn. */
bool Applier::ManageClients(const Stage& stage)
{
    bool done = true;
    for (const std::string& line : stage.lines) {
        done = ManageClient(line) && done;
    }
    return done;
}

/** Ends none, and starts those that do not go on where one is that was to end. */
void Applier::StartClients(const Stage& stage)
{
    for (const std::string& line : stage.lines) {
        const auto words = Words(line.substr(0, line.find(": ")));
        if (words.at(0) != "start") {
            m_notEnded.insert(words.at(1));
            continue;
        }
        const auto formers = Formers(words);
        if (std::none_of(formers.begin(), formers.end(),
                         [&](const std::string& name) { return m_notEnded.contains(name); })) {
            (void)ManageClient(line);
        }
    }
}

/** What does not come is said; the traffic then waits until it does. */
void Applier::WaitForAll(const Stage& stage)
{
    for (const std::string& line : stage.lines) {
        if (!WaitFor(Words(line))) {
            (void)Fail("still waiting for: " + line);
        }
    }
}

bool Applier::ForgetGateways(const Stage& stage)
{
    const GatewayStoreLock lock;
    auto store = GatewayStore::Load();
    if (!lock.Held() || !store) {
        return Fail("cannot change the gateway records");
    }
    for (const std::string& interface : stage.lines) {
        (void)store->Remove(interface, AddressFamily::kIPv4);
        (void)store->Remove(interface, AddressFamily::kIPv6);
    }
    return store->Save() || Fail("cannot write the gateway records");
}

bool Applier::Run(const Stage& stage)
{
    switch (stage.kind) {
    case StageKind::kServices:
        return RunServices(stage);
    case StageKind::kSwitch:
        return RunSwitch(stage);
    case StageKind::kWait:
        return WaitForBridges(stage);
    case StageKind::kSettings:
        return WriteSettings(stage);
    case StageKind::kBatch:
        return RunBatch(stage);
    case StageKind::kAnnounce:
        AnnounceAll(stage);
        return true;
    case StageKind::kAnnouncer:
        AnnounceAll(stage);
        std::for_each(stage.lines.begin(), stage.lines.end(), KeepAnnouncing);
        return true;
    case StageKind::kRouters:
        HearAll(stage);
        return true;
    case StageKind::kCards:
        SetCards(stage);
        return true;
    case StageKind::kResolver:
        TellResolver(stage);
        return true;
    case StageKind::kClients:
        return ManageClients(stage);
    case StageKind::kReady:
        WaitForAll(stage);
        return true;
    case StageKind::kGateways:
        break;
    }
    return ForgetGateways(stage);
}

void Applier::Add(const Stage& stage)
{
    switch (stage.kind) {
    case StageKind::kBatch:
        RunAdditions(stage.lines);
        break;
    case StageKind::kClients:
        StartClients(stage);
        break;
    case StageKind::kSettings:
    case StageKind::kAnnounce:
    case StageKind::kAnnouncer:
    case StageKind::kCards:
    case StageKind::kReady:
    case StageKind::kResolver:
        (void)Run(stage);
        break;
    case StageKind::kServices:
    case StageKind::kSwitch:
    case StageKind::kWait:
    case StageKind::kRouters:
    case StageKind::kGateways:
        break;
    }
}

/** @return  the stage that failed; null when none did. */
const Stage* RunStages(Applier& applier, const Plan& plan)
{
    for (const Stage& stage : plan.stages) {
        if (!applier.Run(stage)) {
            return &stage;
        }
        if (stage.kind == StageKind::kServices) {
            break; // what the switch knows from before decides about the rest
        }
    }
    return nullptr;
}

bool AsksTheSwitch(const Stage& stage)
{
    return stage.kind == StageKind::kSwitch || stage.kind == StageKind::kWait;
}

} // namespace

bool ApplyPlan(const Plan& plan, std::vector<Remark>& remarks)
{
    Applier applier(plan, remarks);
    return RunStages(applier, plan) == nullptr;
}

bool ApplyWhatCanBe(const Plan& plan, std::vector<Remark>& remarks)
{
    Applier applier(plan, remarks);
    const Stage* const failed = RunStages(applier, plan);
    if (failed == nullptr || failed->kind != StageKind::kBatch) {
        return failed == nullptr;
    }
    const Stage* const end = plan.stages.data() + plan.stages.size();
    for (const Stage* stage = failed + 1; stage != end && !AsksTheSwitch(*stage); ++stage) {
        applier.Add(*stage);
    }
    return false;
}

bool ApplyStage(const Stage& stage, std::vector<Remark>& remarks)
{
    const Plan plan;
    return Applier(plan, remarks).Run(stage);
}

} // namespace vornhost
