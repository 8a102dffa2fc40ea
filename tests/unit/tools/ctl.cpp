#include "ctl.h"

#include "run.h"

#include <filesystem>
#include <fstream>
#include <sstream>

namespace unit {

namespace {

constexpr char kStateFolder[] = "/usr/vorn/etc/vornovs";
constexpr char kFileFolder[] = "/etc/sysconfig/network-scripts";

void Write(const std::string& folder, const std::string& name, const std::string& text)
{
    std::filesystem::create_directories(folder);
    std::ofstream(folder + '/' + name) << text;
}

} // namespace

void PrintTo(const Outcome& outcome, std::ostream* stream)
{
    *stream << "exit status " << outcome.exitStatus << "\noutput:\n"
            << outcome.output << "errors:\n"
            << outcome.errors;
}

Outcome Ctl(std::vector<std::string> words)
{
    words.insert(words.begin(), "vornovsctl");
    std::vector<const char*> argv;
    argv.reserve(words.size());
    for (const std::string& word : words) {
        argv.push_back(word.c_str());
    }
    std::ostringstream output;
    std::ostringstream errors;
    const int status = vornovsctl::Run(static_cast<int>(argv.size()), argv.data(), output, errors);
    return {status, output.str(), errors.str()};
}

Outcome Done(const std::string& output)
{
    return {0, output, ""};
}

Outcome Failed(int exitStatus, const std::string& message)
{
    return {exitStatus, "", "vornovsctl: " + message + '\n'};
}

Outcome WrongUsage(const std::string& message)
{
    return Failed(2, message + "\nTry 'vornovsctl --help'.");
}

OnAHost::OnAHost()
{
    Host() = FakeHost();
    PlayUser(0);
    std::filesystem::remove_all(kStateFolder);
    std::filesystem::remove_all(kFileFolder);
}

OnAHost::~OnAHost()
{
    PlayUser(std::nullopt);
}

void OnAHost::PutOnTheSwitch(std::set<std::string> clients)
{
    Host().clients = std::move(clients);
    Host().switchRuns = true;
    Host().bridges = {"ovs_eth0", "ovs_eth1"};
    Host().devices = {"eth0", "eth1", "ovs_eth0", "ovs_eth1"};
    Host().ports = {{"ovs_eth0", {"eth0", "ovs_eth0"}}, {"ovs_eth1", {"eth1", "ovs_eth1"}}};
    Host().wires = {"eth0", "eth1"};
}

void OnAHost::WriteTakenOff(const std::string& text)
{
    Write(kStateFolder, "ovs_ignore.conf", text);
}

void OnAHost::WriteInterfaceFile(const std::string& name, const std::string& text)
{
    Write(kFileFolder, "ifcfg-" + name, text);
}

} // namespace unit
