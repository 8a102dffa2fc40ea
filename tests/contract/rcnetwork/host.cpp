#include "host.h"

#include <sstream>
#include <thread>

namespace contract {
namespace {

constexpr char kFiles[] = "/etc/sysconfig/network-scripts";
constexpr char kState[] = "/run/vornovs";
constexpr std::chrono::seconds kPatience{20};
constexpr std::chrono::milliseconds kPoll{20};

std::string Output(const std::vector<std::string>& argv)
{
    return RunProgram(argv).output;
}

/** The interface and the address of each line of "ip -oneline address". */
std::string Addresses()
{
    std::istringstream lines(Output({"ip", "-oneline", "address", "show", "scope", "global"}));
    std::string text;
    for (std::string line; std::getline(lines, line);) {
        std::istringstream words(line);
        std::string number;
        std::string interface;
        std::string family;
        std::string address;
        words >> number >> interface >> family >> address;
        text += interface + " " + address + "\n";
    }
    return text;
}

std::string WithoutTrailingBlanks(const std::string& text)
{
    std::istringstream lines(text);
    std::string result;
    for (std::string line; std::getline(lines, line);) {
        line.erase(line.find_last_not_of(' ') + 1);
        result += line + "\n";
    }
    return result;
}

} // namespace

Outcome RcNetwork(const std::vector<std::string>& arguments)
{
    std::vector<std::string> argv{RCNETWORK};
    argv.insert(argv.end(), arguments.begin(), arguments.end());
    return RunProgram(argv);
}

Outcome RcNetworkOfLibrary(const std::vector<std::string>& arguments)
{
    std::vector<std::string> argv{"env", "VORNOVS_HOLD=1", RCNETWORK};
    argv.insert(argv.end(), arguments.begin(), arguments.end());
    return RunProgram(argv);
}

std::string Network()
{
    return WithoutTrailingBlanks(Addresses() + Output({"ip", "-4", "route", "show", "default"}) +
                                 Output({"ip", "-6", "route", "show", "default"}));
}

std::string Snapshot()
{
    return Output({"ip", "-details", "address"}) + Output({"ip", "route", "show", "table", "all"}) +
           Output({"ip", "-6", "route", "show", "table", "all"}) + Output({"ip", "rule"}) +
           Output({"ip", "neighbour", "show", "nud", "permanent"});
}

bool WaitUntil(const std::function<bool()>& condition)
{
    const auto deadline = std::chrono::steady_clock::now() + kPatience;
    while (!condition()) {
        if (std::chrono::steady_clock::now() > deadline) {
            return false;
        }
        std::this_thread::sleep_for(kPoll);
    }
    return true;
}

std::vector<std::filesystem::path> Processes(const std::string& file, const std::string& beginning)
{
    std::vector<std::filesystem::path> found;
    std::error_code ended;
    const auto here = std::filesystem::read_symlink("/proc/self/ns/net");
    for (const auto& process : std::filesystem::directory_iterator("/proc")) {
        if (ReadFile(process.path() / file).rfind(beginning, 0) == 0 &&
            std::filesystem::read_symlink(process.path() / "ns/net", ended) == here) {
            found.push_back(process.path());
        }
    }
    return found;
}

void Host::SetUp()
{
    Delete(kState);
    Delete(kFiles);
    Delete("/etc/vornovs-host.conf");
    Delete("/usr/vorn/etc/vornnetd");
    WriteFile(std::string(kFiles) + "/network", "");
    for (const std::string number : {"0", "1"}) {
        Ip("link add eth" + number + " type veth peer name cable" + number);
        // The cables' own addresses would come and go by themselves.
        WriteFile("/proc/sys/net/ipv6/conf/cable" + number + "/disable_ipv6", "1\n");
        Ip("link set dev cable" + number + " up");
    }
}

void Host::TearDown()
{
    // Whoever would go on in the background finds nothing to do any more.
    Delete(kState);
    Ip("link del dev eth0");
    Ip("link del dev eth1");
}

void Host::File(const std::string& interface, const std::string& text)
{
    WriteFile(IfcfgPath(interface), text);
}

} // namespace contract
