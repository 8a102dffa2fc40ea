#include "inputs.h"

#include "clientcontrol.h"
#include "conversion.h"
#include "kinship.h"

#include "support/keyvaluefile.h"
#include "support/remembered.h"

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <sstream>

namespace vornhost {
namespace {

constexpr std::chrono::seconds kReadLimit{5};

std::string FirstLine(const std::string& path)
{
    std::ifstream file(path);
    std::string line;
    std::getline(file, line);
    return line;
}

/** A service script says in comments which process it runs. */
std::string CommentValue(const std::string& script, const std::string& key)
{
    std::ifstream file(script);
    const std::string beginning = "# " + key + ":";
    for (std::string line; std::getline(file, line);) {
        if (line.rfind(beginning, 0) == 0) {
            const auto first = line.find_first_not_of(" \t", beginning.size());
            return first == std::string::npos ? "" : line.substr(first);
        }
    }
    return {};
}

/** @return  the number of a service's process, empty when it does not run. */
std::string ServiceProcess(const std::string& script)
{
    const std::string process = FirstLine(CommentValue(script, "pidfile"));
    const bool isNumber =
        !process.empty() && process.find_first_not_of("0123456789") == std::string::npos;
    const bool runs =
        isNumber && FirstLine("/proc/" + process + "/comm") == CommentValue(script, "processname");
    return runs ? process : "";
}

ParsedFile ReadInterfaceFile(const std::string& name, const std::filesystem::path& path)
{
    const auto values = KeyValueFile::Load(path);
    if (values) {
        return ParseInterfaceFile(name, values->Text());
    }
    ParsedFile parsed;
    parsed.file.name = name;
    parsed.file.use = FileUse::kLeaveAlone;
    parsed.remarks.push_back({Severity::kError, "cannot read " + path.string() + ": " +
                                                    std::strerror(errno) +
                                                    "; the interface is left as it is"});
    return parsed;
}

} // namespace

std::optional<std::map<std::string, InterfaceFile>> ReadInterfaceFiles(std::vector<Remark>& remarks)
{
    std::map<std::string, InterfaceFile> files;
    std::error_code error;
    std::filesystem::directory_iterator entries(kConfigurationFolder, error);
    for (; !error && entries != std::filesystem::directory_iterator(); entries.increment(error)) {
        const std::string name = InterfaceOfFileName(entries->path().filename());
        if (name.empty()) {
            continue;
        }
        ParsedFile parsed = ReadInterfaceFile(name, entries->path());
        remarks.insert(remarks.end(), parsed.remarks.begin(), parsed.remarks.end());
        files[name] = std::move(parsed.file);
    }
    if (error) {
        remarks.push_back({Severity::kError, std::string("cannot read ") + kConfigurationFolder +
                                                 ": " + error.message()});
        return std::nullopt;
    }
    return files;
}

namespace {

void ReadGateways(Inputs& inputs, std::vector<Remark>& remarks)
{
    const auto store = GatewayStore::Load();
    if (store) {
        inputs.gateways = store->Records();
        return;
    }
    remarks.push_back(
        {Severity::kError, std::string("cannot read ") + kGatewayStorePath + "; routes stay"});
    for (auto& [name, file] : inputs.files) {
        file.whole = false;
    }
}

void ReadSwitchState(Inputs& inputs, std::vector<Remark>& remarks)
{
    if (inputs.request.switchHung) {
        inputs.switchState.hung = true;
        return;
    }
    if (SwitchProcesses().empty()) {
        return;
    }
    if (auto bridges = vornhost::ReadSwitch(kReadLimit)) {
        inputs.switchState.running = true;
        inputs.switchState.bridges = std::move(*bridges);
        return;
    }
    inputs.switchState.hung = true;
    remarks.push_back({Severity::kError, "the switch's database does not answer"});
}

void ReadRunState(Inputs& inputs)
{
    std::ifstream file(kRunStatePath);
    std::ostringstream text;
    text << file.rdbuf();
    inputs.runState = ParseRunState(text.str());
}

/** Of every name that a bond has now or may have had. */
void ReadFormerBonds(Inputs& inputs)
{
    std::set<std::string> names;
    for (const auto& [name, file] : inputs.files) {
        names.insert(PlainOf(name));
        names.insert(PlainOf(file.master));
    }
    for (const SwitchBridge& bridge : inputs.switchState.bridges) {
        names.insert(PlainOf(bridge.name));
    }
    for (const Link& link : inputs.live.links) {
        names.insert(link.name);
    }
    for (const std::string& name : names) {
        const auto bond = name.empty() ? std::nullopt : RememberedBond::Load(name);
        if (bond) {
            inputs.formerBonds[name] = {*bond, SwitchColumns(bond->options)};
        }
    }
}

void ReadAllSettings(Inputs& inputs)
{
    ReadSettings(kNewInterface, inputs.live);
    for (const Link& link : inputs.live.links) {
        const std::string plain = PlainOf(link.name);
        if (IsTagDevice(link) || link.kind == "bond" || link.kind == "vlan" ||
            inputs.files.contains(plain) || inputs.files.contains(BridgeOf(plain)) ||
            inputs.runState.interfaces.contains(plain) || plain != link.name ||
            inputs.live.FindLink(BridgeOf(plain)) != nullptr) {
            ReadSettings(link.name, inputs.live);
        }
    }
}

} // namespace

std::string SwitchProcesses()
{
    const std::string database = ServiceProcess(kDatabaseService);
    const std::string daemon = ServiceProcess(kSwitchService);
    return database.empty() || daemon.empty() ? "" : database + " " + daemon;
}

std::vector<std::string> ToolEnvironment()
{
    return {"PATH=/usr/local/sbin:/usr/local/bin:/usr/sbin:/usr/bin:/sbin:/bin", "LC_ALL=C",
            "OVS_CTL_TIMEOUT=10"};
}

std::optional<Inputs> ReadInputs(const Request& request, std::vector<Remark>& remarks)
{
    Inputs inputs;
    inputs.request = request;
    auto files = ReadInterfaceFiles(remarks);
    if (!files) {
        return std::nullopt;
    }
    inputs.files = std::move(*files);
    ReadGateways(inputs, remarks);
    ReadSwitchState(inputs, remarks);
    ReadRunState(inputs);
    inputs.handover = LoadHandover();
    if (inputs.handover.Empty()) {
        inputs.handover = OwedSinceCut(inputs.files);
    }
    inputs.clients = ReadClients();
    auto live = ReadLiveState();
    if (!live) {
        remarks.push_back({Severity::kError, "cannot read the kernel's network"});
        return std::nullopt;
    }
    inputs.live = std::move(*live);
    ReadAllSettings(inputs);
    ReadFormerBonds(inputs);
    return inputs;
}

} // namespace vornhost
