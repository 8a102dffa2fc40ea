#include "hold.h"

#include "inputs.h"
#include "reconcile.h"

#include "support/atomicfile.h"
#include "support/keyvaluefile.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <charconv>
#include <csignal>
#include <ctime>
#include <fstream>
#include <sstream>
#include <thread>

#include <fcntl.h>
#include <nlohmann/json.hpp>
#include <sys/wait.h>
#include <unistd.h>

namespace vornhost {
namespace {

using Json = nlohmann::json;

constexpr char kHoldPath[] = "/run/vornovs/network.hold";
constexpr char kSettingsPath[] = "/etc/vornovs-host.conf";
constexpr char kOwnProgram[] = "/proc/self/exe";
constexpr unsigned kDefaultSeconds = 30;
constexpr unsigned kMostSeconds = 3600;
constexpr mode_t kPrivate = 0600;
constexpr unsigned kLowestOtherDescriptor = 3;

struct Hold {
    std::string token;
    std::set<std::string> names; ///< None: everything.
};

std::optional<Hold> ReadHold()
{
    std::ifstream file(kHoldPath);
    std::ostringstream text;
    text << file.rdbuf();
    try {
        const Json json = Json::parse(text.str());
        return Hold{json.at("token").get<std::string>(),
                    json.at("names").get<std::set<std::string>>()};
    } catch (const std::exception&) {
        return std::nullopt;
    }
}

bool WriteHold(const Hold& hold)
{
    const Json json = {{"token", hold.token}, {"names", hold.names}};
    return ReplaceFile(kHoldPath, json.dump() + "\n", kPrivate);
}

/** Differs from any other of this boot, and of an earlier one whose file survived. */
std::string NewToken()
{
    timespec now{};
    (void)clock_gettime(CLOCK_REALTIME, &now);
    return std::to_string(getpid()) + "-" + std::to_string(now.tv_sec) + "-" +
           std::to_string(now.tv_nsec);
}

/** Gives the holder nothing of its caller's: no descriptors, no folder, no signal settings. */
void Detach()
{
    if (chdir("/") != 0) {
        _exit(1);
    }
    const int null = open("/dev/null", O_RDWR | O_CLOEXEC);
    for (const int descriptor : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO}) {
        (void)dup2(null, descriptor);
    }
    (void)close_range(kLowestOtherDescriptor, ~0U, 0);
    for (int signal = 1; signal < NSIG; ++signal) {
        (void)std::signal(signal, SIG_DFL);
    }
    sigset_t none;
    (void)sigemptyset(&none);
    (void)sigprocmask(SIG_SETMASK, &none, nullptr);
}

/** Starts the holder as nobody's child. */
bool StartHolder(const std::string& token)
{
    std::string program = "rc.network";
    std::string verb = kHolderVerb;
    std::string argument = token;
    std::array<char*, 4> arguments{program.data(), verb.data(), argument.data(), nullptr};
    std::vector<std::string> settings = ToolEnvironment();
    std::vector<char*> environment;
    environment.reserve(settings.size() + 1);
    for (std::string& setting : settings) {
        environment.push_back(setting.data());
    }
    environment.push_back(nullptr);

    const pid_t child = fork();
    if (child == 0) {
        // Before the holder exists, so that nothing meant for its caller's group can reach it.
        (void)setsid();
        const pid_t holder = fork();
        if (holder == 0) {
            Detach();
            (void)execve(kOwnProgram, arguments.data(), environment.data());
            _exit(1);
        }
        _exit(holder < 0 ? 1 : 0);
    }
    int status = -1;
    while (child > 0 && waitpid(child, &status, 0) < 0 && errno == EINTR) {
    }
    return child > 0 && status == 0;
}

} // namespace

std::chrono::seconds HoldTime()
{
    const auto settings = KeyValueFile::Load(kSettingsPath);
    const std::string text = settings ? settings->Get("HOLD_SECONDS").value_or("") : "";
    unsigned seconds = 0;
    const auto [stop, error] = std::from_chars(text.data(), text.data() + text.size(), seconds);
    const bool usable = error == std::errc() && stop == text.data() + text.size() && seconds > 0 &&
                        seconds <= kMostSeconds;
    return std::chrono::seconds(usable ? seconds : kDefaultSeconds);
}

bool BeginHold(const Request& request)
{
    const auto former = ReadHold();
    Hold hold{NewToken(), request.names};
    if (former && former->names.empty()) {
        hold.names.clear();
    } else if (former && !hold.names.empty()) {
        hold.names.insert(former->names.begin(), former->names.end());
    }
    return WriteHold(hold) && StartHolder(hold.token);
}

void EndHold(const std::set<std::string>& names)
{
    auto hold = ReadHold();
    if (hold && !names.empty()) {
        if (hold->names.empty()) {
            return; // everything else is still held
        }
        for (const std::string& name : names) {
            hold->names.erase(name);
        }
        if (!hold->names.empty()) {
            (void)WriteHold(*hold);
            return;
        }
    }
    (void)unlink(kHoldPath);
}

std::optional<Request> HeldBy(const std::string& token)
{
    const auto hold = ReadHold();
    if (!hold || hold->token != token) {
        return std::nullopt;
    }
    Request request;
    request.names = hold->names;
    return request;
}

void WaitForStart(const std::string& token, std::chrono::seconds time)
{
    const auto deadline = std::chrono::steady_clock::now() + time;
    while (std::chrono::steady_clock::now() < deadline && HeldBy(token)) {
        const auto left = deadline - std::chrono::steady_clock::now();
        std::this_thread::sleep_for(
            std::min<std::chrono::steady_clock::duration>(left, std::chrono::seconds(1)));
    }
}

} // namespace vornhost
