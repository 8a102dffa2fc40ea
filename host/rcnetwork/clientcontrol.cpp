#include "clientcontrol.h"

#include "inputs.h"

#include "support/atomicfile.h"
#include "support/interfacename.h"
#include "support/interfacevalues.h"
#include "support/process.h"
#include "support/runlock.h"
#include "support/servicemanager.h"
#include "support/spawn.h"

#include <array>
#include <cerrno>
#include <climits>
#include <csignal>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <functional>
#include <optional>
#include <sstream>
#include <thread>

#include <fcntl.h>

namespace vornhost {
namespace {

namespace fs = std::filesystem;

constexpr char kClientProgram[] = "/usr/vorn/lib/vornovs-dhcp";
constexpr char kEventProgram[] = "/usr/vorn/lib/vornovs-dhcp-event";
constexpr char kLeaseFolder[] = "/var/lib/dhcpcd/";
constexpr std::array kLeaseEndings{".lease", ".lease6"};
constexpr char kConfigurationEnding[] = ".conf";
constexpr char kHeader[] = "# Written by rc.network for its client; not to be edited.\n";
constexpr std::chrono::seconds kClientDeadline{20};
constexpr std::chrono::seconds kEndDeadline{5};
constexpr std::chrono::seconds kStartDeadline{5};
constexpr std::chrono::milliseconds kLookAgain{10};

std::string FileOf(const std::string& interface, const char* ending)
{
    return std::string(kRunFolder) + "/dhcp/" + interface + ending;
}

/** The name of its process, and of its script before that becomes the process. */
bool IsClientName(const std::string& name)
{
    return name == "dhcpcd" || name == "vornovs-dhcp";
}

struct Process {
    pid_t id = 0;
    std::string name;
    pid_t group = 0;
    bool ended = false; ///< Only its parent has not noticed yet.
};

std::optional<Process> ReadProcess(pid_t id)
{
    std::ifstream file("/proc/" + std::to_string(id) + "/stat");
    std::string text;
    std::getline(file, text);
    const auto open = text.find('(');
    const auto close = text.rfind(')');
    if (open == std::string::npos || close == std::string::npos) {
        return std::nullopt;
    }
    Process process;
    process.id = id;
    process.name = text.substr(open + 1, close - open - 1);
    std::istringstream rest(text.substr(close + 1));
    std::string state;
    pid_t parent = 0;
    rest >> state >> parent >> process.group;
    process.ended = state == "Z" || state == "X";
    return process;
}

/** What a client says of itself, 0 when it says nothing. */
pid_t RecordedProcess(const std::string& interface)
{
    std::ifstream file(FileOf(interface, ".pid"));
    pid_t id = 0;
    file >> id;
    return id;
}

bool IsRunning(const std::string& interface)
{
    const pid_t id = RecordedProcess(interface);
    const auto process = id > 0 ? ReadProcess(id) : std::nullopt;
    return process && !process->ended && IsClientName(process->name);
}

/** The client and its helpers, which outlive it when it is killed. */
std::vector<pid_t> ProcessesOf(pid_t leader)
{
    std::vector<pid_t> ids;
    std::error_code error;
    for (const auto& entry : fs::directory_iterator("/proc", error)) {
        const auto number = ToNumber(entry.path().filename(), 1, INT_MAX);
        const auto id = static_cast<pid_t>(number.value_or(0));
        const auto process = id > 0 ? ReadProcess(id) : std::nullopt;
        if (process && !process->ended && process->group == leader && IsClientName(process->name)) {
            ids.push_back(id);
        }
    }
    return ids;
}

bool WaitFor(const std::function<bool()>& condition, std::chrono::milliseconds time)
{
    const auto deadline = std::chrono::steady_clock::now() + time;
    while (!condition()) {
        if (std::chrono::steady_clock::now() > deadline) {
            return false;
        }
        std::this_thread::sleep_for(kLookAgain);
    }
    return true;
}

/** The instance of a unit: what is not a letter, a digit or one of a few signs is written in hex.
 */
std::string UnitOf(const std::string& interface)
{
    constexpr char kDigits[] = "0123456789abcdef";
    std::string name;
    for (const char letter : interface) {
        const auto byte = static_cast<unsigned char>(letter);
        const bool first = name.empty();
        if (std::isalnum(byte) != 0 || letter == '_' || (letter == '.' && !first)) {
            name += letter;
        } else {
            name += std::string("\\x") + kDigits[byte >> 4U] + kDigits[byte & 0xfU];
        }
    }
    return "vornovs-dhcp@" + name + ".service";
}

/** The client itself first, so that it leaves everything as it shall be. */
bool EndProcesses(pid_t leader)
{
    (void)kill(leader, SIGTERM);
    const auto gone = [&] { return ProcessesOf(leader).empty(); };
    if (WaitFor([&] { return !ReadProcess(leader) || ReadProcess(leader)->ended; }, kEndDeadline) &&
        WaitFor(gone, kLookAgain)) {
        return true;
    }
    for (const int signal : {SIGTERM, SIGKILL}) {
        for (const pid_t id : ProcessesOf(leader)) {
            (void)kill(id, signal);
        }
        if (WaitFor(gone, kEndDeadline)) {
            return true;
        }
    }
    return false;
}

bool Spawn(const std::vector<std::string>& argv, std::string& error)
{
    SpawnActions actions;
    actions.Open(STDIN_FILENO, "/dev/null", O_RDONLY);
    actions.Open(STDOUT_FILENO, "/dev/null", O_WRONLY);
    actions.Duplicate(STDOUT_FILENO, STDERR_FILENO);
    actions.CloseFrom(STDERR_FILENO + 1);
    actions.ChangeFolder("/");
    const SpawnAttributes attributes(
        POSIX_SPAWN_SETSID | POSIX_SPAWN_SETSIGDEF | POSIX_SPAWN_SETSIGMASK, EmptySignalSet());
    const std::vector<std::string> environment = ToolEnvironment();
    const auto argvPointers = Pointers(argv);
    const auto environmentPointers = Pointers(environment);
    pid_t child = 0;
    const int failure =
        actions.IsComplete()
            ? ::posix_spawn(&child, argv.front().c_str(), actions.Get(), attributes.Get(),
                            argvPointers.data(), environmentPointers.data())
            : ENOMEM;
    error = failure == 0 ? "" : std::strerror(failure);
    return failure == 0;
}

/** One lease is left, the latest one, under the name of the interface that has it now. */
void TakeLease(const std::string& interface, const std::vector<std::string>& formers)
{
    for (const char* ending : kLeaseEndings) {
        const fs::path own = kLeaseFolder + interface + ending;
        for (const std::string& former : formers) {
            const fs::path other = kLeaseFolder + former + ending;
            std::error_code error;
            const auto otherTime = fs::last_write_time(other, error);
            if (error) {
                continue;
            }
            const auto ownTime = fs::last_write_time(own, error);
            if (error || otherTime > ownTime) {
                fs::rename(other, own, error);
            } else {
                fs::remove(other, error);
            }
        }
    }
}

/** For the client's event program, which lets go of what the former one said of name servers. */
bool WriteFormers(const std::string& interface, const std::vector<std::string>& formers)
{
    std::string text;
    for (const std::string& former : formers) {
        text += former + "\n";
    }
    return ReplaceFile(FileOf(interface, ".former"), text, kPrivateFile);
}

/** What this one is going to say is its own again. */
void RemoveFromFormers(const std::string& interface)
{
    std::error_code error;
    for (const auto& entry : fs::directory_iterator(std::string(kRunFolder) + "/dhcp", error)) {
        std::ifstream file(entry.path());
        std::vector<std::string> others;
        bool named = false;
        for (std::string line; entry.path().extension() == ".former" && std::getline(file, line);) {
            named = named || line == interface;
            if (line != interface) {
                others.push_back(line);
            }
        }
        if (named) {
            (void)WriteFormers(entry.path().stem(), others);
        }
    }
}

bool WriteConfiguration(const std::string& interface, const ClientOptions& options)
{
    std::string text = kHeader;
    for (const std::string& option : options) {
        text += option + "\n";
    }
    return ReplaceFile(FileOf(interface, kConfigurationEnding), text, kPrivateFile);
}

ClientOptions ReadConfiguration(const fs::path& path)
{
    std::ifstream file(path);
    ClientOptions options;
    for (std::string line; std::getline(file, line);) {
        if (line.rfind('#', 0) != 0) {
            options.push_back(line);
        }
    }
    return options;
}

void ForgetFiles(const std::string& interface)
{
    for (const char* ending : {kConfigurationEnding, ".pid", ".former"}) {
        std::error_code error;
        fs::remove(FileOf(interface, ending), error);
    }
}

bool RunEvent(const std::vector<std::string>& event)
{
    ProcessOptions options;
    options.deadline = kClientDeadline;
    options.environment = ToolEnvironment();
    options.environment.insert(options.environment.end(), event.begin(), event.end());
    return RunProcess({kEventProgram}, options).Succeeded();
}

} // namespace

std::map<std::string, LiveClient> ReadClients()
{
    std::map<std::string, LiveClient> clients;
    std::error_code error;
    for (const auto& entry : fs::directory_iterator(std::string(kRunFolder) + "/dhcp", error)) {
        const std::string name = entry.path().stem();
        if (entry.path().extension() == kConfigurationEnding && IsInterfaceName(name)) {
            clients[name] = {IsRunning(name), ReadConfiguration(entry.path())};
        }
    }
    return clients;
}

bool StartClient(const std::string& interface, const std::vector<std::string>& formers,
                 const ClientOptions& options, std::string& error)
{
    std::error_code failure;
    fs::create_directories(std::string(kRunFolder) + "/dhcp", failure);
    fs::permissions(std::string(kRunFolder) + "/dhcp", fs::perms::owner_all, failure);
    if (!EndClient(interface, error)) {
        return false;
    }
    TakeLease(interface, formers);
    RemoveFromFormers(interface);
    if (!WriteConfiguration(interface, options) || !WriteFormers(interface, formers)) {
        error = std::string("cannot write its configuration: ") + std::strerror(errno);
        return false;
    }
    const bool started = SystemdRuns() ? StartUnit(UnitOf(interface), kClientDeadline, &error)
                                       : Spawn({kClientProgram, interface}, error);
    if (started) {
        for (const std::string& former : formers) {
            ForgetFiles(former);
        }
    }
    return started && (WaitFor([&] { return IsRunning(interface); }, kStartDeadline) ||
                       (error = "it ended at once", false));
}

bool EndClient(const std::string& interface, std::string& error)
{
    if (SystemdRuns() && !StopUnit(UnitOf(interface), kClientDeadline, &error)) {
        return false;
    }
    const pid_t leader = RecordedProcess(interface);
    if (leader <= 0 || (!IsRunning(interface) && ProcessesOf(leader).empty())) {
        return true;
    }
    return EndProcesses(leader) || (error = "it does not end", false);
}

bool TellNameServers(const std::string& interface, const NameServers& told)
{
    if (told.servers.empty() && told.domains.empty()) {
        return RunEvent({"interface=" + interface, "reason=FORGET", "protocols=conf"});
    }
    // The metric puts them before those of servers and routers.
    return RunEvent({"interface=" + interface, "reason=STATIC", "protocol=conf", "ifmetric=0",
                     "if_configured=true", "if_up=true", "if_down=false",
                     "new_domain_name_servers=" + Joined(told.servers),
                     "new_domain_search=" + Joined(told.domains)});
}

bool DropClient(const std::string& interface, std::string& error)
{
    if (!EndClient(interface, error)) {
        return false;
    }
    // Name servers too many do no harm.
    (void)RunEvent({"interface=" + interface, "reason=FORGET", "protocols=dhcp dhcp6 ra"});
    ForgetFiles(interface);
    return true;
}

} // namespace vornhost
