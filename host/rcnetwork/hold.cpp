#include "hold.h"

#include "alone.h"
#include "hostsettings.h"

#include "support/atomicfile.h"

#include <algorithm>
#include <ctime>
#include <fstream>
#include <sstream>
#include <thread>

#include <nlohmann/json.hpp>
#include <unistd.h>

namespace vornhost {
namespace {

using Json = nlohmann::json;

constexpr char kHoldPath[] = "/run/vornovs/network.hold";

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
    return ReplaceFile(kHoldPath, json.dump() + "\n", kPrivateFile);
}

/** Differs from any other of this boot, and of an earlier one whose file survived. */
std::string NewToken()
{
    timespec now{};
    (void)clock_gettime(CLOCK_REALTIME, &now);
    return std::to_string(getpid()) + "-" + std::to_string(now.tv_sec) + "-" +
           std::to_string(now.tv_nsec);
}

/** In a unit of its own nothing that ends the client reaches it, not even what ends all of it. */
bool StartHolder(const std::string& token)
{
    return StartAlone("vornovs-hold@" + token + ".service", {kHolderVerb, token});
}

} // namespace

std::chrono::seconds HoldTime()
{
    constexpr unsigned kUsual = 30;
    return HostSeconds("HOLD_SECONDS", kUsual, 1);
}

bool IsHeld()
{
    return ReadHold().has_value();
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
